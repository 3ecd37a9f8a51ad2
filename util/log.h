// The tool writes to the Android log only through LogInfo and LogError. Every record has the tag
// "ApkToolkit". The printf attribute lets the compiler check each message against its arguments.
// The functions allocate nothing and preserve errno.
#pragma once

#include <android/log.h>

#include <cerrno>
#include <cstdarg>
#include <cstdio>

inline constexpr char kLogTag[] = "ApkToolkit";

// The log keeps at most this many bytes of a record's text, including the closing NUL. LogText cuts
// longer texts.
inline constexpr size_t kLogTextSize = 1024;

// Writes one record with `priority` (an android_LogPriority). `format` and `arguments` are those of
// vprintf.
__attribute__((format(printf, 2, 0))) inline void LogText(int priority, const char* format,
                                                          va_list arguments) {
  const int saved_errno = errno;
  char text[kLogTextSize];
  vsnprintf(text, sizeof(text), format, arguments);
  __android_log_print(priority, kLogTag, "%s", text);
  errno = saved_errno;
}

// Progress, at priority 4 (ANDROID_LOG_INFO).
__attribute__((format(printf, 1, 2))) inline void LogInfo(const char* format, ...) {
  va_list arguments;
  va_start(arguments, format);
  LogText(ANDROID_LOG_INFO, format, arguments);
  va_end(arguments);
}

// A failure, at priority 6 (ANDROID_LOG_ERROR).
__attribute__((format(printf, 1, 2))) inline void LogError(const char* format, ...) {
  va_list arguments;
  va_start(arguments, format);
  LogText(ANDROID_LOG_ERROR, format, arguments);
  va_end(arguments);
}
