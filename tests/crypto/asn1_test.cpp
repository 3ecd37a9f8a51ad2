#include "crypto/asn1.h"
