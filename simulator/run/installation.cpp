#include "simulator/run/installation.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <sys/statvfs.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <climits>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <map>
#include <set>

#include "apk/native_libraries.h"
#include "simulator/package/android_manifest.h"
#include "simulator/package/archive.h"
#include "simulator/phone/text.h"
#include "util/file.h"
#include "util/scoped_fd.h"

namespace simulator {

namespace {

namespace fs = std::filesystem;

// The ABIs of a phone, in the order in which its installer prefers them.
constexpr const char* kPhoneAbis[] = {"arm64-v8a", "armeabi-v7a", "armeabi"};
constexpr char kArm64Directory[] = "lib/arm64";

// Maps a path, relative to the package's directory, to the entry that is extracted to this path.
using Layout = std::map<std::string, std::string>;

std::vector<std::string> LibraryNames(const Archive& archive);
bool LiesAlone(int package, const std::vector<std::string>& libraries);
Layout PlanLayout(const std::vector<std::string>& entries, InstalledAbi choice,
                  std::vector<std::string>* left_out, std::set<std::string>* of_other_abis);
bool IsNameForInstallers(const std::string& entry);
bool Wants(InstalledAbi choice, bool is_arm64, bool has_arm64);
bool PutPackage(const std::string& file, int source, const std::string& copy,
                const Deadline& deadline);
int Extract(const Archive& archive, const std::string& entry, const std::string& path,
            const Deadline& deadline);
bool WriteAll(int fd, std::string_view bytes, const Deadline& deadline);

}  // namespace

Installation::~Installation() {
  std::error_code error;
  if (!directory_.empty()) fs::remove_all(directory_, error);
}

std::optional<std::string> Installation::LayOut(const std::string& file, InstallWhen when,
                                                InstalledAbi abi, const Deadline& deadline) {
  path_ = file;
  if (when == InstallWhen::kNever) return {};
  std::error_code error;
  if (!fs::is_regular_file(file, error)) return {};
  const ScopedFd source(open(file.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK));
  int32_t result = -1;
  if (source.get() < 0) return {};
  Archive archive(source.get(), &result);
  if (result != 0) return {};
  std::vector<uint8_t> manifest;
  if (archive.Read(kAndroidManifestName, &manifest) == Archive::ReadResult::kMissing) return {};
  if (ParseAndroidManifest(manifest).extracts_libraries == false) return {};
  const std::vector<std::string> libraries = LibraryNames(archive);
  if (when == InstallWhen::kAlone && !LiesAlone(source.get(), libraries)) return {};
  const Layout layout = PlanLayout(libraries, abi, &left_out_, &of_other_abis_);
  if (layout.empty()) return {};

  std::string directory = fs::temp_directory_path(error).string() + "/apktoolkit-sim.XXXXXX";
  if (error) return "TMPDIR: " + error.message();
  const auto failure = [](const std::string& path, int number) {
    return path + ": " + strerrordesc_np(number);
  };
  if (mkdtemp(directory.data()) == nullptr) {
    return failure(fs::path(directory).parent_path().string(), errno);
  }
  directory_ = fs::canonical(directory, error).string();
  // No library can have this path: libraries are extracted below lib/.
  const std::string copy = directory_ + "/base.apk";
  if (!PutPackage(file, source.get(), copy, deadline)) {
    return failure(std::string(kInstalledDirectory) + "base.apk", errno);
  }
  for (const auto& [place, entry] : layout) {
    const std::string path = directory_ + "/" + place;
    fs::create_directories(fs::path(path).parent_path(), error);
    const int extracted = Extract(archive, entry, path, deadline);
    if (extracted == 0) continue;
    if (extracted > 0) return failure(kInstalledDirectory + place, extracted);
    not_extracted_.push_back(entry);
    unlink(path.c_str());
  }
  if (archive.HasShrunk()) return "it became shorter meanwhile";
  path_ = copy;
  is_done_ = true;
  return {};
}

// Replaces the temporary directory's path wherever the journal contains it. mkdtemp makes the end
// of this path random, so the author of a package cannot put the path into a name.
std::string Installation::WithStablePaths(const std::string& journal) const {
  if (directory_.empty()) return journal;
  const std::string quoted = EncodeText(directory_ + "/");
  const std::string directory = quoted.substr(1, quoted.size() - 2);
  std::string stable;
  size_t from = 0;
  for (size_t at; (at = journal.find(directory, from)) != std::string::npos;
       from = at + directory.size()) {
    stable.append(journal, from, at - from).append(kInstalledDirectory);
  }
  return stable.append(journal.substr(from));
}

namespace {

// The names of all library entries, including entries that cannot be extracted.
std::vector<std::string> LibraryNames(const Archive& archive) {
  std::vector<std::string> names;
  for (const ArchiveEntry& entry : archive.Entries()) {
    if (kLibraryNames.Has(entry.name)) names.push_back(entry.name);
  }
  return names;
}

// True if nothing was installed beside the package: the installer's directories, such as lib/arm64,
// do not exist, and nothing is at the paths where the tool looks for libraries. Like the tool, this
// function looks beside the open file, not beside a link to it. Returns false for a file on a
// read-only file system: the tool does not sign there, and a copy in another place would hide this.
// Also returns false if the file's path or file system cannot be determined.
bool LiesAlone(int package, const std::vector<std::string>& libraries) {
  const std::string file = GetFilenameByFd(package);
  struct statvfs system = {};
  if (file.empty() || fstatvfs(package, &system) != 0 || (system.f_flag & ST_RDONLY) != 0)
    return false;
  const auto is_there = [](const std::string& path) {
    struct stat state = {};
    return lstat(path.c_str(), &state) == 0 || (errno != ENOENT && errno != ENOTDIR);
  };
  const std::string directory = file.substr(0, file.rfind('/') + 1);
  for (const ApkTools::LibraryDirectory& each : ApkTools::kLibraryDirectories) {
    if (is_there(directory + each.installed)) return false;
  }
  return std::none_of(libraries.begin(), libraries.end(), [&](const std::string& entry) {
    const std::string place = ApkTools::InstalledLibraryPath(file, entry);
    return !place.empty() && is_there(place);
  });
}

// `choice` selects the processors (InstalledAbi): 64-bit Arm, 32-bit Arm or both. For each selected
// processor, an installer uses only one of the processor's ABIs. It is the first of these ABIs in
// kPhoneAbis for which the package has libraries.
Layout PlanLayout(const std::vector<std::string>& entries, InstalledAbi choice,
                  std::vector<std::string>* left_out, std::set<std::string>* of_other_abis) {
  Layout layout;
  std::set<std::string> taken;  // directories for libraries that are in `layout`
  for (const char* const abi : kPhoneAbis) {
    const std::string abi_directory = kLibraryNames.prefix + std::string(abi);
    const std::string installed = ApkTools::InstalledLibraryPath("", abi_directory);
    const bool has_arm64 = taken.count(kArm64Directory) != 0;
    const bool is_wanted =
        taken.count(installed) == 0 && Wants(choice, installed == kArm64Directory, has_arm64);
    for (const std::string& entry : entries) {
      const bool is_of_abi = entry.rfind(abi_directory + "/", 0) == 0;
      if (!is_of_abi || !IsNameForInstallers(entry)) continue;
      if (is_wanted) {
        layout.emplace(ApkTools::InstalledLibraryPath("", entry), entry);
        taken.insert(installed);
      } else {
        of_other_abis->insert(entry);
      }
    }
  }
  for (const std::string& entry : entries) {
    if (!IsNameForInstallers(entry)) left_out->push_back(entry);
  }
  return layout;
}

// `entry` must be a name from LibraryNames. Returns true if `entry` is lib/ABI/FILE and an
// installer accepts the name FILE. FILE then cannot lead out of the directory of its ABI: FILE
// contains no "/", and it is not "." or ".." because it ends with ".so".
bool IsNameForInstallers(const std::string& entry) {
  const size_t slash = entry.find('/', strlen(kLibraryNames.prefix));
  return slash != std::string::npos && entry.find('/', slash + 1) == std::string::npos &&
         entry.find('\0') == std::string::npos && entry.size() - slash - 1 <= NAME_MAX;
}

bool Wants(InstalledAbi choice, bool is_arm64, bool has_arm64) {
  if (choice == InstalledAbi::kPreferred) return is_arm64 || !has_arm64;
  return choice == InstalledAbi::kAll || (choice == InstalledAbi::kArm64) == is_arm64;
}

// Makes a hard link to the package if the file system allows it, else a copy. Returns false, with
// errno set, if neither can be made.
bool PutPackage(const std::string& file, int source, const std::string& copy,
                const Deadline& deadline) {
  constexpr size_t kPart = 1 << 20;
  const int way = AT_SYMLINK_FOLLOW;
  if (linkat(AT_FDCWD, file.c_str(), AT_FDCWD, copy.c_str(), way) == 0) return true;
  const ScopedFd target(open(copy.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0644));
  if (target.get() < 0) return false;
  std::string part(kPart, '\0');
  off_t offset = 0;
  ssize_t size;
  while ((size = pread(source, part.data(), part.size(), offset)) > 0) {
    if (!WriteAll(target.get(), {part.data(), static_cast<size_t>(size)}, deadline)) return false;
    offset += size;
  }
  return size == 0;
}

// Returns 0 if the whole entry was extracted to `path`. If the file at `path` cannot be created or
// written, returns the errno. If the entry cannot be read to its end, returns -1.
int Extract(const Archive& archive, const std::string& entry, const std::string& path,
            const Deadline& deadline) {
  constexpr mode_t kMode = 0755;
  const int flags = O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC;
  const ScopedFd file(open(path.c_str(), flags, kMode));
  if (file.get() < 0) return errno;
  int error = 0;
  const bool is_whole = archive.Stream(entry, [&](std::string_view part) {
    if (!WriteAll(file.get(), part, deadline)) error = errno;
    return error == 0;
  });
  if (error != 0) return error;
  return is_whole ? 0 : -1;
}

bool WriteAll(int fd, std::string_view bytes, const Deadline& deadline) {
  while (!bytes.empty()) {
    errno = ETIMEDOUT;
    if (deadline.HasPassed()) return false;
    const ssize_t written = write(fd, bytes.data(), bytes.size());
    if (written <= 0) return false;
    bytes.remove_prefix(static_cast<size_t>(written));
  }
  return true;
}

}  // namespace

}  // namespace simulator
