#include "simulator/show/words.h"

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
  const std::vector<Verdict> all = {Verdict::kSigned,         Verdict::kOtherSigner,
                                    Verdict::kTrustedJar,     Verdict::kPartlySigned,
                                    Verdict::kNotInstallable, Verdict::kNotAccepted,
                                    Verdict::kRefused,        Verdict::kNotTrustedJar,
                                    Verdict::kNotLookedAt,    Verdict::kNotSimulated};
  std::vector<Verdict> twice = all;
  twice.insert(twice.end(), all.begin(), all.end());
  EXPECT_EQ(
      Summary(all),
      "10 files: 1 signed, 1 signed but with another signer, 1 trusted JAR, 1 partly signed, 1 "
      "not installable, 1 not accepted, 1 refused, 1 JAR not trusted, 1 not looked at, 1 not "
      "simulated");
  EXPECT_EQ(
      Summary(twice),
      "20 files: 2 signed, 2 signed but with another signer, 2 trusted JARs, 2 partly signed, 2 "
      "not installable, 2 not accepted, 2 refused, 2 JARs not trusted, 2 not looked at, 2 "
      "not simulated");
  EXPECT_EQ(Summary({}), "0 files");
}

TEST(HasCure, IsTrueOnceForConsecutiveItemsWithTheSameCause) {
  const Item changed = Library(&cause::kLibraryChanged);
  const Item refused = Library(&cause::kKernelRefused);
  EXPECT_TRUE(HasCure(changed, nullptr));
  EXPECT_TRUE(HasCure(changed, &refused));
  EXPECT_FALSE(HasCure(changed, &changed));
}

TEST(HasCure, IsFalseForConsequencesAndItemsWithNothingToSign) {
  EXPECT_FALSE(HasCure(Library(&cause::kPackageRefused), nullptr));
  EXPECT_FALSE(HasCure(Library(&cause::kNotReached), nullptr));
  Item nothing = Library(&cause::kLibraryOtherAbi);
  nothing.state = ItemState::kNothing;
  EXPECT_FALSE(HasCure(nothing, nullptr));
}

namespace {

using Lines = std::vector<std::string>;

Report WithSigner() {
  Report report;
  report.package_name = "com.app";
  report.signer.emplace();
  report.signer->subject = "CN=a";
  report.signer->key = {"RSA", 512, "spki", "0123456789abcdef"};
  return report;
}

}  // namespace

TEST(HeadFacts, NameTheSignerAndTheKernelsKey) {
  Report report = WithSigner();
  EXPECT_EQ(HeadFacts(report, "..."), Lines({"com.app", "signer CN=a, RSA-512"}));
  report.key = {"98302ce800f64646", 2048, true};
  EXPECT_EQ(HeadFacts(report, "..."),
            Lines({"com.app", "signer CN=a, RSA-2048, key 98302ce8...f64646"}));
  report.key->bits = 0;
  EXPECT_EQ(HeadFacts(report, "…")[1], "signer CN=a, RSA, key 98302ce8…f64646");
  // A payload can have any length. A short payload is shown whole.
  report.key->sha256 = "ab";
  EXPECT_EQ(HeadFacts(report, "…")[1], "signer CN=a, RSA, key ab");
  report.key->sha256 = "98302ce800f64646";
  report.signer.reset();
  report.package_name = "";
  EXPECT_EQ(HeadFacts(report, "..."), Lines({"signer unknown, RSA, key 98302ce8...f64646"}));
  report.key.reset();
  EXPECT_EQ(HeadFacts(report, "..."), Lines());
}

TEST(HeadFacts, NameAnUnknownAlgorithmWithoutASize) {
  Report report = WithSigner();
  report.signer->key = {"1.2.3", 0, "spki", ""};
  EXPECT_EQ(HeadFacts(report, "...")[1], "signer CN=a, 1.2.3");
}

TEST(HeadFacts, ShowAlarmsAndTheNumberOfWarnings) {
  Report report;
  report.warnings = {{&cause::kUnlistedEntries, "x"}, {&cause::kBlockAmbiguous, "why"}};
  EXPECT_EQ(HeadFacts(report, "..."),
            Lines({"! other programs may find a different signer in its signature block: why",
                   "2 warnings"}));
  report.warnings.erase(report.warnings.begin());
  EXPECT_EQ(HeadFacts(report, "...").back(), "1 warning");
}

TEST(HeadFacts, HaveTheReasonInPlaceOfTheSigner) {
  Report report = WithSigner();
  report.verdict = Verdict::kPartlySigned;
  report.items = {
      {ItemKind::kPackage, "package", "", ItemState::kDone, {}},
      Library(&cause::kLibraryMissing),
      {ItemKind::kKey, "com.app", "", ItemState::kRefused, {&cause::kRegistrationRefused, "7"}}};
  EXPECT_EQ(HeadFacts(report, "..."),
            Lines({"lib/arm64/a.so: it is not beside the package, but other libraries are"}));
  report.items[1].state = ItemState::kAbsent;
  EXPECT_EQ(HeadFacts(report, "..."), Lines({"libzu answered 7"}));
}

// The tool's own refusals are not the reason why phones do not install the package.
TEST(HeadFacts, ShowTheInstallersReasonIfItDecidesTheVerdict) {
  Report report = WithSigner();
  report.verdict = Verdict::kNotInstallable;
  report.items = {Library(&cause::kLibraryMissing),
                  {ItemKind::kInstaller,
                   "installer",
                   "",
                   ItemState::kRefused,
                   {&cause::kNotInstallable, "why"}}};
  EXPECT_EQ(HeadFacts(report, "..."), Lines({"phones do not install it: why"}));
}

// The first line alone must show that the signer is not one of those that --signer names, even if
// the file was refused for another reason.
TEST(HeadFacts, ReportAnUnexpectedSignerInAdditionToTheReason) {
  Report report = WithSigner();
  report.verdict = Verdict::kPartlySigned;
  const Item signer = {
      ItemKind::kSigner, "signer", "", ItemState::kRefused, {&cause::kSignerUnexpected, "who"}};
  report.items = {Library(&cause::kLibraryMissing), signer};
  report.items[0].state = ItemState::kRefused;
  EXPECT_EQ(HeadFacts(report, "..."),
            Lines({"lib/arm64/a.so: it is not beside the package, but other libraries are",
                   "its signer is not one that --signer names: who"}));
  report.verdict = Verdict::kNotAccepted;
  report.items = {signer};
  EXPECT_EQ(HeadFacts(report, "..."), Lines({"its signer is not one that --signer names: who"}));
  // The cause signer-not-verified is only a consequence of the refused package, so HeadFacts leaves
  // this cause out.
  report.verdict = Verdict::kRefused;
  report.items = {Library(&cause::kLibraryMissing), signer};
  report.items[0].state = ItemState::kRefused;
  report.items[1].reason = {&cause::kSignerNotVerified, "who"};
  EXPECT_EQ(HeadFacts(report, "...").size(), 1U);
}

TEST(HeadFacts, NameTheOtherSigner) {
  Report report = WithSigner();
  report.verdict = Verdict::kOtherSigner;
  RangeJudgement range;
  range.is_verified = true;
  range.signers = {{"v3", *report.signer}};
  range.signers[0].certificate.subject = "CN=other";
  range.signers[0].certificate.key.sha256 = "other";
  report.installer.ranges = {range};
  EXPECT_EQ(HeadFacts(report, "..."),
            Lines({"com.app", "signer CN=a, RSA-512", "phones install it as signed by CN=other"}));
}

TEST(SignerRows, SayWhetherTheKernelGotTheKey) {
  Report report = WithSigner();
  EXPECT_EQ(SignerRows(report).back(),
            Rows::value_type("modulus SHA-256 digest", "0123456789abcdef (of the modulus alone)"));
  report.key = {"98302ce8", 2048, true};
  EXPECT_EQ(SignerRows(report).size(), 6U);
  EXPECT_EQ(SignerRows(report)[5],
            Rows::value_type("modulus SHA-256 digest",
                             "98302ce8 (of the modulus alone; the kernel got this digest)"));
  report.key->was_got = false;
  EXPECT_EQ(SignerRows(report)[5].second, "98302ce8 (of the modulus alone, as the tool reads it)");
  // The certificate is shown even if the crypto library cannot read its key. The key in
  // `report.key` is shown even if the certificate is missing.
  report.signer->key = {"RSA", 0, "spki", ""};
  EXPECT_EQ(SignerRows(report).size(), 5U);
  EXPECT_EQ(SignerRows(report)[3].first, "public key SHA-256 digest");
  report.signer.reset();
  EXPECT_EQ(SignerRows(report).size(), 1U);
}

TEST(LinkText, IsNotReachedAfterABrokenLink) {
  EXPECT_EQ(TextOf(Link{"manifest", LinkState::kHolds, "text"}), "text");
  EXPECT_EQ(TextOf(Link{"manifest", LinkState::kBroken, "why"}), "why");
  EXPECT_EQ(TextOf(Link{"manifest", LinkState::kNotReached, "text"}), "not reached");
}
