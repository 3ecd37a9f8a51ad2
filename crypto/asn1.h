// Reading DER, one header at a time. No allocation, no logging; records point into the caller's
// bytes.
#pragma once

#include <cstddef>
#include <cstdint>

struct asn1_hdr {
  const uint8_t* payload;
  uint8_t identifier;
  uint8_t class_;
  uint8_t constructed;
  uint32_t tag;
  uint32_t length;
};

struct asn1_oid {
  uint32_t oid[20];
  uint64_t len;
};

int asn1_get_next(const uint8_t* buf, size_t len, asn1_hdr* hdr);
int asn1_parse_oid(const uint8_t* buf, size_t len, asn1_oid* oid);
int asn1_get_oid(const uint8_t* buf, size_t len, asn1_oid* oid, const uint8_t** next);
void asn1_oid_to_str(const asn1_oid* oid, char* buf, size_t size);
uint64_t asn1_bit_string_to_long(const uint8_t* buf, size_t len);
