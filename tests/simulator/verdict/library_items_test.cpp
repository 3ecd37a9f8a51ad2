// The items of a report for native libraries.
#include <gtest/gtest.h>

#include <cerrno>

#include "simulator/verdict/made_report.h"

using namespace simulator;

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

// The item of a library for which the tool logs `error`. `opening` is LibraryFacts::error: the
// errno of opening the library's file, or 0 if the file can be opened.
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

TEST(MakeReport, LogLinesBeforeARefusedLibrarySayWhy) {
  EXPECT_EQ(LibraryItem("Can't read file: x (streamoff=-1)\n"),
            "lib/arm64/libfoo.so refused library-no-file");
  EXPECT_EQ(LibraryItem("Can't find file in META-INF/MANIFEST.MF: x\n"),
            "lib/arm64/libfoo.so refused library-not-listed");
  EXPECT_EQ(LibraryItem("verifyData: Unsupported digest type: MD5-Digest\n"),
            "lib/arm64/libfoo.so refused library-digest");
}

TEST(MakeReport, LibraryThatCannotBeOpenedIsRefusedUnlessMissing) {
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
  EXPECT_EQ(item(0, true), "refused library-not-opened the reason is not known");
}

TEST(MakeReport, MissingLibraryIsRefusedIfTheUserIsStrict) {
  EXPECT_EQ(LibraryItem("Can't open file: x\n", ENOENT, false, {true}),
            "lib/arm64/libfoo.so refused library-not-installed");
  EXPECT_EQ(LibraryItem("Can't open file: x\n", ENOENT, true, {true}),
            "lib/arm64/libfoo.so refused library-missing");
}

TEST(MakeReport, LibraryThatStaysInThePackageHasItsOwnReason) {
  PackageFacts facts = WithLibraries({"lib/arm64-v8a/libfoo.so"}, ENOENT);
  facts.manifest.extracts_libraries = false;
  EXPECT_EQ(Items({kLibrariesStart, Log(6, "Can't open file: x\n"),
                   Log(6, "VeltSignJni: File not verified: " + kLibrary + "\n"), kFileStart,
                   Sign(kFile, kPackagePayload)},
                  facts)[1],
            "lib/arm64/libfoo.so absent library-in-package");
}

// The tool goes through the library entries in order, and stops at the first damaged library entry.
// Later libraries are not signed, even if they are good.
TEST(MakeReport, LibraryAfterADamagedEntryIsRefusedIfInstalled) {
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

TEST(MakeReport, LibraryThatCannotBeExtractedIsRefused) {
  RunRecord record = Record({kLibrariesStart, Log(6, "Can't open file: x\n"),
                             Log(6, "VeltSignJni: File not verified: " + kLibrary + "\n"),
                             kFileStart, Sign(kFile, kPackagePayload)});
  record.not_extracted = {"lib/arm64-v8a/libfoo.so"};
  const Report report =
      MakeReport(record, WithLibraries({"lib/arm64-v8a/libfoo.so"}, ENOENT, true), {});
  EXPECT_EQ(report.verdict, Verdict::kPartlySigned);
  EXPECT_EQ(ItemsOf(report)[1], "lib/arm64/libfoo.so refused library-not-extracted");
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

TEST(MakeReport, LibraryOfAnUnknownAbiHasNothingToSign) {
  const PackageFacts facts = WithLibraries({"lib/x86_64/libfoo.so", "lib/armeabi/libfoo.so"});
  const Report report = Made({kLibrariesStart, kTakesUp, Sign("/data/app/lib/arm/libfoo.so", "00"),
                              kFileStart, Sign(kFile, kPackagePayload)},
                             facts);
  EXPECT_EQ(report.verdict, Verdict::kSigned);
  EXPECT_EQ(ItemsOf(report),
            Lines({"package done", "lib/x86_64/libfoo.so nothing library-other-abi",
                   "lib/arm/libfoo.so done"}));
}

TEST(MakeReport, LibrariesOfARefusedPackageAreRefused) {
  const PackageFacts facts = WithLibraries({"lib/arm64-v8a/libfoo.so"});
  const Report report = Made({Log(6, "Can't validate manifest.\n"), kLibrariesStart,
                              Log(6, "VeltSignJni: malformed apk: /a\n"), kFileStart, kTakesUp,
                              Log(4, "VeltSign finished: 65536.\n")},
                             facts);
  EXPECT_EQ(report.verdict, Verdict::kRefused);
  EXPECT_EQ(ItemsOf(report)[1], "lib/arm64/libfoo.so refused package-refused");
  EXPECT_FALSE(report.items[0].is_verified);
}

// If the integrity value forbids the signing of a library, the kernel gets no request, and the
// tool's log names no path. The order of the libraries then shows which library the log is about.
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

TEST(MakeReport, LibrariesAfterTheEndOfTheToolAreNotReached) {
  const Report report = Made({kLibrariesStart, kTakesUp, Integrity("1f"),
                              Sign("/data/app/lib/arm64/liba.so", kPackagePayload)},
                             WithLibraries({"lib/arm64-v8a/liba.so", "lib/arm64-v8a/libb.so"}), {},
                             {{"event", "exit"}, {"signal", 9}});
  EXPECT_EQ(ItemsOf(report),
            Lines({"package refused not-reached", "lib/arm64/liba.so done",
                   "lib/arm64/libb.so refused not-reached", "tool refused tool-killed 9"}));
}
