#include "crypto/asn1.h"

#include <algorithm>
#include <cstdio>

namespace {

constexpr uint32_t kLongFormTag = 31;
constexpr uint32_t kMaxLengthOctets = 4;

// Octets that are read one by one.
struct Octets {
  const uint8_t* position;
  size_t left;

  bool Next(uint8_t* octet) {
    if (left == 0) return false;
    *octet = *position++;
    --left;
    return true;
  }
};

bool ReadIdentifier(Octets* octets, asn1_hdr* hdr);
bool ReadLength(Octets* octets, asn1_hdr* hdr);
bool ReadArc(Octets* octets, uint64_t* value);

}  // namespace

int asn1_get_next(const uint8_t* buf, size_t len, asn1_hdr* hdr) {
  return asn1_get_next_bounded(buf, len, len, hdr);
}

int asn1_get_next_bounded(const uint8_t* buf, size_t available, size_t bound, asn1_hdr* hdr) {
  *hdr = {};
  const size_t readable = std::min(available, bound);
  Octets octets = {buf, readable};
  if (!ReadIdentifier(&octets, hdr) || !ReadLength(&octets, hdr)) return -1;

  const size_t header_length = readable - octets.left;
  // Deliberate: the remaining length is cut to 32 bits, as many as the field `length` of asn1_hdr
  // has. The cut never increases the remaining length, so no accepted element ends beyond `bound`.
  const auto remaining = static_cast<uint32_t>(bound - header_length);
  if (hdr->length > remaining) return -1;
  hdr->payload = octets.position;
  return 0;
}

int asn1_parse_oid(const uint8_t* buf, size_t len, asn1_oid* oid) {
  *oid = {};
  Octets octets = {buf, len};
  while (octets.left > 0) {
    uint64_t value = 0;
    if (!ReadArc(&octets, &value) || oid->len == kAsn1MaxArcs) return -1;
    if (oid->len == 0) {
      // The first two arcs share a value (X.690 §8.19.4).
      const uint64_t first = std::min<uint64_t>(value / 40, 2);
      oid->oid[oid->len++] = static_cast<uint32_t>(first);
      value -= first * 40;
    }
    // Deliberate: an arc of more than 32 bits keeps only its low 32 bits.
    oid->oid[oid->len++] = static_cast<uint32_t>(value);
  }
  return 0;
}

int asn1_get_oid(const uint8_t* buf, size_t len, asn1_oid* oid, const uint8_t** next) {
  asn1_hdr hdr;
  if (asn1_get_next(buf, len, &hdr) != 0 || hdr.length == 0 || hdr.class_ != kAsn1Universal ||
      hdr.tag != kAsn1Oid) {
    return -1;
  }
  *next = hdr.payload + hdr.length;
  return asn1_parse_oid(hdr.payload, hdr.length, oid);
}

void asn1_oid_to_str(const asn1_oid* oid, char* buf, size_t size) {
  if (size == 0) return;
  buf[0] = '\0';
  size_t used = 0;
  for (size_t i = 0; i < oid->len; ++i) {
    const int length = snprintf(buf + used, size - used, "%s%u", i == 0 ? "" : ".", oid->oid[i]);
    // No test can make `length` negative: snprintf cannot fail with this format.
    if (length < 0 || static_cast<size_t>(length) >= size - used) break;
    used += static_cast<size_t>(length);
  }
  buf[size - 1] = '\0';
}

// Deliberate: the count of unused bits is ignored, so the unused bits are read like all others.
uint64_t asn1_bit_string_to_long(const uint8_t* buf, size_t len) {
  constexpr size_t kMaxOctets = 5;  // 1 for the count of unused bits, and 4 for 32 bits
  uint64_t value = 0;
  for (size_t i = 1; i < std::min(len, kMaxOctets); ++i) {
    for (size_t bit = 0; bit < 8; ++bit) {
      if ((buf[i] & (0x80 >> bit)) != 0) value |= uint64_t{1} << (8 * (i - 1) + bit);
    }
  }
  return value;
}

namespace {

bool ReadIdentifier(Octets* octets, asn1_hdr* hdr) {
  if (!octets->Next(&hdr->identifier)) return false;
  hdr->class_ = hdr->identifier >> 6;
  hdr->constructed = (hdr->identifier >> 5) & 1;
  hdr->tag = hdr->identifier & 0x1f;
  if (hdr->tag != kLongFormTag) return true;

  // Deliberate: the tag number may have any number of octets. Its low 32 bits are kept.
  hdr->tag = 0;
  uint8_t octet;
  do {
    if (!octets->Next(&octet)) return false;
    hdr->tag = hdr->tag << 7 | (octet & 0x7f);
  } while ((octet & 0x80) != 0);
  return true;
}

bool ReadLength(Octets* octets, asn1_hdr* hdr) {
  uint8_t octet;
  if (!octets->Next(&octet)) return false;
  if (octet < 0x80) {
    hdr->length = octet;
    return true;
  }
  // The reserved octet 0xFF fails, because its count, 127, is too large. Deliberate: the length may
  // have more octets than DER allows. The indefinite form has the count 0 and reads as empty
  // contents. Its end-of-contents octets are not searched for.
  const uint32_t count = octet & 0x7f;
  if (count > kMaxLengthOctets) return false;
  for (uint32_t i = 0; i < count; ++i) {
    if (!octets->Next(&octet)) return false;
    hdr->length = hdr->length << 8 | octet;
  }
  return true;
}

// Reads one value in base 128, most significant digit first. Keeps its low 64 bits.
bool ReadArc(Octets* octets, uint64_t* value) {
  uint8_t octet;
  do {
    if (!octets->Next(&octet)) return false;
    *value = *value << 7 | (octet & 0x7f);
  } while ((octet & 0x80) != 0);
  return true;
}

}  // namespace
