// The log of a fuzz target. Records are formatted in util/log.h and then dropped.
#include <android/log.h>

extern "C" int __android_log_print(int, const char*, const char*, ...) { return 0; }
