// Lists the entries of a package, and compares them with their digests in the manifest. The
// simulator calls the tool's functions to find and compare the digests. A run of the tool compares
// only a few entries.
#pragma once

#include <cstdint>
#include <functional>
#include <string>
#include <vector>

#include "simulator/package/archive.h"

namespace simulator {

// The result of comparing an entry with its digest in the manifest.
enum class EntryDigest {
  kUnlisted,  // the manifest has no digest for the entry
  kMatches,
  kDiffers,
  kNotCompared,  // the entry cannot be read or is too long, the tool does not support the digest's
                 // algorithm, or the time limit had passed
};

struct ListedEntry {
  ArchiveEntry entry;
  bool is_listed;     // the manifest has a digest for the entry
  bool is_signature;  // its name is that of a manifest, signature file or signature block
  EntryDigest digest = EntryDigest::kUnlisted;
  bool has_sha1 = false;  // the digest that the tool would compare is a SHA-1 digest
};

struct PackageEntries {
  std::vector<ListedEntry> all;      // in the order of the archive
  std::vector<std::string> missing;  // names that have a digest in the manifest but no entry
};

// Returns true if the caller's time limit has passed.
using IsLate = std::function<bool()>;
// For callers without a time limit.
inline bool IsNeverLate() { return false; }

// `manifest`: the text of META-INF/MANIFEST.MF; may be empty.
PackageEntries CompareEntries(Archive* archive, std::vector<uint8_t> manifest,
                              const IsLate& is_late);

// True if the tool treats `name` as the name of a SHA-1 digest ("SHA1-Digest").
bool IsSha1Digest(const std::string& name);

}  // namespace simulator
