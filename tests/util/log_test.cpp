#include "util/log.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <string>

#include "support/log_capture.h"

namespace {

TEST(Log, ProgressHasPriorityFour) {
  LogCapture log;
  LogInfo("VeltSign starts: %d.\n", 3);
  EXPECT_EQ(log.records(), Records({{4, "VeltSign starts: 3.\n"}}));
}

TEST(Log, FailureHasPrioritySix) {
  LogCapture log;
  LogError("Can't open file: %s\n", "/x");
  EXPECT_EQ(log.records(), Records({{6, "Can't open file: /x\n"}}));
}

TEST(Log, AddsNoLineEnd) {
  LogCapture log;
  LogError("Unknown certificate type");
  EXPECT_EQ(log.records(), Records({{6, "Unknown certificate type"}}));
}

TEST(Log, PercentSignsInArgumentsAreText) {
  LogCapture log;
  LogError("%s", "100%n %s");
  EXPECT_EQ(log.records(), Records({{6, "100%n %s"}}));
}

TEST(Log, ErrnoIsKept) {
  LogCapture log;
  errno = EACCES;
  LogInfo("%s", "x");
  EXPECT_EQ(EACCES, errno);
  LogError("%s", "x");
  EXPECT_EQ(EACCES, errno);
}

TEST(Log, TextOf1023BytesIsWhole) {
  LogCapture log;
  const std::string text(1023, 'x');
  LogError("%s", text.c_str());
  EXPECT_EQ(log.records(), Records({{6, text}}));
}

TEST(Log, LongerTextIsCutTo1023Bytes) {
  LogCapture log;
  LogError("%s\n", std::string(1023, 'x').c_str());
  EXPECT_EQ(log.records(), Records({{6, std::string(1023, 'x')}}));
}

TEST(Log, RecordEndsAtANulCharacter) {
  LogCapture log;
  LogError("after colon: %c\n", '\0');
  EXPECT_EQ(log.records(), Records({{6, "after colon: "}}));
}

}  // namespace
