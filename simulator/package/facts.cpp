#include "simulator/package/facts.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <sys/statvfs.h>

#include <algorithm>
#include <cerrno>

#include "apk/apk.h"
#include "apk/entry_digests.h"
#include "apk/native_libraries.h"
#include "simulator/package/signing_block.h"
#include "util/file.h"
#include "util/scoped_fd.h"
#include "util/text.h"

namespace simulator {

namespace {

// Nothing waits for a writer or for whoever holds a lease, and a terminal stays whose it was.
constexpr int kOpenFlags = O_RDONLY | O_CLOEXEC | O_NONBLOCK | O_NOCTTY;

FileKind KindOf(int fd, uint64_t size);
bool IsText(const std::string& start);
void ReadArchive(int fd, PackageFacts* facts);
void ListEntries(Archive* archive, PackageFacts* facts);
bool IsSignatureName(const std::string& name);
void FindLibraries(const Archive& archive, const std::string& path, PackageFacts* facts);
LibraryFacts FindLibrary(const std::string& entry, const std::string& path);
void ReadNewerSigners(int fd, PackageFacts* facts);

}  // namespace

PackageFacts LookAt(const std::string& path) {
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
  } else if (!S_ISREG(state.st_mode)) {
    facts.kind = FileKind::kSpecial;
  } else {
    facts.size = static_cast<uint64_t>(state.st_size);
    facts.kind = KindOf(file.get(), facts.size);
    if (facts.kind == FileKind::kArchive) ReadArchive(file.get(), &facts);
  }
  return facts;
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

// No control characters but those that texts have.
bool IsText(const std::string& start) {
  return std::all_of(start.begin(), start.end(), [](char c) {
    const unsigned char byte = static_cast<unsigned char>(c);
    return (byte >= 0x20 && byte != 0x7f) || (byte >= '\a' && byte <= '\r') || byte == 0x1b;
  });
}

void ReadArchive(int fd, PackageFacts* facts) {
  Archive archive(fd, &facts->archive_result);
  if (facts->archive_result != 0) return;
  std::vector<uint8_t> manifest;
  archive.Read(kAndroidManifestName, &manifest);
  facts->manifest = ParseAndroidManifest(manifest);
  facts->jar = ReadJarSignature(&archive);
  ListEntries(&archive, facts);
  FindLibraries(archive, GetFilenameByFd(fd), facts);
  facts->too_long = archive.too_long();
  if (facts->manifest.has_overlaps) facts->too_long.push_back(kAndroidManifestName);
  ReadNewerSigners(fd, facts);
  facts->was_changed = archive.HasShrunk();
}

void ListEntries(Archive* archive, PackageFacts* facts) {
  std::vector<uint8_t> text;
  facts->jar.manifest = archive->Read(ApkTools::Apk::kMANIFEST_MF, &text);
  ApkTools::EntryDigests manifest;
  manifest.Load(std::move(text));
  manifest.List();
  std::string digest_name, digest;
  for (ArchiveEntry& entry : archive->Entries()) {
    const bool is_listed = manifest.Find(entry.name, digest_name, digest);
    const bool is_signature = IsSignatureName(entry.name);
    facts->entries.push_back({std::move(entry), is_listed, is_signature});
  }
}

// The manifest, signature files and their blocks, which no manifest lists.
bool IsSignatureName(const std::string& name) {
  constexpr std::string_view kDirectory = "META-INF/";
  if (name == ApkTools::Apk::kMANIFEST_MF) return true;
  if (name.compare(0, kDirectory.size(), kDirectory) != 0) return false;
  if (name.find('/', kDirectory.size()) != std::string::npos) return false;
  return EndsWith(name, ".SF") || EndsWith(name, ".RSA") || EndsWith(name, ".EC") ||
         EndsWith(name, ".DSA");
}

// The tool's walk names all but the damaged ones.
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

// What lies at the place of the library, told by opening it as the tool does.
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
  if (is_too_large) facts->too_long.push_back("the block of the schemes after v1");
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
