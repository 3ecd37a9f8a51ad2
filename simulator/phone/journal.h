// The journal of a simulated run: one JSON object per line, in the order of the events
// (docs/journal.md describes it). Two kinds of code write to the journal: apktoolkit-sim, and the
// stand-ins for libzu, the kernel and the log, which are libraries inside the tool's process. Each
// line is one appending write, so the lines are in the order of the writes. The stand-ins must load
// no further libraries into the tool's process, so this file uses no JSON library.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "simulator/phone/text.h"

namespace simulator {

// The version of docs/journal.schema.json; the journal's first line contains this version.
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
  // Appends the line to the open file `journal`. Returns false if the line was not written whole.
  bool AppendTo(int journal) const;

 private:
  std::string line_;
};

// Opens the journal at `path` for appending, close-on-exec. Its descriptor has a high number, so
// that the process's own files get the same descriptors as without the journal. Returns -1 if the
// journal cannot be opened.
int OpenJournal(const char* path);

}  // namespace simulator
