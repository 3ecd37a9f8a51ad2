// The log of a fuzz target. util/log.h formats each record, and this function drops it.
#include <android/log.h>

extern "C" int __android_log_print(int, const char*, const char*, ...) { return 0; }
