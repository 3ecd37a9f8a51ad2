#include "crypto/rsa.h"
