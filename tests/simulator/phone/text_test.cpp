#include "simulator/phone/text.h"

#include <gtest/gtest.h>

#include "simulator/phone/probe_run.h"

using namespace simulator;

namespace {

// The text as an independent JSON reader sees it.
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
  // For each length from two to four bytes, the list has the first and the last character that is
  // not hidden (IsHidden). The list has all neighbours of the surrogates and of U+F780 to U+F7FF.
  for (const std::string text : {"\u00a0", "\u07ff", "\u0800", "\ud7ff", "\ue000", "\ufffd",
                                 "\U00010000", "\U0010ffff", "\uf77f", "\uf800"}) {
    EXPECT_EQ(EncodeText(text), "\"" + text + "\"");
  }
}

// The text of a journal on a terminal must not mislead a person. A JSON reader turns each escape
// back into its character.
TEST(JournalText, HiddenCharactersAreEscaped) {
  EXPECT_EQ(EncodeText("\u0080\u009f\u00ad\u061c\u180e"), R"("\u0080\u009f\u00ad\u061c\u180e")");
  EXPECT_EQ(EncodeText("\u200b\u200f\u2028\u202e\u2060\u206f"),
            R"("\u200b\u200f\u2028\u202e\u2060\u206f")");
  EXPECT_EQ(EncodeText("\ufeff\ufff9\ufffb\ufffe\uffff"), R"("\ufeff\ufff9\ufffb\ufffe\uffff")");
  EXPECT_EQ(EncodeText("\U000e0000\U000e007f"), R"("\udb40\udc00\udb40\udc7f")");
  EXPECT_EQ(EncodeText("\x1f\x7f"), R"("\u001f\u007f")");
}

TEST(JournalText, NeighboursOfHiddenCharactersStay) {
  for (const std::string text :
       {" ",      "~",      "\u00a0", "\u00ac", "\u00ae",     "\u061b",    "\u061d",
        "\u200a", "\u2010", "\u2027", "\u202f", "\u205f",     "\u2070",    "\ufefe",
        "\uff00", "\ufff8", "\ufffc", "\ufffd", "\U00010000", "\U000e0080"}) {
    EXPECT_EQ(EncodeText(text), "\"" + text + "\"");
  }
}

TEST(HexText, IsInLowerCase) { EXPECT_EQ(HexText(std::string("\0\x9f\xfa", 3)), "009ffa"); }

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

TEST(JournalText, PrivateCharactersAreWrittenByteByByte) {
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

TEST(Split, KeepsEmptyParts) {
  EXPECT_EQ(Split("", ','), Lines({""}));
  EXPECT_EQ(Split("a", ','), Lines({"a"}));
  EXPECT_EQ(Split(",a,,b,", ','), Lines({"", "a", "", "b", ""}));
}
