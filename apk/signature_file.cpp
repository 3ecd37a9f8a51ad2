// The package's signature: signature file, signature block, and the digest of the manifest.
#include <openssl/md5.h>
#include <openssl/sha.h>

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

std::string SignatureBlockName(const std::string& signature_file_name);
bool FitsInBlock(const std::vector<uint8_t>& block, const uint8_t* start, size_t length);
int VerifySignature(rsa_context& key, const std::vector<uint8_t>& block, const uint8_t* sha1,
                    const uint8_t* sha256, const uint8_t* md5, const uint8_t* signature);

// A key that is wiped and released with its owner.
struct ScopedRsaKey {
  rsa_context context = {};
  ScopedRsaKey() = default;
  ~ScopedRsaKey() { mpi_free(&context.N, &context.E, nullptr); }
  ScopedRsaKey(const ScopedRsaKey&) = delete;
  ScopedRsaKey& operator=(const ScopedRsaKey&) = delete;
};

// The longest modulus that becomes a manufacturer key, in bytes.
constexpr uint32_t kLongestKey = 2047;

}  // namespace

bool Apk::InitCertSf() {
  std::string name;
  std::vector<uint8_t> content;
  if (!ExtractSignatureFile(name, content)) return false;
  std::vector<uint8_t> sha1, sha256, md5;
  ComputeSHA1Digest(content, sha1);
  ComputeSHA256Digest(content, sha256);
  ComputeMD5Digest(content, md5);
  if (!cert_sf_.load(std::move(content))) return false;

  const std::string block_name = SignatureBlockName(name);
  std::vector<uint8_t> block;
  if (ExtractEntry(block_name, block) != 0) {
    LogError("Can't extract RSA certificate: %s\n", block_name.c_str());
    return false;
  }
  if (!VerifyCertificate(block, sha1, sha256, md5, manufacturer_key_)) {
    LogError("file not verified: %s\n", name.c_str());
    return false;
  }
  return true;
}

// Deliberate: of several signature files only the first in the archive's order counts.
bool Apk::ExtractSignatureFile(std::string& name, std::vector<uint8_t>& content) {
  void* cookie;
  if (StartIteration(&cookie, "META-INF/", ".SF") != 0) return false;
  ZipEntry entry;
  const int32_t found = Next(cookie, &entry, name);
  EndIteration(cookie);
  return found == 0 && ExtractZipEntry(zip_handle_, &entry, content) == 0;
}

bool Apk::VerifyCertificate(std::vector<uint8_t>& block, std::vector<uint8_t>& sha1,
                            std::vector<uint8_t>& sha256, std::vector<uint8_t>& md5,
                            std::vector<uint8_t>& key) {
  pkcs7 record = {};
  if (processCert(block.data(), static_cast<uint32_t>(block.size()), &record) != 0) {
    LogError("Unknown certificate type");
    return false;
  }
  uint8_t tbs_sha1[SHA_DIGEST_LENGTH], tbs_md5[MD5_DIGEST_LENGTH], tbs_sha256[SHA256_DIGEST_LENGTH];
  SHA1(record.tbs_data, record.tbs_data_length, tbs_sha1);
  MD5(record.tbs_data, record.tbs_data_length, tbs_md5);
  SHA256(record.tbs_data, record.tbs_data_length, tbs_sha256);

  // The record's four bytes, read as they are: right for one-byte exponents and for 65537.
  uint32_t exponent;
  memcpy(&exponent, record.exponent, sizeof(exponent));
  ScopedRsaKey rsa;
  int result = kRsaBadInput;
  if (FitsInBlock(block, record.modulus, record.modulus_length)) {
    result = rsa_set_key(&rsa.context, record.modulus, nullptr, exponent, record.modulus_length);
  }
  if (result != 0) {
    LogError("RSA could not set key: %X\n", static_cast<unsigned>(result));
    return false;
  }
  // Deliberate: the certificate's own key must have signed it. Who issued it is not asked, there is
  // no store of trusted issuers.
  result =
      VerifySignature(rsa.context, block, tbs_sha1, tbs_sha256, tbs_md5, record.cert_signature);
  if (result != 0) {
    LogError("RSA could not verify certificate: %X\n", static_cast<unsigned>(result));
    return false;
  }
  result = VerifySignature(rsa.context, block, sha1.data(), sha256.data(), md5.data(),
                           record.signed_digest);
  if (result != 0) {
    LogError("RSA could not verify data: %X\n", static_cast<unsigned>(result));
    return false;
  }
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
    // Deliberate: the first section with a digest decides; a later one cannot repair it.
    break;
  }
  LogError("Can't validate manifest.\n");
  return false;
}

bool Apk::VerifyData(const std::string& digest_name, const std::vector<uint8_t>& expected,
                     const std::vector<uint8_t>& data) {
  // Deliberate: neither MD5, which is broken, nor the longer digests, which no package carries.
  struct Algorithm {
    const char* attribute;
    void (*compute)(const std::vector<uint8_t>&, std::vector<uint8_t>&);
  };
  constexpr Algorithm kAlgorithms[] = {
      {"SHA1-Digest", ComputeSHA1Digest},
      {"SHA-256-Digest", ComputeSHA256Digest},
  };
  for (const Algorithm& algorithm : kAlgorithms) {
    if (digest_name != algorithm.attribute) continue;
    std::vector<uint8_t> computed;
    algorithm.compute(data, computed);
    return computed == expected;
  }
  LogError("verifyData: Unsupported digest type: %s\n", digest_name.c_str());
  return false;
}

namespace {

// Deliberate: only RSA blocks are looked for; no key of another kind is supported.
std::string SignatureBlockName(const std::string& signature_file_name) {
  const size_t dot = signature_file_name.rfind('.');
  if (dot == std::string::npos) return signature_file_name;
  return signature_file_name.substr(0, dot + 1) + "RSA";
}

// `start` points into the block, or to its end.
bool FitsInBlock(const std::vector<uint8_t>& block, const uint8_t* start, size_t length) {
  const auto offset = static_cast<size_t>(start - block.data());
  return offset <= block.size() && length <= block.size() - offset;
}

// rsa_pkcs1_verify of a signature in the block, which is as long as the modulus whatever length the
// block states; bad input where the block ends before it does.
int VerifySignature(rsa_context& key, const std::vector<uint8_t>& block, const uint8_t* sha1,
                    const uint8_t* sha256, const uint8_t* md5, const uint8_t* signature) {
  if (!FitsInBlock(block, signature, static_cast<size_t>(key.len))) return kRsaBadInput;
  return rsa_pkcs1_verify(&key, sha1, sha256, md5, signature);
}

}  // namespace

}  // namespace ApkTools
