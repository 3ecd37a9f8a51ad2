// What can be said of a file by looking at it, without the tool: what it is, and, of a package, who
// signed it and what its signature lists. It explains what the tool did and decides nothing: what
// does not read here is simply not there.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "simulator/package/archive.h"
#include "simulator/package/certificate.h"
#include "simulator/package/compiled_manifest.h"

namespace simulator {

enum class FileKind {
  kUnreadable,  // it cannot be opened; `error` says why
  kFolder,
  kSpecial,  // a device, a pipe or a socket
  kEmpty,
  kText,
  kCutArchive,  // begins like an archive and has no end
  kNoArchive,
  kArchive,
};

// One signer of one scheme after JAR signing.
struct NewerSignerFacts {
  std::string scheme;  // "v2", "v3" or "v3.1"
  CertificateFacts certificate;
};

// The JAR signature that the tool looks at, and what stands beside it.
struct JarSignatureFacts {
  bool has_manifest = false;  // META-INF/MANIFEST.MF
  bool can_read_manifest = false;
  // Those entries META-INF/*.SF, in the tool's order: it takes the first.
  std::vector<std::string> signature_files;
  // The block beside the first, whatever its kind (RSA, EC, DSA); empty: none.
  std::string block_name;
  bool block_is_whole = false;
  size_t signer_count = 0;
  bool has_signed_attributes = false;
  std::string digest;               // that the first signer signed, such as "SHA-256"
  std::string signature_algorithm;  // of the first signer
  std::optional<CertificateFacts> certificate;
  std::string claimed_schemes;       // see ClaimedSchemes
  bool has_manifest_digest = false;  // the signature file states one, of whatever kind
};

struct ListedEntry {
  ArchiveEntry entry;
  bool is_listed;     // the manifest has a digest for it
  bool is_signature;  // it belongs to a JAR signature itself
};

struct PackageFacts {
  FileKind kind = FileKind::kUnreadable;
  int error = 0;              // of opening the file
  bool is_read_only = false;  // its file system is
  uint64_t size = 0;          // of the file, in bytes
  int32_t archive_result =
      -1;  // the zip library's; 0: it is an archive, and what follows is filled

  bool is_package = false;  // has an AndroidManifest.xml
  AndroidManifest manifest;
  JarSignatureFacts jar;
  std::vector<NewerSignerFacts> newer;
  bool has_damaged_signing_block = false;
  std::vector<ListedEntry> entries;
  // lib/….so, in the order in which the tool walks through them.
  std::vector<ArchiveEntry> libraries;
};

// What its compiled AndroidManifest.xml says; nothing where that cannot be read.
AndroidManifest ReadAndroidManifest(const Archive& archive);

// Looks at the file at `path`. A pipe or a device is not opened.
PackageFacts LookAt(const std::string& path);

// The names of the schemes after v1 that somebody signed with, each once, in the file's order.
std::vector<std::string> NewerSchemes(const PackageFacts& facts);

}  // namespace simulator
