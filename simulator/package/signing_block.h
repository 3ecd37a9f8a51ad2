// The signers of the signature schemes v2, v3 and v3.1, which are newer than JAR signing. These
// signers are in the signing block, which is between an archive's entries and its central
// directory. The block is found in the same way as the platform finds it. Digests and signatures
// are not verified. A block with more than 16 signers (kMostSigners in signing_block.cpp) counts as
// damaged.
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
  std::string_view certificate;  // DER; the signer's first certificate, which has the signer's key
};

struct SigningBlock {
  // In the order of the block. If the block has several ID-value pairs for one scheme, the first
  // pair counts.
  std::vector<NewerSigner> signers;
  // A part of the block is malformed, or the block has too many signers. `signers` then has only
  // the signers before the malformed part, or before the first signer that is too many.
  bool is_damaged = false;
};

// In bytes. A larger block is not read. The block of a real package has a few kilobytes.
inline constexpr uint64_t kMostBlockBytes = 16 << 20;

// Returns the signing block of the archive that is open as `fd`, from the block's first size field
// to its magic. Returns an empty text if the archive has no signing block, or if the block is
// larger than kMostBlockBytes. Sets `*is_too_large` to true in the second case, otherwise to
// false.
std::string ReadSigningBlock(int fd, const ArchiveEnd& end, bool* is_too_large);

// Parses the result of ReadSigningBlock. The certificates point into `block`.
SigningBlock ParseSigningBlock(std::string_view block);

}  // namespace simulator
