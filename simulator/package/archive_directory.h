// The central directory of a zip archive and the record behind it, read record by record
// (APPNOTE.TXT 4.3.12 and 4.3.16). The platform's library passes over an entry that it finds
// damaged without its name; here it has one.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace simulator {

struct ArchiveEnd {
  uint16_t entry_count;
  // Of the central directory, as the record has it: maybe beyond the file.
  uint32_t directory_offset;
};

// One entry, as the directory describes it.
struct ArchiveEntry {
  std::string name;  // any bytes
  uint64_t size;     // what its data takes in the archive, in bytes
  bool is_damaged;   // the platform's library does not find it
  bool is_encrypted = false;
};

// The end record of the file that is open as `fd`, by the last of its marks; none when it has none.
std::optional<ArchiveEnd> FindArchiveEnd(int fd);

// The entries that the directory names, in its order, none of them damaged as far as it knows;
// those before the first record that does not read.
std::vector<ArchiveEntry> ReadDirectory(int fd, const ArchiveEnd& end);

// `size` bytes of the file from `offset` on, or as many as there are.
std::string ReadAt(int fd, uint64_t offset, size_t size);

}  // namespace simulator
