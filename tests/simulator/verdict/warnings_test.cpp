#include "simulator/verdict/parts.h"

#include <gtest/gtest.h>

using namespace simulator;

namespace {

const std::string kModulus(64, 'a');
const std::string kOther(64, 'b');

CertificateFacts CertificateWith(const std::string& subject, const std::string& modulus,
                                 const std::string& key) {
  CertificateFacts certificate;
  certificate.subject = subject;
  certificate.issuer = "CN=issuer";
  certificate.key = {"RSA", 2048, key, modulus};
  return certificate;
}

const CertificateFacts kJarSigner = CertificateWith("CN=jar", kModulus, "jar key");

// A package without any warning.
PackageFacts Good() {
  PackageFacts facts;
  facts.jar.manifest = Archive::ReadResult::kRead;
  facts.jar.signature_files = {"META-INF/CERT.SF"};
  facts.jar.key = ToolKey{kModulus, 256, 2048, 65537, false};
  facts.jar.block.is_whole = true;
  facts.jar.block.signer_count = 1;
  facts.jar.certificate = kJarSigner;
  facts.manifest.package_name = facts.manifest.installer_name = "com.app";
  return facts;
}

Report ReportOf(const PackageFacts& facts, ItemKind kind = ItemKind::kPackage) {
  Report report;
  report.items = {{kind, "package", "", ItemState::kDone, {}}};
  report.signer = facts.jar.certificate;
  report.key = {kModulus, 2048, true};
  return report;
}

std::vector<std::string> Warnings(const PackageFacts& facts, const Report& report,
                                  const RunRecord& run = {}) {
  std::vector<std::string> lines;
  for (const Reason& warning : FindWarnings(run, facts, report)) {
    lines.push_back(std::string(warning.cause->code) + ": " + warning.detail);
  }
  return lines;
}

std::vector<std::string> Warnings(const PackageFacts& facts) {
  return Warnings(facts, ReportOf(facts));
}

using Lines = std::vector<std::string>;

}  // namespace

TEST(Warnings, GoodPackageHasNone) { EXPECT_EQ(Warnings(Good()), Lines()); }

// ---- Other programs read other values than the tool.

TEST(Warnings, CertificateWithAnotherKeyThanTheKernelsIsReported) {
  PackageFacts facts = Good();
  facts.jar.certificate->key.modulus_sha256 = kOther;
  EXPECT_EQ(Warnings(facts),
            Lines({"certificate-other-key: a modulus with the SHA-256 digest " + kOther}));
  facts.jar.certificate->key.modulus_sha256 = "";
  EXPECT_EQ(Warnings(facts), Lines({"certificate-other-key: no key"}));
  EXPECT_EQ(cause::kCertificateOtherKey.severity, Severity::kAlarm);
}

// The warning compares the JAR signer's certificate with the key that the kernel got, even if the
// file now shows another key.
TEST(Warnings, CertificateIsComparedWithTheKeyThatTheKernelGot) {
  Report report = ReportOf(Good());
  report.key->sha256 = kOther;
  EXPECT_EQ(Warnings(Good(), report),
            Lines({"certificate-other-key: a modulus with the SHA-256 digest " + kModulus}));
}

TEST(Warnings, PackageWithoutAKeyHasNone) {
  PackageFacts facts = Good();
  facts.jar.key.reset();
  facts.jar.block.is_whole = false;
  Report report = ReportOf(facts);
  report.key.reset();
  EXPECT_EQ(Warnings(facts, report), Lines());
}

TEST(Warnings, BlockThatOthersReadDifferentlyIsReported) {
  PackageFacts facts = Good();
  facts.jar.block.is_whole = false;
  EXPECT_EQ(Warnings(facts), Lines({"block-ambiguous: it is not strict DER"}));
  facts = Good();
  facts.jar.certificate.reset();
  EXPECT_EQ(Warnings(facts), Lines({"block-ambiguous: it is not strict DER"}));
  facts = Good();
  facts.jar.names_other_certificate = true;
  EXPECT_EQ(Warnings(facts),
            Lines({"block-ambiguous: it names a certificate other than its first one"}));
  EXPECT_EQ(cause::kBlockAmbiguous.severity, Severity::kAlarm);
}

TEST(Warnings, OtherPackageNameOfTheInstallerIsReported) {
  PackageFacts facts = Good();
  facts.manifest.installer_name = "com.evil";
  EXPECT_EQ(Warnings(facts), Lines({"other-package-name: \"com.evil\""}));
  facts.manifest.package_name.reset();
  EXPECT_EQ(Warnings(facts), Lines());
}

// ---- Signers.

TEST(Warnings, SeveralSignersAreReported) {
  PackageFacts facts = Good();
  facts.jar.block.signer_count = 2;
  EXPECT_EQ(Warnings(facts), Lines({"several-signers: META-INF/CERT.SF"}));
  facts = Good();
  facts.jar.signature_files.push_back("META-INF/OTHER.SF");
  EXPECT_EQ(Warnings(facts), Lines({"several-signers: META-INF/CERT.SF"}));
}

TEST(Warnings, ForgeableKeyIsNotSaidTwice) {
  PackageFacts facts = Good();
  facts.jar.key->is_forgeable = true;
  facts.jar.key->exponent = -1;
  EXPECT_EQ(Warnings(facts), Lines({"forgeable-key: -1"}));
  Report report = ReportOf(facts);
  report.items[0].reason.cause = &cause::kExponentRefused;
  EXPECT_EQ(Warnings(facts, report), Lines());
}

TEST(Warnings, OtherKeyOfAnyNewerSignerIsReported) {
  PackageFacts facts = Good();
  const CertificateFacts other = CertificateWith("CN=other", kOther, "other key");
  facts.newer = {{"v2", kJarSigner}, {"v3", kJarSigner}};
  EXPECT_EQ(Warnings(facts), Lines());
  const std::string told = "signature (CN=other, public key SHA-256 digest: other key)";
  facts.newer = {{"v2", kJarSigner}, {"v2", other}};
  EXPECT_EQ(Warnings(facts), Lines({"other-key: the v2 " + told}));
  facts.newer = {{"v2", other}, {"v2", kJarSigner}, {"v3", other}};
  EXPECT_EQ(Warnings(facts), Lines({"other-key: the v2 " + told, "other-key: the v3 " + told}));
}

// The key of a v2 or v3 signer must have the modulus that the kernel gets. This key must also be
// the key in the JAR signer's certificate. If one of these conditions fails, the warning other-key
// reports the signer.
TEST(Warnings, KeyThatMatchesOnlyInPartIsReported) {
  PackageFacts facts = Good();
  facts.newer = {{"v2", CertificateWith("CN=other", kModulus, "other key")}};
  EXPECT_EQ(Warnings(facts).size(), 1U);
  facts.newer = {{"v2", CertificateWith("CN=other", kOther, "jar key")}};
  EXPECT_EQ(Warnings(facts).size(), 1U);
  // If the JAR signer's certificate cannot be read, the key of a v2 or v3 signer is compared only
  // with the key that the kernel got. The unreadable certificate also causes the warning
  // block-ambiguous.
  facts.jar.certificate.reset();
  facts.newer = {{"v2", CertificateWith("CN=other", kOther, "jar key")}};
  EXPECT_EQ(Warnings(facts).size(), 2U);
  facts.newer = {{"v2", CertificateWith("CN=other", kModulus, "jar key")}};
  EXPECT_EQ(Warnings(facts).size(), 1U);
}

TEST(Warnings, KeyOtherThanTheEcSignersIsReported) {
  PackageFacts facts = Good();
  facts.jar.key.reset();
  facts.jar.certificate->key = {"EC", 256, "ec key", ""};
  facts.newer = {{"v2", *facts.jar.certificate}};
  Report report = ReportOf(facts);
  report.key.reset();
  EXPECT_EQ(Warnings(facts, report), Lines());
  facts.newer = {{"v2", kJarSigner}};
  EXPECT_EQ(Warnings(facts, report).size(), 1U);
  report.signer.reset();
  EXPECT_EQ(Warnings(facts, report), Lines());
}

TEST(Warnings, StrippedSchemesAreReported) {
  PackageFacts facts = Good();
  facts.jar.claimed_schemes = "2, 3";
  EXPECT_EQ(Warnings(facts), Lines({"schemes-stripped: v2, v3"}));
  facts.newer = {{"v3", kJarSigner}};
  EXPECT_EQ(Warnings(facts), Lines({"schemes-stripped: v2"}));
  facts.newer = {{"v2", kJarSigner}};
  EXPECT_EQ(Warnings(facts), Lines({"schemes-stripped: v3"}));
  facts.newer = {{"v2", kJarSigner}, {"v3", kJarSigner}};
  EXPECT_EQ(Warnings(facts), Lines());
}

// ---- The file.

TEST(Warnings, PartsThatAreNotLookedIntoAreReported) {
  PackageFacts facts = Good();
  facts.has_damaged_signing_block = true;
  facts.too_long = {"a", "b"};
  const Lines expected = {"signing-block-damaged: ", "not-looked-into: a", "not-looked-into: b"};
  EXPECT_EQ(Warnings(facts), expected);
  EXPECT_EQ(Warnings(facts, ReportOf(facts, ItemKind::kJar)), expected);
}

TEST(Warnings, UnlistedAndDamagedEntriesAreReported) {
  PackageFacts facts = Good();
  facts.entries = {{{"listed", 1, false}, true, false},
                   {{"META-INF/A.SF", 10, false}, false, true},
                   {{"added", 100, false}, false, false}};
  EXPECT_EQ(Warnings(facts), Lines({"unlisted-entries: 1 entry (100 bytes)"}));
  facts.entries.push_back({{"lost", 1000, true}, false, false});
  EXPECT_EQ(Warnings(facts),
            Lines({"entries-damaged: 1 entry: lost", "unlisted-entries: 2 entries (1100 bytes)"}));
  // Without META-INF/MANIFEST.MF, it is not known which entries are listed.
  facts.jar.manifest = Archive::ReadResult::kMissing;
  EXPECT_EQ(Warnings(facts), Lines({"entries-damaged: 1 entry: lost"}));
  facts.entries = {{{"added", 1, false}, false, false}};
  facts.jar.manifest = Archive::ReadResult::kRead;
  EXPECT_EQ(Warnings(facts), Lines({"unlisted-entries: 1 entry (1 byte)"}));
}

// The simulator lays out a package: it extracts the libraries beside the package, as an installer
// does. `not_laid_out` has the library entries whose names no installer accepts.
TEST(Warnings, EntriesThatAreNotLaidOutAreReported) {
  RunRecord run;
  run.not_laid_out = {"lib/a.so"};
  EXPECT_EQ(Warnings(Good(), ReportOf(Good()), run), Lines({"not-laid-out: 1 entry: lib/a.so"}));
  run.not_laid_out.emplace_back("lib/b.so");
  EXPECT_EQ(Warnings(Good(), ReportOf(Good()), run),
            Lines({"not-laid-out: 2 entries: lib/a.so, ..."}));
}

TEST(Warnings, PackageWarningsDoNotAppearForAJar) {
  PackageFacts facts = Good();
  facts.jar.certificate->key.modulus_sha256 = kOther;
  facts.jar.block.signer_count = 2;
  facts.jar.claimed_schemes = "2";
  facts.entries = {{{"added", 1, true}, false, false}};
  facts.manifest.installer_name = "x";
  EXPECT_EQ(Warnings(facts, ReportOf(facts, ItemKind::kJar)), Lines());
}

// ---- Entries that are not as the manifest lists them.

TEST(Warnings, ChangedMissingAndUncomparedEntriesAreReported) {
  PackageFacts facts = Good();
  facts.entries = {{{"same", 1, false}, true, false, EntryDigest::kMatches},
                   {{"a", 1, false}, true, false, EntryDigest::kDiffers},
                   {{"b", 1, false}, true, false, EntryDigest::kDiffers},
                   {{"long", 1, false}, true, false, EntryDigest::kNotCompared}};
  facts.missing = {"gone"};
  EXPECT_EQ(Warnings(facts),
            Lines({"entries-changed: 2 entries: a, ...", "entries-missing: 1 entry: gone",
                   "entries-not-compared: 1 entry: long"}));
  EXPECT_EQ(cause::kEntriesNotCompared.severity, Severity::kAlarm);
}

TEST(Warnings, FaultThatAnItemReportsIsNotRepeated) {
  PackageFacts facts = Good();
  facts.entries = {{{"classes.dex", 1, false}, true, false, EntryDigest::kDiffers},
                   {{"lib/arm64-v8a/a.so", 1, false}, true, false, EntryDigest::kDiffers},
                   {{"damaged", 1, true}, true, false, EntryDigest::kNotCompared}};
  Report report = ReportOf(facts);
  report.items[0].reason.cause = &cause::kDexChanged;
  report.items.push_back({ItemKind::kLibrary,
                          "lib/arm64/a.so",
                          "lib/arm64-v8a/a.so",
                          ItemState::kRefused,
                          {&cause::kLibraryChangedInside, ""}});
  EXPECT_EQ(Warnings(facts, report), Lines({"entries-damaged: 1 entry: damaged"}));
}

// ---- Keys, digests and certificates that nobody should sign a release with.

TEST(Warnings, KeyOfFewerThan2048BitsIsReported) {
  PackageFacts facts = Good();
  facts.jar.key->bits = 2047;
  EXPECT_EQ(Warnings(facts), Lines({"weak-key: 2047"}));
  facts.jar.key->bits = 2048;
  EXPECT_EQ(Warnings(facts), Lines());
}

TEST(Warnings, DebugCertificateIsReported) {
  PackageFacts facts = Good();
  facts.jar.certificate->subject = "C=US, O=Android, CN=Android Debug";
  EXPECT_EQ(Warnings(facts), Lines({"debug-key: "}));
  facts.jar.certificate->subject = "CN=Android Debug, O=Android";
  EXPECT_EQ(Warnings(facts), Lines({"debug-key: "}));
  facts.jar.certificate->subject = "CN=Android Debugger";
  EXPECT_EQ(Warnings(facts), Lines());
}

TEST(Warnings, DigestsWithKnownCollisionsAreReported) {
  PackageFacts facts = Good();
  facts.jar.certificate->signature_algorithm = "SHA256withRSA";
  facts.jar.block.digest = "SHA256";
  facts.entries = {{{"a", 1, false}, true, false, EntryDigest::kMatches, false}};
  EXPECT_EQ(Warnings(facts), Lines());
  for (const char* digest : {"SHA384", "SHA512", "SHA224"}) {
    facts.jar.block.digest = digest;
    facts.jar.certificate->signature_algorithm = std::string(digest) + "withRSA";
    EXPECT_EQ(Warnings(facts), Lines()) << digest;
  }
  facts.jar.block.digest = "SHA256";
  facts.jar.certificate->signature_algorithm = "SHA1withRSA";
  EXPECT_EQ(Warnings(facts), Lines({"weak-digest: the certificate is signed with SHA1withRSA"}));
  facts.jar.certificate->signature_algorithm = "SHA256withRSA";
  facts.jar.has_sha1_of_manifest = true;
  EXPECT_EQ(Warnings(facts),
            Lines({"weak-digest: the signature file has the manifest's SHA-1 digest"}));
  facts.jar.has_sha1_of_manifest = false;
  facts.entries[0].has_sha1 = true;
  EXPECT_EQ(Warnings(facts), Lines({"weak-digest: the manifest has SHA-1 digests of 1 entry"}));
  facts.entries[0].has_sha1 = false;
  facts.jar.block.digest = "MD5";
  EXPECT_EQ(Warnings(facts), Lines({"weak-digest: the signature block is made with MD5"}));
  facts.jar.block.digest = "SHA1";
  facts.jar.certificate->signature_algorithm = "MD5withRSA";
  EXPECT_EQ(Warnings(facts), Lines({"weak-digest: the certificate is signed with MD5withRSA, the "
                                    "signature block is made with SHA1"}));
}

// The v2 signer's certificate has the JAR signer's key, but is another certificate. Phones use the
// v2 signer's certificate.
TEST(Warnings, CertificateOfANewerSchemeIsCheckedAsWell) {
  PackageFacts facts = Good();
  NewerSignerFacts newer = {"v2", *facts.jar.certificate};
  facts.newer = {newer};
  EXPECT_EQ(Warnings(facts), Lines());
  newer.certificate.sha256 = "other";
  newer.certificate.subject = "C=US, CN=Android Debug";
  newer.certificate.signature_algorithm = "SHA1withRSA";
  newer.certificate.not_after = -1;
  facts.newer = {newer, newer};
  EXPECT_EQ(Warnings(facts),
            Lines({"debug-key: ", "weak-digest: the certificate is signed with SHA1withRSA",
                   "certificate-expired: 1969-12-31 23:59:59 UTC"}));
  newer.certificate.subject = "O=CN=Android Debug";
  newer.certificate.signature_algorithm = "SHA256withRSA";
  newer.certificate.not_after = {};
  facts.newer = {newer};
  EXPECT_EQ(Warnings(facts), Lines());
}

// The time 1000000000 is 2001-09-09 01:46:40 UTC (`date -u -d @1000000000`). The certificate is
// still valid in the second that notAfter names.
TEST(Warnings, ExpiredCertificateIsReported) {
  const auto told = [](std::optional<int64_t> end, int64_t now) {
    PackageFacts facts = Good();
    facts.jar.certificate->not_after = end;
    Lines codes;
    for (const Reason& each : FindWarnings({}, facts, ReportOf(facts), now)) {
      codes.push_back(std::string(each.cause->code) + ": " + each.detail);
    }
    return codes;
  };
  EXPECT_EQ(told(1000000000, 1000000001), Lines({"certificate-expired: 2001-09-09 01:46:40 UTC"}));
  EXPECT_EQ(told(1000000000, 1000000000), Lines());
  EXPECT_EQ(told({}, 1000000001), Lines());
}

// ---- Encrypted entries.

TEST(Warnings, EncryptedEntriesAreNotCalledDamaged) {
  PackageFacts facts = Good();
  facts.entries = {{{"secret", 1, true, true}, true, false, EntryDigest::kNotCompared}};
  EXPECT_EQ(Warnings(facts), Lines({"entries-encrypted: 1 entry: secret"}));
}
