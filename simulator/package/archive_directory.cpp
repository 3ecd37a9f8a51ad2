#include "simulator/package/archive_directory.h"

#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>

#include "simulator/package/cbs.h"

namespace simulator {

std::optional<ArchiveEnd> FindArchiveEnd(int fd) {
  constexpr char kMark[] = "PK\5\6";
  constexpr size_t kRecordSize = 22;
  constexpr size_t kMostComment = 0xffff;
  struct stat state = {};
  if (fstat(fd, &state) != 0 || state.st_size < 0) return {};
  const uint64_t size = static_cast<uint64_t>(state.st_size);
  const uint64_t tail_size = std::min<uint64_t>(size, kRecordSize + kMostComment);
  const std::string tail = ReadAt(fd, size - tail_size, static_cast<size_t>(tail_size));
  const size_t at = tail.size() < kRecordSize ? std::string::npos
                                              : tail.rfind(kMark, tail.size() - kRecordSize, 4);
  if (at == std::string::npos) return {};
  // The record begins with these fields: signature, two disk numbers, the number of entries on this
  // disk, the number of all entries, the size of the directory, the offset of the directory.
  CBS record = ToCbs(std::string_view(tail).substr(at));
  ArchiveEnd end = {};
  const bool is_read = CBS_skip(&record, 10) != 0 &&
                       CBS_get_u16le(&record, &end.entry_count) != 0 && CBS_skip(&record, 4) != 0 &&
                       CBS_get_u32le(&record, &end.directory_offset);
  return is_read ? std::optional(end) : std::nullopt;
}

std::vector<ArchiveEntry> ReadDirectory(int fd, const ArchiveEnd& end) {
  constexpr char kMark[] = "PK\1\2";
  constexpr size_t kRecordSize = 46;
  std::vector<ArchiveEntry> entries;
  uint64_t offset = end.directory_offset;
  while (entries.size() < end.entry_count) {
    const std::string record = ReadAt(fd, offset, kRecordSize);
    constexpr uint16_t kEncrypted = 1;  // APPNOTE.TXT 4.4.4, bit 0
    // The record begins with these fields: signature, two versions, flags, ten other bytes, the
    // compressed size, the uncompressed size, and the lengths of the name, the extra field and the
    // comment. These three parts follow the record.
    CBS fields = ToCbs(record);
    uint32_t size = 0;
    uint16_t flags = 0;
    uint16_t name_size = 0, extra_size = 0, comment_size = 0;
    if (record.compare(0, 4, kMark) != 0 || !CBS_skip(&fields, 8) ||
        !CBS_get_u16le(&fields, &flags) || !CBS_skip(&fields, 10) ||
        !CBS_get_u32le(&fields, &size) || !CBS_skip(&fields, 4) ||
        !CBS_get_u16le(&fields, &name_size) || !CBS_get_u16le(&fields, &extra_size) ||
        !CBS_get_u16le(&fields, &comment_size)) {
      break;
    }
    std::string name = ReadAt(fd, offset + kRecordSize, name_size);
    if (name.size() < name_size) break;
    entries.push_back({std::move(name), size, false, (flags & kEncrypted) != 0});
    offset += kRecordSize + name_size + uint64_t{extra_size} + comment_size;
  }
  return entries;
}

std::string ReadAt(int fd, uint64_t offset, size_t size) {
  std::string bytes(size, '\0');
  size_t length = 0;
  while (length < size) {
    const ssize_t part =
        pread(fd, bytes.data() + length, size - length, static_cast<off_t>(offset + length));
    if (part <= 0) break;
    length += static_cast<size_t>(part);
  }
  bytes.resize(length);
  return bytes;
}

}  // namespace simulator
