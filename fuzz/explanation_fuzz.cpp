// The simulator's own readers of a file, which explain the tool's result. The first byte of the
// input selects a function of kReaders. The other bytes are the input of this function: a whole
// file, or one part of a file.
#include <sys/mman.h>
#include <unistd.h>

#include <algorithm>
#include <memory>
#include <string>

#include "fuzz/fuzz.h"
#include "simulator/package/android_manifest.h"
#include "simulator/package/certificate.h"
#include "simulator/package/facts.h"
#include "simulator/package/signature_block.h"
#include "simulator/package/signing_block.h"

using namespace simulator;

namespace {

bool IsPartOf(std::string_view part, std::string_view whole) {
  return part.empty() ||
         (part.data() >= whole.data() && part.data() + part.size() <= whole.data() + whole.size());
}

void JudgeCertificate(std::string_view bytes) {
  const auto facts = ParseCertificate(bytes);
  ParseAlgorithm(bytes);
  if (!facts) return;
  Require(facts->sha256.size() == 64 && facts->key.sha256.size() == 64,
          "the certificate and its key have digests");
  const bool has_modulus = !facts->key.modulus_sha256.empty();
  Require(!has_modulus || facts->key.modulus_sha256.size() == 64,
          "the modulus's digest has 64 digits");
  Require(!has_modulus || facts->key.bits > 0, "a key with a modulus has a size");
}

void JudgeSigningBlock(std::string_view bytes) {
  for (const NewerSigner& signer : ParseSigningBlock(bytes).signers) {
    Require(IsPartOf(signer.certificate, bytes), "a certificate is in the block");
  }
}

void JudgeSignatureBlock(std::string_view bytes) {
  const SignatureBlockFacts facts = ParseSignatureBlock(bytes);
  Require(IsPartOf(facts.certificate, bytes), "the certificate is in the block");
  Require(!facts.is_whole || facts.signer_count > 0, "a whole block has a signer");
}

void JudgeAndroidManifest(std::string_view bytes) {
  const AndroidManifest manifest = ParseAndroidManifest({bytes.begin(), bytes.end()});
  Require(!manifest.has_overlaps || !manifest.package_name,
          "a manifest with overlapping strings is not read");
  // A UTF-16 unit of two bytes becomes at most three bytes of UTF-8.
  Require(manifest.installer_name.size() <= bytes.size() * 3 / 2,
          "the package's name by the installer's rules fits in the document");
}

void ReadWholeFile(std::string_view bytes) {
  const int fd = memfd_create("package", MFD_CLOEXEC);
  Require(write(fd, bytes.data(), bytes.size()) == static_cast<ssize_t>(bytes.size()),
          "the file is written");
  const PackageFacts facts = LookAt("/proc/self/fd/" + std::to_string(fd));
  close(fd);
  Require(facts.error == 0 && facts.size == bytes.size(), "the file is opened and has its size");
  const bool is_archive = facts.kind == FileKind::kArchive && facts.archive_result == 0;
  Require(is_archive || facts.entries.empty(), "only archives have entries");
  Require(!facts.was_changed, "the file was not changed");
  size_t libraries = 0;
  for (const ListedEntry& each : facts.entries) libraries += kLibraryNames.Has(each.entry.name);
  Require(libraries == facts.libraries.size(), "each library is listed, damaged or not");
  const bool has_key = facts.jar.key.has_value();
  Require(!has_key || facts.jar.key->modulus_sha256.size() == 64,
          "the digest of the signer's modulus has 64 digits");
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  constexpr void (*kReaders[])(std::string_view) = {ReadWholeFile, JudgeSigningBlock,
                                                    JudgeCertificate, JudgeSignatureBlock,
                                                    JudgeAndroidManifest};
  if (size == 0) return 0;
  const size_t which = data[0] % (sizeof(kReaders) / sizeof(kReaders[0]));
  // An exact copy, so that reading one byte too far is detected.
  const std::unique_ptr<char[]> copy(new char[size - 1]);
  std::copy(data + 1, data + size, copy.get());
  kReaders[which]({copy.get(), size - 1});
  return 0;
}
