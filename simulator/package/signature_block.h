// The signature block of a JAR: a PKCS#7 SignedData (RFC 2315 §9), as far as explaining a refusal
// needs it. Read as strict DER; the tool reads its own way, and what it makes of a block stands in
// its log. What is read points into the caller's bytes.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

namespace simulator {

struct SignatureBlockFacts {
  bool is_whole = false;         // the block read to its last signer
  std::string_view certificate;  // the first one, which is the one that the tool takes; DER
  size_t certificate_count = 0;
  size_t signer_count = 0;
  // Of the first signer:
  bool has_signed_attributes = false;
  std::string digest;               // such as "SHA-256"
  std::string signature_algorithm;  // such as "SHA256withRSA", or the key's alone
};

SignatureBlockFacts ParseSignatureBlock(std::string_view block);

}  // namespace simulator
