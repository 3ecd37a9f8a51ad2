#include "simulator/verdict/make_report.h"

#include <gtest/gtest.h>

#include <cerrno>

#include "apk/native_libraries.h"

#include "simulator/phone/probe_run.h"

using namespace simulator;

namespace {

const std::string kFile = "/data/app/base.apk";
const std::string kLibrary = "/data/app/lib/arm64/libfoo.so";
constexpr char kPackagePayload[] = "0100ab";
constexpr char kNoData[] = "0000";

const Json kStart = {{"event", "start"}, {"file", "base.apk"}, {"path", kFile}};
const Json kExit = {{"event", "exit"}, {"status", 0}};

Json Log(int priority, const std::string& text, const std::string& tag = "ApkToolkit") {
  return {{"event", "log"}, {"priority", priority}, {"tag", tag}, {"text", text}};
}

Json Sign(const std::string& path, const std::string& payload, int error = 0) {
  return {{"event", "sign"},          {"fd", 3},       {"path", path}, {"payload", payload},
          {"result", error ? -1 : 0}, {"errno", error}};
}

Json Verify(int error) {
  return {{"event", "verify"},
          {"fd", 3},
          {"path", kFile},
          {"result", error ? -1 : 0},
          {"errno", error}};
}

Json Integrity(const Json& text) { return {{"event", "integrity"}, {"pid", 0}, {"text", text}}; }

Json Register(int64_t result) {
  return {{"event", "register"}, {"fd", 3},      {"path", kFile},
          {"name", "com.app"},   {"data", "ab"}, {"result", result}};
}

RunRecord Record(Events events, const Json& end = kExit) {
  events.insert(events.begin(), kStart);
  events.push_back(end);
  return TakeApart(events);
}

Report Made(const Events& events, const PackageFacts& facts = {}, const JudgeOptions& options = {},
            const Json& end = kExit) {
  return MakeReport(Record(events, end), facts, options);
}

// "name state code detail", one line for each item.
Lines ItemsOf(const Report& report) {
  Lines lines;
  for (const Item& item : report.items) {
    constexpr const char* kStates[] = {"done", "refused", "absent", "nothing"};
    std::string line = item.name + " " + kStates[static_cast<size_t>(item.state)];
    if (item.reason.cause != nullptr) line += std::string(" ") + item.reason.cause->code;
    if (!item.reason.detail.empty()) line += " " + item.reason.detail;
    lines.push_back(line);
  }
  return lines;
}

Lines Items(const Events& events, const PackageFacts& facts = {}) {
  return ItemsOf(Made(events, facts));
}

// The tool's log lines while it takes up one file for the kernel.
const Json kTakesUp = Log(4, "VeltSignOat: Apk case.\n");
const Json kLibrariesStart = Log(4, "VeltSignJni starts: 3.\n");
const Json kFileStart = Log(4, "VeltSign starts: zip_fd = 3, fd = 3.\n");

Json CannotSign(int error) {
  return Log(6, "VELT can't sign a file (result=10000, errno " + std::to_string(error) + ": x).\n");
}

// The facts of a package with these libraries; opening each gives `error`.
PackageFacts WithLibraries(const Lines& entries, int error = 0, bool has_directory = false) {
  PackageFacts facts;
  for (const std::string& name : entries) {
    const std::string place = ApkTools::InstalledLibraryPath("", name);
    facts.libraries.push_back({name, place, true, error, has_directory});
  }
  return facts;
}

}  // namespace

TEST(MakeReport, GoodPackage) {
  const Report report =
      Made({kLibrariesStart, kTakesUp, Integrity("1f"), Sign(kLibrary, kPackagePayload), kFileStart,
            kTakesUp, Integrity("1f"), Sign(kFile, kPackagePayload), Register(0)});
  EXPECT_EQ(report.verdict, Verdict::kSigned);
  EXPECT_EQ(ItemsOf(report), Lines({"package done", "lib/arm64/libfoo.so done", "com.app done"}));
  EXPECT_EQ(report.file, "base.apk");
  EXPECT_EQ(report.path, kFile);
}

TEST(MakeReport, TrustedJarIsGoodWhateverItLacksOfAPackage) {
  const Report report = Made({Log(6, "Can't extract Android Manifest: Entry not found\n"),
                              kLibrariesStart, Log(6, "VeltSignJni: malformed apk: /a\n"),
                              kFileStart, Verify(0), Sign(kFile, kNoData)});
  EXPECT_EQ(report.verdict, Verdict::kTrustedJar);
  EXPECT_EQ(ItemsOf(report), Lines({"JAR done"}));
}

TEST(MakeReport, JarThatIsNotTrusted) {
  const Report report = Made({Log(6, "Can't extract Android Manifest: Entry not found\n"),
                              Verify(ENOKEY), Log(4, "VELT can't verify a file\n")});
  EXPECT_EQ(report.verdict, Verdict::kNotTrustedJar);
  EXPECT_EQ(ItemsOf(report),
            Lines({"JAR refused jar-not-trusted ENOKEY: Required key not available"}));
}

TEST(MakeReport, DamagedAndroidManifestIsToldFromAJar) {
  EXPECT_EQ(
      Items({Log(6, "Can't extract Android Manifest: Inconsistent information\n"), Verify(ENOKEY)}),
      Lines({"JAR refused android-manifest-damaged"}));
}

TEST(MakeReport, TrustedJarThatTheKernelRefuses) {
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

TEST(MakeReport, LibraryWithOtherBytesIsRefused) {
  const Report report =
      Made({kLibrariesStart, Log(6, "VeltSignJni: File not verified: " + kLibrary + "\n"),
            kFileStart, Sign(kFile, kPackagePayload)});
  EXPECT_EQ(report.verdict, Verdict::kPartlySigned);
  EXPECT_EQ(ItemsOf(report),
            Lines({"package done", "lib/arm64/libfoo.so refused library-changed"}));
  EXPECT_TRUE(report.items[0].is_verified);
  EXPECT_FALSE(report.items[1].is_verified);
}

// The library's item where this is logged of it, and opening it ends like this.
std::string LibraryItem(const std::string& error, int opening = 0, bool has_directory = false,
                        const JudgeOptions& options = {}) {
  const Report report = Made(
      {kLibrariesStart, Log(6, error), Log(6, "VeltSignJni: File not verified: " + kLibrary + "\n"),
       kFileStart, Sign(kFile, kPackagePayload)},
      WithLibraries({"lib/arm64-v8a/libfoo.so"}, opening, has_directory), options);
  const Verdict expected =
      report.items[1].state == ItemState::kRefused ? Verdict::kPartlySigned : Verdict::kSigned;
  EXPECT_EQ(report.verdict, expected);
  return ItemsOf(report)[1];
}

TEST(MakeReport, LinesBeforeALibraryWasNotVerifiedSayWhy) {
  EXPECT_EQ(LibraryItem("Can't read file: x (streamoff=-1)\n"),
            "lib/arm64/libfoo.so refused library-no-file");
  EXPECT_EQ(LibraryItem("Can't find file in META-INF/MANIFEST.MF: x\n"),
            "lib/arm64/libfoo.so refused library-not-listed");
  EXPECT_EQ(LibraryItem("verifyData: Unsupported digest type: MD5-Digest\n"),
            "lib/arm64/libfoo.so refused library-digest");
}

TEST(MakeReport, LibraryThatDoesNotOpenIsRefusedUnlessItIsNotThere) {
  const auto item = [](int error, bool has_directory) {
    return LibraryItem("Can't open file: x\n", error, has_directory).substr(20);
  };
  EXPECT_EQ(item(ENOENT, false), "absent library-not-installed");
  EXPECT_EQ(item(ENOENT, true), "absent library-missing");
  EXPECT_EQ(item(ENOTDIR, false), "absent library-not-installed");
  EXPECT_EQ(item(EACCES, true), "refused library-no-permission");
  EXPECT_EQ(item(EPERM, true), "refused library-no-permission");
  EXPECT_EQ(item(EWOULDBLOCK, true), "refused library-leased");
  EXPECT_EQ(item(ELOOP, true),
            "refused library-not-opened ELOOP: Too many levels of symbolic links");
  EXPECT_EQ(item(0, true), "refused library-not-opened why is not known");
}

TEST(MakeReport, LibraryThatIsNotThereIsRefusedWhereTheUserIsStrict) {
  EXPECT_EQ(LibraryItem("Can't open file: x\n", ENOENT, false, {true}),
            "lib/arm64/libfoo.so refused library-not-installed");
  EXPECT_EQ(LibraryItem("Can't open file: x\n", ENOENT, true, {true}),
            "lib/arm64/libfoo.so refused library-missing");
}

TEST(MakeReport, LibraryThatThePackageKeepsIsToldApart) {
  PackageFacts facts = WithLibraries({"lib/arm64-v8a/libfoo.so"}, ENOENT);
  facts.manifest.extracts_libraries = false;
  EXPECT_EQ(Items({kLibrariesStart, Log(6, "Can't open file: x\n"),
                   Log(6, "VeltSignJni: File not verified: " + kLibrary + "\n"), kFileStart,
                   Sign(kFile, kPackagePayload)},
                  facts)[1],
            "lib/arm64/libfoo.so absent library-in-package");
}

// The tool's walk ends there, and what comes after is not signed however good it is.
TEST(MakeReport, LibraryBehindADamagedEntryIsRefusedIfItLiesThere) {
  const auto items = [](int error, bool is_strict) {
    PackageFacts facts =
        WithLibraries({"lib/arm64-v8a/liba.so", "lib/arm64-v8a/libb.so", "lib/x86/libc.so"}, error);
    for (LibraryFacts& library : facts.libraries) library.is_met = false;
    facts.libraries[0].is_met = true;
    facts.libraries[0].error = 0;
    return ItemsOf(Made({kLibrariesStart, kTakesUp, Integrity("1f"),
                         Sign("/data/app/lib/arm64/liba.so", kPackagePayload), kFileStart,
                         Sign(kFile, kPackagePayload)},
                        facts, {is_strict}));
  };
  EXPECT_EQ(items(0, false), Lines({"package done", "lib/arm64/liba.so done",
                                    "lib/arm64/libb.so refused library-behind-damage",
                                    "lib/x86/libc.so nothing library-other-abi"}));
  EXPECT_EQ(items(ENOENT, false)[2], "lib/arm64/libb.so absent library-not-installed");
  EXPECT_EQ(items(ENOENT, true)[2], "lib/arm64/libb.so refused library-not-installed");
}

TEST(MakeReport, LibraryThatCannotBeLaidOutIsRefused) {
  RunRecord record = Record({kLibrariesStart, Log(6, "Can't open file: x\n"),
                             Log(6, "VeltSignJni: File not verified: " + kLibrary + "\n"),
                             kFileStart, Sign(kFile, kPackagePayload)});
  record.not_extracted = {"lib/arm64-v8a/libfoo.so"};
  const Report report =
      MakeReport(record, WithLibraries({"lib/arm64-v8a/libfoo.so"}, ENOENT, true), {});
  EXPECT_EQ(report.verdict, Verdict::kPartlySigned);
  EXPECT_EQ(ItemsOf(report)[1], "lib/arm64/libfoo.so refused library-not-extracted");
}

TEST(MakeReport, DamagedEntriesAreADoubtAndForTheStrictARefusal) {
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

TEST(MakeReport, OtherWarningsAreNoRefusalForTheStrict) {
  PackageFacts facts;
  facts.was_changed = true;
  const Report report = Made({kFileStart, Sign(kFile, kPackagePayload)}, facts, {true});
  EXPECT_EQ(ItemsOf(report), Lines({"package done"}));
  ASSERT_EQ(report.warnings.size(), 1U);
  EXPECT_EQ(report.warnings[0].cause, &cause::kFileChanged);
}

TEST(MakeReport, LibraryThatVanishedIsRefused) {
  EXPECT_EQ(Items({kLibrariesStart, Log(6, "File " + kLibrary + " is not opened"),
                   Log(6, "Error 2: No such file or directory.\n"), kFileStart,
                   Sign(kFile, kPackagePayload)})[1],
            "lib/arm64/libfoo.so refused library-not-opened ENOENT: No such file or directory");
}

TEST(MakeReport, EachVanishedLibraryHasItsOwnError) {
  const Lines items = Items({kLibrariesStart, Log(6, "File /data/app/a.so is not opened"),
                             Log(6, "Error 2: x.\n"), Log(6, "File /data/app/b.so is not opened"),
                             Log(6, "Error 13: x.\n"), kFileStart, Sign(kFile, kPackagePayload)});
  EXPECT_EQ(items[1], "a.so refused library-not-opened ENOENT: No such file or directory");
  EXPECT_EQ(items[2], "b.so refused library-not-opened EACCES: Permission denied");
}

TEST(MakeReport, ErrorThatNoLineTellsTheUseOfCounts) {
  EXPECT_EQ(Items({kFileStart, Sign(kFile, kPackagePayload), Log(6, "Can't open file: x\n")}),
            Lines({"package done", "tool refused tool-error Can't open file: x"}));
}

TEST(MakeReport, LibrariesOfOtherProcessorsAreNothingToSign) {
  const PackageFacts facts = WithLibraries({"lib/x86_64/libfoo.so", "lib/armeabi/libfoo.so"});
  const Report report = Made({kLibrariesStart, kTakesUp, Sign("/data/app/lib/arm/libfoo.so", "00"),
                              kFileStart, Sign(kFile, kPackagePayload)},
                             facts);
  EXPECT_EQ(report.verdict, Verdict::kSigned);
  EXPECT_EQ(ItemsOf(report),
            Lines({"package done", "lib/x86_64/libfoo.so nothing library-other-abi",
                   "lib/arm/libfoo.so done"}));
}

TEST(MakeReport, LibrariesOfARefusedPackageFollowIt) {
  const PackageFacts facts = WithLibraries({"lib/arm64-v8a/libfoo.so"});
  const Report report = Made({Log(6, "Can't validate manifest.\n"), kLibrariesStart,
                              Log(6, "VeltSignJni: malformed apk: /a\n"), kFileStart, kTakesUp,
                              Log(4, "VeltSign finished: 65536.\n")},
                             facts);
  EXPECT_EQ(report.verdict, Verdict::kRefused);
  EXPECT_EQ(ItemsOf(report)[1], "lib/arm64/libfoo.so refused package-refused");
  EXPECT_FALSE(report.items[0].is_verified);
}

// The tool names no path when it may not sign; the order of the libraries tells which it was.
TEST(MakeReport, LibrariesThatTheKernelWasNotAskedForAreKnownByTheirOrder) {
  const PackageFacts facts = WithLibraries({"lib/arm64-v8a/liba.so", "lib/arm64-v8a/libb.so"});
  const Report report =
      Made({kLibrariesStart, kTakesUp, Integrity("1f"),
            Sign("/data/app/lib/arm64/liba.so", kPackagePayload), kTakesUp, Integrity("0"),
            CannotSign(2), kFileStart, kTakesUp, Integrity(nullptr), CannotSign(2),
            Log(4, "VeltSign finished: 65536.\n")},
           facts);
  EXPECT_EQ(report.verdict, Verdict::kPartlySigned);
  EXPECT_EQ(ItemsOf(report), Lines({"package refused integrity-missing", "lib/arm64/liba.so done",
                                    "lib/arm64/libb.so refused integrity-zero"}));
}

TEST(MakeReport, LibrariesBehindTheToolsEndAreNotReached) {
  const Report report = Made({kLibrariesStart, kTakesUp, Integrity("1f"),
                              Sign("/data/app/lib/arm64/liba.so", kPackagePayload)},
                             WithLibraries({"lib/arm64-v8a/liba.so", "lib/arm64-v8a/libb.so"}), {},
                             {{"event", "exit"}, {"signal", 9}});
  EXPECT_EQ(ItemsOf(report),
            Lines({"package refused not-reached", "lib/arm64/liba.so done",
                   "lib/arm64/libb.so refused not-reached", "tool refused tool-killed 9"}));
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

// Payload and key are those that the kernel got, with the package or else with a library. The
// tool's own code is asked where it got none.
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

// Of one file as well, and of a library whose path nobody told.
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

TEST(MakeReport, KeyThatLibzuRefuses) {
  const Report report =
      Made({kFileStart, Sign(kFile, kPackagePayload), Log(4, "VeltSign finished: 0.\n"),
            Register(65541), Log(6, "ZuAddCertificate: ZuNewCertificate failed 65541.\n")});
  EXPECT_EQ(report.verdict, Verdict::kPartlySigned);
  EXPECT_EQ(ItemsOf(report), Lines({"package done", "com.app refused registration-refused 65541"}));
}

TEST(MakeReport, KeyOfARefusedPackage) {
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

TEST(MakeReport, EndOfTheToolCounts) {
  const Json failed = {{"event", "exit"}, {"status", 1}};
  const Json killed = {{"event", "exit"}, {"signal", 11}};
  const Report report = Made({Sign(kFile, kPackagePayload)}, {}, {}, failed);
  EXPECT_EQ(report.verdict, Verdict::kPartlySigned);
  EXPECT_EQ(ItemsOf(report)[1], "tool refused tool-failed 1");
  EXPECT_EQ(ItemsOf(Made({}, {}, {}, killed)),
            Lines({"package refused not-reached", "tool refused tool-killed 11"}));
}

TEST(MakeReport, FileThatTheToolDidNotLookAt) {
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

TEST(MakeReport, ToolThatSaysNothingOfAFileThatItCouldOpenIsNotTheTool) {
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
      {Failure::Kind::kNotInstalled, &cause::kNotInstalled}};
  for (const auto& [kind, why] : rows) {
    RunRecord record = Record({Sign(kFile, kPackagePayload)});
    record.failure = {kind, "x"};
    const Report report = MakeReport(record, {}, {});
    EXPECT_EQ(report.verdict, Verdict::kNotSimulated);
    EXPECT_EQ(report.items[0].reason.cause, why);
  }
}

TEST(MakeReport, EachVerdictHasItsStatus) {
  EXPECT_EQ(StatusOf(Verdict::kSigned), 0);
  EXPECT_EQ(StatusOf(Verdict::kTrustedJar), 0);
  EXPECT_EQ(StatusOf(Verdict::kPartlySigned), 1);
  EXPECT_EQ(StatusOf(Verdict::kRefused), 1);
  EXPECT_EQ(StatusOf(Verdict::kNotTrustedJar), 1);
  EXPECT_EQ(StatusOf(Verdict::kNotSimulated), 3);
  EXPECT_EQ(StatusOf(Verdict::kNotLookedAt), 4);
}

TEST(MakeReport, OddEventsAreNoHarm) {
  const Report report = MakeReport(TakeApart({{{"event", 5}},
                                              {{"event", "sign"}, {"path", 7}, {"result", "no"}},
                                              {{"no", "event"}},
                                              {{"event", "log"}, {"priority", "6"}}}),
                                   {}, {});
  EXPECT_EQ(report.items.size(), 1U);
}
