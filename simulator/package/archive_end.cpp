#include "simulator/package/archive_end.h"

#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>

#include "simulator/package/byte_reader.h"

namespace simulator {

namespace {

constexpr char kSignature[] = "PK\5\6";
constexpr size_t kRecordSize = 22;
constexpr size_t kMostComment = 0xffff;

}  // namespace

std::optional<ArchiveEnd> FindArchiveEnd(int fd) {
  struct stat state = {};
  if (fstat(fd, &state) != 0 || state.st_size < 0) return {};
  const uint64_t size = static_cast<uint64_t>(state.st_size);
  const uint64_t tail_size = std::min<uint64_t>(size, kRecordSize + kMostComment);
  const std::string tail = ReadAt(fd, size - tail_size, static_cast<size_t>(tail_size));
  const size_t at = tail.size() < kRecordSize
                        ? std::string::npos
                        : tail.rfind(kSignature, tail.size() - kRecordSize, 4);
  if (at == std::string::npos) return {};
  // Signature, four numbers of 16 bits, the directory's size, its offset.
  constexpr size_t kBeforeOffset = 16;
  ByteReader reader(std::string_view(tail).substr(at + kBeforeOffset));
  uint32_t offset = 0;
  if (!reader.U32(&offset)) return {};
  return ArchiveEnd{offset};
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
