// The central directory of a zip archive and the end record after it (APPNOTE.TXT 4.3.12 and
// 4.3.16). The platform's library skips a damaged entry and does not report its name. This reader
// also returns damaged entries.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace simulator {

struct ArchiveEnd {
  uint16_t entry_count;
  // The offset of the central directory, as the record states it. It may be beyond the end of the
  // file.
  uint32_t directory_offset;
};

// One entry, as the directory describes it.
struct ArchiveEntry {
  std::string name;  // any bytes
  uint64_t size;     // of its compressed data, in bytes
  bool is_damaged;   // the platform's library does not find it
  bool is_encrypted = false;
};

// Finds the end record of the open file `fd`. If several byte sequences look like an end record,
// the last of them counts. None if the end record is missing or cannot be read.
std::optional<ArchiveEnd> FindArchiveEnd(int fd);

// Returns the entries in the order of the directory. Ends at the first malformed record. The
// directory does not show which entries are damaged, so `is_damaged` is false in all results.
// Archive::Entries sets this member later.
std::vector<ArchiveEntry> ReadDirectory(int fd, const ArchiveEnd& end);

// Reads `size` bytes of the file from `offset` on. Returns fewer if the file ends earlier or cannot
// be read.
std::string ReadAt(int fd, uint64_t offset, size_t size);

}  // namespace simulator
