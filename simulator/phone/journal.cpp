#include "simulator/phone/journal.h"

#include <fcntl.h>
#include <unistd.h>

#include "simulator/phone/descriptors.h"

namespace simulator {

Event& Event::Json(const char* key, std::string_view value) {
  line_ += ",\"";
  line_ += key;
  line_ += "\":";
  line_ += value;
  return *this;
}

bool Event::AppendTo(int journal) const {
  const std::string line = Line();
  return write(journal, line.data(), line.size()) == static_cast<ssize_t>(line.size());
}

int OpenJournal(const char* path) {
  const int fd = open(path, O_WRONLY | O_CREAT | O_APPEND | O_CLOEXEC, 0666);
  return fd < 0 ? fd : MoveHigh(fd);
}

}  // namespace simulator
