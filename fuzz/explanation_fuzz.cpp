// What the simulator reads of a file to explain what the tool made of it: each of its readers, and
// all of them over a whole file. The first byte says which.
#include <openssl/bn.h>
#include <openssl/rsa.h>
#include <openssl/x509.h>
#include <sys/mman.h>
#include <unistd.h>

#include <algorithm>
#include <memory>
#include <string>

#include "fuzz/fuzz.h"
#include "simulator/package/certificate.h"
#include "simulator/package/compiled_manifest.h"
#include "simulator/package/facts.h"
#include "simulator/package/jar_manifest.h"
#include "simulator/package/signature_block.h"
#include "simulator/package/signing_block.h"

using namespace simulator;

namespace {

struct Free {
  void operator()(X509* certificate) const { X509_free(certificate); }
  void operator()(EVP_PKEY* key) const { EVP_PKEY_free(key); }
};

bool IsPartOf(std::string_view part, std::string_view whole) {
  return part.empty() ||
         (part.data() >= whole.data() && part.data() + part.size() <= whole.data() + whole.size());
}

// What libcrypto's own parser takes is read from the same places.
void JudgeCertificate(std::string_view bytes) {
  const auto facts = ParseCertificate(bytes);
  const auto* at = reinterpret_cast<const uint8_t*>(bytes.data());
  const std::unique_ptr<X509, Free> judge(d2i_X509(nullptr, &at, static_cast<long>(bytes.size())));
  if (!facts || !judge) return;
  const std::unique_ptr<EVP_PKEY, Free> key(X509_get_pubkey(judge.get()));
  const RSA* const rsa = key == nullptr ? nullptr : EVP_PKEY_get0_RSA(key.get());
  if (rsa == nullptr) return;
  Require(facts->key.algorithm == "RSA", "the key is an RSA key");
  Require(facts->key.bits == static_cast<int>(BN_num_bits(RSA_get0_n(rsa))), "its size");
  std::string modulus(BN_num_bytes(RSA_get0_n(rsa)), '\0');
  BN_bn2bin(RSA_get0_n(rsa), reinterpret_cast<uint8_t*>(modulus.data()));
  Require(facts->key.modulus_sha256 == Sha256Hex(modulus), "its modulus");
}

void JudgeSigningBlock(std::string_view bytes) {
  for (const NewerSigner& signer : ParseSigningBlock(bytes).signers) {
    Require(IsPartOf(signer.certificate, bytes), "a certificate lies in the block");
  }
}

void JudgeSignatureBlock(std::string_view bytes) {
  const SignatureBlockFacts facts = ParseSignatureBlock(bytes);
  Require(IsPartOf(facts.certificate, bytes), "the certificate lies in the block");
  Require(!facts.is_whole || facts.signer_count > 0, "a whole block has a signer");
}

void JudgeJarManifest(std::string_view bytes) {
  size_t length = 0;
  for (const ManifestSection& section : ParseJarManifest(bytes)) {
    Require(!section.empty(), "a section has an attribute");
    for (const auto& [name, value] : section) length += name.size() + value.size();
  }
  Require(length <= bytes.size(), "nothing is made up");
  ListedEntries(bytes);
  ClaimedSchemes(bytes);
  StatesManifestDigest(bytes);
}

void JudgeCompiledManifest(std::string_view bytes) {
  const AndroidManifest manifest = ParseCompiledManifest(bytes);
  // A character of two bytes becomes three at most.
  Require(manifest.package_name.size() <= bytes.size() * 3 / 2, "the name lies in the document");
}

void ReadWholeFile(std::string_view bytes) {
  const int fd = memfd_create("package", MFD_CLOEXEC);
  Require(write(fd, bytes.data(), bytes.size()) == static_cast<ssize_t>(bytes.size()), "the file");
  const PackageFacts facts = LookAt("/proc/self/fd/" + std::to_string(fd));
  close(fd);
  Require(facts.error == 0 && facts.size == bytes.size(), "the file is looked at");
  const bool is_archive = facts.kind == FileKind::kArchive && facts.archive_result == 0;
  Require(is_archive || facts.entries.empty(), "only archives have entries");
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  constexpr void (*kReaders[])(std::string_view) = {ReadWholeFile,    JudgeSigningBlock,
                                                    JudgeCertificate, JudgeSignatureBlock,
                                                    JudgeJarManifest, JudgeCompiledManifest};
  if (size == 0) return 0;
  const size_t which = data[0] % (sizeof(kReaders) / sizeof(kReaders[0]));
  // A copy of its own size, so that one byte too far is found.
  const std::unique_ptr<char[]> copy(new char[size - 1]);
  std::copy(data + 1, data + size, copy.get());
  kReaders[which]({copy.get(), size - 1});
  return 0;
}
