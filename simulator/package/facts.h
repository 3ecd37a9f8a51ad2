// The facts that the simulator finds in a file: its kind, and, of a package, the signer, the
// entries that the signature lists, and the libraries that lie beside it. The facts explain the
// tool's answer and decide nothing. A malformed part counts as missing.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "simulator/package/android_manifest.h"
#include "simulator/package/archive.h"
#include "simulator/package/certificate.h"
#include "simulator/package/entries.h"
#include "simulator/package/jar_signature.h"

namespace simulator {

enum class FileKind {
  kUnreadable,  // it cannot be opened; `error` says why
  kDirectory,
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

// A library lib/….so of the package, and what lies where the tool looks for it.
struct LibraryFacts {
  std::string entry;  // its name in the package
  // Where the installer puts it, from the package's directory on; empty: no phone of this kind
  // does.
  std::string place;
  bool is_met = true;          // by the tool's walk over the libraries
  int error = 0;               // of opening the file as the tool does; 0: it can be opened
  bool has_directory = false;  // the file's directory is there
};

struct PackageFacts {
  FileKind kind = FileKind::kUnreadable;
  int error = 0;              // of opening the file
  bool is_read_only = false;  // its file system is
  bool was_changed = false;   // while it was looked at
  uint64_t size = 0;          // of the file, in bytes
  std::string sha256;         // of the file's bytes; empty: it was not read to its end
  uint64_t packages = 0;      // of a directory: the files in it that have a package's name
  // The zip library's; 0: it is an archive, and what follows is filled.
  int32_t archive_result = -1;

  std::string entry_twice;  // the first entry that stands in it again; empty: none does

  AndroidManifest manifest;
  JarSignatureFacts jar;
  std::vector<NewerSignerFacts> newer;
  bool has_damaged_signing_block = false;
  std::vector<std::string> too_long;  // what is there and was not looked into, for its length
  std::vector<ListedEntry> entries;
  std::vector<std::string> missing;  // names that the manifest lists and the archive does not have
  // In the order in which the tool walks through them, damaged ones last.
  std::vector<LibraryFacts> libraries;
};

// Looks at the file at `path`, and at the libraries beside it. Neither a pipe nor a device is read,
// and nothing is waited for. Once `is_late` says so, no further entry is compared with the
// manifest.
PackageFacts LookAt(
    const std::string& path, const IsLate& is_late = [] { return false; });

// The SHA-256 digest of the bytes of an open file, in lower-case hexadecimal; empty once it is
// late, and where they cannot be read.
std::string FileSha256(
    int fd, const IsLate& is_late = [] { return false; });

// The names of the schemes after v1 that somebody signed with, each once, in the file's order.
std::vector<std::string> NewerSchemes(const PackageFacts& facts);

}  // namespace simulator
