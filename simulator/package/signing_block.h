// The signers of the schemes after JAR signing (v2, v3, v3.1). They are in the signing block, which
// is between an archive's entries and its central directory. The block is found in the same way as
// the platform finds it. Digests and signatures are not verified. A block with more than 16 signers
// (kMostSigners in signing_block.cpp) counts as damaged. The certificates point into the caller's
// bytes.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "simulator/package/archive_directory.h"

namespace simulator {

// One signer of one scheme.
struct NewerSigner {
  const char* scheme;            // "v2", "v3" or "v3.1"
  std::string_view certificate;  // DER; the first of the signer's chain, with the key that signs
};

struct SigningBlock {
  // In the order of the block. If the block has several ID-value pairs for one scheme, the first
  // pair counts.
  std::vector<NewerSigner> signers;
  // A part of the block is malformed. The signers are those before that part.
  bool is_damaged = false;
};

// In bytes. A larger block is not read. The blocks of real packages have a few kilobytes.
inline constexpr uint64_t kMostBlockBytes = 16 << 20;

// Reads the signing block of the archive that is open as `fd`, from its first size field to its
// magic. Returns an empty text if the archive has no such block, or if the block is larger than
// kMostBlockBytes. Sets `is_too_large` to true only in the second case.
std::string ReadSigningBlock(int fd, const ArchiveEnd& end, bool* is_too_large);

SigningBlock ParseSigningBlock(std::string_view block);

}  // namespace simulator
