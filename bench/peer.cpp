// bench_peer FILE: does the tool's job with OpenSSL's functions for PKCS#7, X.509 and digests. This
// program looks up the digests of entries in a hash table.
#include <openssl/evp.h>
#include <openssl/pkcs7.h>
#include <openssl/rsa.h>
#include <openssl/x509.h>

#include <cstring>
#include <unordered_map>
#include <vector>

#include "bench/job.h"

namespace {

using Entries = std::unordered_map<std::string_view, std::string_view>;

constexpr std::string_view kDigest = "SHA-256-Digest: ";
constexpr std::string_view kManifestDigest = "SHA-256-Digest-Manifest: ";
constexpr std::string_view kSectionEnd = "\r\n\r\n";

std::vector<uint8_t> VerifySignature(const Buffer& block, const Buffer& signature_file);
Entries ReadEntries(std::string_view manifest);
std::string_view Value(std::string_view section, std::string_view name);
void CheckDigest(std::string_view expected, const Buffer& content);

}  // namespace

int main(int argc, char** argv) {
  const GivenPackage package = OpenGiven(argc, argv);
  Buffer compiled_manifest, manifest, signature_file, block;
  Extract(package, "AndroidManifest.xml", compiled_manifest);
  Extract(package, "META-INF/MANIFEST.MF", manifest);
  const std::string signature_file_name = SignatureFileName(package);
  Extract(package, signature_file_name, signature_file);
  Extract(package, signature_file_name.substr(0, signature_file_name.rfind('.')) + ".RSA", block);

  const std::vector<uint8_t> key = VerifySignature(block, signature_file);
  CheckDigest(Value(signature_file.text(), kManifestDigest), manifest);
  const Entries entries = ReadEntries(manifest.text());
  const std::string name = WalkManifest(compiled_manifest);
  {
    Buffer dex;
    Extract(package, "classes.dex", dex);
    CheckDigest(entries.at("classes.dex"), dex);
  }
  SignLibraries(package, [&](const std::string& library, const Buffer& content) {
    CheckDigest(entries.at(library), content);
  });
  SignGiven(package);
  Register(package, name, key.data(), key.size());
  return 0;
}

namespace {

// Returns the signer's modulus. Like the tool, this function requires that the certificate is
// signed with its own key. Like the tool, it does not check the issuer.
std::vector<uint8_t> VerifySignature(const Buffer& block, const Buffer& signature_file) {
  const uint8_t* at = block.data();
  PKCS7* const pkcs7 = d2i_PKCS7(nullptr, &at, static_cast<long>(block.size()));
  BIO* const signed_bytes =
      BIO_new_mem_buf(signature_file.data(), static_cast<int>(signature_file.size()));
  constexpr int kFlags = PKCS7_NOVERIFY | PKCS7_BINARY;
  if (PKCS7_verify(pkcs7, nullptr, nullptr, signed_bytes, nullptr, kFlags) != 1) {
    GiveUp("signature does not verify");
  }
  STACK_OF(X509)* const signers = PKCS7_get0_signers(pkcs7, nullptr, 0);
  X509* const certificate = sk_X509_value(signers, 0);
  EVP_PKEY* const key = X509_get0_pubkey(certificate);
  if (X509_verify(certificate, key) != 1) GiveUp("certificate does not verify");

  BIGNUM* number = nullptr;
  EVP_PKEY_get_bn_param(key, "n", &number);
  std::vector<uint8_t> modulus(static_cast<size_t>(BN_num_bytes(number)));
  BN_bn2bin(number, modulus.data());
  BN_free(number);
  sk_X509_free(signers);
  BIO_free(signed_bytes);
  PKCS7_free(pkcs7);
  return modulus;
}

Entries ReadEntries(std::string_view manifest) {
  Entries entries;
  while (!manifest.empty()) {
    const size_t end = manifest.find(kSectionEnd);
    const std::string_view section = manifest.substr(0, end);
    const std::string_view name = Value(section, "Name: ");
    if (!name.empty()) entries[name] = Value(section, kDigest);
    if (end == manifest.npos) break;
    manifest.remove_prefix(end + kSectionEnd.size());
  }
  return entries;
}

std::string_view Value(std::string_view section, std::string_view name) {
  const size_t found = section.find(name);
  if (found == section.npos) return {};
  const size_t start = found + name.size();
  return section.substr(start, section.find('\r', start) - start);
}

void CheckDigest(std::string_view expected, const Buffer& content) {
  uint8_t digest[EVP_MAX_MD_SIZE], text[2 * EVP_MAX_MD_SIZE];
  unsigned length = 0;
  if (EVP_Digest(content.data(), content.size(), digest, &length, EVP_sha256(), nullptr) != 1) {
    GiveUp("cannot compute a digest");
  }
  const int text_length = EVP_EncodeBlock(text, digest, static_cast<int>(length));
  if (expected != std::string_view(reinterpret_cast<char*>(text), static_cast<size_t>(text_length)))
    GiveUp("digest does not match");
}

}  // namespace
