// Writes the APK signing block of the schemes that followed JAR signing (APK Signature Scheme v2,
// v3, v3.1), with one function for each layer. The block is a list of pairs of scheme and value,
// between an archive's entries and its central directory. It protects the entries of META-INF like
// all other entries. Numbers are little-endian. The size of the block and the length before each of
// its pairs have 64 bits. Inside a pair's value, a length field of 32 bits stands before every list
// and every element.
#pragma once

#include <cstdint>
#include <string>
#include <utility>
#include <vector>

#include "support/bytes.h"

inline constexpr uint32_t kSchemeV2 = 0x7109871a;
inline constexpr uint32_t kSchemeV3 = 0xf05368c0;
inline constexpr uint32_t kSchemeV31 = 0x1b93ad61;

// A signer with this certificate: signed data (no digests, one certificate), no signatures, no key.
Bytes SignerBytes(const Bytes& certificate);
// The value of a scheme's pair: the list of its signers.
Bytes Signers(const std::vector<Bytes>& signers);
// The block of these pairs of scheme and value: size, pairs, size again, magic.
Bytes SigningBlockBytes(const std::vector<std::pair<uint32_t, Bytes>>& pairs);
// The archive with two additions: `block` before its central directory, and `comment` (at most 255
// bytes) at its end. `archive` itself must not have a comment.
Bytes ArchiveWithBlock(const Bytes& archive, const Bytes& block, const std::string& comment = "");

// The archive, signed with scheme v2 by the RSA test key `key`. The signature covers all bytes of
// `archive`, which must have neither a block nor a comment.
Bytes AddSigningBlock(const Bytes& archive, const std::string& key);
