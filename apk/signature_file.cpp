// The package's signature: signature file, signature block, and the digest of the manifest.
#include <cstring>
#include <string_view>
#include <utility>

#include "apk/apk.h"
#include "apk/base64.h"
#include "apk/extraction.h"
#include "crypto/pkcs7.h"
#include "crypto/rsa.h"
#include "util/digest.h"
#include "util/log.h"

namespace ApkTools {

namespace {

bool FitsInBlock(const std::vector<uint8_t>& block, const uint8_t* start, size_t length);
int LoadKey(const std::vector<uint8_t>& block, const pkcs7& record, rsa_context& key);
int VerifySignature(const rsa_context& key, const std::vector<uint8_t>& block,
                    const Digests& digests, const uint8_t* signature);

// VerifyCertificate refuses a modulus of more than this many bytes.
constexpr uint32_t kLongestKey = 2047;

}  // namespace

bool Apk::InitCertSf() {
  std::string name;
  std::vector<uint8_t> content;
  if (!ExtractSignatureFile(name, content)) return false;
  Digests digests = ComputeDigests(content);
  if (!cert_sf_.load(std::move(content))) return false;

  const std::string block_name = SignatureBlockName(name);
  std::vector<uint8_t> block;
  if (ExtractEntry(block_name, block) != 0) {
    LogError("Can't extract RSA certificate: %s\n", block_name.c_str());
    return false;
  }
  if (!VerifyCertificate(block, digests.sha1, digests.sha256, digests.md5, manufacturer_key_)) {
    LogError("file not verified: %s\n", name.c_str());
    return false;
  }
  return true;
}

// Deliberate: of several signature files, only the first in the zip library's order counts.
bool Apk::ExtractSignatureFile(std::string& name, std::vector<uint8_t>& content) {
  void* cookie;
  if (StartIteration(&cookie, "META-INF/", ".SF") != 0) return false;
  ZipEntry entry;
  const int32_t found = Next(cookie, &entry, name);
  EndIteration(cookie);
  return found == 0 && ExtractZipEntry(zip_handle_, &entry, content) == 0;
}

// Deliberate: only RSA blocks are looked for, because only RSA keys are supported.
std::string SignatureBlockName(const std::string& signature_file_name) {
  const size_t dot = signature_file_name.rfind('.');
  if (dot == std::string::npos) return signature_file_name;
  return signature_file_name.substr(0, dot + 1) + "RSA";
}

bool Apk::VerifyCertificate(std::vector<uint8_t>& block, std::vector<uint8_t>& sha1,
                            std::vector<uint8_t>& sha256, std::vector<uint8_t>& md5,
                            std::vector<uint8_t>& key) {
  pkcs7 record = {};
  if (processCert(block.data(), static_cast<uint32_t>(block.size()), &record) != 0) {
    // Deliberate: the text has no line end. Programs that parse the log match on this text.
    LogError("Unknown certificate type");
    return false;
  }
  rsa_local rsa;
  int result = LoadKey(block, record, rsa);
  if (result != 0) {
    LogError("RSA could not set key: %X\n", static_cast<unsigned>(result));
    return false;
  }
  // Deliberate: the certificate must be signed with its own key. Its issuer is not checked: the
  // tool has no store of trusted issuers.
  const uint8_t* const tbs = record.tbs_data;
  const Digests tbs_digests = ComputeDigests({tbs, tbs + record.tbs_data_length});
  result = VerifySignature(rsa, block, tbs_digests, record.cert_signature);
  if (result != 0) {
    LogError("RSA could not verify certificate: %X\n", static_cast<unsigned>(result));
    return false;
  }
  result = VerifySignature(rsa, block, {sha1, sha256, md5}, record.signed_digest);
  if (result != 0) {
    LogError("RSA could not verify data: %X\n", static_cast<unsigned>(result));
    return false;
  }
  // Deliberate: a key longer than kLongestKey never verifies above, so no test makes this condition
  // true. The condition limits the key's length even if the limit of rsa_pkcs1_verify is raised
  // later.
  if (record.modulus_length > kLongestKey) return false;
  key.assign(record.modulus, record.modulus + record.modulus_length);
  return true;
}

bool Apk::ValidateManifest(const std::vector<uint8_t>& manifest) {
  if (!cert_sf_) {
    LogError("Can't validate manifest. Bad SF file.\n");
    return false;
  }
  constexpr std::string_view kManifest = "-Manifest";
  for (const ManifestMf::Section& section : cert_sf_.getSections()) {
    const auto [name, value] = section.findLastEndingIn("-Digest-Manifest");
    if (name.empty()) continue;
    const std::string digest_name(name.substr(0, name.size() - kManifest.size()));
    const std::vector<uint8_t> expected = Base64Decode(std::string(value));
    if (!expected.empty() && VerifyData(digest_name, expected, manifest)) return true;
    // Deliberate: the first section with a digest of the manifest decides. Later sections do not
    // count, even if the digest in the first section is wrong.
    break;
  }
  LogError("Can't validate manifest.\n");
  return false;
}

bool Apk::VerifyData(const std::string& digest_name, const std::vector<uint8_t>& expected,
                     const std::vector<uint8_t>& data) {
  // Deliberate: only SHA-1 and SHA-256 digests are supported. apksigner writes one of the two into
  // every manifest. Other digests (MD5, SHA-512) are refused. Signatures have another rule: a
  // signature over an MD5 digest is supported, because old packages can have such a signature.
  std::vector<uint8_t> computed;
  if (digest_name == "SHA1-Digest") {
    ComputeSHA1Digest(data, computed);
  } else if (digest_name == "SHA-256-Digest") {
    ComputeSHA256Digest(data, computed);
  } else {
    LogError("verifyData: Unsupported digest type: %s\n", digest_name.c_str());
    return false;
  }
  return computed == expected;
}

namespace {

// True if the `length` bytes at `start` are inside the block. `start` must point into the block or
// to its end.
bool FitsInBlock(const std::vector<uint8_t>& block, const uint8_t* start, size_t length) {
  const auto offset = static_cast<size_t>(start - block.data());
  return offset <= block.size() && length <= block.size() - offset;
}

// Loads the record's key into `key`. Returns kRsaBadInput if the modulus extends beyond the block,
// or if the exponent is 1 or -1. Otherwise returns the result of rsa_set_key.
int LoadKey(const std::vector<uint8_t>& block, const pkcs7& record, rsa_context& key) {
  if (!FitsInBlock(block, record.modulus, record.modulus_length)) return kRsaBadInput;
  // Deliberate: the exponent's four bytes are read in host byte order, although certificates store
  // the high byte first. The result is right for an exponent of one byte and for 65537. The usual
  // signing tools use no other exponents.
  uint32_t exponent;
  memcpy(&exponent, record.exponent, sizeof(exponent));
  if (rsa_is_forgeable(exponent)) return kRsaBadInput;
  return rsa_set_key(&key, record.modulus, nullptr, exponent, record.modulus_length);
}

// Verifies the signature that starts at `signature` in the block. Reads as many bytes as the
// modulus has, and ignores the signature's length field. Returns kRsaBadInput if the block has
// fewer bytes left. Otherwise returns the result of rsa_pkcs1_verify.
int VerifySignature(const rsa_context& key, const std::vector<uint8_t>& block,
                    const Digests& digests, const uint8_t* signature) {
  if (!FitsInBlock(block, signature, static_cast<size_t>(key.len))) return kRsaBadInput;
  return rsa_pkcs1_verify(&key, digests.sha1.data(), digests.sha256.data(), digests.md5.data(),
                          signature);
}

}  // namespace

}  // namespace ApkTools
