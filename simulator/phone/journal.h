// The journal of a simulated run: one JSON object per line, in the order of the events
// (docs/journal.md describes it). Two kinds of code write to the journal: apktoolkit-sim, and the
// stand-ins for libzu, the kernel and the log, which are libraries inside the tool's process. Each
// line is one appending write, so the lines are in the order of the writes. This code uses no JSON
// library, because the stand-ins must not bring libraries into the tool's process.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "simulator/phone/text.h"

namespace simulator {

// The version of the schema; the journal's first line contains it.
inline constexpr int kJournalVersion = 1;

// One line under construction. Keys are plain ASCII names.
class Event {
 public:
  explicit Event(const char* name) : line_("{\"event\":" + EncodeText(name)) {}

  Event& Number(const char* key, int64_t value) { return Json(key, std::to_string(value)); }
  // A text may contain any bytes (see EncodeText).
  Event& Text(const char* key, std::string_view bytes) { return Json(key, EncodeText(bytes)); }
  // As lower-case hexadecimal digits.
  Event& Hex(const char* key, std::string_view bytes) {
    return Json(key, '"' + HexText(bytes) + '"');
  }
  Event& Null(const char* key) { return Json(key, "null"); }
  // A value that is already JSON.
  Event& Json(const char* key, std::string_view value);

  // The whole line, with its line feed.
  std::string Line() const { return line_ + "}\n"; }
  // Appends the line to the open file `journal`. Returns false if it could not be written whole.
  bool AppendTo(int journal) const;

 private:
  std::string line_;
};

// Opens the journal at `path` for appending, close-on-exec. Its descriptor has a high number, so
// that the process's own files get the same descriptors as without the journal. Returns -1 if it
// cannot be opened.
int OpenJournal(const char* path);

}  // namespace simulator
