// crypto/rsa.h: any key and signature. libcrypto computes the encoded message from the signature,
// and the target derives the expected result from this message. If the length is bad, the modulus
// is even, or the signature is not less than the modulus, the target knows the expected result
// without this message.
#include "crypto/rsa.h"

#include <algorithm>

#include "fuzz/fuzz.h"
#include "fuzz/rsa_model.h"

namespace {

constexpr int kBadInput = 5, kBadPadding = 7, kNotVerified = 18, kBadModulus = 20;

struct Case {
  Bytes modulus;
  uint32_t exponent;
  Bytes signature;
  Bytes sha1, sha256, md5;
  bool has_sha256;
};

int Judge(const Bytes& digest_info, Bytes prefix, const Bytes& digest) {
  prefix.insert(prefix.end(), digest.begin(), digest.end());
  return digest_info == prefix ? 0 : kNotVerified;
}

int JudgeMd(Bytes digest_info, const Bytes& md5) {
  const uint8_t algorithm = digest_info[13];  // 5: MD5; MD2 and MD4 differ only in this byte
  const Bytes prefix = {0x30, 0x20, 0x30, 0x0c, 0x06, 0x08, 0x2a, 0x86, 0x48,
                        0x86, 0xf7, 0x0d, 0x02, 0x00, 0x05, 0x00, 0x04, 0x10};
  digest_info[13] = 0;
  if (!std::equal(prefix.begin(), prefix.end(), digest_info.begin())) return kNotVerified;
  return algorithm == 5 ? Judge(digest_info, prefix, md5) : kBadPadding;
}

// Returns the expected result for an encoded message (RFC 8017 section 9.2). The padding may have
// any length. Only DigestInfos for MD5, SHA-1 and SHA-256 are accepted.
int JudgeMessage(const Case& c, const Bytes& message) {
  if (message[0] != 0 || message[1] != 1) return kBadPadding;
  const auto separator =
      std::find_if(message.begin() + 2, message.end(), [](uint8_t byte) { return byte != 0xff; });
  if (separator == message.end() || *separator != 0) return kBadPadding;
  const Bytes digest_info(separator + 1, message.end());
  if (digest_info.size() == 51 && c.has_sha256) {
    return Judge(digest_info,
                 {0x30, 0x31, 0x30, 0x0d, 0x06, 0x09, 0x60, 0x86, 0x48, 0x01, 0x65, 0x03, 0x04,
                  0x02, 0x01, 0x05, 0x00, 0x04, 0x20},
                 c.sha256);
  }
  if (digest_info.size() == 35) {
    return Judge(
        digest_info,
        {0x30, 0x21, 0x30, 0x09, 0x06, 0x05, 0x2b, 0x0e, 0x03, 0x02, 0x1a, 0x05, 0x00, 0x04, 0x14},
        c.sha1);
  }
  return digest_info.size() == 34 ? JudgeMd(digest_info, c.md5) : kBadPadding;
}

int ExpectedAnswer(const Case& c) {
  if (c.modulus.size() < 16 || c.modulus.size() > 512) return kBadInput;
  if (c.signature >= c.modulus) return kBadInput;
  if (c.modulus.back() % 2 == 0) return kBadModulus;
  return JudgeMessage(c, PublicOperation(c.signature, c.modulus, c.exponent));
}

Bytes Take(FuzzedDataProvider& input, size_t size) {
  Bytes bytes = input.ConsumeBytes<uint8_t>(size);
  bytes.resize(size);
  return bytes;
}

Case ReadCase(FuzzedDataProvider& input) {
  constexpr size_t kLengths[] = {15, 16, 34 + 3, 35 + 3, 51 + 3, 64, 65, 66, 128, 512, 513};
  // With the exponent 1, the signature is the encoded message, so the input chooses the message's
  // bytes.
  constexpr uint32_t kExponents[] = {1, 3, 17, 65537, 0, 2, 0x80000000, 0xffffffff, 0x7fffffff};
  const auto length = input.ConsumeBool() ? input.PickValueInArray(kLengths)
                                          : input.ConsumeIntegralInRange<size_t>(0, 140);
  Case c;
  c.exponent =
      input.ConsumeBool() ? input.PickValueInArray(kExponents) : input.ConsumeIntegral<uint32_t>();
  c.has_sha256 = input.ConsumeIntegral<uint8_t>() != 0;
  c.sha1 = Take(input, 20);
  c.sha256 = Take(input, 32);
  c.md5 = Take(input, 16);
  c.signature = Take(input, length);
  c.modulus = Take(input, length);
  return c;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  FuzzedDataProvider input(data, size);
  const Case c = ReadCase(input);
  rsa_local context;
  Require(rsa_set_key(&context, c.modulus.data(), nullptr, c.exponent,
                      static_cast<uint32_t>(c.modulus.size())) == 0,
          "a key loads");
  const uint8_t* const sha256 = c.has_sha256 ? c.sha256.data() : nullptr;
  for (int round = 0; round < 2; ++round) {
    Require(rsa_pkcs1_verify(&context, c.sha1.data(), sha256, c.md5.data(), c.signature.data()) ==
                ExpectedAnswer(c),
            "rsa_pkcs1_verify returns the expected result");
  }
  return 0;
}
