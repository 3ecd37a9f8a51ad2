#include "simulator/package/signature_block.h"

#include <gtest/gtest.h>

#include "support/signature_block.h"

using namespace simulator;

namespace {

std::string_view View(const Bytes& bytes) {
  return {reinterpret_cast<const char*>(bytes.data()), bytes.size()};
}

const Bytes kSignatureFile = ToBytes("Signature-Version: 1.0\r\n\r\n");

}  // namespace

TEST(SignatureBlockFacts, AreWholeForABlockAsApksignerMakesIt) {
  const SignatureBlock block;
  const Bytes der = block.Build(kSignatureFile);
  const SignatureBlockFacts facts = ParseSignatureBlock(View(der));
  EXPECT_TRUE(facts.is_whole);
  EXPECT_EQ(facts.certificate, View(block.SignerCertificate().Build()));
  EXPECT_EQ(facts.signer_count, 1U);
  EXPECT_FALSE(facts.has_signed_attributes);
  EXPECT_EQ(facts.digest, "SHA256");
  EXPECT_TRUE(facts.has_known_digest);
  EXPECT_FALSE(facts.has_pss);
}

TEST(SignatureBlockFacts, SeeSignedAttributes) {
  SignatureBlock block;
  block.authenticated_attributes = true;
  block.digest = Digest::kSha1;
  const Bytes der = block.Build(kSignatureFile);
  const SignatureBlockFacts facts = ParseSignatureBlock(View(der));
  EXPECT_TRUE(facts.has_signed_attributes);
  EXPECT_EQ(facts.digest, "SHA1");
  EXPECT_TRUE(facts.has_known_digest);
}

TEST(SignatureBlockFacts, FirstCertificateAndSignerAreUsed) {
  SignatureBlock block;
  const Bytes certificate = block.SignerCertificate().Build();
  Certificate other;
  other.serial = der::Integer(7);
  block.certificates = Concat({certificate, other.Build()});
  SignatureBlock second;
  second.digest = Digest::kSha1;
  second.serial = der::Integer(7);
  block.signer_infos =
      der::Set({block.SignerInfo(kSignatureFile), second.SignerInfo(kSignatureFile),
                second.SignerInfo(kSignatureFile)});
  const Bytes der = block.Build(kSignatureFile);
  const SignatureBlockFacts facts = ParseSignatureBlock(View(der));
  EXPECT_EQ(facts.certificate, View(certificate));
  EXPECT_EQ(facts.signer_count, 3U);
  EXPECT_EQ(facts.digest, "SHA256");
  // Issuer and serial number, as the certificate has them.
  const Bytes id = Concat({Certificate().issuer, Certificate().serial});
  EXPECT_EQ(facts.signer_id, std::string(id.begin(), id.end()));
}

TEST(SignatureBlockFacts, DigestsThatTheToolCannotUseAreNamed) {
  const auto digest = [](const std::string& oid) {
    SignatureBlock block;
    block.digest_algorithm = AlgorithmIdentifier(oid);
    const Bytes der = block.Build(kSignatureFile);
    const SignatureBlockFacts facts = ParseSignatureBlock(View(der));
    EXPECT_TRUE(facts.is_whole);
    return facts.digest + (facts.has_known_digest ? " is known" : "");
  };
  EXPECT_EQ(digest(DigestOid(Digest::kMd5)), "MD5 is known");
  EXPECT_EQ(digest("2.16.840.1.101.3.4.2.2"), "SHA384");
  EXPECT_EQ(digest("2.16.840.1.101.3.4.2.3"), "SHA512");
  EXPECT_EQ(digest("1.2.3.4"), "1.2.3.4");
}

// RFC 4056 §3: the field signatureAlgorithm identifies RSASSA-PSS. The field digestAlgorithm does
// not.
TEST(SignatureBlockFacts, RsassaPssIsFoundInTheSignatureAlgorithm) {
  const auto has_pss = [](const std::string& digest, const std::string& algorithm) {
    SignatureBlock block;
    block.signer_infos = der::Set({der::Sequence(
        {der::Integer(1), der::Sequence({der::Sequence({}), der::Integer(1)}),
         AlgorithmIdentifier(digest), AlgorithmIdentifier(algorithm), der::OctetString({1, 2})})});
    const Bytes der = block.Build(kSignatureFile);
    const SignatureBlockFacts facts = ParseSignatureBlock(View(der));
    EXPECT_TRUE(facts.is_whole);
    return facts.has_pss;
  };
  const std::string pss = "1.2.840.113549.1.1.10";
  EXPECT_TRUE(has_pss(DigestOid(Digest::kSha256), pss));
  EXPECT_FALSE(has_pss(pss, "1.2.840.113549.1.1.1"));
}

TEST(SignatureBlockFacts, AreNotWholeForACutBlock) {
  const Bytes der = SignatureBlock().Build(kSignatureFile);
  for (size_t size = 0; size < der.size(); ++size) {
    const Bytes cut(der.begin(), der.begin() + static_cast<ptrdiff_t>(size));
    EXPECT_FALSE(ParseSignatureBlock(View(cut)).is_whole) << size;
  }
}

TEST(SignatureBlockFacts, AreNotWholeForABlockWithoutSigners) {
  SignatureBlock block;
  block.signer_infos = der::Set({});
  const Bytes der = block.Build(kSignatureFile);
  const SignatureBlockFacts facts = ParseSignatureBlock(View(der));
  EXPECT_FALSE(facts.is_whole);
  EXPECT_FALSE(facts.certificate.empty());
}
