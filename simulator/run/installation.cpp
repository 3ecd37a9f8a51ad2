#include "simulator/run/installation.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <climits>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <map>

#include "simulator/package/archive.h"
#include "simulator/package/facts.h"

namespace simulator {

namespace {

namespace fs = std::filesystem;

constexpr char kArm64[] = "arm64";
constexpr char kArm[] = "arm";

// A name as installers take it: a file's, in the folder of its ABI.
struct LibraryName {
  std::string abi;   // such as "arm64-v8a"
  std::string file;  // such as "libvault.so"
};

// What goes where: the path below the package's folder, and the entry that it comes from.
using Layout = std::map<std::string, std::string>;

std::optional<LibraryName> ParseName(const std::string& entry);
bool Wants(InstalledAbi choice, const std::string& folder, bool has_arm64);
Layout PlanLayout(const std::vector<ArchiveEntry>& libraries, InstalledAbi choice,
                  std::vector<std::string>* left_out);
bool PutPackage(const std::string& file, int source, const std::string& copy,
                const Deadline& deadline);
bool Extract(const Archive& archive, const std::string& entry, const std::string& path,
             const Deadline& deadline);
bool WriteAll(int fd, std::string_view bytes);
std::string FileName(const std::string& path);

// A file that is open as long as this object lives.
class OpenFile {
 public:
  explicit OpenFile(int fd) : fd_(fd) {}
  ~OpenFile() {
    if (fd_ >= 0) close(fd_);
  }
  OpenFile(const OpenFile&) = delete;
  OpenFile& operator=(const OpenFile&) = delete;
  int get() const { return fd_; }

 private:
  const int fd_;
};

}  // namespace

Installation::~Installation() {
  std::error_code error;
  if (!folder_.empty()) fs::remove_all(folder_, error);
}

std::optional<std::string> Installation::LayOut(const std::string& file, InstalledAbi abi,
                                                const Deadline& deadline) {
  path_ = file;
  struct stat state = {};
  if (stat(file.c_str(), &state) != 0 || !S_ISREG(state.st_mode)) return {};
  const OpenFile source(open(file.c_str(), O_RDONLY | O_CLOEXEC));
  int32_t result = -1;
  if (source.get() < 0) return {};
  const Archive archive(source.get(), &result);
  if (result != 0) return {};
  if (ReadAndroidManifest(archive).extracts_libraries == false) return {};
  const Layout layout = PlanLayout(archive.Entries("lib/", ".so"), abi, &left_out_);
  if (layout.empty()) return {};

  std::error_code error;
  std::string folder = fs::temp_directory_path(error).string() + "/apktoolkit-sim.XXXXXX";
  if (error) return error.message();
  if (mkdtemp(folder.data()) == nullptr) return folder + ": " + strerrordesc_np(errno);
  folder_ = fs::canonical(folder, error).string();
  const std::string copy = folder_ + "/" + FileName(file);
  if (!PutPackage(file, source.get(), copy, deadline)) return copy + ": " + strerrordesc_np(errno);
  for (const auto& [place, entry] : layout) {
    const std::string path = folder_ + "/" + place;
    fs::create_directories(fs::path(path).parent_path(), error);
    if (!Extract(archive, entry, path, deadline)) {
      left_out_.push_back(entry);
      unlink(path.c_str());
    }
  }
  path_ = copy;
  return {};
}

namespace {

// lib/ABI/FILE, and neither has a way out of its folder.
std::optional<LibraryName> ParseName(const std::string& entry) {
  constexpr size_t kPrefix = 4;  // "lib/"
  const size_t slash = entry.find('/', kPrefix);
  if (slash == std::string::npos || entry.find('\0') != std::string::npos) return {};
  LibraryName name = {entry.substr(kPrefix, slash - kPrefix), entry.substr(slash + 1)};
  if (name.file.find('/') != std::string::npos || name.file.size() > NAME_MAX) return {};
  return name;
}

// One library of a name for each kind of processor: the ABI that comes first in the table wins, as
// with an installer. Other processors' libraries are not for this phone and left alone.
Layout PlanLayout(const std::vector<ArchiveEntry>& libraries, InstalledAbi choice,
                  std::vector<std::string>* left_out) {
  constexpr struct {
    const char* abi;
    const char* folder;
  } kAbis[] = {{"arm64-v8a", kArm64}, {"armeabi-v7a", kArm}, {"armeabi", kArm}};
  Layout layout;
  bool has_arm64 = false;
  for (const auto& row : kAbis) {
    bool is_taken = false;
    for (const ArchiveEntry& entry : libraries) {
      const auto name = ParseName(entry.name);
      if (!name || name->abi != row.abi || !Wants(choice, row.folder, has_arm64)) continue;
      layout.emplace(std::string("lib/") + row.folder + "/" + name->file, entry.name);
      is_taken = true;
    }
    has_arm64 = has_arm64 || (is_taken && strcmp(row.folder, kArm64) == 0);
    // Of two kinds for the same processor, an installer takes one.
    if (is_taken && strcmp(row.folder, kArm) == 0) break;
  }
  for (const ArchiveEntry& entry : libraries) {
    if (!ParseName(entry.name)) left_out->push_back(entry.name);
  }
  return layout;
}

bool Wants(InstalledAbi choice, const std::string& folder, bool has_arm64) {
  switch (choice) {
    case InstalledAbi::kAll:
      return true;
    case InstalledAbi::kArm64:
      return folder == kArm64;
    case InstalledAbi::kArm:
      return folder == kArm;
    case InstalledAbi::kPreferred:
      return folder == kArm64 || !has_arm64;
  }
  return false;
}

// The package itself under another name where the file system allows it, else a copy.
bool PutPackage(const std::string& file, int source, const std::string& copy,
                const Deadline& deadline) {
  constexpr size_t kPart = 1 << 20;
  const int way = AT_SYMLINK_FOLLOW;
  if (linkat(AT_FDCWD, file.c_str(), AT_FDCWD, copy.c_str(), way) == 0) return true;
  const OpenFile target(open(copy.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0644));
  if (target.get() < 0) return false;
  std::string part(kPart, '\0');
  off_t offset = 0;
  ssize_t size;
  while ((size = pread(source, part.data(), part.size(), offset)) > 0) {
    if (!WriteAll(target.get(), {part.data(), static_cast<size_t>(size)})) return false;
    offset += size;
    errno = ETIMEDOUT;
    if (deadline.HasPassed()) return false;
  }
  return size == 0;
}

bool Extract(const Archive& archive, const std::string& entry, const std::string& path,
             const Deadline& deadline) {
  constexpr mode_t kMode = 0755;
  const int flags = O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC;
  const OpenFile file(open(path.c_str(), flags, kMode));
  return file.get() >= 0 && archive.Stream(entry, [&](std::string_view part) {
    return !deadline.HasPassed() && WriteAll(file.get(), part);
  });
}

bool WriteAll(int fd, std::string_view bytes) {
  while (!bytes.empty()) {
    const ssize_t written = write(fd, bytes.data(), bytes.size());
    if (written <= 0) return false;
    bytes.remove_prefix(static_cast<size_t>(written));
  }
  return true;
}

std::string FileName(const std::string& path) { return path.substr(path.rfind('/') + 1); }

}  // namespace

}  // namespace simulator
