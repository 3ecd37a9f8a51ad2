// Measures the RSA public operation of the host's OpenSSL. This is a separate program, because
// bench_micro links the platform's libcrypto, whose functions have the same names as those of
// the host's OpenSSL.
#include <benchmark/benchmark.h>
#include <openssl/bn.h>
#include <openssl/core_names.h>
#include <openssl/evp.h>
#include <openssl/param_build.h>
#include <openssl/rsa.h>

#include <cstdint>
#include <vector>

namespace {

using Bytes = std::vector<uint8_t>;

struct SignedMessage {
  Bytes modulus, signature;
  unsigned char digest[32] = {1, 2, 3};
};

SignedMessage SignWithNewKey(unsigned bits) {
  SignedMessage message;
  EVP_PKEY* const key = EVP_RSA_gen(bits);
  BIGNUM* modulus = nullptr;
  EVP_PKEY_get_bn_param(key, OSSL_PKEY_PARAM_RSA_N, &modulus);
  message.modulus.resize(static_cast<size_t>(BN_num_bytes(modulus)));
  BN_bn2bin(modulus, message.modulus.data());
  EVP_PKEY_CTX* const context = EVP_PKEY_CTX_new(key, nullptr);
  EVP_PKEY_sign_init(context);
  EVP_PKEY_CTX_set_rsa_padding(context, RSA_PKCS1_PADDING);
  EVP_PKEY_CTX_set_signature_md(context, EVP_sha256());
  size_t length = message.modulus.size();
  message.signature.resize(length);
  EVP_PKEY_sign(context, message.signature.data(), &length, message.digest, sizeof(message.digest));
  EVP_PKEY_CTX_free(context);
  BN_free(modulus);
  EVP_PKEY_free(key);
  return message;
}

// The measured time includes loading the key from its bytes into a new RSA object.
void OpenSsl(benchmark::State& state) {
  const SignedMessage message = SignWithNewKey(static_cast<unsigned>(state.range(0)));
  for (auto _ : state) {
    RSA* const key = RSA_new();
    BIGNUM* const exponent = BN_new();
    BN_set_word(exponent, 65537);
    RSA_set0_key(
        key, BN_bin2bn(message.modulus.data(), static_cast<int>(message.modulus.size()), nullptr),
        exponent, nullptr);
    if (RSA_verify(NID_sha256, message.digest, sizeof(message.digest), message.signature.data(),
                   static_cast<unsigned>(message.signature.size()), key) != 1) {
      state.SkipWithError("does not verify");
    }
    RSA_free(key);
  }
}
BENCHMARK(OpenSsl)->Name("public/openssl")->Arg(1024)->Arg(1536)->Arg(2048)->Arg(3072)->Arg(4096);

}  // namespace

BENCHMARK_MAIN();
