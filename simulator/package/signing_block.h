// The signatures of the schemes after JAR signing (v2, v3, v3.1), as far as whose key made them:
// the signing block, which lies between an archive's entries and its central directory. Digests and
// signatures are not verified. What is read is bounded and points into the caller's bytes.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace simulator {

// One signer of one scheme.
struct NewerSigner {
  const char* scheme;            // "v2", "v3" or "v3.1"
  std::string_view certificate;  // DER, the first of the signer's chain, whose key signs
};

struct SigningBlock {
  std::vector<NewerSigner> signers;  // in the order of the block
  // Something in the block did not read; the signers are those before it.
  bool is_damaged = false;
};

// A larger block than this counts as none; those of real packages have some kilobytes.
inline constexpr uint64_t kMostBlockBytes = 16 << 20;

// The signing block of the archive that is open as `fd`, from its first size field to its magic.
// Empty when there is none, which needs an end of the central directory where it should be.
std::string ReadSigningBlock(int fd);

SigningBlock ParseSigningBlock(std::string_view block);

}  // namespace simulator
