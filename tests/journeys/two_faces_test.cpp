// Packages that the tool and other programs read differently. For example, the tool and another
// program find different signers. The signer's key in the report must be the key that the tool
// reads. Only warnings may name the key that other programs find. The most serious warnings, the
// alarms, are also in the line of the verdict.
#include <gmpxx.h>
#include <gtest/gtest.h>
#include <openssl/mem.h>

#include <algorithm>
#include <nlohmann/json.hpp>
#include <sstream>

#include "support/compiled_manifest.h"
#include "support/files.h"
#include "support/keys.h"
#include "support/package.h"
#include "support/process.h"
#include "support/signing_block.h"
#include "support/simulation.h"

namespace {

using nlohmann::json;

// The SHA-256 digest of the victim's modulus. The victim is the owner of the key rsa-2048, which
// some of these packages show to other programs.
std::string VictimsDigest() { return Hex(DigestOf(Digest::kSha256, ModulusOf("rsa-2048"))); }

// An RSA key with the public exponent 65537. Sign makes a signature with SHA-256.
struct OwnKey {
  mpz_class modulus;
  mpz_class secret;  // the private exponent
  size_t size;       // the modulus's size in bytes, as the tool counts it

  Bytes Encoded(const mpz_class& number) const {
    const size_t used = (mpz_sizeinbase(number.get_mpz_t(), 2) + 7) / 8;
    Bytes bytes(size);
    mpz_export(bytes.data() + (size - used), nullptr, 1, 1, 0, 0, number.get_mpz_t());
    return bytes;
  }
  Bytes Sign(const Bytes& data) const {
    const Bytes message = EncodedMessage(Digest::kSha256, data, size);
    mpz_class number, signature;
    mpz_import(number.get_mpz_t(), message.size(), 1, 1, 0, 0, message.data());
    mpz_powm(signature.get_mpz_t(), number.get_mpz_t(), secret.get_mpz_t(), modulus.get_mpz_t());
    return Encoded(signature);
  }
};

// The package, signed again with this certificate and key.
Package SignedAgain(Package package, Certificate certificate, const OwnKey& key) {
  certificate.signature = der::BitString(key.Sign(certificate.Tbs()));
  SignatureBlock block;
  block.certificates = certificate.Build();
  const Bytes signature_file = package.Item("META-INF/CERT.SF").data;
  block.encrypted_digest = der::OctetString(key.Sign(signature_file));
  package.Item("META-INF/CERT.RSA").data = block.Build(signature_file);
  return package;
}

// Returns a package whose certificate shows the victim's modulus. The exponent has eight bytes, and
// the tool takes the last four (2c 01 00 00) as the modulus length: 300 in host byte order. The
// tool therefore reads 300 bytes, from the start of the victim's modulus, as the modulus of the
// signer's key. The last of these bytes belong to an extension. They are chosen so that the 300
// bytes are a prime number. Anyone can compute the private exponent for a prime modulus, so the
// author of the package can sign. Sets `*digest` to the SHA-256 digest of this prime.
Package WithAPrimeBehindTheVictimsModulus(std::string* digest) {
  constexpr size_t kSize = 300;
  Certificate certificate;
  certificate.public_key_info =
      PublicKeyInfoAround(der::Sequence({der::Integer(Concat({{0}, ModulusOf("rsa-2048")})),
                                         der::Integer(FromHex("01 00 01 00 2c 01 00 00"))}));
  Bytes free(40, 0);
  const auto number_read = [&] {
    certificate.extensions = {Extension("2.5.29.99", free)};
    const Bytes tbs = certificate.Tbs();
    const Bytes modulus = ModulusOf("rsa-2048");
    const auto at = std::search(tbs.begin(), tbs.end(), modulus.begin(), modulus.end());
    return Bytes(at, at + kSize);
  };
  // The key's modulus becomes the next prime that is greater than the number that the tool reads
  // now. The two numbers differ only in their last bytes. These bytes are in the extension.
  const Bytes before = number_read();
  OwnKey key = {0, 0, kSize};
  mpz_import(key.modulus.get_mpz_t(), kSize, 1, 1, 0, 0, before.data());
  mpz_nextprime(key.modulus.get_mpz_t(), key.modulus.get_mpz_t());
  const Bytes prime = key.Encoded(key.modulus);
  size_t kept = 0;  // how many bytes of `free` are in the modulus that the tool reads
  while (kept < free.size()) {
    free[kept] = 0xee;
    if (number_read() == before) break;
    free[kept++] = 0;
  }
  std::copy(prime.end() - static_cast<ptrdiff_t>(kept), prime.end(), free.begin());
  std::fill(free.begin() + static_cast<ptrdiff_t>(kept), free.end(), uint8_t{0});
  EXPECT_EQ(Hex(number_read()), Hex(prime));
  const mpz_class order = key.modulus - 1, exponent = 65537;
  mpz_invert(key.secret.get_mpz_t(), exponent.get_mpz_t(), order.get_mpz_t());
  *digest = Hex(DigestOf(Digest::kSha256, prime));
  return SignedAgain(MakePackage(), certificate, key);
}

// Returns a package whose certificate has two zero bytes before the modulus. The tool keeps one of
// these bytes in the modulus that it reads. Sets `*digest` to the SHA-256 digest of this modulus.
Package WithAZeroBeforeTheModulus(std::string* digest) {
  const RSA* const rsa = TestRsaKey("rsa-2048");
  const auto number = [](const BIGNUM* from) {
    char* const digits = BN_bn2hex(from);
    const mpz_class made(digits, 16);
    OPENSSL_free(digits);
    return made;
  };
  const OwnKey key = {number(RSA_get0_n(rsa)), number(RSA_get0_d(rsa)), 257};
  Certificate certificate;
  certificate.public_key_info = PublicKeyInfoAround(der::Sequence(
      {der::Integer(Concat({{0, 0}, ModulusOf("rsa-2048")})), der::Integer({1, 0, 1})}));
  *digest = Hex(DigestOf(Digest::kSha256, Concat({{0}, ModulusOf("rsa-2048")})));
  return SignedAgain(MakePackage(), certificate, key);
}

// The simulator's results for a package: the exit status, the line of the verdict, the text, the
// page and the journal's verdict.
struct Told {
  explicit Told(const Package& package, const std::vector<std::string>& options = {})
      : Told(package.Build(), options) {}
  explicit Told(const Bytes& archive, const std::vector<std::string>& options = {}) {
    const TempDir directory;
    WriteFile(directory / "base.apk", archive);
    const auto run = [&](std::vector<std::string> words) {
      words.insert(words.begin(),
                   {"env", "LC_ALL=C.UTF-8", SimulatorPath(), "--installer=off", "--install=no"});
      words.insert(words.end(), options.begin(), options.end());
      words.emplace_back("base.apk");
      return RunProcess(words, directory.path());
    };
    const ProcessResult quiet = run({"--quiet"});
    status = quiet.status;
    head = quiet.output;
    text = run({"--verbose", "--html", "page.html"}).output;
    page = ContentOf(directory / "page.html");
    std::istringstream lines(run({"--json"}).output);
    for (std::string line; std::getline(lines, line);) verdict = json::parse(line);
  }

  std::vector<std::string> Warnings() const {
    std::vector<std::string> codes;
    for (const json& warning : verdict["warnings"]) codes.push_back(warning["reason"]);
    return codes;
  }

  int status;
  std::string head;
  std::string text;
  std::string page;
  json verdict;
};

bool Has(const std::string& text, const std::string& part) {
  return text.find(part) != std::string::npos;
}

std::string Shortened(const std::string& digest) {
  return digest.substr(0, 8) + "…" + digest.substr(58);
}

using Codes = std::vector<std::string>;

void ExpectKey(const Told& told, const std::string& digest) {
  EXPECT_EQ(told.verdict["payload"], "2000" + digest);
  EXPECT_EQ(told.verdict["signers"][0]["modulus_sha256"], digest);
  EXPECT_TRUE(Has(told.head, "key " + Shortened(digest))) << told.head;
  const std::string row = digest + " (of the modulus alone; the kernel got this digest)";
  EXPECT_TRUE(Has(told.text, "modulus SHA-256 digest: " + row)) << told.text;
  EXPECT_TRUE(Has(told.page, "<dd>" + row)) << told.page;
}

}  // namespace

TEST(PackageReadInTwoWays, VictimsKeyIsNotShownIfExponentSetsModulusLength) {
  std::string digest;
  const Told told(WithAPrimeBehindTheVictimsModulus(&digest));
  EXPECT_EQ(told.status, 0);
  ASSERT_NE(digest, VictimsDigest());
  ExpectKey(told, digest);
  EXPECT_TRUE(Has(told.head, "SIGNED  base.apk   com.example.app   signer CN=Test, RSA-2400, key "))
      << told.head;
  EXPECT_TRUE(Has(told.head,
                  "   ! its certificate shows this tool a key that other programs do not find: "));
  EXPECT_EQ(told.Warnings(), Codes({"certificate-other-key"}));
  for (const std::string& all : {told.head, told.text, told.page, told.verdict.dump()}) {
    EXPECT_FALSE(Has(all, VictimsDigest().substr(0, 8))) << all;
  }
}

TEST(PackageReadInTwoWays, TwoZerosBeforeTheModulusMakeAnotherKey) {
  std::string digest;
  const Told told(WithAZeroBeforeTheModulus(&digest));
  EXPECT_EQ(told.status, 0);
  ASSERT_NE(digest, VictimsDigest());
  ExpectKey(told, digest);
  EXPECT_TRUE(Has(told.head,
                  "   ! its certificate shows this tool a key that other programs do not find: "));
  EXPECT_EQ(told.Warnings(), Codes({"certificate-other-key"}));
}

// The simulator's X.509 reader, libcrypto, accepts an exponent of five bytes and finds the victim's
// key. In the tool, the fifth byte becomes part of the modulus length. The tool therefore reads
// another key, and the signature does not verify.
TEST(PackageReadInTwoWays, CertificateWithA5ByteExponentShowsAnotherKey) {
  Certificate certificate;
  certificate.public_key_info =
      PublicKeyInfoAround(der::Sequence({der::Integer(Concat({{0}, ModulusOf("rsa-2048")})),
                                         der::Integer(FromHex("01 00 01 00 01"))}));
  PackageOptions options;
  options.block.certificates = certificate.Build();
  const Told told(MakePackage(options));
  EXPECT_EQ(told.status, 1);
  EXPECT_TRUE(Has(told.head,
                  "   ! its certificate shows this tool a key that other programs do not find: "
                  "they find a modulus with the SHA-256 digest " +
                      VictimsDigest()))
      << told.head;
  EXPECT_FALSE(Has(told.head, "key " + Shortened(VictimsDigest())));
}

TEST(PackageReadInTwoWays, WronglyTaggedCertificatesMakeTheBlockAmbiguous) {
  Package package = MakePackage();
  Bytes& block = package.Item("META-INF/CERT.RSA").data;
  const Bytes certificate = SignatureBlock().SignerCertificate().Build();
  const auto at = std::search(block.begin(), block.end(), certificate.begin(), certificate.end());
  ASSERT_NE(at, block.end());
  // This byte is the identifier octet of the block's field `certificates`. The tool ignores this
  // byte.
  at[-4] = 0xa3;
  const Told told(package);
  EXPECT_EQ(told.status, 0);
  ExpectKey(told, VictimsDigest());
  EXPECT_TRUE(Has(told.head, "SIGNED  base.apk   com.example.app   signer unknown, RSA-2048, key "))
      << told.head;
  EXPECT_EQ(told.Warnings(), Codes({"block-ambiguous"}));
}

TEST(PackageReadInTwoWays, SignatureThatNamesAnotherCertificateIsAmbiguous) {
  PackageOptions options;
  options.block.serial = der::Integer(99);
  const Told told(MakePackage(options));
  EXPECT_EQ(told.status, 0);
  EXPECT_EQ(told.Warnings(), Codes({"block-ambiguous"}));
  EXPECT_TRUE(Has(told.head, "   ! other programs may find a different signer"));
}

TEST(PackageReadInTwoWays, OtherPackageNameForInstallersIsReported) {
  PackageOptions options;
  options.android_manifest =
      CompiledXml()
          .Element("manifest", {InAndroidNamespace(StringAttribute("package", "com.victim.bank")),
                                StringAttribute("package", "com.evil.reader")})
          .Build();
  const Told told(MakePackage(options));
  EXPECT_EQ(told.status, 0);
  EXPECT_EQ(told.verdict["package"], "com.victim.bank");
  EXPECT_TRUE(Has(told.head, "   com.victim.bank   ")) << told.head;
  EXPECT_TRUE(Has(told.head, "   ! phones install it as \"com.evil.reader\""));
  EXPECT_EQ(told.Warnings(), Codes({"other-package-name"}));
}

// ---- The newer signatures (v2 and later) in the signing block.

TEST(PackageReadInTwoWays, SecondValueOfASchemeIsIgnored) {
  const Bytes own = Signers({SignerBytes(SignatureBlock().SignerCertificate().Build())});
  Certificate certificate;
  certificate.key = "rsa-2048-other";
  const Bytes other = Signers({SignerBytes(certificate.Build())});
  const Bytes both = Signers({SignerBytes(SignatureBlock().SignerCertificate().Build()),
                              SignerBytes(certificate.Build())});
  const auto warnings = [](const std::vector<std::pair<uint32_t, Bytes>>& pairs) {
    return Told(ArchiveWithBlock(MakePackage().Build(), SigningBlockBytes(pairs))).Warnings();
  };
  EXPECT_EQ(warnings({{kSchemeV2, own}}), Codes());
  EXPECT_EQ(warnings({{kSchemeV2, other}, {kSchemeV2, own}}), Codes({"other-key"}));
  EXPECT_EQ(warnings({{kSchemeV2, own}, {kSchemeV2, other}}), Codes());
  EXPECT_EQ(warnings({{kSchemeV2, both}}), Codes({"other-key"}));
}

TEST(PackageReadInTwoWays, SigningBlockThatIsTooLargeIsReported) {
  Certificate certificate;
  certificate.key = "rsa-2048-other";
  const Bytes block = SigningBlockBytes(
      {{7, Bytes(16 << 20, 0)}, {kSchemeV2, Signers({SignerBytes(certificate.Build())})}});
  const Told told(ArchiveWithBlock(MakePackage().Build(), block));
  EXPECT_EQ(told.Warnings(), Codes({"not-looked-into"}));
  EXPECT_TRUE(Has(told.head, "   ! the signing block (v2 and later) is too large and was not read"))
      << told.head;
}

// ---- A damaged entry hides no other finding.

TEST(PackageReadInTwoWays, DamagedEntryHidesNoOther) {
  Package package = MakePackage();
  package.items.push_back({"res/damaged", ToBytes("x")});
  package.items.back().local.crc = 1;
  package.items.push_back({"classes2.dex", ToBytes("another's")});
  const Told told(package);
  EXPECT_EQ(told.status, 0);
  EXPECT_EQ(told.Warnings(), Codes({"entries-damaged", "unlisted-entries"}));
  EXPECT_TRUE(Has(told.text, "the archive is damaged and cannot be read at 1 entry: res/damaged"));
  EXPECT_TRUE(Has(told.text, "      not listed: classes2.dex\n")) << told.text;
  const Told strict(package, {"--strict", "--install"});
  EXPECT_EQ(strict.status, 1);
  EXPECT_TRUE(Has(strict.head, "PARTLY SIGNED")) << strict.head;
  EXPECT_TRUE(Has(strict.text,
                  "  ✗ entries              the archive is damaged and cannot be read at 1 entry"))
      << strict.text;
}
