#include "support/zip.h"

#include <zlib.h>

#include <cstdlib>

#include "support/little_endian.h"

namespace {

constexpr uint16_t kVersion = 20;
constexpr uint16_t kDescriptorFlag = 1 << 3;
constexpr uint16_t kStored = 0, kDeflated = 8;

// An item's bytes in the archive, and the values for its headers and data descriptor. `crc` and
// `length` are those of item.data, even if the archive has item.raw in place of item.data.
struct Facts {
  Bytes contents;
  uint32_t crc;
  uint32_t compressed_length;
  uint32_t length;
};

Facts FactsOf(const ZipItem& item) {
  Facts facts;
  facts.contents = item.raw ? *item.raw : item.deflated ? Deflate(item.data) : item.data;
  facts.crc =
      static_cast<uint32_t>(crc32(0, item.data.data(), static_cast<uInt>(item.data.size())));
  facts.compressed_length = static_cast<uint32_t>(facts.contents.size());
  facts.length = static_cast<uint32_t>(item.data.size());
  return facts;
}

// The part that the local and the central header have in common.
void PutCommon(Bytes& out, const ZipItem& item) {
  Put16(out, kVersion);
  Put16(out, item.data_descriptor ? kDescriptorFlag : uint16_t{0});
  Put16(out, item.method.value_or(item.deflated ? kDeflated : kStored));
  Put32(out, 0x00210000);  // 1980-01-01
}

void PutClaim(Bytes& out, const ZipClaim& claim, const Facts& facts) {
  Put32(out, claim.crc.value_or(facts.crc));
  Put32(out, claim.compressed_length.value_or(facts.compressed_length));
  Put32(out, claim.length.value_or(facts.length));
}

void PutText(Bytes& out, const std::string& text) {
  out.insert(out.end(), text.begin(), text.end());
}

void PutLocal(Bytes& out, const ZipItem& item, const Facts& facts) {
  const std::string& name = item.local_name ? *item.local_name : item.name;
  Put32(out, 0x04034b50);
  PutCommon(out, item);
  PutClaim(out, item.local, item.data_descriptor ? Facts{{}, 0, 0, 0} : facts);
  Put16(out, static_cast<uint16_t>(name.size()));
  Put16(out, 0);  // extra field
  PutText(out, name);
  out.insert(out.end(), facts.contents.begin(), facts.contents.end());
  if (item.data_descriptor) {
    Put32(out, 0x08074b50);
    PutClaim(out, item.descriptor, facts);
  }
}

void PutCentral(Bytes& out, const ZipItem& item, const Facts& facts, size_t local_offset) {
  Put32(out, 0x02014b50);
  Put16(out, kVersion);
  PutCommon(out, item);
  PutClaim(out, item.central, facts);
  Put16(out, static_cast<uint16_t>(item.name.size()));
  Put16(out, 0);  // extra field
  Put16(out, 0);  // comment
  Put16(out, 0);  // disk
  Put16(out, 0);  // internal attributes
  Put32(out, 0);  // external attributes
  Put32(out, static_cast<uint32_t>(local_offset));
  PutText(out, item.name);
}

void PutEnd(Bytes& out, size_t count, size_t central_offset, size_t central_length) {
  Put32(out, 0x06054b50);
  Put16(out, 0);  // disk
  Put16(out, 0);  // disk of the central directory
  Put16(out, static_cast<uint16_t>(count));
  Put16(out, static_cast<uint16_t>(count));
  Put32(out, static_cast<uint32_t>(central_length));
  Put32(out, static_cast<uint32_t>(central_offset));
  Put16(out, 0);  // comment
}

}  // namespace

ZipItem ClaimingLength(ZipItem item, uint32_t length) {
  item.local.length = item.data_descriptor ? 0 : length;
  item.central.length = length;
  item.descriptor.length = length;
  return item;
}

Bytes BuildZip(const std::vector<ZipItem>& items) {
  Bytes out, central;
  for (const ZipItem& item : items) {
    const Facts facts = FactsOf(item);
    PutCentral(central, item, facts, out.size());
    PutLocal(out, item, facts);
  }
  const size_t central_offset = out.size();
  out.insert(out.end(), central.begin(), central.end());
  PutEnd(out, items.size(), central_offset, central.size());
  return out;
}

Bytes Deflate(const Bytes& data) {
  z_stream stream = {};
  if (deflateInit2(&stream, Z_BEST_COMPRESSION, Z_DEFLATED, -MAX_WBITS, 8, Z_DEFAULT_STRATEGY) !=
      Z_OK) {
    abort();
  }
  Bytes out(deflateBound(&stream, data.size()));
  stream.next_in = const_cast<Bytef*>(data.data());
  stream.avail_in = static_cast<uInt>(data.size());
  stream.next_out = out.data();
  stream.avail_out = static_cast<uInt>(out.size());
  if (deflate(&stream, Z_FINISH) != Z_STREAM_END) abort();
  out.resize(stream.total_out);
  deflateEnd(&stream);
  return out;
}
