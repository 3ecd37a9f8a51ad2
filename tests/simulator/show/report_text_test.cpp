#include "simulator/show/report_text.h"

#include <gtest/gtest.h>

#include <sstream>

#include "simulator/phone/probe_run.h"
#include "simulator/show/hostile_report.h"

using namespace simulator;

namespace {

const Look kUtf8 = {false, true};
const Look kAscii = {false, false};

std::string Printed(const Report& report, const Look& look = kUtf8,
                    Detail detail = Detail::kUsual) {
  std::ostringstream out;
  PrintReport(report, detail, look, out);
  return out.str();
}

// A report with items that are done, one refused item, and one item that has nothing to sign. The
// report has no signer and no events.
Report Example() {
  Report report;
  report.file = "base.apk";
  report.path = "/data/app/base.apk";
  report.verdict = Verdict::kPartlySigned;
  report.package_name = "com.example.vault";
  report.items = {
      {ItemKind::kPackage, "package", "", ItemState::kDone, {}},
      {ItemKind::kLibrary, "lib/arm/libvault.so", "", ItemState::kDone, {}},
      {ItemKind::kLibrary,
       "lib/arm64/libvault.so",
       "",
       ItemState::kRefused,
       {&cause::kLibraryChanged, ""}},
      {ItemKind::kLibrary,
       "lib/x86_64/libvault.so",
       "",
       ItemState::kNothing,
       {&cause::kLibraryOtherAbi, ""}},
      {ItemKind::kKey, "com.example.vault", "", ItemState::kDone, {}},
  };
  return report;
}

CertificateFacts Signer() {
  CertificateFacts signer;
  signer.subject = "CN=Vault";
  signer.sha256 = std::string(64, 'c');
  signer.key.algorithm = "RSA";
  signer.key.bits = 2048;
  signer.key.sha256 = std::string(64, 'a');
  signer.key.modulus_sha256 = "98302ce8" + std::string(50, '0') + "f64646";
  return signer;
}

}  // namespace

TEST(ReportText, HasTheVerdictTheItemsAndWhatToDo) {
  EXPECT_EQ(
      Printed(Example()),
      "PARTLY SIGNED  base.apk   lib/arm64/libvault.so: its bytes are not those that the manifest "
      "lists\n"
      "  ✓ package                 signed with the payload of the signer's key\n"
      "  ✓ lib/arm/libvault.so     signed\n"
      "  ✗ lib/arm64/libvault.so   not signed: its bytes are not those that the manifest "
      "lists\n"
      "      The file beside the package was changed after it was installed. Install\n"
      "      the package again.\n"
      "  – lib/x86_64/libvault.so  nothing to sign: the tool knows no directory for its ABI\n"
      "  ✓ key                     registered for com.example.vault\n");
}

TEST(ReportText, MarksAreAsciiWithoutUtf8) {
  const Lines lines = LinesOf(Printed(Example(), kAscii));
  EXPECT_EQ(lines[1].substr(0, 11), "  + package");
  EXPECT_EQ(lines[3].substr(0, 10), "  x lib/ar");
  EXPECT_EQ(lines[6].substr(0, 10), "  - lib/x8");
}

TEST(ReportText, SignerIsPrintedAsApksignerPrintsIt) {
  Report report = Example();
  report.items.clear();
  report.signer = Signer();
  report.key = {report.signer->key.modulus_sha256, 2048, true};
  report.schemes = {"v1", "v2"};
  report.protection.verified = {2, 100};
  report.protection.unlisted = {1, 1};
  EXPECT_EQ(Printed(report),
            "PARTLY SIGNED  base.apk   com.example.vault   signer CN=Vault, RSA-2048, key "
            "98302ce8…f64646\n"
            "  signer\n"
            "    certificate DN: CN=Vault\n"
            "    certificate SHA-256 digest: " +
                std::string(64, 'c') +
                "\n"
                "    key algorithm: RSA\n"
                "    key size (bits): 2048\n"
                "    public key SHA-256 digest: " +
                std::string(64, 'a') +
                "\n"
                "    modulus SHA-256 digest: 98302ce8" +
                std::string(50, '0') +
                "f64646"
                " (of the modulus alone; the kernel got this digest)\n"
                "    schemes: v1, v2\n"
                "    protects: 2 entries (100 bytes) verified, 0 entries (0 bytes) listed and not "
                "verified, 1 entry (1 byte) not listed\n");
}

TEST(ReportText, QuietPrintsOnlyTheVerdictLine) {
  EXPECT_EQ(
      Printed(Example(), kUtf8, Detail::kVerdict),
      "PARTLY SIGNED  base.apk   lib/arm64/libvault.so: its bytes are not those that the manifest "
      "lists\n");
}

TEST(ReportText, VerboseNamesWhatIsNotListedAndTheChain) {
  Report report = Example();
  report.items.clear();
  report.protection.unlisted_names = {"assets/a", "odd\nname"};
  report.signer = Signer();
  report.key = {report.signer->key.modulus_sha256, 2048, true};
  report.newer = {{"v2", Signer()}};
  report.chain = {{"key", LinkState::kHolds, "RSA-2048"},
                  {"certificate", LinkState::kBroken, "why"},
                  {"manifest", LinkState::kNotReached, "text"}};
  const std::string text = Printed(report, kUtf8, Detail::kAll);
  for (const char* part : {"      not listed: assets/a\n      not listed: odd\\x0aname\n",
                           "  signer of v2\n    certificate DN: CN=Vault\n",
                           "    ✓ key: RSA-2048\n    ✗ certificate: why\n"
                           "    – manifest: not reached\n"}) {
    EXPECT_NE(text.find(part), std::string::npos) << text;
  }
}

TEST(ReportText, WarningsAreYellowAndSayWhatToDo) {
  Report report = Example();
  report.items.clear();
  report.warnings = {{&cause::kSchemesStripped, "v2"}};
  EXPECT_EQ(
      Printed(report, {true, true}),
      "\x1b[33mPARTLY SIGNED\x1b[0m  base.apk   com.example.vault   1 warning\n"
      "\x1b[33m  ! the signature file says that the package is also signed with v2, but it is "
      "not: phones do not install the package\x1b[0m\n"
      "      Sign the package again, as the last step that changes it.\n");
}

TEST(ReportText, RefusalsAreRedAndTheGoodVerdictIsGreen) {
  Report report = Example();
  report.verdict = Verdict::kSigned;
  const Lines lines = LinesOf(Printed(report, {true, true}));
  EXPECT_EQ(lines[0].substr(0, 15), "\x1b[32mSIGNED\x1b[0m");
  EXPECT_EQ(lines[1].substr(0, 2), "  ");
  EXPECT_EQ(lines[3].substr(0, 5), "\x1b[31m");
}

// Names of up to 40 characters set the width of the column, and longer names extend past it.
TEST(ReportText, NamesWidenTheColumnUpTo40Characters) {
  const std::string longest(40, 'l');
  const auto column = [&](const std::string& other) {
    Report report = Example();
    report.items = {{ItemKind::kLibrary, "a", "", ItemState::kDone, {}},
                    {ItemKind::kLibrary, other, "", ItemState::kDone, {}}};
    const Lines lines = LinesOf(Printed(report, kAscii));
    EXPECT_EQ(lines[2], "  + " + other + "  signed");
    return lines[1].find("signed");
  };
  EXPECT_EQ(column("bcd"), 4U + 3 + 2);
  EXPECT_EQ(column(longest), 4U + 40 + 2);
  EXPECT_EQ(column(longest + "l"), 4U + 40 + 2);
}

// Items a and b have the same cause, and its cure is printed once. No cure is printed for item c,
// because its cause follows from another cause. The six lines are the verdict, the three items, and
// the two lines of the cure.
TEST(ReportText, NeighboursWithTheSameCausePrintOneCure) {
  Report report = Example();
  report.items = {
      {ItemKind::kLibrary, "a", "", ItemState::kAbsent, {&cause::kLibraryMissing, ""}},
      {ItemKind::kLibrary, "b", "", ItemState::kAbsent, {&cause::kLibraryMissing, ""}},
      {ItemKind::kLibrary, "c", "", ItemState::kRefused, {&cause::kPackageRefused, ""}}};
  EXPECT_EQ(LinesOf(Printed(report)).size(), 6U);
}

TEST(ReportText, HostileCharactersAreNotPrinted) {
  const Report report = HostileReport(kHostileText);
  for (const Look& look : {kUtf8, kAscii}) {
    const std::string text = Printed(report, look, Detail::kAll);
    EXPECT_EQ(text.find('\x1b'), std::string::npos);
    EXPECT_EQ(text.find('\x07'), std::string::npos);
    EXPECT_EQ(text.find('\xff'), std::string::npos);
    EXPECT_EQ(text.find("\u202e"), std::string::npos);
  }
  for (const char c : Printed(report, kAscii, Detail::kAll)) {
    EXPECT_TRUE(c == '\n' || (c >= 0x20 && c < 0x7f));
  }
}
