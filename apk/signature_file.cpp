#include "apk/apk.h"
