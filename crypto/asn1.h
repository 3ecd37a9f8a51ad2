// Reading DER, and the BER that comes close to it, one header at a time (X.690 §8.1): what a value
// means is left to the caller. No allocation, no logging; records point into the caller's bytes,
// which must outlive them. Every function that can fail returns 0, or -1 for a failure.
#pragma once

#include <cstddef>
#include <cstdint>

// Classes (X.690 §8.1.2.2) and the universal tag numbers in use (X.680 §8.6).
inline constexpr uint8_t kAsn1Universal = 0;
inline constexpr uint8_t kAsn1Context = 2;
inline constexpr uint8_t kAsn1Private = 3;

inline constexpr uint32_t kAsn1Boolean = 1;
inline constexpr uint32_t kAsn1Integer = 2;
inline constexpr uint32_t kAsn1BitString = 3;
inline constexpr uint32_t kAsn1OctetString = 4;
inline constexpr uint32_t kAsn1Oid = 6;
inline constexpr uint32_t kAsn1Sequence = 16;
inline constexpr uint32_t kAsn1Set = 17;
inline constexpr uint32_t kAsn1UtcTime = 23;
inline constexpr uint32_t kAsn1GeneralizedTime = 24;

// One header, decoded.
struct asn1_hdr {
  const uint8_t* payload;  // first byte of the contents; null when the header could not be read
  uint8_t identifier;      // the first identifier octet, as it is
  uint8_t class_;          // its bits 8 and 7
  uint8_t constructed;     // its bit 6
  uint32_t tag;            // its low five bits, or the long form's number
  uint32_t length;         // of the contents, in bytes; 0 for the indefinite form
};

inline constexpr size_t kAsn1MaxArcs = 20;

// One object identifier.
struct asn1_oid {
  uint32_t oid[kAsn1MaxArcs];  // the arcs, first arc first
  uint64_t len;                // arcs in use
};

// Reads the header at the start of the `len` bytes at `buf` into `hdr`. The element must end within
// those bytes. Identifier and length octets need not be minimal; of a long tag number the low 32
// bits are kept; the indefinite form reads as length 0. More than four length octets, and the
// reserved first length octet 0xFF, fail.
//
// After a failure `hdr` holds what was decoded before it, with a null payload.
int asn1_get_next(const uint8_t* buf, size_t len, asn1_hdr* hdr);

// The same, for callers that trust an outer length: the element's length is compared with what
// `bound` bytes at `buf` would leave for it, though no more than `available` of them can be read.
// The header's own octets must lie within both. The contents may end beyond `available`, and it is
// for the caller to look no further than there.
int asn1_get_next_bounded(const uint8_t* buf, size_t available, size_t bound, asn1_hdr* hdr);

// Decodes the contents of an OBJECT IDENTIFIER (X.690 §8.19), `len` bytes at `buf`; no bytes give
// no arcs. Of each arc the low 32 bits are kept. Contents that end within an arc, and a 21st arc,
// fail, and leave the arcs before them in `oid`.
int asn1_parse_oid(const uint8_t* buf, size_t len, asn1_oid* oid);

// Reads a whole OBJECT IDENTIFIER element from the `len` bytes at `buf`. Once its header is read
// and right, `next` receives the position after the element. Other elements fail, and empty
// contents do.
int asn1_get_oid(const uint8_t* buf, size_t len, asn1_oid* oid, const uint8_t** next);

// Writes the arcs as dotted text into the `size` bytes at `buf`: cut where it does not fit, always
// NUL-terminated, nothing at all when `size` is 0. The tool itself prints no object identifier:
// this is for the diagnostics of programs that read certificates with this library, and for tests.
void asn1_oid_to_str(const asn1_oid* oid, char* buf, size_t size);

// The named bits of a BIT STRING (X.690 §8.6) as an integer: `buf` holds the contents, the count of
// unused bits first, which is ignored. Named bit n becomes bit n of the result; bits from the 32nd
// on are dropped. Contents of less than two bytes give 0.
uint64_t asn1_bit_string_to_long(const uint8_t* buf, size_t len);
