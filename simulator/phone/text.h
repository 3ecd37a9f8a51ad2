// Texts in the journal and in settings: any bytes as JSON strings and back, and lists in one text.
// Nothing is kept, nothing is logged.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

namespace simulator {

// `bytes` as a JSON string with its quotation marks. UTF-8 stays as it is, but hidden characters
// are written as \u escapes. A byte that belongs to no valid UTF-8 character is written as the
// private character U+F7XX, XX being the byte. For the sake of the way back, the bytes of the
// characters U+F780 to U+F7FF themselves are written so, too.
std::string EncodeText(std::string_view bytes);

// The bytes of a text that was encoded so, from the UTF-8 that a JSON reader makes of it.
std::string DecodeText(std::string_view utf8);

// The lower-case hexadecimal digits of the bytes.
std::string HexText(std::string_view bytes);

// The length of the valid UTF-8 character that `bytes` starts with, 0 when it does not start with
// one.
size_t Utf8Length(std::string_view bytes);

// Whether the valid UTF-8 character is one that a terminal obeys, or that has no width or turns the
// direction of what stands around it, or that is a noncharacter (U+FFFE, U+FFFF, which XML
// forbids).
bool IsHidden(std::string_view character);

// The parts of `text` between the separators; one empty part when `text` is empty.
std::vector<std::string> Split(const std::string& text, char separator);

}  // namespace simulator
