#include "crypto/pkcs7.h"
