#include "support/log_capture.h"

#include <android/log.h>

#include <cerrno>
#include <cstdarg>
#include <cstdio>
#include <ostream>

#include "util/log.h"

namespace {

LogCapture* current = nullptr;

// Some records of the platform's zip library have no tag.
bool IsTools(const char* tag) { return tag != nullptr && std::string(tag) == kLogTag; }

}  // namespace

bool operator==(const LogRecord& a, const LogRecord& b) {
  return a.priority == b.priority && a.text == b.text;
}

std::ostream& operator<<(std::ostream& out, const LogRecord& record) {
  return out << '[' << record.priority << "] " << record.text;
}

LogCapture::LogCapture() { current = this; }
LogCapture::~LogCapture() { current = nullptr; }

void KeepLogRecord(int priority, const char* tag, const std::string& text) {
  if (current != nullptr && IsTools(tag)) current->records_.push_back({priority, text});
}

extern "C" int __android_log_print(int priority, const char* tag, const char* format, ...) {
  char text[65536];
  va_list arguments;
  va_start(arguments, format);
  const int length = vsnprintf(text, sizeof(text), format, arguments);
  va_end(arguments);
  KeepLogRecord(priority, tag, text);
  if (IsTools(tag)) errno = EDOM;  // the log library can change errno; LogText must restore it
  return length;
}
