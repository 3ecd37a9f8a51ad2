// Reading little-endian records, as zip archives, signing blocks and compiled manifests have them,
// out of bytes that nobody vouches for. Nothing is read beyond their end.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

namespace simulator {

class ByteReader {
 public:
  explicit ByteReader(std::string_view bytes) : bytes_(bytes) {}

  // Each takes what it reads off the front. False, with nothing taken, when there is not so much.
  bool U16(uint16_t* value) { return Number(value); }
  bool U32(uint32_t* value) { return Number(value); }
  bool U64(uint64_t* value) { return Number(value); }
  bool Bytes(uint64_t size, std::string_view* part) {
    if (size > bytes_.size()) return false;
    *part = bytes_.substr(0, static_cast<size_t>(size));
    bytes_.remove_prefix(part->size());
    return true;
  }
  // So many bytes as the 32-bit number before them says.
  bool Prefixed(std::string_view* part) {
    ByteReader ahead = *this;
    uint32_t size = 0;
    if (!ahead.U32(&size) || !ahead.Bytes(size, part)) return false;
    *this = ahead;
    return true;
  }

  bool empty() const { return bytes_.empty(); }

 private:
  template <typename Unsigned>
  bool Number(Unsigned* value) {
    std::string_view part;
    if (!Bytes(sizeof(*value), &part)) return false;
    uint64_t number = 0;
    for (size_t i = part.size(); i-- > 0;) number = number << 8 | static_cast<uint8_t>(part[i]);
    *value = static_cast<Unsigned>(number);
    return true;
  }

  std::string_view bytes_;
};

}  // namespace simulator
