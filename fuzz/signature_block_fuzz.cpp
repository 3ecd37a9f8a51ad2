// crypto/pkcs7.h and ApkTools::Apk::VerifyCertificate: any bytes as the signature block of one
// fixed signature file. SignAgain gets about half of the mutated blocks. It writes good signatures
// into a block if it can, so that mutations elsewhere in the block get past the signature checks.
#include <cstring>
#include <random>

#include "apk/apk.h"
#include "crypto/pkcs7.h"
#include "fuzz/fuzz.h"
#include "fuzz/signature_model.h"
#include "fuzz/signer.h"
#include "support/certificate.h"

extern "C" size_t LLVMFuzzerMutate(uint8_t* data, size_t size, size_t max_size);

namespace {

const Bytes& SignatureFile() {
  static const auto& bytes = *new Bytes(ToBytes("Signature-Version: 1.0\r\n\r\n"));
  return bytes;
}

}  // namespace

extern "C" size_t LLVMFuzzerCustomMutator(uint8_t* data, size_t size, size_t max_size,
                                          unsigned seed) {
  size = LLVMFuzzerMutate(data, size, max_size);
  std::minstd_rand random(seed);
  if (random() % 2 == 0) return size;
  Bytes block(data, data + size);
  SignAgain(block, SignatureFile());
  memcpy(data, block.data(), size);
  return size;
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  Bytes block(data, data + size);
  pkcs7 record = {};
  const int parsed = processCert(block.data(), static_cast<uint32_t>(size), &record);
  Require(parsed == 0 || parsed == 1, "processCert returns 0 or 1");
  if (parsed == 0) CompareWithStrictReader(record, block);

  ApkTools::Apk apk(-1);
  Bytes sha1 = DigestOf(Digest::kSha1, SignatureFile());
  Bytes sha256 = DigestOf(Digest::kSha256, SignatureFile());
  Bytes md5 = DigestOf(Digest::kMd5, SignatureFile());
  const Bytes untouched = {0x5a};
  Bytes key = untouched;
  const bool verified = apk.VerifyCertificate(block, sha1, sha256, md5, key);
  const Bytes expected = parsed == 0 ? VerifiedKey(record, block, SignatureFile()) : Bytes();
  Require(verified == !expected.empty(),
          "VerifyCertificate accepts exactly the blocks that VerifiedKey accepts");
  Require(key == (verified ? expected : untouched),
          "the key is the modulus if verified, else unchanged");
  return 0;
}
