#include "simulator/package/jar_signature.h"

#include <openssl/bn.h>

#include <cstring>
#include <utility>

#include "apk/apk.h"
#include "apk/manifest_mf.h"
#include "crypto/asn1.h"
#include "crypto/pkcs7.h"
#include "crypto/rsa.h"
#include "simulator/package/entries.h"

namespace simulator {

namespace {

using Bytes = std::vector<uint8_t>;

void ReadSignatureFile(Bytes text, JarSignatureFacts* jar);
void FindBlock(const Archive& archive, JarSignatureFacts* jar);
void ReadBlock(const Bytes& block, JarSignatureFacts* jar);
std::optional<ToolKey> ReadToolKey(const Bytes& block, const pkcs7& record);
bool IsCertificateAt(std::string_view certificate, const uint8_t* tbs);
std::string_view ToView(const uint8_t* bytes, size_t size);

}  // namespace

JarSignatureFacts ReadJarSignature(Archive* archive) {
  JarSignatureFacts jar;
  jar.signature_files = archive->Walk(kSignatureFileNames).names;
  if (jar.signature_files.empty()) return jar;
  Bytes text, block;
  archive->Read(jar.signature_files[0], &text);
  ReadSignatureFile(std::move(text), &jar);
  FindBlock(*archive, &jar);
  if (archive->Read(jar.block_name, &block) == Archive::ReadResult::kRead) ReadBlock(block, &jar);
  return jar;
}

namespace {

void ReadSignatureFile(Bytes text, JarSignatureFacts* jar) {
  ManifestMf signature_file;
  signature_file.load(std::move(text));
  const ManifestMf::Sections& sections = signature_file.getSections();
  if (sections.size() > 0) jar->claimed_schemes = sections[0].find("X-Android-APK-Signed");
  for (const ManifestMf::Section& section : sections) {
    const std::string name(section.findLastEndingIn("-Digest-Manifest").first);
    if (name.empty() || jar->has_manifest_digest) continue;
    jar->has_manifest_digest = true;
    jar->has_sha1_of_manifest = IsSha1Digest(name.substr(0, name.size() - strlen("-Manifest")));
  }
}

void FindBlock(const Archive& archive, JarSignatureFacts* jar) {
  const std::string name = ApkTools::SignatureBlockName(jar->signature_files[0]);
  const std::string base = name.substr(0, name.rfind('.') + 1);
  jar->block_name = name;
  for (const std::string& candidate : {name, base + "EC", base + "DSA"}) {
    if (jar->has_block) break;
    jar->has_block = archive.Has(candidate);
    if (jar->has_block) jar->block_name = candidate;
  }
}

void ReadBlock(const Bytes& block, JarSignatureFacts* jar) {
  jar->block = ParseSignatureBlock(ToView(block.data(), block.size()));
  const std::string_view certificate = std::exchange(jar->block.certificate, {});
  pkcs7 record = {};
  const bool is_read = processCert(block.data(), static_cast<uint32_t>(block.size()), &record) == 0;
  if (is_read) jar->key = ReadToolKey(block, record);
  if (is_read && !IsCertificateAt(certificate, record.tbs_data)) return;
  jar->certificate = ParseCertificate(certificate);
  const std::string& signer = jar->block.signer_id;
  jar->names_other_certificate = jar->certificate && jar->block.is_whole &&
                                 signer != jar->certificate->issuer_and_serial &&
                                 signer != jar->certificate->key_id;
}

// Returns no key if the modulus ends beyond the block: the tool refuses such a key.
std::optional<ToolKey> ReadToolKey(const Bytes& block, const pkcs7& record) {
  const auto room = static_cast<size_t>(block.data() + block.size() - record.modulus);
  if (record.modulus > block.data() + block.size() || record.modulus_length > room) return {};
  ToolKey key;
  key.modulus_sha256 = Sha256Hex(ToView(record.modulus, record.modulus_length));
  key.size = record.modulus_length;
  memcpy(&key.exponent, record.exponent, sizeof(key.exponent));
  key.is_forgeable = rsa_is_forgeable(static_cast<uint32_t>(key.exponent));
  const bssl::UniquePtr<BIGNUM> number(BN_bin2bn(record.modulus, record.modulus_length, nullptr));
  key.bits = static_cast<int>(BN_num_bits(number.get()));
  return key;
}

// True if `tbs` points to the tbsCertificate of `certificate`.
bool IsCertificateAt(std::string_view certificate, const uint8_t* tbs) {
  asn1_hdr header;
  return asn1_get_next(reinterpret_cast<const uint8_t*>(certificate.data()), certificate.size(),
                       &header) == 0 &&
         header.payload == tbs;
}

std::string_view ToView(const uint8_t* bytes, size_t size) {
  return {reinterpret_cast<const char*>(bytes), size};
}

}  // namespace

}  // namespace simulator
