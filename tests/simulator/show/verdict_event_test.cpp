#include "simulator/show/verdict_event.h"

#include <gtest/gtest.h>

#include "simulator/phone/probe_run.h"

using namespace simulator;

namespace {

// A report with something of everything.
Report WholeReport() {
  Report report;
  report.file = "base.apk";
  report.path = "/data/app/od\xe9\".apk";
  report.verdict = Verdict::kPartlySigned;
  report.package_name = "com.app";
  report.items = {
      {ItemKind::kPackage, "package", "", ItemState::kDone, {}},
      {ItemKind::kLibrary,
       "lib/arm64/a.so",
       "lib/arm64-v8a/a.so",
       ItemState::kRefused,
       {&cause::kKernelRefused, "EPERM"}},
      {ItemKind::kLibrary,
       "lib/arm/a.so",
       "lib/armeabi/a.so",
       ItemState::kAbsent,
       {&cause::kLibraryMissing, ""}},
      {ItemKind::kLibrary,
       "lib/x86/a.so",
       "lib/x86/a.so",
       ItemState::kNothing,
       {&cause::kLibraryOtherAbi, ""}},
      {ItemKind::kKey, "com.app", "", ItemState::kDone, {}},
  };
  report.warnings = {{&cause::kSigningBlockDamaged, ""}};
  report.signer.emplace();
  report.signer->subject = "CN=a";
  report.signer->sha256 = "11";
  report.signer->key = {"RSA", 2048, "22", "33", ""};
  report.newer = {{"v2", *report.signer}};
  report.newer[0].certificate.key = {"EC", 256, "44", "", ""};
  report.protection.verified = {1, 2};
  report.chain = {{"key", LinkState::kHolds, "RSA-2048"}, {"entries", LinkState::kBroken, "x"}};

  return report;
}

}  // namespace

TEST(VerdictEvent, HoldsTheWholeReport) {
  const Json event = ParseJournal(VerdictEvent(WholeReport())).at(0);
  EXPECT_EQ(event["event"], "verdict");
  EXPECT_EQ(event["file"], "base.apk");
  EXPECT_EQ(event["path"], "/data/app/od\uf7e9\".apk");
  EXPECT_EQ(event["verdict"], "partly-signed");
  EXPECT_EQ(event["status"], 1);
  EXPECT_EQ(event["package"], "com.app");
  EXPECT_EQ(event["items"], Json::parse(R"json([
    {"kind": "package", "name": "package", "state": "signed"},
    {"kind": "library", "name": "lib/arm64/a.so", "entry": "lib/arm64-v8a/a.so",
     "state": "refused", "reason": "kernel-refused", "text": "the kernel refused (EPERM)"},
    {"kind": "library", "name": "lib/arm/a.so", "entry": "lib/armeabi/a.so", "state": "absent",
     "reason": "library-missing",
     "text": "it does not lie beside the package, where others are"},
    {"kind": "library", "name": "lib/x86/a.so", "entry": "lib/x86/a.so",
     "state": "nothing-to-sign", "reason": "library-other-abi",
     "text": "no phone of this kind installs it"},
    {"kind": "key", "name": "com.app", "state": "registered"}])json"));
  EXPECT_EQ(event["warnings"], Json::parse(R"([{"reason": "signing-block-damaged",
    "text": "the block of the schemes after v1 does not read"}])"));
  EXPECT_EQ(event["signers"], Json::parse(R"([
    {"scheme": "v1", "subject": "CN=a", "certificate_sha256": "11", "key_algorithm": "RSA",
     "key_bits": 2048, "key_sha256": "22", "modulus_sha256": "33"},
    {"scheme": "v2", "subject": "CN=a", "certificate_sha256": "11", "key_algorithm": "EC",
     "key_bits": 256, "key_sha256": "44"}])"));
  EXPECT_EQ(event["protection"]["verified"], Json::parse(R"({"entries": 1, "bytes": 2})"));
  EXPECT_EQ(event["chain"], Json::parse(R"([
    {"link": "key", "state": "holds", "text": "RSA-2048"},
    {"link": "entries", "state": "broken", "text": "x"}])"));
}

TEST(VerdictEvent, IsOneLine) {
  Report report;
  report.package_name = "a\nb";
  const std::string line = VerdictEvent(report);
  EXPECT_EQ(line.find('\n'), line.size() - 1);
}

TEST(VerdictEvent, EveryVerdictHasACode) {
  EXPECT_STREQ(CodeOf(Verdict::kSigned), "signed");
  EXPECT_STREQ(CodeOf(Verdict::kRefused), "refused");
  EXPECT_STREQ(CodeOf(Verdict::kTrustedJar), "trusted-jar");
  EXPECT_STREQ(CodeOf(Verdict::kNotTrustedJar), "not-trusted-jar");
  EXPECT_STREQ(CodeOf(Verdict::kNotLookedAt), "not-looked-at");
  EXPECT_STREQ(CodeOf(Verdict::kNotSimulated), "not-simulated");
}
