#include "simulator/program/journal_file.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <fstream>

namespace {

bool IsJournal(const std::string& path) {
  const std::string first = "{\"event\":\"journal\"";
  std::string start(first.size(), '\0');
  std::ifstream file(path, std::ios::binary);
  file.read(start.data(), static_cast<std::streamsize>(start.size()));
  return file && start == first;
}

}  // namespace

JournalFile::~JournalFile() {
  if (fd_ >= 0) close(fd_);
}

std::optional<std::string> JournalFile::Objection(const std::string& path,
                                                  const std::vector<std::string>& inputs) {
  struct stat state = {};
  if (stat(path.c_str(), &state) != 0 || !S_ISREG(state.st_mode)) return {};
  for (const std::string& input : inputs) {
    struct stat other = {};
    if (stat(input.c_str(), &other) == 0 && other.st_dev == state.st_dev &&
        other.st_ino == state.st_ino) {
      return "--journal " + path + " is a file that is to be looked at; it is left alone";
    }
  }
  if (state.st_size == 0 || IsJournal(path)) return {};
  return "--journal " + path + " is there and holds no journal; it is left alone";
}

bool JournalFile::Open(const std::string& path) {
  fd_ = open(path.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0666);
  return fd_ >= 0;
}

bool JournalFile::Append(const std::string& lines) const {
  size_t written = 0;
  while (written < lines.size()) {
    const ssize_t part = write(fd_, lines.data() + written, lines.size() - written);
    if (part <= 0) return false;
    written += static_cast<size_t>(part);
  }
  return true;
}
