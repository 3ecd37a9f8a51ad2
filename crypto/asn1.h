// Reads DER one header at a time (X.690 §8.1). Accepts some encodings that only BER allows. The
// caller interprets the values. The functions neither allocate nor log. An asn1_hdr points into the
// caller's bytes, which must outlive it. Every function that can fail returns 0 for success and -1
// for failure.
#pragma once

#include <cstddef>
#include <cstdint>

// The classes (X.690 §8.1.2.2) and the universal tag numbers (X.680 §8.6) that the tool needs.
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
  const uint8_t* payload;  // first byte of the contents; null after a failure
  uint8_t identifier;      // the first identifier octet, unchanged
  uint8_t class_;          // bits 8 and 7 of `identifier`
  uint8_t constructed;     // bit 6 of `identifier`
  uint32_t tag;            // the low five bits of `identifier`, or the long form's number
  uint32_t length;         // of the contents, in bytes; 0 for the indefinite form
};

inline constexpr size_t kAsn1MaxArcs = 20;

// One object identifier.
struct asn1_oid {
  uint32_t oid[kAsn1MaxArcs];  // the arcs, first arc first
  uint64_t len;                // the number of arcs
};

// Reads the header at the start of the `len` bytes at `buf` into `hdr`. The element must end within
// those bytes. Identifier and length octets need not be minimal. A tag number of more than 32 bits
// is cut to its low 32 bits. The indefinite form reads as length 0. Fails for more than four
// subsequent length octets, and for the reserved first length octet 0xFF.
//
// After a failure, `hdr->payload` is null. The other fields contain what was decoded before the
// failure.
int asn1_get_next(const uint8_t* buf, size_t len, asn1_hdr* hdr);

// Like asn1_get_next, but the element at `buf` must end within `bound` bytes. The element's
// header must also end within the `available` bytes at `buf`. The element's contents may end beyond
// the `available` bytes, but the caller must not read beyond the `available` bytes. This function
// is for a caller that derives `bound` from the length of an outer element. The outer element may
// end beyond the `available` bytes.
int asn1_get_next_bounded(const uint8_t* buf, size_t available, size_t bound, asn1_hdr* hdr);

// Decodes the `len` bytes at `buf`, the contents of an OBJECT IDENTIFIER (X.690 §8.19). Empty
// contents have no arcs. The low 32 bits of each arc are kept. The first value, which encodes two
// arcs, is cut to its low 64 bits before it is split. Fails for contents that end within an arc,
// and for a 21st arc. After a failure, `oid` contains the arcs that were decoded before the
// failure.
int asn1_parse_oid(const uint8_t* buf, size_t len, asn1_oid* oid);

// Reads a whole OBJECT IDENTIFIER element from the `len` bytes at `buf`. Fails if asn1_get_next
// fails, if the element is not an OBJECT IDENTIFIER, or if its contents are empty. In these three
// cases, `oid` and `next` stay unchanged. In all other cases, `next` becomes the position after the
// element, even if asn1_parse_oid then fails for the contents.
int asn1_get_oid(const uint8_t* buf, size_t len, asn1_oid* oid, const uint8_t** next);

// Writes the arcs as dotted text into the `size` bytes at `buf`. The text is cut to fit and ends
// with a NUL. If `size` is 0, nothing is written. The tool itself prints no object identifier. This
// function is for tests, and for the diagnostics of other programs that are linked with
// apktoolkit_core.
void asn1_oid_to_str(const asn1_oid* oid, char* buf, size_t size);

// Returns the named bits of a BIT STRING (X.690 §8.6) as an integer. The contents are the `len`
// bytes at `buf`. Their first byte, the count of unused bits, is ignored. Named bit n becomes bit n
// of the result; bits 32 and above are dropped. Returns 0 for contents of fewer than two bytes.
uint64_t asn1_bit_string_to_long(const uint8_t* buf, size_t len);
