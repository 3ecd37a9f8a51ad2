#include "apk/manifest_mf.h"
