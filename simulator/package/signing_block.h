// The signatures of the schemes after JAR signing (v2, v3, v3.1), as far as whose key made them:
// the signing block, which lies between an archive's entries and its central directory. Found as
// the platform finds it. Digests and signatures are not verified. All results are bounded and point
// into the caller's bytes.
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
  std::string_view certificate;  // DER, the first of the signer's chain, whose key signs
};

struct SigningBlock {
  // In the order of the block; of several values for one scheme the first counts.
  std::vector<NewerSigner> signers;
  // Something in the block did not read; the signers are those before it.
  bool is_damaged = false;
};

// A larger block than this is not read; those of real packages have some kilobytes.
inline constexpr uint64_t kMostBlockBytes = 16 << 20;

// The signing block of the archive that is open as `fd`, from its first size field to its magic.
// Empty when the archive has no such block, or one that is larger than kMostBlockBytes, which
// `is_too_large` tells.
std::string ReadSigningBlock(int fd, const ArchiveEnd& end, bool* is_too_large);

SigningBlock ParseSigningBlock(std::string_view block);

}  // namespace simulator
