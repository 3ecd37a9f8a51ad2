#include "simulator/journal.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/resource.h>
#include <unistd.h>

#include <nlohmann/json.hpp>

#include "simulator/probe_run.h"

namespace {

// What a JSON reader of another's making sees.
std::string ReadBack(const std::string& bytes) {
  return Json::parse(EncodeText(bytes)).get<std::string>();
}

}  // namespace

TEST(JournalText, PlainTextStaysAsItIs) {
  EXPECT_EQ(EncodeText(""), "\"\"");
  EXPECT_EQ(EncodeText("lib/arm64 ~"), "\"lib/arm64 ~\"");
}

TEST(JournalText, QuotesBackslashesAndControlsAreEscaped) {
  EXPECT_EQ(EncodeText("\"\\\n\t\x01\x7f"), R"("\"\\\n\u0009\u0001\u007f")");
  EXPECT_EQ(EncodeText(std::string("a\0b", 3)), R"("a\u0000b")");
}

TEST(JournalText, Utf8StaysAsItIs) {
  // The first and the last character of two, three and four bytes, around the surrogates.
  for (const std::string text : {"\u0080", "\u07ff", "\u0800", "\ud7ff", "\ue000", "\uffff",
                                 "\U00010000", "\U0010ffff", "\uf77f", "\uf800"}) {
    EXPECT_EQ(EncodeText(text), "\"" + text + "\"");
  }
}

TEST(JournalText, BytesThatAreNoUtf8BecomePrivateCharacters) {
  EXPECT_EQ(EncodeText("a\xe9z"), R"("a\uf7e9z")");
  EXPECT_EQ(EncodeText("\x80"), R"("\uf780")");
  EXPECT_EQ(EncodeText("\xff"), R"("\uf7ff")");
  EXPECT_EQ(EncodeText("\xe2\x82"), R"("\uf7e2\uf782")");                      // cut short
  EXPECT_EQ(EncodeText("\xc1\xbf"), R"("\uf7c1\uf7bf")");                      // overlong
  EXPECT_EQ(EncodeText("\xe0\x9f\xbf"), R"("\uf7e0\uf79f\uf7bf")");            // overlong
  EXPECT_EQ(EncodeText("\xed\xa0\x80"), R"("\uf7ed\uf7a0\uf780")");            // a surrogate
  EXPECT_EQ(EncodeText("\xf0\x8f\xbf\xbf"), R"("\uf7f0\uf78f\uf7bf\uf7bf")");  // overlong
  EXPECT_EQ(EncodeText("\xf4\x90\x80\x80"), R"("\uf7f4\uf790\uf780\uf780")");  // above U+10FFFF
  EXPECT_EQ(EncodeText("\xf5\x80\x80\x80"), R"("\uf7f5\uf780\uf780\uf780")");
}

TEST(JournalText, ThePrivateCharactersThemselvesAreWrittenByteByByte) {
  EXPECT_EQ(EncodeText("\uf780"), R"("\uf7ef\uf79e\uf780")");
  EXPECT_EQ(EncodeText("\uf7ff"), R"("\uf7ef\uf79f\uf7bf")");
}

TEST(JournalText, EveryTextComesBack) {
  std::string all;
  for (int byte = 0; byte < 256; ++byte) all += static_cast<char>(byte);
  EXPECT_EQ(DecodeText(ReadBack(all)), all);
  const std::string odd = "\uf780\xef\x9e\xe9 \u00e9 \U0001f600 \xf0\x9f";
  EXPECT_EQ(DecodeText(ReadBack(odd)), odd);
}

TEST(JournalEvent, IsOneLineOfJson) {
  char path[] = "/tmp/apktoolkit-journal-XXXXXX";
  const int file = mkstemp(path);
  ASSERT_GE(file, 0);
  Event event("sign");
  event.Number("fd", -3).Text("path", "/a\xe9").Hex("payload", std::string("\x00\xff\x1a", 3));
  EXPECT_TRUE(event.Null("text").AppendTo(file));
  EXPECT_EQ(ReadWhole(path),
            "{\"event\":\"sign\",\"fd\":-3,\"path\":\"/a\\uf7e9\",\"payload\":\"00ff1a\","
            "\"text\":null}\n");
  close(file);
  unlink(path);
}

TEST(JournalEvent, ThatCannotBeWrittenIsReported) { EXPECT_FALSE(Event("journal").AppendTo(-1)); }

TEST(JournalDescriptor, IsHighAndClosedByExec) {
  const int low = dup(0);
  const int journal = OpenJournal("/dev/null");
  EXPECT_GE(journal, 64);
  EXPECT_EQ(fcntl(journal, F_GETFD) & FD_CLOEXEC, FD_CLOEXEC);
  EXPECT_NE(fcntl(journal, F_GETFL) & O_APPEND, 0);
  const int next = dup(0);
  EXPECT_EQ(next, low + 1);
  for (const int fd : {low, journal, next}) close(fd);
}

TEST(JournalDescriptor, OfAFileThatCannotBeOpenedIsMinusOne) {
  EXPECT_EQ(OpenJournal("/nowhere/journal"), -1);
}
