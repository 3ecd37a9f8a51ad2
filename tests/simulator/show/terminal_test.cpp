#include "simulator/show/terminal.h"

#include <gtest/gtest.h>

using namespace simulator;

namespace {

const Look kUtf8 = {false, true};
const Look kAscii = {false, false};

}  // namespace

TEST(Printable, TextIsShownWithoutItsLineEnd) {
  EXPECT_EQ(Printable("é and \u4e2d\n", kUtf8), "é and \u4e2d");
  EXPECT_EQ(Printable("\n\n", kUtf8), "\\x0a");
  EXPECT_EQ(Printable("", kUtf8), "");
}

TEST(Printable, ControlCharactersAndInvalidUtf8AreShownAsBytes) {
  EXPECT_EQ(Printable("\x1b[2J\x07\x7f\t", kUtf8), "\\x1b[2J\\x07\\x7f\\x09");
  EXPECT_EQ(Printable("\u009b31m", kUtf8), "\\xc2\\x9b31m");
  EXPECT_EQ(Printable("\xe9\xff", kUtf8), "\\xe9\\xff");
}

// For example, U+202E shows the text after it from right to left: "gpj.exe" looks like "exe.jpg".
TEST(Printable, CharactersThatTurnOrHideTextAreShownAsBytes) {
  EXPECT_EQ(Printable("a\u202eb", kUtf8), "a\\xe2\\x80\\xaeb");
  EXPECT_EQ(Printable("\u200b\u2028\u2066\ufeff", kUtf8),
            "\\xe2\\x80\\x8b\\xe2\\x80\\xa8\\xe2\\x81\\xa6\\xef\\xbb\\xbf");
  EXPECT_EQ(Printable("\u061b\u061c", kUtf8), "\u061b\\xd8\\x9c");
  EXPECT_EQ(Printable("\u2013\u2027\u2030\u2070\ufefe", kUtf8), "\u2013\u2027\u2030\u2070\ufefe");
}

// In another character set, bytes of UTF-8 could be any characters, including control characters.
TEST(Printable, NonAsciiIsShownAsBytesOutsideUtf8) {
  EXPECT_EQ(Printable("é!", kAscii), "\\xc3\\xa9!");
}

TEST(Coloured, AddsColourCodesOnlyIfColoursAreOn) {
  EXPECT_EQ(Coloured("text", Colour::kRed, kUtf8), "text");
  EXPECT_EQ(Coloured("text", Colour::kRed, {true, true}), "\x1b[31mtext\x1b[0m");
  EXPECT_EQ(Coloured("text", Colour::kPlain, {true, true}), "text");
}

TEST(Columns, CountsCharacters) { EXPECT_EQ(Columns("aé\u4e2d"), 3U); }
