// The Android log of the phone: the records of the tool and of the platform libraries that the
// tool uses.
#include "simulator/phone/log_library.h"

#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <string_view>

#include "simulator/phone/stand_in.h"
#include "util/log.h"

namespace simulator {

namespace {

constexpr int kWritten = 1;

int Log(int priority, const char* tag, const char* text) {
  Event event("log");
  event.Number("priority", priority).Text("tag", tag == nullptr ? "" : tag);
  Record(event.Text("text", std::string_view(text).substr(0, kLogTextSize - 1)));
  return kWritten;
}

__attribute__((format(printf, 3, 0))) int LogFormatted(int priority, const char* tag,
                                                       const char* format, va_list arguments) {
  const ErrnoKeeper keeper;
  char text[kLogTextSize] = "";
  vsnprintf(text, sizeof(text), format, arguments);
  return Log(priority, tag, text);
}

}  // namespace

STAND_IN int __android_log_write(int priority, const char* tag, const char* text) {
  return Log(priority, tag, text);
}

STAND_IN int __android_log_print(int priority, const char* tag, const char* format, ...) {
  va_list arguments;
  va_start(arguments, format);
  const int result = LogFormatted(priority, tag, format, arguments);
  va_end(arguments);
  return result;
}

STAND_IN int __android_log_vprint(int priority, const char* tag, const char* format,
                                  va_list arguments) {
  return LogFormatted(priority, tag, format, arguments);
}

// The simulated log has only one buffer.
STAND_IN int __android_log_buf_write(int, int priority, const char* tag, const char* text) {
  return Log(priority, tag, text);
}

STAND_IN int __android_log_buf_print(int, int priority, const char* tag, const char* format, ...) {
  va_list arguments;
  va_start(arguments, format);
  const int result = LogFormatted(priority, tag, format, arguments);
  va_end(arguments);
  return result;
}

// The platform's C++ libraries, such as the zip library, log with one of the next two functions.
// The log library has two generations (log_library.h). Each generation has only one of the two
// functions.
STAND_IN void __android_log_write_logger_data(__android_logger_data* data, const char* text) {
  ReadLogRecord(data, text, Log);
}

STAND_IN void __android_log_write_log_message(__android_log_message* message) {
  ReadLogRecord(message, Log);
}

STAND_IN void __android_log_assert(const char* condition, const char* tag, const char* format,
                                   ...) {
  if (format == nullptr) {
    Log(ANDROID_LOG_FATAL, tag, condition == nullptr ? "Unspecified assertion failed" : condition);
  } else {
    va_list arguments;
    va_start(arguments, format);
    LogFormatted(ANDROID_LOG_FATAL, tag, format, arguments);
    va_end(arguments);
  }
  abort();
}

}  // namespace simulator
