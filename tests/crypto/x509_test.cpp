#include "crypto/x509.h"
