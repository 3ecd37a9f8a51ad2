// Text for a terminal: makes hostile bytes harmless, and adds colours.
#pragma once

#include <string>
#include <string_view>

namespace simulator {

// The abilities of the terminal.
struct Look {
  bool has_colours = false;
  bool has_utf8 = true;  // else only ASCII is shown
};

// The abilities of standard output: colours on a terminal, unless NO_COLOR is set and not empty;
// UTF-8 if the locale's characters are UTF-8.
Look LookOfStandardOutput();

// Returns `bytes` without anything that controls a terminal or misleads its reader. Hidden
// characters (IsHidden) and bytes that are not UTF-8 are shown as \xNN, byte by byte. If `look` has
// no UTF-8, all characters outside ASCII are also shown in this form. A line feed at the end is
// removed.
std::string Printable(std::string_view bytes, const Look& look);

enum class Colour { kPlain, kGreen, kRed, kYellow };

// `text` in the colour, if there are colours.
std::string Coloured(const std::string& text, Colour colour, const Look& look);

// The number of columns of a printable text. Each character counts as one column.
size_t Columns(std::string_view text);

}  // namespace simulator
