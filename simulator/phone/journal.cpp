#include "simulator/phone/journal.h"

#include <fcntl.h>
#include <unistd.h>

#include "simulator/phone/descriptors.h"
#include "simulator/phone/text.h"

namespace simulator {

Event::Event(const char* name) : line_("{\"event\":") { line_ += EncodeText(name); }

Event& Event::Number(const char* key, int64_t value) {
  Key(key);
  line_ += std::to_string(value);
  return *this;
}

Event& Event::Text(const char* key, std::string_view bytes) {
  Key(key);
  line_ += EncodeText(bytes);
  return *this;
}

Event& Event::Hex(const char* key, std::string_view bytes) {
  return Json(key, '"' + HexText(bytes) + '"');
}

Event& Event::Null(const char* key) {
  Key(key);
  line_ += "null";
  return *this;
}

Event& Event::Json(const char* key, std::string_view value) {
  Key(key);
  line_ += value;
  return *this;
}

bool Event::AppendTo(int journal) const {
  const std::string line = Line();
  return write(journal, line.data(), line.size()) == static_cast<ssize_t>(line.size());
}

Event& Event::Key(const char* key) {
  line_ += ",\"";
  line_ += key;
  line_ += "\":";
  return *this;
}

int OpenJournal(const char* path) {
  const int fd = open(path, O_WRONLY | O_CREAT | O_APPEND | O_CLOEXEC, 0666);
  return fd < 0 ? fd : MoveHigh(fd);
}

}  // namespace simulator
