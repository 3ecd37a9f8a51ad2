// The journal of a simulated run: one JSON object a line, in the order in which things happened
// (docs/journal.md is its schema). Written by the stand-ins inside the tool and by apktoolkit-sim
// around it, each line with one appending write, so that the order of the writes is the order of
// the lines. Needs no JSON library: the stand-ins are to bring nothing into the tool's process.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

// The version of the schema; the journal's first line carries it.
inline constexpr int kJournalVersion = 1;

// One line under construction. Keys are plain ASCII names.
class Event {
 public:
  explicit Event(const char* name);

  Event& Number(const char* key, int64_t value);
  // A text is any bytes (see EncodeText).
  Event& Text(const char* key, std::string_view bytes);
  // As lower-case hexadecimal digits.
  Event& Hex(const char* key, std::string_view bytes);
  Event& Null(const char* key);

  // Appends the line to the open file `journal`; false when it could not be written whole.
  bool AppendTo(int journal) const;

 private:
  Event& Key(const char* key);

  std::string line_;
};

// Opens the journal at `path` for appending, close-on-exec, and keeps its descriptor out of the
// way of those that the process opens itself; -1 when it cannot be opened.
int OpenJournal(const char* path);

// Gives the open file `fd` a descriptor in the upper quarter of what the process may have,
// close-on-exec, so that the lowest free ones, which are handed out next, stay what they would be
// without it. Returns the new descriptor, or `fd` itself when there is none to be had.
int MoveHigh(int fd);

// `bytes` as a JSON string with its quotation marks. UTF-8 stays as it is; a byte that belongs to
// no valid UTF-8 character is written as the private character U+F7XX, XX being the byte. For the
// sake of the way back, the bytes of the characters U+F780 to U+F7FF themselves are written so,
// too.
std::string EncodeText(std::string_view bytes);

// The bytes of a text that was encoded so, from the UTF-8 that a JSON reader makes of it.
std::string DecodeText(std::string_view utf8);

// The length of the valid UTF-8 character that `bytes` starts with, 0 when there is none.
size_t Utf8Length(std::string_view bytes);
