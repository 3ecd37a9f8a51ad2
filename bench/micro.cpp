// Measures the tool's arithmetic, its manifest parser and its Base64 decoder. For comparison, also
// measures the public operation of RSA in the platform's libcrypto and in GMP.
#include <benchmark/benchmark.h>
#include <gmp.h>
#include <openssl/bn.h>
#include <openssl/rsa.h>

#include <string>
#include <vector>

#include "apk/base64.h"
#include "apk/manifest_mf.h"
#include "crypto/mpi.h"
#include "crypto/rsa.h"
#include "support/certificate.h"
#include "support/jar.h"
#include "support/keys.h"
#include "support/package.h"

namespace {

std::string KeyOf(const benchmark::State& state) { return "rsa-" + std::to_string(state.range(0)); }

// The modulus of the test key `key`, as bytes (`modulus`) and as an integer (N). A is a smaller
// number of the same length. T is scratch space.
struct Operands {
  explicit Operands(const std::string& key) : modulus(ModulusOf(key)) {
    mpi_from_bytes(&N, modulus.data(), modulus.size());
    Bytes other = modulus;
    other[0] /= 2;
    mpi_from_bytes(&A, other.data(), other.size());
    mpi_grow(&A, N.n + 1);
    mpi_grow(&T, 2 * (N.n + 1));
    for (uint32_t x = 1; mm * N.p[0] != UINT32_MAX; x *= 2) mm += (mm * N.p[0] + 1) & x;
  }

  Bytes modulus;
  mpi_local N, A, T;
  uint32_t mm = 0;  // -1 / N mod 2^32
};

void MulHlp(benchmark::State& state) {
  Operands operands("rsa-4096");
  const auto limbs = static_cast<int>(state.range(0));
  for (auto _ : state) {
    mpi_mul_hlp(limbs, operands.A.p, operands.T.p, 0x89ABCDEF);
    benchmark::ClobberMemory();
  }
}
BENCHMARK(MulHlp)->Name("mpi_mul_hlp")->Arg(32)->Arg(64)->Arg(128);

void MontMul(benchmark::State& state) {
  Operands operands(KeyOf(state));
  for (auto _ : state) {
    mpi_montmul(&operands.A, &operands.A, &operands.N, operands.mm, &operands.T);
    benchmark::ClobberMemory();
  }
}
BENCHMARK(MontMul)->Name("mpi_montmul")->Arg(1024)->Arg(2048)->Arg(4096);

// Computes R^2 mod N, where R is 2^32 to the power of the number of limbs of N. This is the only
// long division in a public operation of RSA.
void ModMpi(benchmark::State& state) {
  Operands operands(KeyOf(state));
  mpi_local power, remainder;
  mpi_grow(&power, 1);
  power.p[0] = 1;
  mpi_shift_l(&power, 64 * operands.N.n);
  for (auto _ : state) mpi_mod_mpi(&remainder, &power, &operands.N);
}
BENCHMARK(ModMpi)->Name("mpi_mod_mpi")->Arg(1024)->Arg(2048)->Arg(4096);

const Bytes kSigned(1000, 'x');

// Measures the tool's public operation of RSA. The time to load the key from its bytes is included.
void Tool(benchmark::State& state) {
  const Bytes modulus = ModulusOf(KeyOf(state));
  const Bytes signature = SignWith(KeyOf(state), Digest::kSha256, kSigned);
  const Bytes sha1 = DigestOf(Digest::kSha1, kSigned), md5 = DigestOf(Digest::kMd5, kSigned);
  const Bytes sha256 = DigestOf(Digest::kSha256, kSigned);
  for (auto _ : state) {
    rsa_local key;
    rsa_set_key(&key, modulus.data(), nullptr, 65537, static_cast<uint32_t>(modulus.size()));
    if (rsa_pkcs1_verify(&key, sha1.data(), sha256.data(), md5.data(), signature.data()) != 0) {
      state.SkipWithError("does not verify");
    }
  }
}
BENCHMARK(Tool)->Name("public/tool")->Arg(1024)->Arg(1536)->Arg(2048)->Arg(3072)->Arg(4096);

void BoringSsl(benchmark::State& state) {
  const Bytes modulus = ModulusOf(KeyOf(state));
  const Bytes signature = SignWith(KeyOf(state), Digest::kSha256, kSigned);
  Bytes message(modulus.size());
  for (auto _ : state) {
    RSA* const key = RSA_new();
    RSA_set0_key(key, BN_bin2bn(modulus.data(), modulus.size(), nullptr), BN_new(), nullptr);
    const BIGNUM* exponent;
    RSA_get0_key(key, nullptr, &exponent, nullptr);
    BN_set_word(const_cast<BIGNUM*>(exponent), 65537);
    size_t length;
    if (RSA_verify_raw(key, &length, message.data(), message.size(), signature.data(),
                       signature.size(), RSA_PKCS1_PADDING) != 1) {
      state.SkipWithError("does not verify");
    }
    RSA_free(key);
  }
}
BENCHMARK(BoringSsl)
    ->Name("public/boringssl")
    ->Arg(1024)
    ->Arg(1536)
    ->Arg(2048)
    ->Arg(3072)
    ->Arg(4096);

void Gmp(benchmark::State& state) {
  const Bytes modulus = ModulusOf(KeyOf(state));
  const Bytes signature = SignWith(KeyOf(state), Digest::kSha256, kSigned);
  Bytes message(modulus.size());
  for (auto _ : state) {
    mpz_t N, S;
    mpz_init(N);
    mpz_init(S);
    mpz_import(N, modulus.size(), 1, 1, 0, 0, modulus.data());
    mpz_import(S, signature.size(), 1, 1, 0, 0, signature.data());
    mpz_powm_ui(S, S, 65537, N);
    mpz_export(message.data(), nullptr, 1, 1, 0, 0, S);
    mpz_clear(N);
    mpz_clear(S);
  }
}
BENCHMARK(Gmp)->Name("public/gmp")->Arg(1024)->Arg(1536)->Arg(2048)->Arg(3072)->Arg(4096);

// Loads a manifest with the given number of entries.
void Load(benchmark::State& state) {
  JarText manifest = JarText::Manifest().EndSection();
  for (int64_t i = 0; i < state.range(0); ++i) {
    manifest.Section("res/drawable/entry_" + std::to_string(i) + ".png", {"SHA-256-Digest"}, {});
  }
  for (auto _ : state) {
    ManifestMf parsed;
    if (!parsed.load(manifest.text())) state.SkipWithError("does not parse");
  }
}
BENCHMARK(Load)->Name("ManifestMf::load")->Arg(10)->Arg(1000)->Arg(60000);

void Decode(benchmark::State& state) {
  const std::string text = Base64Encode(DigestOf(Digest::kSha256, kSigned));
  uint8_t bytes[64];
  for (auto _ : state) {
    size_t length = sizeof(bytes);
    base64decode(text.data(), text.size(), bytes, &length);
    benchmark::ClobberMemory();
  }
}
BENCHMARK(Decode)->Name("base64decode");

}  // namespace

BENCHMARK_MAIN();
