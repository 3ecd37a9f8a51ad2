// The Android log of a fuzz target. This function drops every record. The tool's records are still
// formatted, because util/log.h formats them before the call.
#include <android/log.h>

extern "C" int __android_log_print(int, const char*, const char*, ...) { return 0; }
