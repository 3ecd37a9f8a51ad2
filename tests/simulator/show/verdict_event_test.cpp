#include "simulator/show/verdict_event.h"

#include <gtest/gtest.h>

#include "simulator/phone/probe_run.h"

using namespace simulator;

namespace {

// A report with values for every part of the event.
Report WholeReport() {
  Report report;
  report.file = "base.apk";
  report.path = "/data/app/od\xe9\".apk";
  report.file_size = 77;
  report.file_sha256 = "66";
  report.tool = {true, "88"};
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
  report.signer->sha1 = "55";
  report.signer->key = {"RSA", 2048, "22", "33"};
  report.newer = {{"v2", *report.signer}};
  report.newer[0].certificate.key = {"EC", 256, "44", ""};
  report.newer.push_back({"v3", *report.signer});
  RangeJudgement old, newer;
  old.levels = {27, 29};
  old.is_verified = true;
  old.schemes = {"v2"};
  old.signers = {{"v2", *report.signer}};
  old.warnings = {{"A_WARNING", {}, "beware"}};
  newer.levels = {30, kNewestLevel};
  newer.errors = {{"A_FAULT", {"a", "b"}, "a b"}};
  report.installer = {Judgement::State::kJudged, "", {old, newer}};
  report.payload = "2000ab";
  report.key = {"ab", 2048, true};
  report.protection.verified = {1, 2};
  report.protection.vouched = {3, 4};
  report.protection.differing = {10, 20};
  report.protection.differing_seen = 9;
  report.protection.differing_names = {"a"};
  report.protection.uncompared = {100, 200};
  report.protection.missing_names = {"b"};
  report.protection.unlisted_names = {"c"};
  report.protection.unlisted = {5, 6};
  report.protection.signature = {7, 8};
  report.chain = {{"key", LinkState::kHolds, "RSA-2048"},
                  {"entries", LinkState::kBroken, "x"},
                  {"manifest", LinkState::kNotReached, "y"}};
  return report;
}

}  // namespace

// The event is compared as a whole, so that the test notices each member that is added, lost or
// confused with another member.
TEST(VerdictEvent, HoldsTheWholeReport) {
  const Json event = ParseJournal(VerdictEvent(WholeReport())).at(0);
  EXPECT_EQ(event, Json::parse(R"json({
    "event": "verdict", "file": "base.apk", "path": "/data/app/od\uf7e9\".apk",
    "size": 77, "sha256": "66", "version": ")json" APKTOOLKIT_VERSION R"json(",
    "tool": {"sha256": "88", "version": ")json" APKTOOLKIT_VERSION R"json("},
    "verdict": "partly-signed", "status": 1, "package": "com.app", "payload": "2000ab",
    "items": [
      {"kind": "package", "name": "package", "state": "signed"},
      {"kind": "library", "name": "lib/arm64/a.so", "entry": "lib/arm64-v8a/a.so",
       "state": "refused", "reason": "kernel-refused", "text": "the kernel refused (EPERM)",
       "cure": "The file was good. docs/guide.md, \"When the kernel refuses\", says where to look."},
      {"kind": "library", "name": "lib/arm/a.so", "entry": "lib/armeabi/a.so", "state": "absent",
       "reason": "library-missing",
       "text": "it is not beside the package, but other libraries are",
       "cure": "Install the package again, unless the installer leaves this library out on purpose."},
      {"kind": "library", "name": "lib/x86/a.so", "entry": "lib/x86/a.so",
       "state": "nothing-to-sign", "reason": "library-other-abi",
       "text": "the tool knows no directory for its ABI",
       "cure": "Nothing to do."},
      {"kind": "key", "name": "com.app", "state": "registered"}],
    "warnings": [{"reason": "signing-block-damaged",
                  "text": "its signing block (v2 and later) is damaged",
                  "cure": "Sign the package again."}],
    "signers": [
      {"scheme": "v1", "subject": "CN=a", "certificate_sha256": "11", "certificate_sha1": "55",
       "key_algorithm": "RSA",
       "key_bits": 2048, "key_sha256": "22", "modulus_sha256": "ab"},
      {"scheme": "v2", "subject": "CN=a", "certificate_sha256": "11", "certificate_sha1": "55",
       "key_algorithm": "EC",
       "key_bits": 256, "key_sha256": "44"},
      {"scheme": "v3", "subject": "CN=a", "certificate_sha256": "11", "certificate_sha1": "55",
       "key_algorithm": "RSA",
       "key_bits": 2048, "key_sha256": "22", "modulus_sha256": "33"}],
    "installer": {"state": "judged", "levels": [
      {"first": 27, "last": 29, "installs": true,
       "signers": [{"scheme": "v2", "subject": "CN=a", "certificate_sha256": "11",
                    "certificate_sha1": "55", "key_algorithm": "RSA", "key_bits": 2048, "key_sha256": "22",
                    "modulus_sha256": "33"}],
       "errors": [], "warnings": [{"issue": "A_WARNING", "parameters": [], "text": "beware"}]},
      {"first": 30, "installs": false, "signers": [],
       "errors": [{"issue": "A_FAULT", "parameters": ["a", "b"], "text": "a b"}],
       "warnings": []}]},
    "protection": {
      "verified": {"entries": 1, "bytes": 2}, "vouched": {"entries": 113, "bytes": 224},
      "unlisted": {"entries": 5, "bytes": 6}, "signature": {"entries": 7, "bytes": 8}},
    "entries": {
      "matching": {"entries": 4, "bytes": 6, "looked_at": 1},
      "differing": {"entries": 10, "bytes": 20, "looked_at": 9, "names": ["a"]},
      "missing": {"entries": 1, "names": ["b"]},
      "unlisted": {"entries": 5, "bytes": 6, "names": ["c"]},
      "uncompared": {"entries": 100, "bytes": 200}},
    "chain": [
      {"link": "key", "state": "holds", "text": "RSA-2048"},
      {"link": "entries", "state": "broken", "text": "x"},
      {"link": "manifest", "state": "not-reached", "text": "y"}]})json"));
}

// The simulator knows the version of only one tool: the tool beside the simulator.
TEST(VerdictEvent, OtherToolHasADigestAndNoVersion) {
  Report report;
  report.tool = {false, "88"};
  EXPECT_EQ(ParseJournal(VerdictEvent(report)).at(0)["tool"], Json::parse(R"({"sha256": "88"})"));
}

TEST(VerdictEvent, IsOneLine) {
  Report report;
  report.package_name = "a\nb";
  const std::string line = VerdictEvent(report);
  EXPECT_EQ(line.find('\n'), line.size() - 1);
}

TEST(VerdictEvent, EveryVerdictHasACodeAndAStatus) {
  const auto code = [](Verdict verdict) {
    Report report;
    report.verdict = verdict;
    const Json event = ParseJournal(VerdictEvent(report)).at(0);
    return event["verdict"].get<std::string>() + " " + event["status"].dump();
  };
  EXPECT_EQ(code(Verdict::kSigned), "signed 0");
  EXPECT_EQ(code(Verdict::kOtherSigner), "other-signer 0");
  EXPECT_EQ(code(Verdict::kNotInstallable), "not-installable 1");
  EXPECT_EQ(code(Verdict::kNotAccepted), "not-accepted 1");
  EXPECT_EQ(code(Verdict::kTrustedJar), "trusted-jar 0");
  EXPECT_EQ(code(Verdict::kPartlySigned), "partly-signed 1");
  EXPECT_EQ(code(Verdict::kRefused), "refused 1");
  EXPECT_EQ(code(Verdict::kNotTrustedJar), "not-trusted-jar 1");
  EXPECT_EQ(code(Verdict::kNotLookedAt), "not-looked-at 4");
  EXPECT_EQ(code(Verdict::kNotSimulated), "not-simulated 3");
}

TEST(VerdictEvent, EveryKindAndStateHasACode) {
  const auto item = [](ItemKind kind, ItemState state) {
    Report report;
    report.items = {{kind, "", "", state, {}}};
    const Json made = ParseJournal(VerdictEvent(report)).at(0)["items"][0];
    return made["kind"].get<std::string>() + " " + made["state"].get<std::string>();
  };
  EXPECT_EQ(item(ItemKind::kPackage, ItemState::kDone), "package signed");
  EXPECT_EQ(item(ItemKind::kJar, ItemState::kRefused), "jar refused");
  EXPECT_EQ(item(ItemKind::kFile, ItemState::kRefused), "file refused");
  EXPECT_EQ(item(ItemKind::kEntries, ItemState::kRefused), "entries refused");
  EXPECT_EQ(item(ItemKind::kLibrary, ItemState::kAbsent), "library absent");
  EXPECT_EQ(item(ItemKind::kKey, ItemState::kDone), "key registered");
  EXPECT_EQ(item(ItemKind::kKey, ItemState::kRefused), "key refused");
  EXPECT_EQ(item(ItemKind::kTool, ItemState::kNothing), "tool nothing-to-sign");
  EXPECT_EQ(item(ItemKind::kInstaller, ItemState::kRefused), "installer refused");
  EXPECT_EQ(item(ItemKind::kSigner, ItemState::kRefused), "signer refused");
  EXPECT_EQ(item(ItemKind::kWarnings, ItemState::kRefused), "warnings refused");
}

TEST(VerdictEvent, EveryStateOfALinkHasACode) {
  Report report;
  report.chain = {{"a", LinkState::kHolds, ""},
                  {"b", LinkState::kBroken, ""},
                  {"c", LinkState::kNotReached, ""}};
  const Json chain = ParseJournal(VerdictEvent(report)).at(0)["chain"];
  EXPECT_EQ(chain[0]["state"], "holds");
  EXPECT_EQ(chain[1]["state"], "broken");
  EXPECT_EQ(chain[2]["state"], "not-reached");
}

// If the report has a key but no certificate, the event still lists a signer of scheme v1. This
// signer has the digest of the key's modulus.
TEST(VerdictEvent, KeyWithoutACertificateIsReportedAsV1Signer) {
  Report report;
  report.key = {"ab", 2048, true};
  const Json signers = ParseJournal(VerdictEvent(report)).at(0)["signers"];
  ASSERT_EQ(signers.size(), 1U);
  EXPECT_EQ(signers[0]["scheme"], "v1");
  EXPECT_EQ(signers[0]["modulus_sha256"], "ab");
  EXPECT_EQ(signers[0]["subject"], "");
}
