#include "simulator/show/report_words.h"

#include <gtest/gtest.h>

using namespace simulator;

namespace {

Item Library(const Cause* why) {
  return {ItemKind::kLibrary, "lib/arm64/a.so", "", ItemState::kRefused, {why, ""}};
}

}  // namespace

TEST(Summary, CountsEachVerdict) {
  EXPECT_EQ(Summary({Verdict::kSigned, Verdict::kRefused, Verdict::kSigned, Verdict::kNotLookedAt}),
            "4 files: 2 signed, 1 refused, 1 not looked at");
  EXPECT_EQ(Summary({Verdict::kTrustedJar}), "1 file: 1 trusted JAR");
}

TEST(ReportWords, SayWhatToDoOnceForNeighboursThatNeedTheSame) {
  const Item changed = Library(&cause::kLibraryChanged);
  const Item refused = Library(&cause::kKernelRefused);
  EXPECT_TRUE(HasCure(changed, nullptr));
  EXPECT_TRUE(HasCure(changed, &refused));
  EXPECT_FALSE(HasCure(changed, &changed));
}

TEST(ReportWords, SayNothingToDoForWhatFollowsFromAnother) {
  EXPECT_FALSE(HasCure(Library(&cause::kPackageRefused), nullptr));
  EXPECT_FALSE(HasCure(Library(&cause::kNotReached), nullptr));
  Item nothing = Library(&cause::kLibraryOtherAbi);
  nothing.state = ItemState::kNothing;
  EXPECT_FALSE(HasCure(nothing, nullptr));
}

TEST(ReportWords, KeyOfUnknownSizeHasItsAlgorithmAlone) {
  CertificateFacts signer;
  signer.subject = "CN=a";
  signer.key.algorithm = "1.2.3";
  EXPECT_EQ(SignerText(signer, "..."), "CN=a, 1.2.3");
  EXPECT_EQ(CertificateRows(signer, true).size(), 5U);
  signer.key.bits = 512;
  signer.key.modulus_sha256 = "0123456789abcdef";
  EXPECT_EQ(SignerText(signer, "..."), "CN=a, 1.2.3-512, key 01234567...abcdef");
  EXPECT_EQ(CertificateRows(signer, true)[5].first, "modulus SHA-256 digest");
}

TEST(ReportWords, KernelGetsTheKeyOfTheJarSignerAlone) {
  CertificateFacts signer;
  signer.key.modulus_sha256 = "0123";
  EXPECT_EQ(CertificateRows(signer, true)[5].second,
            "0123 (of the modulus alone: what the kernel gets)");
  EXPECT_EQ(CertificateRows(signer, false)[5].second, "0123 (of the modulus alone)");
}

TEST(ReportWords, LinkBeyondABreakSaysNothingOfItself) {
  EXPECT_EQ(TextOf(Link{"manifest", LinkState::kHolds, "text"}), "text");
  EXPECT_EQ(TextOf(Link{"manifest", LinkState::kBroken, "why"}), "why");
  EXPECT_EQ(TextOf(Link{"manifest", LinkState::kNotReached, "text"}), "not reached");
}
