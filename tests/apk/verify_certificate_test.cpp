// Tests the signature block of a package: the key in it, and the data that this key signed.
#include <gtest/gtest.h>

#include <algorithm>

#include "apk/package_log.h"
#include "support/certificate.h"
#include "support/jar.h"
#include "support/signature_block.h"

using ApkTools::Apk;

namespace {

constexpr char kNotVerified[] = "file not verified: META-INF/CERT.SF\n";

PackageOptions WithBlock(const SignatureBlock& block) {
  PackageOptions options;
  options.block = block;
  return options;
}

TEST(VerifyCertificate, BlocksWithMd5Sha1OrSha256AreVerified) {
  for (const Digest digest : {Digest::kMd5, Digest::kSha1, Digest::kSha256}) {
    SignatureBlock block;
    block.digest = digest;
    EXPECT_EQ(LogOf(WithBlock(block)), Records());
  }
}

TEST(VerifyCertificate, KeysFrom1024To4096BitsVerifyAndBecomeTheManufacturerKey) {
  for (const char* key : {"rsa-1024", "rsa-1536", "rsa-2048", "rsa-3072", "rsa-4096"}) {
    SignatureBlock block;
    block.key = key;
    OpenPackage open(WithBlock(block));
    EXPECT_TRUE(open.apk.IsGoodApk()) << key;
    EXPECT_EQ(open.apk.GetManufacturerKey(), ModulusOf(key));
  }
}

TEST(VerifyCertificate, KeyOf2048BitsIsKeptAs256Bytes) {
  OpenPackage open{PackageOptions()};
  EXPECT_EQ(open.apk.GetManufacturerKey().size(), 256u);
}

TEST(VerifyCertificate, KeysWithAnExponentOfOneByteVerify) {
  for (const char* key : {"rsa-2048-e3", "rsa-2048-e17"}) {
    SignatureBlock block;
    block.key = key;
    EXPECT_EQ(LogOf(WithBlock(block)), Records()) << key;
  }
}

TEST(VerifyCertificate, BytesThatAreNotASignatureBlockAreAnUnknownType) {
  Package package = MakePackage();
  package.Item("META-INF/CERT.RSA").data = ToBytes("no block");
  testing::internal::CaptureStdout();
  EXPECT_EQ(LogOf(package), Records({Error("Unknown certificate type"), Error(kNotVerified)}));
  EXPECT_NE(testing::internal::GetCapturedStdout(), "");
}

TEST(VerifyCertificate, EmptyBlockIsAnUnknownType) {
  Package package = MakePackage();
  package.Item("META-INF/CERT.RSA").data = {};
  testing::internal::CaptureStdout();
  EXPECT_EQ(LogOf(package), Records({Error("Unknown certificate type"), Error(kNotVerified)}));
  testing::internal::GetCapturedStdout();
}

TEST(VerifyCertificate, EllipticCurveKeyIsAnUnknownType) {
  SignatureBlock block;
  block.key = "ec-p256";
  testing::internal::CaptureStdout();
  EXPECT_EQ(LogOf(WithBlock(block)),
            Records({Error("Unknown certificate type"), Error(kNotVerified)}));
  testing::internal::GetCapturedStdout();
}

TEST(VerifyCertificate, CertificateOfAnotherIssuerFailsEvenWithAGoodSignature) {
  SignatureBlock block;
  block.issuer_key = "rsa-2048-other";
  EXPECT_EQ(LogOf(WithBlock(block)),
            Records({Error("RSA could not verify certificate: 7\n"), Error(kNotVerified)}));
}

TEST(VerifyCertificate, SignatureOverOtherBytesFails) {
  SignatureBlock block;
  block.wrong_digest = true;
  EXPECT_EQ(LogOf(WithBlock(block)),
            Records({Error("SHA256 hash does not match"), Error("RSA could not verify data: 12\n"),
                     Error(kNotVerified)}));
}

// The tool finds the signature by its position among the elements of the SignerInfo
// (crypto/pkcs7.cpp). If there are attributes, the digestEncryptionAlgorithm is at this position.
// The tool then reads the wrong bytes as the signature, and refuses the padding (result 7).
TEST(VerifyCertificate, BlockWithAuthenticatedAttributesFails) {
  SignatureBlock block;
  block.authenticated_attributes = true;
  EXPECT_EQ(LogOf(WithBlock(block)),
            Records({Error("RSA could not verify data: 7\n"), Error(kNotVerified)}));
}

// Returns a block with one certificate. The certificate has a public key with this modulus and this
// exponent, and a signature of `signature_length` bytes.
SignatureBlock WithPublicKey(const Bytes& modulus, const Bytes& exponent, size_t signature_length) {
  Certificate certificate;
  certificate.public_key_info =
      PublicKeyInfoAround(der::Sequence({der::Integer(modulus), der::Integer(exponent)}));
  certificate.signature = der::BitString(Bytes(signature_length, 1));
  SignatureBlock block;
  block.certificates = certificate.Build();
  return block;
}

TEST(VerifyCertificate, KeyOf2048BytesFailsAtTheCertificate) {
  EXPECT_EQ(LogOf(WithBlock(WithPublicKey(Bytes(2048, 0x55), {1, 0, 1}, 2048))),
            Records({Error("RSA could not verify certificate: 5\n"), Error(kNotVerified)}));
}

TEST(VerifyCertificate, KeyOfOneByteFailsAtTheCertificate) {
  // The exponent is empty, so its element is only a header of two bytes. The tool accepts this
  // element only if it is not longer than the contents of the modulus INTEGER (crypto/pkcs7.cpp).
  // These contents are therefore two bytes, 0 and 1. The modulus is read without the leading zero,
  // so it has one byte.
  EXPECT_EQ(LogOf(WithBlock(WithPublicKey({0, 1}, {}, 256))),
            Records({Error("RSA could not verify certificate: 5\n"), Error(kNotVerified)}));
}

TEST(VerifyCertificate, ExponentThatSetsAModulusLengthBeyondTheBlockFails) {
  for (const Bytes& length : {FromHex("ffffff7f"), FromHex("ffffffff"), FromHex("00100000")}) {
    const Bytes exponent = Concat({FromHex("01000100"), length});
    EXPECT_EQ(LogOf(WithBlock(WithPublicKey(Bytes(256, 0x55), exponent, 256))),
              Records({Error("RSA could not set key: 5\n"), Error(kNotVerified)}));
  }
}

TEST(VerifyCertificate, ModulusThatEndsWithTheBlockIsRead) {
  // The fifth to the eighth byte of the exponent overwrite the length of the modulus
  // (crypto/pkcs7.h). In the first check, the modulus ends with the block's last byte. In the
  // second check, it ends one byte later.
  const auto block_with_length = [](uint32_t length) {
    Bytes exponent = FromHex("01000100");
    for (int i = 0; i < 4; ++i) exponent.push_back(static_cast<uint8_t>(length >> (8 * i)));
    SignatureBlock block = WithPublicKey(Bytes(256, 0x55), exponent, 256);
    block.encrypted_digest = der::OctetString(Bytes(256, 1));
    return block;
  };
  const Bytes bytes = block_with_length(0).Build({});
  const Bytes modulus(256, 0x55);
  const auto start = std::search(bytes.begin(), bytes.end(), modulus.begin(), modulus.end());
  const auto rest = static_cast<uint32_t>(bytes.end() - start);

  EXPECT_EQ(LogOf(WithBlock(block_with_length(rest))),
            Records({Error("RSA could not verify certificate: 5\n"), Error(kNotVerified)}));
  EXPECT_EQ(LogOf(WithBlock(block_with_length(rest + 1))),
            Records({Error("RSA could not set key: 5\n"), Error(kNotVerified)}));
}

TEST(VerifyCertificate, CertificateSignatureThatEndsBeyondTheBlockFails) {
  SignatureBlock block = WithPublicKey(Bytes(512, 0x55), {1, 0, 1}, 1);
  block.encrypted_digest = der::OctetString({1});
  EXPECT_EQ(LogOf(WithBlock(block)),
            Records({Error("RSA could not verify certificate: 5\n"), Error(kNotVerified)}));
}

TEST(VerifyCertificate, SignatureThatEndsBeyondTheBlockFails) {
  SignatureBlock block;
  block.encrypted_digest = der::OctetString({1});
  EXPECT_EQ(LogOf(WithBlock(block)),
            Records({Error("RSA could not verify data: 5\n"), Error(kNotVerified)}));
}

// Returns the options for a package. `encode` makes the whole encryptedDigest element of the block
// from the bytes of a good signature.
template <typename Encode>
PackageOptions WithEncodedSignature(Encode encode) {
  PackageOptions options;
  const Bytes signature_file = MakePackage(options).Item("META-INF/CERT.SF").data;
  options.block.encrypted_digest = encode(SignWith("rsa-2048", Digest::kSha256, signature_file));
  return options;
}

TEST(VerifyCertificate, LongerSignatureStringIsReadUpToTheKeysLength) {
  EXPECT_EQ(LogOf(WithEncodedSignature([](Bytes signature) {
              signature.push_back(0xaa);
              return der::OctetString(signature);
            })),
            Records());
}

TEST(VerifyCertificate, ShorterSignatureStringIsReadBeyondItsEnd) {
  EXPECT_EQ(LogOf(WithEncodedSignature([](const Bytes& signature) {
              const Bytes shorter(signature.begin(), signature.end() - 1);
              return Concat({der::OctetString(shorter), {signature.back()}});
            })),
            Records());
}

TEST(VerifyCertificate, ShorterSignatureStringAtTheBlocksEndFails) {
  EXPECT_EQ(LogOf(WithEncodedSignature([](const Bytes& signature) {
              return der::OctetString(Bytes(signature.begin(), signature.end() - 1));
            })),
            Records({Error("RSA could not verify data: 5\n"), Error(kNotVerified)}));
}

// The result of a call of VerifyCertificate. `key` is "before" if the call did not change it.
struct Verification {
  bool verified;
  Bytes key;
};
// Calls VerifyCertificate with a block that signs `covered`, and with the digests of `claimed`.
Verification Verify(SignatureBlock block, const std::string& covered, const std::string& claimed) {
  LogCapture log;
  Apk apk(-1);
  Bytes bytes = block.Build(ToBytes(covered));
  Bytes sha1 = DigestOf(Digest::kSha1, ToBytes(claimed));
  Bytes sha256 = DigestOf(Digest::kSha256, ToBytes(claimed));
  Bytes md5 = DigestOf(Digest::kMd5, ToBytes(claimed));
  Verification result{false, ToBytes("before")};
  result.verified = apk.VerifyCertificate(bytes, sha1, sha256, md5, result.key);
  return result;
}

TEST(VerifyCertificate, KeyIsReplacedOnSuccess) {
  const Verification result = Verify({}, "signature file", "signature file");
  EXPECT_TRUE(result.verified);
  EXPECT_EQ(result.key, ModulusOf("rsa-2048"));
}

TEST(VerifyCertificate, KeyIsUnchangedOnFailure) {
  const Verification result = Verify({}, "signature file", "other file");
  EXPECT_FALSE(result.verified);
  EXPECT_EQ(result.key, ToBytes("before"));
}

TEST(VerifyCertificate, BlockCutShortAnywhereFails) {
  const Bytes whole = SignatureBlock().Build(ToBytes("signature file"));
  Bytes sha1 = DigestOf(Digest::kSha1, ToBytes("signature file"));
  Bytes sha256 = DigestOf(Digest::kSha256, ToBytes("signature file"));
  Bytes md5 = DigestOf(Digest::kMd5, ToBytes("signature file"));
  LogCapture log;
  Apk apk(-1);
  testing::internal::CaptureStdout();
  for (size_t length = 0; length < whole.size(); ++length) {
    Bytes cut(whole.begin(), whole.begin() + static_cast<ptrdiff_t>(length));
    cut.shrink_to_fit();
    Bytes key;
    EXPECT_FALSE(apk.VerifyCertificate(cut, sha1, sha256, md5, key)) << length;
  }
  testing::internal::GetCapturedStdout();
}

}  // namespace
