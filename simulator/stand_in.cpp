#include "simulator/stand_in.h"

#include <unistd.h>

#include <climits>

const Phone& ThisPhone() {
  static const Phone& phone = *new Phone(PhoneFromEnvironment());
  return phone;
}

void Record(const Event& event) {
  const ErrnoKeeper keeper;
  static const int journal =
      ThisPhone().journal.empty() ? -1 : OpenJournal(ThisPhone().journal.c_str());
  if (journal >= 0) event.AppendTo(journal);
}

std::string PathOf(int fd) {
  const ErrnoKeeper keeper;
  char path[PATH_MAX];
  const ssize_t length =
      readlink(("/proc/self/fd/" + std::to_string(fd)).c_str(), path, sizeof(path));
  return length < 0 ? "" : std::string(path, static_cast<size_t>(length));
}
