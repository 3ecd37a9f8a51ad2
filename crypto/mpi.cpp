#include "crypto/mpi.h"
