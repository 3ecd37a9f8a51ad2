// Reads the signature block of a JAR as strict DER. The block is a PKCS#7 SignedData (RFC 2315 §9).
// The tool's own reader is not strict. This reader shows two things that the tool does not report:
// the contents of a block that the tool refused, and the contents that a strict reader finds in a
// block that the tool accepted.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

namespace simulator {

struct SignatureBlockFacts {
  bool is_whole = false;         // the block could be read to its last signer
  std::string_view certificate;  // the first certificate, DER; points into the block
  size_t signer_count = 0;
  // Of the first signer:
  std::string signer_id;  // contents of the SignerIdentifier (RFC 5652 §5.3)
  bool has_signed_attributes = false;
  std::string digest;             // such as "SHA256"
  bool has_known_digest = false;  // MD5, SHA-1 or SHA-256
  bool has_pss = false;           // signed with RSASSA-PSS
};

SignatureBlockFacts ParseSignatureBlock(std::string_view block);

}  // namespace simulator
