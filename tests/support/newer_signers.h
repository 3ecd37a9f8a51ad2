// Writing the signing block of the schemes after v1, layer by layer.
#pragma once

#include <cstdint>
#include <string>
#include <utility>
#include <vector>

#include "support/bytes.h"
#include "support/der.h"
#include "support/little_endian.h"

inline constexpr uint32_t kSchemeV2 = 0x7109871a;
inline constexpr uint32_t kSchemeV3 = 0xf05368c0;
inline constexpr uint32_t kSchemeV31 = 0x1b93ad61;

inline void Put64(Bytes& out, uint64_t value) {
  Put32(out, static_cast<uint32_t>(value & 0xffffffff));
  Put32(out, static_cast<uint32_t>(value >> 32));
}

// The bytes after their length as 32 bits.
inline Bytes Prefixed(const Bytes& bytes) {
  Bytes out;
  Put32(out, static_cast<uint32_t>(bytes.size()));
  return Concat({out, bytes});
}

// A signer with this certificate: signed data (no digests, one certificate), no signatures.
inline Bytes SignerBytes(const Bytes& certificate) {
  const Bytes signed_data = Concat({Prefixed({}), Prefixed(Prefixed(certificate))});
  return Concat({Prefixed(signed_data), Prefixed({}), Prefixed({})});
}

inline Bytes Signers(const std::vector<Bytes>& signers) {
  Bytes all;
  for (const Bytes& signer : signers) all = Concat({all, Prefixed(signer)});
  return Prefixed(all);
}

// size, pairs of number and value, size again, magic.
inline Bytes SigningBlockBytes(const std::vector<std::pair<uint32_t, Bytes>>& pairs) {
  Bytes body;
  for (const auto& [id, value] : pairs) {
    Put64(body, value.size() + 4);
    Put32(body, id);
    body = Concat({body, value});
  }
  Bytes size;
  Put64(size, body.size() + 24);
  return Concat({size, body, size, ToBytes("APK Sig Block 42")});
}

// The archive with `block` in front of its central directory.
inline Bytes ArchiveWithBlock(const Bytes& zip, const Bytes& block,
                              const std::string& comment = "") {
  constexpr size_t kEnd = 22;
  const size_t end = zip.size() - kEnd;
  uint32_t directory = 0;
  for (size_t i = 20; i-- > 16;) directory = directory << 8 | zip[end + i];
  const Bytes before(zip.begin(), zip.begin() + directory);
  const Bytes after(zip.begin() + directory, zip.begin() + static_cast<ptrdiff_t>(end) + 16);
  Bytes tail;
  Put32(tail, directory + static_cast<uint32_t>(block.size()));
  tail.push_back(static_cast<uint8_t>(comment.size()));
  tail.push_back(0);
  return Concat({before, block, after, tail, ToBytes(comment)});
}
