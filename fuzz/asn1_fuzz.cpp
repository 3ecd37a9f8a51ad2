// crypto/asn1.h: any bytes as elements, object identifiers and bit strings.
#include "crypto/asn1.h"

#include <cstring>
#include <vector>

#include "fuzz/fuzz.h"

namespace {

// Reads the elements in the `size` bytes at `data`, up to the first invalid element. Reads the
// contents of each element in the same way, down to depth 8. The outermost elements have depth 0.
void WalkElements(const uint8_t* data, size_t size, int depth) {
  size_t position = 0;
  while (position < size) {
    asn1_hdr header;
    const int result = asn1_get_next(data + position, size - position, &header);
    Require(result == 0 || result == -1, "asn1_get_next returns 0 or -1");
    if (result != 0) {
      Require(header.payload == nullptr, "the payload is null after a failure");
      return;
    }
    Require(LiesIn(header.payload, header.length, data + position, size - position),
            "the contents of an element are in the given bytes");
    Require(header.payload >= data + position + 2, "a header has two bytes or more");
    if (depth < 8) WalkElements(header.payload, header.length, depth + 1);
    position = static_cast<size_t>(header.payload - data) + header.length;
  }
}

void CheckText(const asn1_oid& oid, size_t room) {
  std::vector<char> text(room, '?');
  asn1_oid_to_str(&oid, text.data(), room);
  Require(room == 0 || text.back() == '\0', "the buffer ends with a NUL");
}

void ReadOid(const uint8_t* data, size_t size, size_t room) {
  asn1_oid oid;
  const int bare = asn1_parse_oid(data, size, &oid);
  Require(oid.len <= 20, "at most 20 arcs");
  if (bare == 0) CheckText(oid, room);

  const uint8_t* next = nullptr;
  if (size == 0 || asn1_get_oid(data, size, &oid, &next) != 0) return;
  Require(oid.len >= 2 && oid.len <= 20, "an object identifier element has 2 to 20 arcs");
  Require(LiesIn(next, 0, data, size), "the next element is in the given bytes, or at their end");
  CheckText(oid, room);
}

// Bit n of the string becomes bit n of the value, for the first 32 bits.
void ReadBitString(const uint8_t* data, size_t size) {
  uint64_t expected = 0;
  for (size_t bit = 0; bit < 32 && 1 + bit / 8 < size; ++bit) {
    if ((data[1 + bit / 8] >> (7 - bit % 8) & 1) != 0) expected |= uint64_t{1} << bit;
  }
  Require(asn1_bit_string_to_long(data, size) == expected,
          "bit n of the string is bit n of the value");
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  WalkElements(data, size, 0);
  ReadOid(data, size, size % 90);
  ReadBitString(data, size);
  return 0;
}
