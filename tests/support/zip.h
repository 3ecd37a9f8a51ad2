// Writing zip archives, good ones and every kind of lying one.
//
// What an item does not set is written truthfully; what it does set is written as it is, in the one
// place that the field names, and nothing else changes with it.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "support/der.h"

// What one of the three places says of an entry's data.
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

  std::optional<Bytes> raw = {};        // in the archive instead of the (compressed) data
  std::optional<uint16_t> method = {};  // instead of 0 or 8
  std::optional<std::string> local_name = {};
  ZipClaim local = {}, central = {}, descriptor = {};
};

// An item that lies about its length wherever a length is written.
ZipItem ClaimingLength(ZipItem item, uint32_t length);

// The archive of the items, in their order; names may occur twice.
Bytes BuildZip(const std::vector<ZipItem>& items);

// The raw deflate stream (RFC 1951) of the data.
Bytes Deflate(const Bytes& data);
