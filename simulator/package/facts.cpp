#include "simulator/package/facts.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <sys/statvfs.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <filesystem>
#include <unordered_set>

#include "apk/apk.h"
#include "apk/native_libraries.h"
#include "simulator/package/package_names.h"
#include "simulator/package/signing_block.h"
#include "util/file.h"
#include "util/scoped_fd.h"

namespace simulator {

namespace {

// With these flags, open() does not wait for a writer of a pipe or for the holder of a lease. A
// terminal does not become the controlling terminal.
constexpr int kOpenFlags = O_RDONLY | O_CLOEXEC | O_NONBLOCK | O_NOCTTY;

FileKind KindOf(int fd, uint64_t size);
uint64_t CountPackages(const std::string& directory);
bool IsText(const std::string& start);
void ReadArchive(int fd, const IsLate& is_late, PackageFacts* facts);
std::string FindEntryTwice(int fd);
void FindLibraries(const Archive& archive, const std::string& path, PackageFacts* facts);
LibraryFacts FindLibrary(const std::string& entry, const std::string& path);
void ReadNewerSigners(int fd, PackageFacts* facts);

}  // namespace

PackageFacts LookAt(const std::string& path, const IsLate& is_late) {
  PackageFacts facts;
  const ScopedFd file(open(path.c_str(), kOpenFlags));
  struct stat state = {};
  if (file.get() < 0 || fstat(file.get(), &state) != 0) {
    facts.error = errno;
    return facts;
  }
  struct statvfs system = {};
  facts.is_read_only = fstatvfs(file.get(), &system) == 0 && (system.f_flag & ST_RDONLY) != 0;
  if (S_ISDIR(state.st_mode)) {
    facts.kind = FileKind::kDirectory;
    facts.packages = CountPackages(path);
  } else if (!S_ISREG(state.st_mode)) {
    facts.kind = FileKind::kSpecial;
  } else {
    facts.size = static_cast<uint64_t>(state.st_size);
    facts.kind = KindOf(file.get(), facts.size);
    facts.sha256 = FileSha256(file.get(), is_late);
    if (facts.kind == FileKind::kArchive) ReadArchive(file.get(), is_late, &facts);
  }
  return facts;
}

std::string FileSha256(int fd, const IsLate& is_late) {
  constexpr size_t kPart = 1 << 20;
  Sha256 digest;
  std::string part(kPart, '\0');
  for (off_t offset = 0; !is_late();) {
    const ssize_t size = pread(fd, part.data(), part.size(), offset);
    if (size < 0) break;
    if (size == 0) return digest.Hex();
    digest.Add({part.data(), static_cast<size_t>(size)});
    offset += size;
  }
  return {};
}

std::vector<std::string> NewerSchemes(const PackageFacts& facts) {
  std::vector<std::string> schemes;
  for (const NewerSignerFacts& signer : facts.newer) {
    const bool is_known = std::find(schemes.begin(), schemes.end(), signer.scheme) != schemes.end();
    if (!is_known) schemes.push_back(signer.scheme);
  }
  return schemes;
}

namespace {

FileKind KindOf(int fd, uint64_t size) {
  constexpr char kLocalHeader[] = "PK\3\4";
  constexpr size_t kStart = 4096;
  if (size == 0) return FileKind::kEmpty;
  if (FindArchiveEnd(fd)) return FileKind::kArchive;
  const std::string start = ReadAt(fd, 0, kStart);
  if (start.compare(0, 4, kLocalHeader) == 0) return FileKind::kCutArchive;
  return IsText(start) ? FileKind::kText : FileKind::kNoArchive;
}

// If the directory cannot be read to its end, counts the packages before the error.
uint64_t CountPackages(const std::string& directory) {
  namespace fs = std::filesystem;
  uint64_t count = 0;
  std::error_code error;
  for (fs::directory_iterator entry(directory, error); entry != fs::directory_iterator();
       entry.increment(error)) {
    count += IsPackageName(entry->path().string()) && !entry->is_directory(error) ? 1 : 0;
  }
  return count;
}

// False if `start` has a control character that texts do not contain, such as NUL.
bool IsText(const std::string& start) {
  return std::all_of(start.begin(), start.end(), [](char c) {
    const unsigned char byte = static_cast<unsigned char>(c);
    return (byte >= 0x20 && byte != 0x7f) || (byte >= '\a' && byte <= '\r') || byte == 0x1b;
  });
}

void ReadArchive(int fd, const IsLate& is_late, PackageFacts* facts) {
  Archive archive(fd, &facts->archive_result);
  if (facts->archive_result != 0) {
    facts->entry_twice = FindEntryTwice(fd);
    return;
  }
  std::vector<uint8_t> manifest;
  archive.Read(kAndroidManifestName, &manifest);
  facts->manifest = ParseAndroidManifest(manifest);
  facts->jar = ReadJarSignature(&archive);
  std::vector<uint8_t> text;
  facts->jar.manifest = archive.Read(ApkTools::Apk::kMANIFEST_MF, &text);
  PackageEntries entries = CompareEntries(&archive, std::move(text), is_late);
  facts->entries = std::move(entries.all);
  facts->missing = std::move(entries.missing);
  FindLibraries(archive, GetFilenameByFd(fd), facts);
  facts->too_long = archive.too_long();
  if (facts->manifest.has_overlaps) facts->too_long.push_back(kAndroidManifestName);
  ReadNewerSigners(fd, facts);
  facts->was_changed = archive.HasShrunk();
}

// Returns the first name that the archive has twice. The platform's library does not open such an
// archive.
std::string FindEntryTwice(int fd) {
  const auto end = FindArchiveEnd(fd);
  std::unordered_set<std::string> names;
  for (const ArchiveEntry& entry : end ? ReadDirectory(fd, *end) : std::vector<ArchiveEntry>()) {
    if (!names.insert(entry.name).second) return entry.name;
  }
  return {};
}

// Archive::Walk does not return the names of damaged entries. The second loop adds the
// libraries with damaged entries from `facts->entries`.
void FindLibraries(const Archive& archive, const std::string& path, PackageFacts* facts) {
  const ArchiveWalk walk = archive.Walk(kLibraryNames);
  for (size_t i = 0; i < walk.names.size(); ++i) {
    facts->libraries.push_back(FindLibrary(walk.names[i], path));
    facts->libraries.back().is_met = i < walk.met;
  }
  for (const ListedEntry& each : facts->entries) {
    if (!each.entry.is_damaged || !kLibraryNames.Has(each.entry.name)) continue;
    facts->libraries.push_back(FindLibrary(each.entry.name, path));
    facts->libraries.back().is_met = false;
  }
}

// Tries to open the file at the path where the tool looks for the library. Unlike the tool, does
// not wait for the holder of a lease.
LibraryFacts FindLibrary(const std::string& entry, const std::string& path) {
  LibraryFacts library;
  library.entry = entry;
  library.place = ApkTools::InstalledLibraryPath("", entry);
  if (library.place.empty()) return library;
  const std::string place = ApkTools::InstalledLibraryPath(path, entry);
  const ScopedFd file(open(place.c_str(), kOpenFlags));
  if (file.get() < 0) library.error = errno;
  struct stat state = {};
  library.has_directory = stat(place.substr(0, place.rfind('/') + 1).c_str(), &state) == 0;
  return library;
}

void ReadNewerSigners(int fd, PackageFacts* facts) {
  const auto end = FindArchiveEnd(fd);
  bool is_too_large = false;
  const std::string bytes = end ? ReadSigningBlock(fd, *end, &is_too_large) : std::string();
  if (is_too_large) facts->too_long.push_back("the signing block (v2 and later)");
  const SigningBlock block = ParseSigningBlock(bytes);
  facts->has_damaged_signing_block = block.is_damaged;
  for (const NewerSigner& signer : block.signers) {
    const auto certificate = ParseCertificate(signer.certificate);
    facts->has_damaged_signing_block = facts->has_damaged_signing_block || !certificate;
    if (certificate) facts->newer.push_back({signer.scheme, *certificate});
  }
}

}  // namespace

}  // namespace simulator
