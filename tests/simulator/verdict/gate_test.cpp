// Tests the gate: the demands of --signer and --werror on each file, and the demand that files with
// the same package name have the same signer.
#include "simulator/verdict/gate.h"

#include <gtest/gtest.h>

using namespace simulator;

namespace {

using Lines = std::vector<std::string>;

CertificateFacts SignerWith(char digit) {
  CertificateFacts signer;
  signer.subject = std::string("CN=") + digit;
  signer.sha256 = digit + std::string(63, '1');
  signer.key = {"RSA", 2048, digit + std::string(63, '2'), digit + std::string(63, '3')};
  return signer;
}

const CertificateFacts kOwner = SignerWith('a');
const CertificateFacts kOther = SignerWith('b');
const CertificateFacts kThird = SignerWith('c');

// The name and the digests of kOther.
const std::string kOtherText = "CN=b (SHA-256 digest of the certificate " + kOther.sha256 +
                               ", of the public key " + kOther.key.sha256 + ", of the modulus " +
                               kOther.key.modulus_sha256 + ")";

// The report of a package that the tool verified and the kernel signed.
Report SignedBy(const CertificateFacts& signer, const std::string& file = "base.apk") {
  Report report;
  report.file = file;
  report.verdict = Verdict::kSigned;
  report.package_name = "com.app";
  report.items = {{ItemKind::kPackage, "package", "", ItemState::kDone, {}, true}};
  report.signer = signer;
  report.key = {signer.key.modulus_sha256, 2048, true};
  return report;
}

// The judgement that the phones from API level `first` on install the package, with `signers` as
// its signers.
RangeJudgement Takes(int first, const std::vector<InstallerSigner>& signers) {
  RangeJudgement range;
  range.levels = {first, kNewestLevel};
  range.is_verified = true;
  range.signers = signers;
  return range;
}

Report InstalledFor(Report report, const std::vector<RangeJudgement>& ranges) {
  report.installer = {Judgement::State::kJudged, "", ranges};
  return report;
}

// The code of each item that the gate adds.
Lines Added(const Report& before, const Report& after) {
  Lines codes;
  for (size_t i = before.items.size(); i < after.items.size(); ++i) {
    EXPECT_EQ(after.items[i].state, ItemState::kRefused);
    codes.emplace_back(after.items[i].reason.cause->code);
  }
  return codes;
}

// The result for one file.
struct Judged {
  Lines codes;
  Verdict verdict;
};

Judged With(const Lines& signers, const Report& report) {
  GateOptions options;
  options.signers = signers;
  Report judged = report;
  Gate(options).Judge(&judged);
  return {Added(report, judged), judged.verdict};
}

// The reason of the only item that the gate adds.
std::string ReasonWith(const Lines& signers, const Report& report) {
  GateOptions options;
  options.signers = signers;
  Report judged = report;
  Gate(options).Judge(&judged);
  EXPECT_EQ(judged.items.size(), report.items.size() + 1);
  EXPECT_EQ(judged.items.back().kind, ItemKind::kSigner);
  return judged.items.back().reason.Text();
}

void ExpectTaken(const Lines& signers, const Report& report) {
  const Judged judged = With(signers, report);
  EXPECT_EQ(judged.codes, Lines());
  EXPECT_EQ(judged.verdict, report.verdict);
}

void ExpectUnexpected(const Lines& signers, const Report& report) {
  const Judged judged = With(signers, report);
  EXPECT_EQ(judged.codes, Lines({"signer-unexpected"}));
  EXPECT_EQ(judged.verdict, Verdict::kNotAccepted);
}

}  // namespace

TEST(ReadDigest, AcceptsTheFormsThatToolsPrint) {
  const std::string digest = "0123456789abcdef0123456789abcdef0123456789abcdef0123456789abcdef";
  EXPECT_EQ(ReadDigest(digest), digest);
  EXPECT_EQ(ReadDigest("0123456789ABCDEF0123456789ABCDEF0123456789ABCDEF0123456789ABCDEF"), digest);
  EXPECT_EQ(ReadDigest("01:23:45:67:89:AB:CD:EF:01:23:45:67:89:AB:CD:EF:"
                       "01:23:45:67:89:ab:cd:ef:01:23:45:67:89:ab:cd:ef"),
            digest);
}

TEST(ReadDigest, RejectsOtherForms) {
  const std::string digits(62, '0');
  for (const std::string& text :
       {std::string(), digits, digits + "000", digits + "0", digits + "0g", digits + " 0",
        "0x" + digits, digits + "0\n", ":" + digits + "0", digits + ":00",
        // The next texts have 95 characters, as many as 32 pairs of digits with colons between
        // them. The colons are missing or at wrong positions.
        std::string(64, '0') + std::string(31, ':'), std::string(95, '0'), std::string(95, ':')}) {
    EXPECT_EQ(ReadDigest(text), std::nullopt) << text;
  }
}

TEST(Gate, AcceptsAnySignerIfNoneIsNamed) { ExpectTaken({}, SignedBy(kOwner)); }

TEST(Gate, SignerIsKnownByEachOfHisDigests) {
  for (const std::string& digest : {kOwner.sha256, kOwner.key.sha256, kOwner.key.modulus_sha256}) {
    ExpectTaken({digest}, SignedBy(kOwner));
    ExpectTaken({kOther.sha256, digest}, SignedBy(kOwner));
    ExpectUnexpected({digest}, SignedBy(kOther));
  }
}

TEST(Gate, SaysWhoIsExpectedAndWhoSigned) {
  EXPECT_EQ(ReasonWith({kOwner.sha256, kThird.key.sha256}, SignedBy(kOther)),
            "its signer is not one that --signer names: expected " + kOwner.sha256 + " or " +
                kThird.key.sha256 + ", and the JAR signature is by " + kOtherText);
}

TEST(Gate, SaysForWhomPhonesInstallIt) {
  const Report report = InstalledFor(SignedBy(kOwner), {Takes(27, {{"v3", kOther}})});
  EXPECT_EQ(ReasonWith({kOwner.sha256}, report),
            "its signer is not one that --signer names: expected " + kOwner.sha256 +
                ", and phones install it as signed by " + kOtherText);
}

TEST(Gate, SaysWhomANewerSignatureNames) {
  Report report = SignedBy(kOwner);
  report.newer = {{"v3", kOther}};
  EXPECT_EQ(ReasonWith({kOwner.sha256}, report),
            "its signer is not one that --signer names: expected " + kOwner.sha256 +
                ", and its v3 signature names this signer: " + kOtherText);
}

TEST(Gate, SaysWhoseKeyIsForgeable) {
  Report report = SignedBy(kOther);
  report.warnings = {{&cause::kForgeableKey, "1"}};
  EXPECT_EQ(ReasonWith({kOther.sha256}, report),
            "its signer is not one that --signer names: expected " + kOther.sha256 +
                ", and anyone can sign with the key of " + kOtherText);
}

TEST(Gate, SaysThatASignerHasNoReadableName) {
  Report report = SignedBy(kOther);
  report.signer.reset();
  EXPECT_EQ(ReasonWith({kOwner.sha256}, report),
            "its signer is not one that --signer names: expected " + kOwner.sha256 +
                ", and the JAR signature is by a signer without a readable name (SHA-256 digest of "
                "the modulus " +
                kOther.key.modulus_sha256 + ")");
}

// A certificate counts only if it contains the key whose digest the kernel gets.
TEST(Gate, CertificateWithoutTheKernelsKeyDoesNotCount) {
  Report report = SignedBy(kOwner);
  report.key->sha256 = kOther.key.modulus_sha256;
  ExpectUnexpected({kOwner.sha256}, report);
  ExpectUnexpected({kOwner.key.sha256}, report);
  ExpectUnexpected({kOwner.key.modulus_sha256}, report);
  ExpectTaken({kOther.key.modulus_sha256}, report);
}

TEST(Gate, KeyWithoutACertificateIsKnownByItsModulus) {
  Report report = SignedBy(kOwner);
  report.signer.reset();
  ExpectTaken({kOwner.key.modulus_sha256}, report);
  ExpectUnexpected({kOwner.sha256}, report);
  report.key.reset();
  ExpectUnexpected({kOwner.key.modulus_sha256}, report);
}

// If a key has a forgeable exponent such as 1, anyone can make signatures that the key verifies. A
// forger can combine this exponent with the owner's modulus.
TEST(Gate, ForgeableKeyIsRejectedEvenIfExpected) {
  Report report = SignedBy(kOwner);
  report.warnings = {{&cause::kForgeableKey, "1"}};
  ExpectUnexpected({kOwner.key.modulus_sha256}, report);
  report.warnings = {{&cause::kWeakKey, "1"}};
  ExpectTaken({kOwner.key.modulus_sha256}, report);
}

TEST(Gate, SignersOfTheNewestSchemeMustBeExpectedAsWell) {
  const Lines owner = {kOwner.sha256};
  const RangeJudgement all_own = Takes(27, {{"v1", kOwner}, {"v2", kOwner}});
  ExpectTaken(owner, InstalledFor(SignedBy(kOwner), {all_own}));
  // The signers of an older scheme do not count.
  ExpectTaken(owner, InstalledFor(SignedBy(kOwner), {Takes(27, {{"v2", kOther}, {"v3", kOwner}})}));
  const Report other =
      InstalledFor(SignedBy(kOwner), {Takes(27, {{"v2", kOwner}, {"v3", kOther}})});
  ExpectUnexpected(owner, other);
  ExpectTaken({kOwner.sha256, kOther.sha256}, other);
  // If the newest scheme has several signers, each of them must be expected. The signers for the
  // phones of every API level are checked.
  ExpectUnexpected(owner,
                   InstalledFor(SignedBy(kOwner), {Takes(27, {{"v2", kOther}, {"v2", kOwner}})}));
  ExpectUnexpected(owner, InstalledFor(SignedBy(kOwner), {all_own, Takes(33, {{"v3", kOther}})}));
  ExpectUnexpected(owner, InstalledFor(SignedBy(kOwner), {Takes(27, {{"v2", kOther}}), all_own}));
  // If phones refuse the package, its signers for these phones do not count.
  RangeJudgement refuses = Takes(33, {{"v3", kOther}});
  refuses.is_verified = false;
  ExpectTaken(owner, InstalledFor(SignedBy(kOwner), {all_own, refuses}));
}

TEST(Gate, ReportsEachUnexpectedSignerOnce) {
  const Report report = InstalledFor(
      SignedBy(kOther),
      {Takes(27, {{"v2", kOther}}), Takes(30, {{"v3", kThird}}), Takes(33, {{"v3", kThird}})});
  EXPECT_EQ(With({kOwner.sha256}, report).codes, Lines({"signer-unexpected", "signer-unexpected"}));
}

TEST(Gate, UnverifiedPackageHasNoVerifiedSigner) {
  Report report = SignedBy(kOwner);
  report.verdict = Verdict::kRefused;
  report.items[0] = {ItemKind::kPackage,        "package", "", ItemState::kRefused,
                     {&cause::kDexChanged, ""}, false};
  const Judged judged = With({kOwner.sha256}, report);
  EXPECT_EQ(judged.codes, Lines({"signer-not-verified"}));
  EXPECT_EQ(judged.verdict, Verdict::kRefused);
  // The tool verified the package, but the kernel refused to sign it.
  report.items[0].is_verified = true;
  EXPECT_EQ(With({kOwner.sha256}, report).codes, Lines());
  EXPECT_EQ(With({kOther.sha256}, report).codes, Lines({"signer-unexpected"}));
}

TEST(Gate, TrustedJarHasNoSigner) {
  Report report;
  report.verdict = Verdict::kTrustedJar;
  report.items = {{ItemKind::kJar, "JAR", "", ItemState::kDone, {}}};
  const Judged judged = With({kOwner.sha256}, report);
  EXPECT_EQ(judged.codes, Lines({"signer-none"}));
  EXPECT_EQ(judged.verdict, Verdict::kNotAccepted);
  ExpectTaken({}, report);
}

TEST(Gate, FileThatWasNotLookedAtIsLeftAsItIs) {
  for (const Verdict verdict : {Verdict::kNotLookedAt, Verdict::kNotSimulated}) {
    Report report = SignedBy(kOther);
    report.verdict = verdict;
    ExpectTaken({kOwner.sha256}, report);
  }
}

TEST(Gate, NeverImprovesAVerdict) {
  for (const Verdict verdict :
       {Verdict::kPartlySigned, Verdict::kNotInstallable, Verdict::kRefused}) {
    Report report = SignedBy(kOther);
    report.verdict = verdict;
    EXPECT_EQ(With({kOwner.sha256}, report).verdict, verdict);
  }
  Report report = SignedBy(kOther);
  report.verdict = Verdict::kOtherSigner;
  EXPECT_EQ(With({kOwner.sha256}, report).verdict, Verdict::kNotAccepted);
}

// ---- Warnings.

namespace {

// The result for one file if warnings count as refusals.
Judged WithoutWarnings(const Report& report, const Lines& signers = {}) {
  GateOptions options;
  options.refuses_warnings = true;
  options.signers = signers;
  Report judged = report;
  Gate(options).Judge(&judged);
  EXPECT_EQ(judged.warnings.size(), report.warnings.size());
  return {Added(report, judged), judged.verdict};
}

}  // namespace

TEST(WarningsGate, RefusesAPackageWithAWarning) {
  Report report = SignedBy(kOwner);
  const Judged good = WithoutWarnings(report);
  EXPECT_EQ(good.codes, Lines());
  EXPECT_EQ(good.verdict, Verdict::kSigned);
  report.warnings = {{&cause::kWeakKey, "1024"}};
  const Judged judged = WithoutWarnings(report);
  EXPECT_EQ(judged.codes, Lines({"warnings-refused"}));
  EXPECT_EQ(judged.verdict, Verdict::kNotAccepted);
  ExpectTaken({kOwner.sha256}, report);
}

TEST(WarningsGate, SaysTheFirstAndHowManyMore) {
  GateOptions options;
  options.refuses_warnings = true;
  Report report = SignedBy(kOwner);
  report.warnings = {{&cause::kWeakKey, "1024"}, {&cause::kDebugKey, ""}, {&cause::kDebugKey, ""}};
  Gate(options).Judge(&report);
  EXPECT_EQ(report.items[1].kind, ItemKind::kWarnings);
  EXPECT_EQ(report.items[1].reason.Text(),
            "a warning counts as a refusal (--werror): its RSA key has 1024 bits; fewer than 2048 "
            "bits are not safe (and 2 more)");
}

TEST(WarningsGate, OtherSignerOfTheNewestSchemeCountsAsAWarning) {
  Report report = InstalledFor(SignedBy(kOwner), {Takes(27, {{"v2", kOther}})});
  report.verdict = Verdict::kOtherSigner;
  GateOptions options;
  options.refuses_warnings = true;
  Gate(options).Judge(&report);
  EXPECT_EQ(report.verdict, Verdict::kNotAccepted);
  EXPECT_EQ(report.items[1].reason.detail, "phones install it as signed by another signer, CN=b");
}

// The refusal for the signer comes first, and both refusals are reported.
TEST(WarningsGate, ComesAfterTheRefusalOfTheSigner) {
  Report report = SignedBy(kOther);
  report.warnings = {{&cause::kWeakKey, "1024"}};
  EXPECT_EQ(WithoutWarnings(report, {kOwner.sha256}).codes,
            Lines({"signer-unexpected", "warnings-refused"}));
}

TEST(WarningsGate, ChangesOnlyGoodVerdicts) {
  for (const Verdict verdict : {Verdict::kRefused, Verdict::kPartlySigned, Verdict::kNotInstallable,
                                Verdict::kNotLookedAt, Verdict::kNotSimulated}) {
    Report report = SignedBy(kOwner);
    report.verdict = verdict;
    report.warnings = {{&cause::kWeakKey, "1024"}};
    EXPECT_EQ(WithoutWarnings(report).codes, Lines());
    EXPECT_EQ(WithoutWarnings(report).verdict, verdict);
  }
}

// ---- Files of one package.

namespace {

// The codes that the last file gets. The files before it must get none.
Lines AfterOthers(std::vector<Report> reports) {
  const GateOptions options;
  Gate gate(options);
  for (Report& report : reports) {
    const Report before = report;
    gate.Judge(&report);
    if (&report == &reports.back()) return Added(before, report);
    EXPECT_EQ(Added(before, report), Lines());
  }
  return {};
}

}  // namespace

TEST(OneSignerGate, AcceptsFilesOfOneSigner) {
  EXPECT_EQ(AfterOthers({SignedBy(kOwner), SignedBy(kOwner, "split.apk")}), Lines());
}

TEST(OneSignerGate, SaysWhichFileDiffersFromWhich) {
  const GateOptions options;
  Gate gate(options);
  Report base = SignedBy(kOwner), split = SignedBy(kOther, "split.apk");
  gate.Judge(&base);
  gate.Judge(&split);
  EXPECT_EQ(base.verdict, Verdict::kSigned);
  EXPECT_EQ(split.verdict, Verdict::kNotAccepted);
  const std::string text = split.items[1].reason.Text();
  EXPECT_EQ(text.substr(0, text.find(" (SHA")),
            "the files of a package must have one signer: base.apk of com.app is by CN=a");
  EXPECT_NE(text.find(", and this one by CN=b (SHA-256 digest of the certificate " + kOther.sha256),
            std::string::npos);
}

TEST(OneSignerGate, ComparesEachWithTheFirst) {
  EXPECT_EQ(AfterOthers({SignedBy(kOwner), SignedBy(kOwner), SignedBy(kOther)}),
            Lines({"signer-differs"}));
  const GateOptions options;
  Gate gate(options);
  Report first = SignedBy(kOwner), second = SignedBy(kOther), third = SignedBy(kOwner);
  for (Report* const report : {&first, &second, &third}) gate.Judge(report);
  EXPECT_EQ(second.verdict, Verdict::kNotAccepted);
  EXPECT_EQ(third.verdict, Verdict::kSigned);
}

// Phones compare certificates, and the kernel compares keys.
TEST(OneSignerGate, AnotherCertificateOrKeyIsAnotherSigner) {
  CertificateFacts renewed = kOwner;
  renewed.sha256 = kThird.sha256;
  EXPECT_EQ(AfterOthers({SignedBy(kOwner), SignedBy(renewed)}), Lines({"signer-differs"}));
  Report report = SignedBy(kOwner);
  report.key->sha256 = kOther.key.modulus_sha256;
  EXPECT_EQ(AfterOthers({SignedBy(kOwner), report}), Lines({"signer-differs"}));
}

TEST(OneSignerGate, SignersOfAllPhonesAreCompared) {
  const Report by_owner = InstalledFor(SignedBy(kOwner), {Takes(27, {{"v2", kOwner}})});
  const Report by_other = InstalledFor(
      SignedBy(kOwner), {Takes(27, {{"v2", kOwner}}), Takes(28, {{"v2", kOwner}, {"v3", kOther}})});
  const Report by_other_before = InstalledFor(
      SignedBy(kOwner), {Takes(27, {{"v2", kOther}}), Takes(28, {{"v2", kOther}, {"v3", kOwner}})});
  EXPECT_EQ(AfterOthers({by_owner, by_owner}), Lines());
  EXPECT_EQ(AfterOthers({by_owner, by_other}), Lines({"signer-differs"}));
  EXPECT_EQ(AfterOthers({by_owner, by_other_before}), Lines({"signer-differs"}));
}

TEST(OneSignerGate, SignersAreComparedInAnyOrder) {
  const auto installed_for = [](const std::vector<InstallerSigner>& signers) {
    return InstalledFor(SignedBy(kOwner), {Takes(27, signers)});
  };
  const Report two = installed_for({{"v2", kOwner}, {"v2", kOther}});
  EXPECT_EQ(AfterOthers({two, installed_for({{"v2", kOther}, {"v2", kOwner}})}), Lines());
  const GateOptions options;
  Gate gate(options);
  Report one = installed_for({{"v2", kOwner}}), last = two;
  gate.Judge(&one);
  gate.Judge(&last);
  const std::string text = last.items[1].reason.Text();
  EXPECT_EQ(text.substr(text.find(", and this one by")),
            ", and this one by CN=a (SHA-256 digest of the certificate " + kOwner.sha256 +
                ", of the public key " + kOwner.key.sha256 + ", of the modulus " +
                kOwner.key.modulus_sha256 + ") and CN=b (SHA-256 digest of the certificate " +
                kOther.sha256 + ", of the public key " + kOther.key.sha256 + ", of the modulus " +
                kOther.key.modulus_sha256 + ")");
}

// Without an installer's judgement, the gate compares the signers of the newest scheme in each
// file.
TEST(OneSignerGate, NewestSchemesInTheFilesCountWithoutAnInstaller) {
  Report by_owner = SignedBy(kOwner), by_other = SignedBy(kOwner);
  by_owner.newer = {{"v2", kOther}, {"v3", kOwner}};
  by_other.newer = {{"v2", kOwner}, {"v3", kOther}};
  EXPECT_EQ(AfterOthers({SignedBy(kOwner), by_owner}), Lines());
  EXPECT_EQ(AfterOthers({SignedBy(kOwner), by_other}), Lines({"signer-differs"}));
  EXPECT_EQ(AfterOthers({by_other, SignedBy(kOwner)}), Lines({"signer-differs"}));
  EXPECT_EQ(AfterOthers({by_owner, by_other}), Lines({"signer-differs"}));
}

TEST(OneSignerGate, OtherNamelessAndRefusedPackagesAreNotCompared) {
  Report other_package = SignedBy(kOther);
  other_package.package_name = "com.other";
  EXPECT_EQ(AfterOthers({SignedBy(kOwner), other_package}), Lines());
  Report nameless = SignedBy(kOwner);
  nameless.package_name = "";
  Report other_nameless = SignedBy(kOther);
  other_nameless.package_name = "";
  EXPECT_EQ(AfterOthers({nameless, other_nameless}), Lines());
  // If the tool did not verify a file, the file only claims a signer. The gate does not compare
  // this signer with those of other files.
  Report refused = SignedBy(kOther);
  refused.verdict = Verdict::kRefused;
  refused.items[0].is_verified = false;
  EXPECT_EQ(AfterOthers({refused, SignedBy(kOwner)}), Lines());
  EXPECT_EQ(AfterOthers({SignedBy(kOwner), refused}), Lines());
}
