// Writes DER (X.690), for the builders of test data in this directory, and for tests that need an
// element that no builder makes. Nothing is checked: a test may nest and label elements wrongly.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "support/bytes.h"

namespace der {

// Identifier octets of the universal types that the tests need. Those of SEQUENCE and SET include
// the constructed bit.
enum Identifier : uint8_t {
  kBoolean = 0x01,
  kInteger = 0x02,
  kBitString = 0x03,
  kOctetString = 0x04,
  kNull = 0x05,
  kOid = 0x06,
  kUtf8String = 0x0c,
  kPrintableString = 0x13,
  kIa5String = 0x16,
  kUtcTime = 0x17,
  kGeneralizedTime = 0x18,
  kSequence = 0x30,
  kSet = 0x31,
};

// One element: identifier octet, minimal length octets, contents.
Bytes Element(uint8_t identifier, const Bytes& contents);
Bytes Element(uint8_t identifier, const std::string& contents);

Bytes Sequence(const std::vector<Bytes>& elements);
Bytes Set(const std::vector<Bytes>& elements);
// A constructed element with the context-specific tag [number].
Bytes Context(uint8_t number, const Bytes& contents);
// A primitive element with the context-specific tag [number], such as an IMPLICIT string.
Bytes ContextPrimitive(uint8_t number, const Bytes& contents);

Bytes Boolean(uint8_t value);
Bytes Integer(uint64_t value);
// An INTEGER with exactly these contents octets.
Bytes Integer(const Bytes& contents);
Bytes BitString(const Bytes& contents, uint8_t unused_bits = 0);
Bytes OctetString(const Bytes& contents);
Bytes Null();
// The OBJECT IDENTIFIER with this dotted text.
Bytes Oid(const std::string& dotted);
// Only the contents octets of the OBJECT IDENTIFIER.
Bytes OidContents(const std::string& dotted);

}  // namespace der
