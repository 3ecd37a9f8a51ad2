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

TEST(SignatureBlockFacts, OfABlockAsApksignerMakesIt) {
  const SignatureBlock block;
  const Bytes der = block.Build(kSignatureFile);
  const SignatureBlockFacts facts = ParseSignatureBlock(View(der));
  EXPECT_TRUE(facts.is_whole);
  EXPECT_EQ(facts.certificate, View(block.SignerCertificate().Build()));
  EXPECT_EQ(facts.certificate_count, 1U);
  EXPECT_EQ(facts.signer_count, 1U);
  EXPECT_FALSE(facts.has_signed_attributes);
  EXPECT_EQ(facts.digest, "SHA-256");
}

TEST(SignatureBlockFacts, SeeSignedAttributes) {
  SignatureBlock block;
  block.authenticated_attributes = true;
  block.digest = Digest::kSha1;
  const Bytes der = block.Build(kSignatureFile);
  const SignatureBlockFacts facts = ParseSignatureBlock(View(der));
  EXPECT_TRUE(facts.has_signed_attributes);
  EXPECT_EQ(facts.digest, "SHA-1");
}

TEST(SignatureBlockFacts, CountCertificatesAndSigners) {
  SignatureBlock block;
  const Bytes certificate = block.SignerCertificate().Build();
  block.certificates = Concat({certificate, certificate});
  const Bytes one = SignatureBlock().Build(kSignatureFile);
  const SignatureBlockFacts facts = ParseSignatureBlock(View(block.Build(kSignatureFile)));
  EXPECT_EQ(facts.certificate_count, 2U);
  EXPECT_EQ(facts.signer_count, 1U);
}

TEST(SignatureBlockFacts, OfACutBlockAreThoseBeforeTheCut) {
  const Bytes der = SignatureBlock().Build(kSignatureFile);
  for (size_t size = 0; size < der.size(); ++size) {
    const Bytes cut(der.begin(), der.begin() + static_cast<ptrdiff_t>(size));
    EXPECT_FALSE(ParseSignatureBlock(View(cut)).is_whole) << size;
  }
}

TEST(SignatureBlockFacts, OfABlockWithoutSignersAreNotWhole) {
  SignatureBlock block;
  block.signer_infos = der::Set({});
  const Bytes der = block.Build(kSignatureFile);
  const SignatureBlockFacts facts = ParseSignatureBlock(View(der));
  EXPECT_FALSE(facts.is_whole);
  EXPECT_FALSE(facts.certificate.empty());
}
