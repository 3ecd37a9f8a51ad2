// The facts that the simulator finds in a file: the file's kind and, for an archive, its signer,
// its entries, and the libraries beside it. The facts explain the tool's answer. The facts never
// make a refused file count as signed. If a part of the file is malformed, some or all facts of
// this part are missing.
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
  kUnreadable,  // the file cannot be opened; see `error`
  kDirectory,
  kSpecial,  // a device, a pipe or a socket
  kEmpty,
  kText,
  kCutArchive,  // begins like an archive, but has no end of central directory record
  kNoArchive,
  kArchive,
};

// One signer of one signature scheme that is newer than JAR signing (v1).
struct NewerSignerFacts {
  std::string scheme;  // "v2", "v3" or "v3.1"
  CertificateFacts certificate;
};

// A library lib/….so of the package, and the state of the extracted file at `place`.
struct LibraryFacts {
  std::string entry;  // the library's name in the package
  // The path at which the tool looks for the extracted file, relative to the package's directory.
  // Empty if no prefix in kLibraryDirectories (apk/native_libraries.h) matches `entry`.
  std::string place;
  // True if the tool reaches `entry`. The tool stops at the first library whose entry is damaged:
  // it reaches neither this library nor the libraries after it.
  bool is_met = true;
  int error = 0;               // errno of opening the file; 0: success, or `place` is empty
  bool has_directory = false;  // the file's directory exists
};

struct PackageFacts {
  FileKind kind = FileKind::kUnreadable;
  int error = 0;              // errno of opening the file
  bool is_read_only = false;  // its file system is read-only
  bool was_changed = false;   // the file became shorter while it was read
  uint64_t size = 0;          // of the file, in bytes
  std::string sha256;         // of the file's bytes; empty: it was not read to its end
  // For a directory: the number of its files that have a package's extension, such as .apk.
  uint64_t packages = 0;
  // The zip library's result of opening the archive. If the result is 0, the members after
  // `entry_twice` are filled.
  int32_t archive_result = -1;

  // The first name that the archive has twice. The zip library does not open an archive with such a
  // name. Empty if there is no such name.
  std::string entry_twice;

  AndroidManifest manifest;
  JarSignatureFacts jar;
  std::vector<NewerSignerFacts> newer;
  bool has_damaged_signing_block = false;
  // The names of parts that are too long to read. AndroidManifest.xml is also listed if its strings
  // overlap.
  std::vector<std::string> too_long;
  std::vector<ListedEntry> entries;
  std::vector<std::string> missing;  // names in MANIFEST.MF that the archive does not have
  // First the libraries with intact entries, in the order in which the tool reads these entries.
  // Then the libraries with damaged entries.
  std::vector<LibraryFacts> libraries;
};

// Looks at the file at `path`, and at the libraries beside it. Reads no pipes and no devices, and
// never waits for another process. After `is_late` returns true, reads no more bytes for `sha256`,
// and compares no more entries with their digests in MANIFEST.MF.
PackageFacts LookAt(const std::string& path, const IsLate& is_late = IsNeverLate);

// The SHA-256 digest of the bytes of an open file, in lower-case hexadecimal. Empty if the bytes
// cannot be read, or if `is_late` returns true before the end of the file is reached.
std::string FileSha256(int fd, const IsLate& is_late = IsNeverLate);

// The schemes of `facts.newer`, each once, in the order of their first signers.
std::vector<std::string> NewerSchemes(const PackageFacts& facts);

}  // namespace simulator
