#include "simulator/show/output_file.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <filesystem>
#include <fstream>

namespace simulator {

namespace {

namespace fs = std::filesystem;

bool BeginsWith(const std::string& path, std::string_view start) {
  std::string found(start.size(), '\0');
  std::ifstream file(path, std::ios::binary);
  file.read(found.data(), static_cast<std::streamsize>(found.size()));
  return file && found == start;
}

bool AreSame(const struct stat& one, const struct stat& other) {
  return one.st_dev == other.st_dev && one.st_ino == other.st_ino;
}

// The path of the file that a write to `path` would open or create. `path` may name a file that
// does not exist, or a link to such a file.
fs::path Resolved(const std::string& path) {
  constexpr int kMostLinks = 40;  // the kernel's limit
  std::error_code error;
  fs::path target = fs::absolute(path, error);
  for (int i = 0; i < kMostLinks && fs::is_symlink(target, error); ++i) {
    target = target.parent_path() / fs::read_symlink(target, error);
  }
  const fs::path resolved = fs::weakly_canonical(target, error);
  return error ? fs::path(path) : resolved;
}

}  // namespace

std::optional<std::string> OutputFile::Objection(const std::vector<std::string>& inputs) const {
  const std::string named = std::string(kind_.option) + " " + path_;
  struct stat state = {};
  if (stat(path_.c_str(), &state) != 0 || !S_ISREG(state.st_mode)) return {};
  for (const int stream : {STDOUT_FILENO, STDERR_FILENO}) {
    struct stat other = {};
    if (fstat(stream, &other) == 0 && AreSame(state, other)) {
      return named + " is also standard output or standard error; two outputs cannot be one file";
    }
  }
  for (const std::string& input : inputs) {
    struct stat other = {};
    if (stat(input.c_str(), &other) == 0 && AreSame(state, other)) {
      return named + " is an input of this run; it was not changed";
    }
  }
  if (state.st_size == 0 || BeginsWith(path_, kind_.start)) return {};
  return named + " exists and is not a " + kind_.name + " of apktoolkit-sim; it was not changed";
}

bool OutputFile::IsSameAs(const OutputFile& other) const {
  if (!IsWanted() || !other.IsWanted()) return false;
  std::error_code error;
  if (fs::is_other(path_, error)) return false;
  return Resolved(path_) == Resolved(other.path_) || fs::equivalent(path_, other.path_, error);
}

// Waits up to two seconds for a reader of a pipe.
bool OutputFile::Open() {
  constexpr int kMostTries = 20;
  constexpr useconds_t kPause = 100'000;
  if (!IsWanted()) return true;
  const int flags = O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC | O_NONBLOCK;
  for (int i = 0; i < kMostTries; ++i) {
    if (i > 0) usleep(kPause);
    file_.emplace(open(path_.c_str(), flags, 0666));
    if (file_->get() >= 0 || errno != ENXIO) break;
  }
  return file_->get() >= 0 && fcntl(file_->get(), F_SETFL, 0) == 0;
}

bool OutputFile::Append(std::string_view text) const {
  while (IsWanted() && !text.empty()) {
    const ssize_t part = write(file_->get(), text.data(), text.size());
    if (part <= 0) return false;
    text.remove_prefix(static_cast<size_t>(part));
  }
  return true;
}

std::string OutputFile::ErrorText() const {
  return std::string("cannot write the ") + kind_.name + " " + path_ + ": " +
         (errno == ENXIO ? "nobody reads it" : strerrordesc_np(errno));
}

}  // namespace simulator
