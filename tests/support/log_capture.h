// Catches the Android log of the code under test.
//
// The test program defines __android_log_print itself. Records that the tool's code or a platform
// library writes with this function therefore do not go to standard error. A LogCapture keeps the
// records with the tool's tag, in order, while the LogCapture lives.
#pragma once

#include <string>
#include <vector>

struct LogRecord {
  int priority;
  std::string text;
};

bool operator==(const LogRecord& a, const LogRecord& b);
std::ostream& operator<<(std::ostream& out, const LogRecord& record);

// Only one LogCapture may live at a time. The newest record is the last.
class LogCapture {
 public:
  LogCapture();
  ~LogCapture();
  LogCapture(const LogCapture&) = delete;
  LogCapture& operator=(const LogCapture&) = delete;

  const std::vector<LogRecord>& records() const { return records_; }
  // Forgets all records so far.
  void Clear() { records_.clear(); }

 private:
  friend void KeepLogRecord(int priority, const char* tag, const std::string& text);
  std::vector<LogRecord> records_;
};

// Expected records in a test: EXPECT_EQ(log.records(), Records({Error("…\n")})).
using Records = std::vector<LogRecord>;
inline LogRecord Info(std::string text) { return {4, std::move(text)}; }
inline LogRecord Error(std::string text) { return {6, std::move(text)}; }
