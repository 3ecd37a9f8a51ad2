// Text for a person's eyes: what may be shown of hostile bytes, the marks, and the colours.
#pragma once

#include <string>
#include <string_view>

namespace simulator {

// How the one who reads sees it.
struct Look {
  bool has_colours = false;
  bool has_utf8 = true;  // else nothing but ASCII is shown
};

// How standard output is read: in colours on a terminal, unless NO_COLOR is set; in UTF-8 where the
// locale's characters are.
Look LookOfStandardOutput();

// `bytes` without anything that a terminal would obey or that would mislead the eye: control
// characters, bytes that are not UTF-8, and characters that turn the direction of writing are shown
// as \xNN, byte by byte. Where `look` has only ASCII, so are all other characters. A line end at
// the end is left out.
std::string Printable(std::string_view bytes, const Look& look);

enum class Colour { kPlain, kGreen, kRed, kYellow };

// `text` in the colour, if there are colours.
std::string Coloured(const std::string& text, Colour colour, const Look& look);

// How many columns a printable text takes, each character counting as one.
size_t Columns(std::string_view text);

}  // namespace simulator
