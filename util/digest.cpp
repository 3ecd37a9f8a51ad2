#include "util/digest.h"
