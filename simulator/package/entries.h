// The entries of a package, each compared with its digest in the manifest. The tool's own code
// finds the digest for a name and compares it. In its own run, the tool compares only a few of the
// entries.
#pragma once

#include <cstdint>
#include <functional>
#include <string>
#include <vector>

#include "simulator/package/archive.h"

namespace simulator {

// The answer of the tool's code for an entry and its digest in the manifest.
enum class EntryDigest {
  kUnlisted,  // the manifest has no digest for it
  kMatches,
  kDiffers,
  kNotCompared,  // the entry cannot be read or is too long, the tool does not know the kind of its
                 // digest, or the time was up
};

struct ListedEntry {
  ArchiveEntry entry;
  bool is_listed;     // the manifest has a digest for it
  bool is_signature;  // it is a part of the JAR signature itself
  EntryDigest digest = EntryDigest::kUnlisted;
  bool has_sha1 = false;  // the digest that the tool would compare is a SHA-1 digest
};

struct PackageEntries {
  std::vector<ListedEntry> all;      // in the order of the archive
  std::vector<std::string> missing;  // names in the manifest that the archive does not have
};

// True if the time is up.
using IsLate = std::function<bool()>;
// For callers without a time limit.
inline bool IsNeverLate() { return false; }

// `manifest`: the text of META-INF/MANIFEST.MF; may be empty.
PackageEntries CompareEntries(Archive* archive, std::vector<uint8_t> manifest,
                              const IsLate& is_late);

// True if the tool reads a digest with this name, such as "SHA1-Digest", as SHA-1.
bool IsSha1Digest(const std::string& name);

}  // namespace simulator
