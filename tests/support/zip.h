// Writes ZIP archives, with true or with false fields.
//
// A length or CRC that an item leaves unset gets its true value. Exception: in the local header, it
// is 0 if a data descriptor follows. A field that is set in `local`, `central` or `descriptor` is
// written unchanged, only in that place.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "support/der.h"

// The values that a header or the data descriptor states about an entry's data.
struct ZipClaim {
  std::optional<uint32_t> crc;
  std::optional<uint32_t> compressed_length;
  std::optional<uint32_t> length;
};

// One entry.
struct ZipItem {
  std::string name;  // any bytes
  Bytes data;
  bool deflated = false;
  // The local header leaves lengths and CRC to a data descriptor after the data.
  bool data_descriptor = false;

  std::optional<Bytes> raw = {};        // in the archive in place of the (compressed) data
  std::optional<uint16_t> method = {};  // in place of 0 (stored) or 8 (deflated)
  std::optional<std::string> local_name = {};
  ZipClaim local = {}, central = {}, descriptor = {};
};

// The item with this uncompressed length in both headers and in the data descriptor. Exception: if
// the item has a data descriptor, its local header claims 0.
ZipItem ClaimingLength(ZipItem item, uint32_t length);

// The archive of the items, in order. Names may occur twice.
Bytes BuildZip(const std::vector<ZipItem>& items);

// The raw deflate stream (RFC 1951) of the data.
Bytes Deflate(const Bytes& data);
