// What cannot be seen from outside of a manifest: the guard, and what becomes of the text.
#include "apk/manifest_parser.h"

#include <gtest/gtest.h>

#include "support/bytes.h"
#include "support/log_capture.h"

namespace {

TEST(ManifestParser, AStateThatIsNoneFails) {
  for (const int state : {-1, 6}) {
    Bytes text = ToBytes("A: 1\r\n\r\n");
    ManifestSections sections;
    sections.reset(text.data(), text.size());
    LogCapture log;
    ManifestParser parser(text, sections, static_cast<ManifestParser::State>(state));
    EXPECT_FALSE(parser.parse());
    EXPECT_EQ(Records({Error("Parse manifest: Unexpected state.\n")}), log.records());
  }
}

// The value "12345" is one piece of the text; what it was moved from is still there.
TEST(ManifestParser, ContinuationLinesMoveUpBehindWhatTheyContinue) {
  Bytes text = ToBytes("A: 1\r\n 23\n 45\r\n\r\n");
  ManifestSections sections;
  sections.reset(text.data(), text.size());
  EXPECT_TRUE(ManifestParser(text, sections).parse());
  EXPECT_EQ("A: 123453\n 45\r\n\r\n", std::string(text.begin(), text.end()));
  ASSERT_EQ(1u, sections.size());
  EXPECT_EQ("12345", sections[0].find("A"));
  EXPECT_EQ(reinterpret_cast<const char*>(text.data()) + 3, sections[0].find("A").data());
}

}  // namespace
