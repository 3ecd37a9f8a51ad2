// Writes ZIP archives. A test can set false values in their headers and data descriptors.
//
// A length or CRC that an item leaves unset gets its true value. Exception: if a data descriptor
// follows, an unset value is 0 in the local header. A value that is set in `local` is written
// unchanged, and only into the local header. The values of `central` are for the central header,
// and those of `descriptor` are for the data descriptor.
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
  // True: the local header leaves lengths and CRC to a data descriptor after the data.
  bool data_descriptor = false;

  std::optional<Bytes> raw = {};        // in the archive in place of the (compressed) data
  std::optional<uint16_t> method = {};  // in place of 0 (stored) or 8 (deflated)
  std::optional<std::string> local_name = {};
  ZipClaim local = {}, central = {}, descriptor = {};
};

// The item with this uncompressed length in the central header and in the data descriptor. If the
// item has a data descriptor, the local header has the length 0. Otherwise, the local header has
// this length too.
ZipItem ClaimingLength(ZipItem item, uint32_t length);

// The archive of the items, in order. Names may occur twice.
Bytes BuildZip(const std::vector<ZipItem>& items);

// The raw deflate stream (RFC 1951) of the data.
Bytes Deflate(const Bytes& data);
