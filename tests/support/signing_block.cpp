#include "support/signing_block.h"

#include <algorithm>
#include <cstdlib>

#include "support/certificate.h"
#include "support/little_endian.h"

namespace {

constexpr uint32_t kRsaPkcs1Sha256 = 0x0103;

Bytes Number32(uint32_t value) {
  Bytes bytes;
  Put32(bytes, value);
  return bytes;
}

Bytes Number64(uint64_t value) {
  return Concat(
      {Number32(static_cast<uint32_t>(value)), Number32(static_cast<uint32_t>(value >> 32))});
}

// The pieces, after their total length in bytes (4 bytes, little-endian).
Bytes Prefixed(const std::vector<Bytes>& pieces) {
  const Bytes whole = Concat(pieces);
  return Concat({Number32(static_cast<uint32_t>(whole.size())), whole});
}

// The parts of an archive that has no comment.
struct ArchiveParts {
  Bytes entries, directory, end_record;
};

constexpr size_t kEndRecordSize = 22;            // of the end of central directory record
constexpr size_t kDirectoryOffsetInRecord = 16;  // where that record has the directory's offset
constexpr size_t kCommentInRecord = 20;          // where that record has the comment's length

ArchiveParts TakeApart(const Bytes& archive) {
  if (archive.size() < kEndRecordSize) abort();
  const auto end = archive.end() - static_cast<ptrdiff_t>(kEndRecordSize);
  ArchiveParts parts;
  parts.end_record.assign(end, archive.end());
  uint32_t offset = 0;
  for (size_t i = 4; i-- > 0;) {
    offset = offset << 8 | parts.end_record[kDirectoryOffsetInRecord + i];
  }
  if (offset > archive.size() - kEndRecordSize) abort();
  const auto directory = archive.begin() + static_cast<ptrdiff_t>(offset);
  parts.entries.assign(archive.begin(), directory);
  parts.directory.assign(directory, end);
  return parts;
}

// Splits each of the three parts into chunks of at most 1 MiB. Returns the digest over the digests
// of all chunks.
Bytes DigestOfChunks(const ArchiveParts& parts) {
  constexpr size_t kChunk = 1 << 20;
  Bytes digests;
  uint32_t count = 0;
  for (const Bytes& part : {parts.entries, parts.directory, parts.end_record}) {
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

Bytes SignerOf(const Bytes& digest, const std::string& key) {
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

}  // namespace

Bytes SignerBytes(const Bytes& certificate) {
  const Bytes signed_data = Concat({Prefixed({}), Prefixed({Prefixed({certificate})})});
  return Concat({Prefixed({signed_data}), Prefixed({}), Prefixed({})});
}

Bytes Signers(const std::vector<Bytes>& signers) {
  std::vector<Bytes> elements;
  for (const Bytes& signer : signers) elements.push_back(Prefixed({signer}));
  return Prefixed(elements);
}

Bytes SigningBlockBytes(const std::vector<std::pair<uint32_t, Bytes>>& pairs) {
  Bytes body;
  for (const auto& [id, value] : pairs) {
    body = Concat({body, Number64(value.size() + 4), Number32(id), value});
  }
  const Bytes magic = ToBytes("APK Sig Block 42");
  const Bytes size = Number64(body.size() + 8 + magic.size());
  return Concat({size, body, size, magic});
}

Bytes ArchiveWithBlock(const Bytes& archive, const Bytes& block, const std::string& comment) {
  ArchiveParts parts = TakeApart(archive);
  const Bytes moved = Number32(static_cast<uint32_t>(parts.entries.size() + block.size()));
  std::copy(moved.begin(), moved.end(), parts.end_record.begin() + kDirectoryOffsetInRecord);
  parts.end_record[kCommentInRecord] = static_cast<uint8_t>(comment.size());
  return Concat({parts.entries, block, parts.directory, parts.end_record, ToBytes(comment)});
}

Bytes AddSigningBlock(const Bytes& archive, const std::string& key) {
  const Bytes signer = SignerOf(DigestOfChunks(TakeApart(archive)), key);
  return ArchiveWithBlock(archive, SigningBlockBytes({{kSchemeV2, Signers({signer})}}));
}
