#include "simulator/verdict/make_report.h"

#include <gtest/gtest.h>

#include <cerrno>

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

// What the tool logs while it takes up one file for the kernel.
const Json kTakesUp = Log(4, "VeltSignOat: Apk case.\n");
const Json kLibrariesStart = Log(4, "VeltSignJni starts: 3.\n");
const Json kFileStart = Log(4, "VeltSign starts: zip_fd = 3, fd = 3.\n");

Json CannotSign(int error) {
  return Log(6, "VELT can't sign a file (result=10000, errno " + std::to_string(error) + ": x).\n");
}

PackageFacts WithLibraries(const Lines& entries) {
  PackageFacts facts;
  for (const std::string& name : entries) facts.libraries.push_back({name, 1, 1, false});
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
  const Report report =
      Made({Log(6, "Can't extract Android Manifest: Entry not found\n"), kLibrariesStart,
            Log(6, "VeltSignJni: malformed apk: /a\n"), Verify(0), Sign(kFile, kNoData)});
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
}

struct LibraryRow {
  const char* error;
  const char* item;
};

TEST(MakeReport, LinesBeforeALibraryWasNotVerifiedSayWhy) {
  const std::vector<LibraryRow> rows = {
      {"Can't read file: x (streamoff=-1)\n", "refused library-no-file"},
      {"Can't find file in META-INF/MANIFEST.MF: x\n", "refused library-not-listed"},
      {"verifyData: Unsupported digest type: MD5-Digest\n", "refused library-digest"},
      // Nothing lies at /data on a workstation.
      {"Can't open file: x\n", "absent library-not-installed"},
  };
  for (const LibraryRow& row : rows) {
    EXPECT_EQ(Items({kLibrariesStart, Log(6, row.error),
                     Log(6, "VeltSignJni: File not verified: " + kLibrary + "\n"), kFileStart,
                     Sign(kFile, kPackagePayload)}),
              Lines({"package done", std::string("lib/arm64/libfoo.so ") + row.item}));
  }
}

TEST(MakeReport, LibraryThatIsNotThereIsNoRefusalUnlessTheUserIsStrict) {
  const Events events = {kLibrariesStart, Log(6, "Can't open file: x\n"),
                         Log(6, "VeltSignJni: File not verified: " + kLibrary + "\n"), kFileStart,
                         Sign(kFile, kPackagePayload)};
  EXPECT_EQ(Made(events).verdict, Verdict::kSigned);
  const Report report = Made(events, {}, {true});
  EXPECT_EQ(report.verdict, Verdict::kPartlySigned);
  EXPECT_EQ(ItemsOf(report)[1], "lib/arm64/libfoo.so refused library-not-installed");
}

TEST(MakeReport, LibraryThatThePackageKeepsIsToldApart) {
  PackageFacts facts = WithLibraries({"lib/arm64-v8a/libfoo.so"});
  facts.manifest.extracts_libraries = false;
  EXPECT_EQ(Items({kLibrariesStart, Log(6, "Can't open file: x\n"),
                   Log(6, "VeltSignJni: File not verified: " + kLibrary + "\n"), kFileStart,
                   Sign(kFile, kPackagePayload)},
                  facts)[1],
            "lib/arm64/libfoo.so absent library-in-package");
}

TEST(MakeReport, LibraryThatVanishedIsRefused) {
  EXPECT_EQ(Items({kLibrariesStart, Log(6, "File " + kLibrary + " is not opened"),
                   Log(6, "Error 2: No such file or directory.\n"), kFileStart,
                   Sign(kFile, kPackagePayload)})[1],
            "lib/arm64/libfoo.so refused library-not-opened ENOENT: No such file or directory");
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
  EXPECT_EQ(item(ELOOP, false, true),
            "file refused file-not-opened ELOOP: Too many levels of symbolic links");
  EXPECT_EQ(item(0, true, true), "file refused read-only-file-system");
  EXPECT_EQ(item(0, true, false), "file refused standard-input-closed");
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
