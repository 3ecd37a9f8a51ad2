// The log of a fuzz target: what is logged is formatted, in util/log.h, and goes nowhere.
#include <android/log.h>

extern "C" int __android_log_print(int, const char*, const char*, ...) { return 0; }
