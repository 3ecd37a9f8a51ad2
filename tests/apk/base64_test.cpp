#include "apk/base64.h"
