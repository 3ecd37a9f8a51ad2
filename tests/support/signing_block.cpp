#include "support/signing_block.h"

#include <algorithm>
#include <cstdlib>

#include "support/certificate.h"
#include "support/little_endian.h"

namespace {

constexpr uint32_t kSchemeV2 = 0x7109871a;
constexpr uint32_t kRsaPkcs1Sha256 = 0x0103;
constexpr size_t kEndRecordSize = 22;            // of the end of the central directory
constexpr size_t kDirectoryOffsetInRecord = 16;  // where that tells the directory's offset

Bytes Number32(uint32_t value) {
  Bytes bytes;
  Put32(bytes, value);
  return bytes;
}

Bytes Number64(uint64_t value) {
  return Concat(
      {Number32(static_cast<uint32_t>(value)), Number32(static_cast<uint32_t>(value >> 32))});
}

// The pieces, with their length before them.
Bytes Prefixed(const std::vector<Bytes>& pieces) {
  const Bytes whole = Concat(pieces);
  return Concat({Number32(static_cast<uint32_t>(whole.size())), whole});
}

// The digest of the digests of each megabyte of the three parts.
Bytes DigestOfChunks(const std::vector<Bytes>& parts) {
  constexpr size_t kChunk = 1 << 20;
  Bytes digests;
  uint32_t count = 0;
  for (const Bytes& part : parts) {
    for (size_t start = 0; start < part.size(); start += kChunk, ++count) {
      const size_t size = std::min(kChunk, part.size() - start);
      const auto first = part.begin() + static_cast<ptrdiff_t>(start);
      const Bytes chunk(first, first + static_cast<ptrdiff_t>(size));
      const Bytes digest =
          DigestOf(Digest::kSha256, Concat({{0xa5}, Number32(static_cast<uint32_t>(size)), chunk}));
      digests.insert(digests.end(), digest.begin(), digest.end());
    }
  }
  return DigestOf(Digest::kSha256, Concat({{0x5a}, Number32(count), digests}));
}

Bytes Signer(const Bytes& digest, const std::string& key) {
  Certificate certificate;
  certificate.key = key;
  const Bytes signed_data =
      Concat({Prefixed({Prefixed({Number32(kRsaPkcs1Sha256), Prefixed({digest})})}),
              Prefixed({Prefixed({certificate.Build()})}), Prefixed({})});
  const Bytes signature = SignWith(key, Digest::kSha256, signed_data);
  return Concat({Prefixed({signed_data}),
                 Prefixed({Prefixed({Number32(kRsaPkcs1Sha256), Prefixed({signature})})}),
                 Prefixed({PublicKeyInfo(key)})});
}

Bytes Block(const Bytes& signer) {
  const Bytes value = Prefixed({Prefixed({signer})});
  const Bytes pair = Concat({Number64(value.size() + 4), Number32(kSchemeV2), value});
  const Bytes magic = ToBytes("APK Sig Block 42");
  const Bytes size = Number64(pair.size() + 8 + magic.size());
  return Concat({size, pair, size, magic});
}

}  // namespace

Bytes AddSigningBlock(const Bytes& archive, const std::string& key) {
  if (archive.size() < kEndRecordSize) abort();
  const auto end = archive.end() - static_cast<ptrdiff_t>(kEndRecordSize);
  Bytes end_record(end, archive.end());
  uint32_t offset = 0;
  for (size_t i = 4; i > 0; --i)
    offset = offset << 8 | end_record[kDirectoryOffsetInRecord + i - 1];
  if (offset > archive.size() - kEndRecordSize) abort();
  const auto directory = archive.begin() + static_cast<ptrdiff_t>(offset);
  const Bytes entries(archive.begin(), directory), directory_bytes(directory, end);

  const Bytes block = Block(Signer(DigestOfChunks({entries, directory_bytes, end_record}), key));
  const Bytes moved = Number32(offset + static_cast<uint32_t>(block.size()));
  std::copy(moved.begin(), moved.end(), end_record.begin() + kDirectoryOffsetInRecord);
  return Concat({entries, block, directory_bytes, end_record});
}
