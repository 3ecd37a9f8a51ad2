// The facts that the simulator finds in a file: its kind and, for a package, its signer, its
// entries, and the libraries beside it. The facts explain the tool's answer. They never make a
// refused file count as signed. The facts of a malformed part are missing.
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
  kUnreadable,  // it cannot be opened; see `error`
  kDirectory,
  kSpecial,  // a device, a pipe or a socket
  kEmpty,
  kText,
  kCutArchive,  // begins like an archive, but its end is missing
  kNoArchive,
  kArchive,
};

// One signer of one signature scheme that is newer than JAR signing (v1).
struct NewerSignerFacts {
  std::string scheme;  // "v2", "v3" or "v3.1"
  CertificateFacts certificate;
};

// A library lib/….so of the package, and the file at the place where the tool looks for it.
struct LibraryFacts {
  std::string entry;  // its name in the package
  // The path at which the tool looks for the file, relative to the package's directory; empty:
  // `entry` does not begin with the directory of an Arm ABI.
  std::string place;
  // True if the tool reaches `entry`. False for a damaged entry, and for each entry after the first
  // damaged one.
  bool is_met = true;
  int error = 0;               // errno of opening the file; 0: it can be opened, or no `place`
  bool has_directory = false;  // the file's directory exists
};

struct PackageFacts {
  FileKind kind = FileKind::kUnreadable;
  int error = 0;              // errno of opening the file
  bool is_read_only = false;  // its file system is read-only
  bool was_changed = false;   // the file became shorter while it was read
  uint64_t size = 0;          // of the file, in bytes
  std::string sha256;         // of the file's bytes; empty: it was not read to its end
  // For a directory: the number of files in it whose names end like a package's, such as .apk.
  uint64_t packages = 0;
  // The result of the zip library. If it is 0, the library opened the archive, and the members
  // after `entry_twice` are filled.
  int32_t archive_result = -1;

  std::string entry_twice;  // the first name that a refused archive has twice; empty: none

  AndroidManifest manifest;
  JarSignatureFacts jar;
  std::vector<NewerSignerFacts> newer;
  bool has_damaged_signing_block = false;
  // Parts that were not read because they are too long, or an Android manifest whose strings
  // overlap.
  std::vector<std::string> too_long;
  std::vector<ListedEntry> entries;
  std::vector<std::string> missing;  // names in MANIFEST.MF that the archive does not have
  // In the order in which the tool reads their entries, damaged ones last.
  std::vector<LibraryFacts> libraries;
};

// Looks at the file at `path`, and at the libraries beside it. Reads no pipes and no devices, and
// never waits. After `is_late` returns true, reads no more bytes for `sha256`, and compares no more
// entries with their digests in MANIFEST.MF.
PackageFacts LookAt(const std::string& path, const IsLate& is_late = IsNeverLate);

// The SHA-256 digest of the bytes of an open file, in lower-case hexadecimal; empty if they cannot
// be read, or if `is_late` returns true before their end.
std::string FileSha256(int fd, const IsLate& is_late = IsNeverLate);

// The names of the file's schemes after v1, each once, in the file's order.
std::vector<std::string> NewerSchemes(const PackageFacts& facts);

}  // namespace simulator
