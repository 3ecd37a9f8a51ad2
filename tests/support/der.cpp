#include "support/der.h"

#include <algorithm>
#include <sstream>

namespace der {

Bytes Element(uint8_t identifier, const Bytes& contents) {
  Bytes length;
  for (size_t rest = contents.size(); rest > 0; rest >>= 8) {
    length.insert(length.begin(), static_cast<uint8_t>(rest));
  }
  if (contents.size() < 0x80) {
    length = {static_cast<uint8_t>(contents.size())};
  } else {
    length.insert(length.begin(), static_cast<uint8_t>(0x80 | length.size()));
  }
  return Concat({{identifier}, length, contents});
}

Bytes Element(uint8_t identifier, const std::string& contents) {
  return Element(identifier, ToBytes(contents));
}

Bytes Sequence(const std::vector<Bytes>& elements) { return Element(kSequence, Concat(elements)); }

Bytes Set(const std::vector<Bytes>& elements) { return Element(kSet, Concat(elements)); }

Bytes Context(uint8_t number, const Bytes& contents) {
  return Element(static_cast<uint8_t>(0xa0 | number), contents);
}

Bytes ContextPrimitive(uint8_t number, const Bytes& contents) {
  return Element(static_cast<uint8_t>(0x80 | number), contents);
}

Bytes Boolean(uint8_t value) { return Element(kBoolean, Bytes{value}); }

Bytes Integer(uint64_t value) {
  Bytes contents = {static_cast<uint8_t>(value)};
  while ((value >>= 8) != 0) contents.insert(contents.begin(), static_cast<uint8_t>(value));
  if ((contents.front() & 0x80) != 0) contents.insert(contents.begin(), 0);
  return Integer(contents);
}

Bytes Integer(const Bytes& contents) { return Element(kInteger, contents); }

Bytes BitString(const Bytes& contents, uint8_t unused_bits) {
  return Element(kBitString, Concat({{unused_bits}, contents}));
}

Bytes OctetString(const Bytes& contents) { return Element(kOctetString, contents); }

Bytes Null() { return Element(kNull, Bytes()); }

Bytes Oid(const std::string& dotted) { return Element(kOid, OidContents(dotted)); }

Bytes OidContents(const std::string& dotted) {
  std::vector<uint64_t> arcs;
  std::istringstream text(dotted);
  for (std::string arc; std::getline(text, arc, '.');) arcs.push_back(std::stoull(arc));
  arcs[1] += 40 * arcs[0];
  Bytes contents;
  for (size_t i = 1; i < arcs.size(); ++i) {
    Bytes value = {static_cast<uint8_t>(arcs[i] & 0x7f)};
    for (uint64_t rest = arcs[i] >> 7; rest != 0; rest >>= 7) {
      value.insert(value.begin(), static_cast<uint8_t>(0x80 | (rest & 0x7f)));
    }
    contents.insert(contents.end(), value.begin(), value.end());
  }
  return contents;
}

}  // namespace der
