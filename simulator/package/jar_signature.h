// The JAR signature that the tool verifies, and facts that explain the tool's answer. The tool's
// own code finds the signature file and its block, and reads the signature file and the key. Other
// facts only explain the answer: facts of the block, which is read as strict DER
// (signature_block.h), and facts of the certificate, which libcrypto reads (certificate.h). Only
// the tool decides whether the signature is valid.
#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <vector>

#include "simulator/package/archive.h"
#include "simulator/package/certificate.h"
#include "simulator/package/signature_block.h"

namespace simulator {

// An RSA key as the tool reads it from a signature block. Other readers of the certificate may find
// another key.
struct ToolKey {
  std::string modulus_sha256;  // the digest in the kernel's payload; in hexadecimal
  uint32_t size = 0;           // of the modulus in bytes, as the tool reads it
  int bits = 0;
  int32_t exponent = 0;
  bool is_forgeable = false;  // anyone can make its signatures
};

struct JarSignatureFacts {
  Archive::ReadResult manifest = Archive::ReadResult::kMissing;  // META-INF/MANIFEST.MF
  // The entries META-INF/*.SF, in the order in which the tool finds them. The tool uses the first.
  std::vector<std::string> signature_files;
  std::string claimed_schemes;        // X-Android-APK-Signed, such as "2, 3"; empty: not stated
  bool has_manifest_digest = false;   // the signature file has a digest of the manifest
  bool has_sha1_of_manifest = false;  // the manifest digest that the tool uses is SHA-1
  // The name of the block that the tool looks for (.RSA). If the package has only a block for
  // another kind of key (.EC or .DSA), the name of that block.
  std::string block_name;
  bool has_block = false;
  // None if the tool cannot read a key.
  std::optional<ToolKey> key;

  SignatureBlockFacts block;  // read as strict DER; its member `certificate` is always empty
  // The first certificate of the block. None if this certificate cannot be parsed, or if the tool
  // reads the key from another certificate.
  std::optional<CertificateFacts> certificate;
  // The first signer's identifier does not name the first certificate.
  bool names_other_certificate = false;
};

JarSignatureFacts ReadJarSignature(Archive* archive);

}  // namespace simulator
