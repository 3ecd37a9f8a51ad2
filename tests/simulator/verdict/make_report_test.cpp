#include "simulator/verdict/make_report.h"

#include <gtest/gtest.h>

#include <cerrno>

#include "simulator/verdict/made_report.h"

using namespace simulator;

TEST(MakeReport, GoodPackageIsSigned) {
  const Report report =
      Made({kLibrariesStart, kTakesUp, Integrity("1f"), Sign(kLibrary, kPackagePayload), kFileStart,
            kTakesUp, Integrity("1f"), Sign(kFile, kPackagePayload), Register(0)});
  EXPECT_EQ(report.verdict, Verdict::kSigned);
  EXPECT_EQ(ItemsOf(report), Lines({"package done", "lib/arm64/libfoo.so done", "com.app done"}));
  EXPECT_EQ(report.file, "base.apk");
  EXPECT_EQ(report.path, kFile);
}

TEST(MakeReport, TrustedJarIsGoodWithoutAnAndroidManifest) {
  const Report report = Made({Log(6, "Can't extract Android Manifest: Entry not found\n"),
                              kLibrariesStart, Log(6, "VeltSignJni: malformed apk: /a\n"),
                              kFileStart, Verify(0), Sign(kFile, kNoData)});
  EXPECT_EQ(report.verdict, Verdict::kTrustedJar);
  EXPECT_EQ(ItemsOf(report), Lines({"JAR done"}));
}

TEST(MakeReport, JarThatTheKernelDoesNotTrustIsRefused) {
  const Report report = Made({Log(6, "Can't extract Android Manifest: Entry not found\n"),
                              Verify(ENOKEY), Log(4, "VELT can't verify a file\n")});
  EXPECT_EQ(report.verdict, Verdict::kNotTrustedJar);
  EXPECT_EQ(ItemsOf(report),
            Lines({"JAR refused jar-not-trusted ENOKEY: Required key not available"}));
}

TEST(MakeReport, DamagedAndroidManifestHasItsOwnReason) {
  EXPECT_EQ(
      Items({Log(6, "Can't extract Android Manifest: Inconsistent information\n"), Verify(ENOKEY)}),
      Lines({"JAR refused android-manifest-damaged"}));
}

TEST(MakeReport, TrustedJarThatTheKernelDoesNotSignIsRefused) {
  const Report report = Made({Verify(0), Sign(kFile, kNoData, EPERM)});
  EXPECT_EQ(report.verdict, Verdict::kRefused);
  EXPECT_EQ(ItemsOf(report), Lines({"JAR refused kernel-refused EPERM: Operation not permitted"}));
}

TEST(MakeReport, ErrorAfterTheVerificationOfAJarCounts) {
  const Report report = Made({kFileStart, Verify(0), Sign(kFile, kNoData),
                              Log(4, "VeltSign finished: 0.\n"), Log(6, "odd\n")});
  EXPECT_EQ(report.verdict, Verdict::kPartlySigned);
  EXPECT_EQ(ItemsOf(report), Lines({"JAR done", "tool refused tool-error odd"}));
}

TEST(MakeReport, DamagedEntriesAreRefusedOnlyIfTheUserIsStrict) {
  PackageFacts facts;
  facts.entries = {{{"res/a", 1, true}, true, false}, {{"res/b", 1, true}, true, false}};
  const Report report = Made({Sign(kFile, kPackagePayload)}, facts);
  EXPECT_EQ(report.verdict, Verdict::kSigned);
  ASSERT_EQ(report.warnings.size(), 1U);
  EXPECT_EQ(report.warnings[0].Text(),
            "the archive is damaged and cannot be read at 2 entries: res/a, ...");
  const Report strict = Made({Sign(kFile, kPackagePayload)}, facts, {true});
  EXPECT_EQ(strict.verdict, Verdict::kPartlySigned);
  EXPECT_TRUE(strict.warnings.empty());
  EXPECT_EQ(ItemsOf(strict),
            Lines({"package done", "entries refused entries-damaged 2 entries: res/a, ..."}));
}

TEST(MakeReport, OtherWarningsAreNotRefusedIfTheUserIsStrict) {
  PackageFacts facts;
  facts.too_long = {"a"};
  const Report report = Made({kFileStart, Sign(kFile, kPackagePayload)}, facts, {true});
  EXPECT_EQ(ItemsOf(report), Lines({"package done"}));
  ASSERT_EQ(report.warnings.size(), 1U);
  EXPECT_EQ(report.warnings[0].cause, &cause::kNotLookedInto);
}

TEST(MakeReport, ErrorThatExplainsNoOtherLineIsAToolError) {
  EXPECT_EQ(Items({kFileStart, Sign(kFile, kPackagePayload), Log(6, "Can't open file: x\n")}),
            Lines({"package done", "tool refused tool-error Can't open file: x"}));
}

TEST(MakeReport, IntegrityValuesAreReadAsTheToolReadsThem) {
  const auto reason = [](const Json& value) {
    return Items({kFileStart, kTakesUp, Integrity(value), CannotSign(2)})[0];
  };
  EXPECT_EQ(reason("0"), "package refused integrity-zero");
  EXPECT_EQ(reason("0x00"), "package refused integrity-zero");
  EXPECT_EQ(reason("none"), "package refused integrity-unreadable none");
  EXPECT_EQ(reason(""), "package refused integrity-unreadable");
  EXPECT_EQ(reason(nullptr), "package refused integrity-missing");
}

// The report has the payload that the kernel accepted for the package. If the kernel accepted no
// payload for the package, the report has the payload of the first library that the kernel signed.
// The report's key is the key whose digest this payload contains. If the kernel signed nothing, the
// report has no payload. The report's key is then the key that the tool's own code reads from the
// package.
TEST(MakeReport, KeyIsTheOneThatTheKernelGot) {
  const std::string own(64, 'a'), other(64, 'b');
  PackageFacts facts = WithLibraries({"lib/arm64-v8a/libfoo.so"});
  facts.jar.key = ToolKey{own, 256, 2048, 65537, false};
  const auto told = [&facts](const Events& events) {
    const Report report = Made(events, facts);
    return report.key->sha256.substr(0, 1) + " " + std::to_string(report.key->bits) +
           (report.key->was_got ? " got " : " not got ") + report.payload.substr(0, 5);
  };
  const Events library = {kLibrariesStart, kTakesUp, Sign(kLibrary, "2000" + other)};
  EXPECT_EQ(told({kFileStart, kTakesUp, Sign(kFile, "2000" + own)}), "a 2048 got 2000a");
  EXPECT_EQ(told({kFileStart, kTakesUp, Sign(kFile, "2000" + other)}), "b 0 got 2000b");
  EXPECT_EQ(told({kFileStart, kTakesUp, Sign(kFile, "2000" + other, EPERM)}), "a 2048 not got ");
  EXPECT_EQ(
      told({library[0], library[1], library[2], kFileStart, kTakesUp, Sign(kFile, "2000" + own)}),
      "a 2048 got 2000a");
  EXPECT_EQ(told({library[0], library[1], library[2], kFileStart, kTakesUp,
                  Sign(kFile, "2000" + own, EPERM)}),
            "b 0 got 2000b");
  EXPECT_EQ(told({Log(6, "Can't validate manifest.\n")}), "a 2048 not got ");
}

// If the kernel answers several times for one file, each answer counts. An answer for a library
// counts even if the library's path is not known.
TEST(MakeReport, EachAnswerOfTheKernelCounts) {
  const std::string refused = "kernel-refused EPERM: Operation not permitted";
  EXPECT_EQ(Items({kFileStart, kTakesUp, Sign(kFile, kPackagePayload, EPERM),
                   Sign(kFile, kPackagePayload)}),
            Lines({"package refused " + refused, "base.apk done"}));
  EXPECT_EQ(Items({kFileStart, kTakesUp, Sign(kFile, kPackagePayload),
                   Sign(kFile, kPackagePayload, EPERM)}),
            Lines({"package done", "base.apk refused " + refused}));
  EXPECT_EQ(Items({kLibrariesStart, kTakesUp, Sign("", kPackagePayload, EPERM), CannotSign(EPERM),
                   kFileStart, kTakesUp, Sign(kFile, kPackagePayload)}),
            Lines({"package done", " refused " + refused}));
}

TEST(MakeReport, KernelRefusalsNameTheError) {
  EXPECT_EQ(Items({kLibrariesStart, kTakesUp, Integrity("1f"),
                   Sign(kLibrary, kPackagePayload, EPERM), CannotSign(1), kFileStart, kTakesUp,
                   Integrity("1f"), Sign(kFile, kPackagePayload, EACCES), CannotSign(13)}),
            Lines({"package refused kernel-refused EACCES: Permission denied",
                   "lib/arm64/libfoo.so refused kernel-refused EPERM: Operation not permitted"}));
}

TEST(MakeReport, KeyThatIsKnownAlreadyIsRegistered) {
  EXPECT_EQ(Items({Sign(kFile, kPackagePayload), Register(65540)})[1], "com.app done");
}

TEST(MakeReport, KeyThatLibzuRefusesMakesThePackagePartlySigned) {
  const Report report =
      Made({kFileStart, Sign(kFile, kPackagePayload), Log(4, "VeltSign finished: 0.\n"),
            Register(65541), Log(6, "ZuAddCertificate: ZuNewCertificate failed 65541.\n")});
  EXPECT_EQ(report.verdict, Verdict::kPartlySigned);
  EXPECT_EQ(ItemsOf(report), Lines({"package done", "com.app refused registration-refused 65541"}));
}

TEST(MakeReport, KeyOfARefusedPackageIsRefused) {
  EXPECT_EQ(Items({Log(6, "Can't load manifest: size=3\n"), kFileStart,
                   Log(4, "VeltSign finished: 65536.\n"),
                   Log(6, "Apk archive is not valid for fd=3, path=/a\n")}),
            Lines({"package refused manifest-malformed", " refused package-refused"}));
}

TEST(MakeReport, OnlyTheToolsOwnErrorsCount) {
  EXPECT_EQ(Made({Log(6, "bad", "ziparchive"), Log(5, "so so"), Sign(kFile, "0100ab")}).verdict,
            Verdict::kSigned);
  EXPECT_EQ(Items({Log(7, "worse"), Sign(kFile, kPackagePayload)}),
            Lines({"package done", "tool refused tool-error worse"}));
}

TEST(MakeReport, FailedAndKilledToolsAreReported) {
  const Json failed = {{"event", "exit"}, {"status", 1}};
  const Json killed = {{"event", "exit"}, {"signal", 11}};
  const Report report = Made({Sign(kFile, kPackagePayload)}, {}, {}, failed);
  EXPECT_EQ(report.verdict, Verdict::kPartlySigned);
  EXPECT_EQ(ItemsOf(report)[1], "tool refused tool-failed 1");
  EXPECT_EQ(ItemsOf(Made({}, {}, {}, killed)),
            Lines({"package refused not-reached", "tool refused tool-killed 11"}));
}

TEST(MakeReport, FileThatWasNotLookedAtHasAReason) {
  const auto item = [](int error, bool is_read_only, bool has_standard_input) {
    PackageFacts facts;
    facts.error = error;
    facts.is_read_only = is_read_only;
    RunRecord record = Record({});
    record.has_standard_input = has_standard_input;
    const Report report = MakeReport(record, facts, {});
    EXPECT_EQ(report.verdict, Verdict::kNotLookedAt);
    return ItemsOf(report)[0];
  };
  EXPECT_EQ(item(ENOENT, false, true), "file refused file-missing");
  EXPECT_EQ(item(EACCES, false, true), "file refused file-no-permission");
  EXPECT_EQ(item(EPERM, false, true), "file refused file-no-permission");
  EXPECT_EQ(item(EWOULDBLOCK, false, true), "file refused file-leased");
  EXPECT_EQ(item(ENOTDIR, false, true), "file refused file-not-opened ENOTDIR: Not a directory");
  EXPECT_EQ(item(ELOOP, false, true),
            "file refused file-not-opened ELOOP: Too many levels of symbolic links");
  EXPECT_EQ(item(0, true, true), "file refused read-only-file-system");
  EXPECT_EQ(item(0, true, false), "file refused standard-input-closed");
}

TEST(MakeReport, DirectoryWithoutPackagesWasNotLookedAt) {
  RunRecord record = Record({});
  record.has_no_packages = true;
  const Report report = MakeReport(record, {}, {});
  EXPECT_EQ(report.verdict, Verdict::kNotLookedAt);
  EXPECT_EQ(ItemsOf(report), Lines({"file refused no-packages"}));
}

TEST(MakeReport, FileOfASilentOrFailedToolIsNotSimulated) {
  const Report report = Made({});
  EXPECT_EQ(report.verdict, Verdict::kNotSimulated);
  EXPECT_EQ(ItemsOf(report), Lines({"tool refused tool-silent"}));
  PackageFacts missing;
  missing.error = ENOENT;
  const Report failed = Made({}, missing, {}, {{"event", "exit"}, {"status", 1}});
  EXPECT_EQ(failed.verdict, Verdict::kNotSimulated);
  EXPECT_EQ(ItemsOf(failed), Lines({"tool refused tool-failed 1"}));
}

TEST(MakeReport, FailureOfTheSimulationIsNoVerdictOnTheFile) {
  RunRecord record = Record({Sign(kFile, kPackagePayload)});
  record.failure = {Failure::Kind::kTimedOut, "2 seconds"};
  const Report report = MakeReport(record, {}, {});
  EXPECT_EQ(report.verdict, Verdict::kNotSimulated);
  EXPECT_EQ(report.items[0].reason.Text(), "it was still busy after 2 seconds and was stopped");
  record.failure = {Failure::Kind::kInterrupted, ""};
  EXPECT_EQ(MakeReport(record, {}, {}).items[0].reason.Text(), "it was interrupted");
}

TEST(MakeReport, EachFailureHasItsCause) {
  const std::vector<std::pair<Failure::Kind, const Cause*>> rows = {
      {Failure::Kind::kNotStarted, &cause::kToolNotStarted},
      {Failure::Kind::kTimedOut, &cause::kToolTimedOut},
      {Failure::Kind::kInterrupted, &cause::kInterrupted},
      {Failure::Kind::kStandInsMissing, &cause::kStandInsMissing},
      {Failure::Kind::kStateNotKept, &cause::kStateNotKept},
      {Failure::Kind::kNotInstalled, &cause::kNotInstalled},
      {Failure::Kind::kChanged, &cause::kFileChanged}};
  for (const auto& [kind, why] : rows) {
    RunRecord record = Record({Sign(kFile, kPackagePayload)});
    record.failure = {kind, "x"};
    const Report report = MakeReport(record, {}, {});
    EXPECT_EQ(report.verdict, Verdict::kNotSimulated);
    EXPECT_EQ(report.items[0].reason.cause, why);
  }
}

TEST(MakeReport, FileThatShrankWhileItWasReadHasNoResult) {
  PackageFacts facts;
  facts.was_changed = true;
  const Report report = Made({kFileStart, Sign(kFile, kPackagePayload)}, facts);
  EXPECT_EQ(report.verdict, Verdict::kNotSimulated);
  EXPECT_EQ(report.items[0].reason.cause, &cause::kFileChanged);
}

TEST(MakeReport, EachVerdictHasItsExitStatus) {
  EXPECT_EQ(StatusOf(Verdict::kSigned), 0);
  EXPECT_EQ(StatusOf(Verdict::kOtherSigner), 0);
  EXPECT_EQ(StatusOf(Verdict::kTrustedJar), 0);
  EXPECT_EQ(StatusOf(Verdict::kPartlySigned), 1);
  EXPECT_EQ(StatusOf(Verdict::kNotInstallable), 1);
  EXPECT_EQ(StatusOf(Verdict::kNotAccepted), 1);
  EXPECT_EQ(StatusOf(Verdict::kRefused), 1);
  EXPECT_EQ(StatusOf(Verdict::kNotTrustedJar), 1);
  EXPECT_EQ(StatusOf(Verdict::kNotSimulated), 3);
  EXPECT_EQ(StatusOf(Verdict::kNotLookedAt), 4);
}

TEST(MakeReport, MalformedEventsAreIgnored) {
  const Report report = MakeReport(TakeApart({{{"event", 5}},
                                              {{"event", "sign"}, {"path", 7}, {"result", "no"}},
                                              {{"no", "event"}},
                                              {{"event", "log"}, {"priority", "6"}}}),
                                   {}, {});
  EXPECT_EQ(report.items.size(), 1U);
}
