#include "simulator/package/facts.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <sys/statvfs.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <set>

#include "simulator/package/archive_end.h"
#include "simulator/package/jar_manifest.h"
#include "simulator/package/signature_block.h"
#include "simulator/package/signing_block.h"

namespace simulator {

namespace {

constexpr char kManifestName[] = "META-INF/MANIFEST.MF";
constexpr char kAndroidManifestName[] = "AndroidManifest.xml";

// Longer entries are not read to explain anything.
constexpr uint64_t kMostManifest = 32 << 20;
constexpr uint64_t kMostAndroidManifest = 4 << 20;
constexpr uint64_t kMostBlock = 4 << 20;

FileKind KindOf(int fd, uint64_t size);
bool IsText(const std::string& start);
void ReadArchive(int fd, PackageFacts* facts);
JarSignatureFacts ReadJarSignature(const Archive& archive);
void ReadBlock(const std::string& block, JarSignatureFacts* jar);
bool IsSignatureName(const std::string& name);
std::vector<ListedEntry> ListEntries(const Archive& archive, const std::set<std::string>& listed);
void ReadNewerSigners(int fd, PackageFacts* facts);
bool EndsWith(const std::string& text, const std::string& end);

}  // namespace

PackageFacts LookAt(const std::string& path) {
  PackageFacts facts;
  struct stat state = {};
  if (stat(path.c_str(), &state) != 0) {
    facts.error = errno;
    return facts;
  }
  // As the tool does: nothing waits for a writer, and a socket cannot be opened.
  const int fd = open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK | O_NOCTTY);
  if (fd < 0) {
    facts.error = errno;
    return facts;
  }
  struct statvfs system = {};
  facts.is_read_only = fstatvfs(fd, &system) == 0 && (system.f_flag & ST_RDONLY) != 0;
  if (S_ISDIR(state.st_mode)) {
    facts.kind = FileKind::kFolder;
  } else if (!S_ISREG(state.st_mode)) {
    facts.kind = FileKind::kSpecial;
  } else {
    facts.size = static_cast<uint64_t>(state.st_size);
    facts.kind = KindOf(fd, facts.size);
    if (facts.kind == FileKind::kArchive) ReadArchive(fd, &facts);
  }
  close(fd);
  return facts;
}

AndroidManifest ReadAndroidManifest(const Archive& archive) {
  return ParseCompiledManifest(
      archive.Read(kAndroidManifestName, kMostAndroidManifest).value_or(""));
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
  const Archive archive(fd, &facts->archive_result);
  if (facts->archive_result != 0) return;
  facts->is_package = archive.Has(kAndroidManifestName);
  facts->manifest = ReadAndroidManifest(archive);
  facts->jar = ReadJarSignature(archive);
  facts->jar.has_manifest = archive.Has(kManifestName);
  const auto listing = archive.Read(kManifestName, kMostManifest);
  facts->jar.can_read_manifest = listing.has_value();
  facts->entries = ListEntries(archive, ListedEntries(listing.value_or("")));
  facts->libraries = archive.Entries("lib/", ".so");
  ReadNewerSigners(fd, facts);
}

JarSignatureFacts ReadJarSignature(const Archive& archive) {
  JarSignatureFacts jar;
  for (const ArchiveEntry& entry : archive.Entries("META-INF/", ".SF")) {
    jar.signature_files.push_back(entry.name);
  }
  if (jar.signature_files.empty()) return jar;
  const std::string& name = jar.signature_files[0];
  const std::string text = archive.Read(name, kMostManifest).value_or("");
  jar.claimed_schemes = ClaimedSchemes(text);
  jar.has_manifest_digest = StatesManifestDigest(text);
  const std::string base = name.substr(0, name.rfind('.') + 1);
  for (const char* kind : {"RSA", "EC", "DSA"}) {
    if (!archive.Has(base + kind)) continue;
    jar.block_name = base + kind;
    ReadBlock(archive.Read(jar.block_name, kMostBlock).value_or(""), &jar);
    break;
  }
  return jar;
}

void ReadBlock(const std::string& block, JarSignatureFacts* jar) {
  const SignatureBlockFacts facts = ParseSignatureBlock(block);
  jar->block_is_whole = facts.is_whole;
  jar->signer_count = facts.signer_count;
  jar->has_signed_attributes = facts.has_signed_attributes;
  jar->digest = facts.digest;
  jar->signature_algorithm = facts.signature_algorithm;
  jar->certificate = ParseCertificate(facts.certificate);
}

std::vector<ListedEntry> ListEntries(const Archive& archive, const std::set<std::string>& listed) {
  std::vector<ListedEntry> entries;
  for (ArchiveEntry& entry : archive.Entries()) {
    const bool is_listed = listed.count(entry.name) > 0;
    const bool is_signature = IsSignatureName(entry.name);
    entries.push_back({std::move(entry), is_listed, is_signature});
  }
  return entries;
}

// The manifest, signature files and their blocks, which no manifest lists.
bool IsSignatureName(const std::string& name) {
  const std::string folder = "META-INF/";
  if (name == kManifestName) return true;
  if (name.compare(0, folder.size(), folder) != 0) return false;
  if (name.find('/', folder.size()) != std::string::npos) return false;
  return EndsWith(name, ".SF") || EndsWith(name, ".RSA") || EndsWith(name, ".EC") ||
         EndsWith(name, ".DSA");
}

void ReadNewerSigners(int fd, PackageFacts* facts) {
  const std::string bytes = ReadSigningBlock(fd);
  const SigningBlock block = ParseSigningBlock(bytes);
  facts->has_damaged_signing_block = block.is_damaged;
  for (const NewerSigner& signer : block.signers) {
    const auto certificate = ParseCertificate(signer.certificate);
    facts->has_damaged_signing_block = facts->has_damaged_signing_block || !certificate;
    if (certificate) facts->newer.push_back({signer.scheme, *certificate});
  }
}

bool EndsWith(const std::string& text, const std::string& end) {
  return text.size() >= end.size() && text.compare(text.size() - end.size(), end.size(), end) == 0;
}

}  // namespace

}  // namespace simulator
