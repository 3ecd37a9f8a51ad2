// Where a zip archive ends: the record behind its central directory, as whoever reads an archive
// looks for it from the back of the file.
#pragma once

#include <cstdint>
#include <optional>
#include <string>

namespace simulator {

struct ArchiveEnd {
  uint64_t
      directory_offset;  // of the central directory, as the record has it: maybe beyond the file
};

// The end record of the file that is open as `fd`; none when it has none.
std::optional<ArchiveEnd> FindArchiveEnd(int fd);

// `size` bytes of the file from `offset` on, or as many as there are.
std::string ReadAt(int fd, uint64_t offset, size_t size);

}  // namespace simulator
