// Functions for the texts of the journal and of settings. They encode any bytes as JSON strings or
// in hexadecimal, decode the JSON strings, examine UTF-8 characters, and split lists. They keep no
// state and log nothing.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

namespace simulator {

// `bytes` as a JSON string with its quotation marks. UTF-8 stays as it is, but quotation marks,
// backslashes and hidden characters (IsHidden) are escaped. A byte that belongs to no valid UTF-8
// character is written as the private character U+F7XX, XX being the byte. If `bytes` itself
// contains a character from U+F780 to U+F7FF, each byte of this character is written in the same
// way, so that decoding is unambiguous.
std::string EncodeText(std::string_view bytes);

// Returns the bytes that EncodeText encoded. `utf8` is the value that a JSON reader returns for the
// result of EncodeText.
std::string DecodeText(std::string_view utf8);

// The lower-case hexadecimal digits of the bytes.
std::string HexText(std::string_view bytes);

// The length, in bytes, of the valid UTF-8 character that `bytes` starts with; 0 if it does not
// start with one.
size_t Utf8Length(std::string_view bytes);

// True if the valid UTF-8 character must not be shown, for example because it controls a terminal,
// has no width or changes the direction of the text around it. Also true for U+FFFE and U+FFFF,
// which XML forbids.
bool IsHidden(std::string_view character);

// The parts of `text` between the separators; one empty part if `text` is empty.
std::vector<std::string> Split(const std::string& text, char separator);

}  // namespace simulator
