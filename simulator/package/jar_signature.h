// The JAR signature that the tool looks at, and the facts beside it. The tool's own code reads the
// texts, the key and the names of the files. Parts that only explain are read strictly
// (signature_block.h) or by libcrypto (certificate.h). Only the tool says whether the signature
// holds.
#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <vector>

#include "simulator/package/archive.h"
#include "simulator/package/certificate.h"
#include "simulator/package/signature_block.h"

namespace simulator {

// An RSA key as the tool reads it from a signature block, which need not be what the certificate
// shows to others.
struct ToolKey {
  std::string modulus_sha256;  // what a payload holds of the key, in hexadecimal
  uint32_t size = 0;           // of the modulus, in bytes, as the tool counts them
  int bits = 0;
  int32_t exponent = 0;
  bool is_forgeable = false;  // anyone can make its signatures
};

struct JarSignatureFacts {
  Archive::ReadResult manifest = Archive::ReadResult::kMissing;  // META-INF/MANIFEST.MF
  // Those entries META-INF/*.SF, in the tool's order: it takes the first.
  std::vector<std::string> signature_files;
  std::string claimed_schemes;        // X-Android-APK-Signed, such as "2, 3"; empty: not stated
  bool has_manifest_digest = false;   // the signature file states one, of any kind
  bool has_sha1_of_manifest = false;  // the one that the tool takes is a SHA-1 digest
  // The block that the tool looks for, "RSA"; or one of another kind of key, if that alone is
  // there.
  std::string block_name;
  bool has_block = false;
  // None when the tool does not read one.
  std::optional<ToolKey> key;

  SignatureBlockFacts block;  // as others read it; its certificate is not kept
  // The first certificate; where the tool reads a key, only if it is the one that the tool reads.
  std::optional<CertificateFacts> certificate;
  bool names_other_certificate = false;  // the first signer is somebody else's, by its identifier
};

JarSignatureFacts ReadJarSignature(Archive* archive);

}  // namespace simulator
