#include "simulator/stand_in.h"

#include <fcntl.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <climits>

namespace {

// Open from the start, so that a process without a free descriptor is recorded all the same.
int JournalDescriptor() {
  static const int journal =
      ThisPhone().journal.empty() ? -1 : OpenJournal(ThisPhone().journal.c_str());
  return journal;
}

__attribute__((constructor)) void OpenEarly() {
  const ErrnoKeeper keeper;
  JournalDescriptor();
}

}  // namespace

const Phone& ThisPhone() {
  static const Phone& phone = *new Phone(PhoneFromEnvironment());
  return phone;
}

void Record(const Event& event) {
  const ErrnoKeeper keeper;
  if (JournalDescriptor() >= 0) event.AppendTo(JournalDescriptor());
}

std::string PathOf(int fd) {
  const ErrnoKeeper keeper;
  char path[PATH_MAX];
  const std::string link = "/proc/self/fd/" + std::to_string(fd);
  // The system call itself: a readlink that answers otherwise is there for the tool, not for this.
  const long length = syscall(SYS_readlinkat, AT_FDCWD, link.c_str(), path, sizeof(path));
  return length < 0 ? "" : std::string(path, static_cast<size_t>(length));
}
