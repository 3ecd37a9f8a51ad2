// Catches what the code under test writes to the Android log.
//
// The test program defines __android_log_print itself, so that records of the tool, and of the
// platform libraries under it, arrive here and not on standard error. Only records with the tool's
// tag are kept; they are kept while a LogCapture lives, in order.
#pragma once

#include <string>
#include <vector>

struct LogRecord {
  int priority;
  std::string text;
};

bool operator==(const LogRecord& a, const LogRecord& b);
std::ostream& operator<<(std::ostream& out, const LogRecord& record);

// One at a time; the newest record is the last.
class LogCapture {
 public:
  LogCapture();
  ~LogCapture();
  LogCapture(const LogCapture&) = delete;
  LogCapture& operator=(const LogCapture&) = delete;

  const std::vector<LogRecord>& records() const { return records_; }
  // Forgets what was caught so far.
  void Clear() { records_.clear(); }

 private:
  friend void KeepLogRecord(int priority, const char* tag, const std::string& text);
  std::vector<LogRecord> records_;
};

// Expected records, as tests write them: EXPECT_EQ(log.records(), Records({Error("…\n")})).
using Records = std::vector<LogRecord>;
inline LogRecord Info(std::string text) { return {4, std::move(text)}; }
inline LogRecord Error(std::string text) { return {6, std::move(text)}; }
