#include "simulator/program/verdict.h"

#include <gtest/gtest.h>

#include <cerrno>

#include "simulator/phone/probe_run.h"

namespace {

const std::string kFile = "/data/app/base.apk";
const std::string kLibrary = "/data/app/lib/arm64/libfoo.so";

const Json kStart = {{"event", "start"}, {"file", "base.apk"}, {"path", kFile}};
const Json kExit = {{"event", "exit"}, {"status", 0}};

Json Log(int priority, const std::string& tag, const std::string& text) {
  return {{"event", "log"}, {"priority", priority}, {"tag", tag}, {"text", text}};
}

Json Sign(const std::string& path, const std::string& payload, int error = 0) {
  return {{"event", "sign"},          {"fd", 3},       {"path", path}, {"payload", payload},
          {"result", error ? -1 : 0}, {"errno", error}};
}

Json Verify(int error, const std::string& path = kFile) {
  return {
      {"event", "verify"}, {"fd", 3}, {"path", path}, {"result", error ? -1 : 0}, {"errno", error}};
}

Json Register(int64_t result) {
  return {{"event", "register"}, {"fd", 3},      {"path", kFile},
          {"name", "com.app"},   {"data", "ab"}, {"result", result}};
}

// The reasons of a run in which this happened.
Lines Reasons(Events events, const Json& end = kExit) {
  events.insert(events.begin(), kStart);
  events.push_back(end);
  return Judge(events).reasons;
}

}  // namespace

TEST(Verdict, GoodPackage) {
  const Verdict verdict = Judge({kStart, Log(4, "ApkToolkit", "starts\n"), Sign(kLibrary, "0100ab"),
                                 Sign(kFile, "0100ab"), Register(0), kExit});
  EXPECT_EQ(verdict.reasons, Lines());
  EXPECT_EQ(verdict.own, Signed::kAsPackage);
  EXPECT_EQ(verdict.libraries, 1);
  EXPECT_EQ(verdict.keys, 1);
}

TEST(Verdict, TrustedJarIsGoodWhateverItLacksOfAPackage) {
  const Verdict verdict =
      Judge({kStart, Log(6, "ApkToolkit", "Can't extract Android Manifest: Entry not found\n"),
             Verify(0), Sign(kFile, "0000"), kExit});
  EXPECT_EQ(verdict.reasons, Lines());
  EXPECT_EQ(verdict.own, Signed::kAsJar);
  EXPECT_EQ(verdict.libraries, 0);
  EXPECT_EQ(verdict.keys, 0);
}

TEST(Verdict, JarThatIsNotTrusted) {
  EXPECT_EQ(Reasons({Log(6, "ApkToolkit", "no manifest\n"), Verify(ENOKEY),
                     Log(4, "ApkToolkit", "VELT can't verify a file\n")}),
            Lines({"the kernel does not trust it (ENOKEY: Required key not available)"}));
}

TEST(Verdict, ErrorAfterTheVerificationOfAJarCounts) {
  EXPECT_EQ(Reasons({Verify(0), Sign(kFile, "0000"), Log(6, "ApkToolkit", "no location\n")}),
            Lines({"no location"}));
}

TEST(Verdict, VerificationOfAnotherFileTakesNothingBack) {
  EXPECT_EQ(Reasons({Log(6, "ApkToolkit", "bad"), Verify(0, kLibrary), Sign(kFile, "0000")}),
            Lines({"bad"}));
}

TEST(Verdict, LibraryThatWasRefusedInAGoodPackage) {
  EXPECT_EQ(Reasons({Log(6, "ApkToolkit", "VeltSignJni: File not verified: " + kLibrary + "\n"),
                     Sign(kFile, "0100ab")}),
            Lines({"VeltSignJni: File not verified: " + kLibrary}));
}

TEST(Verdict, ReasonsKeepTheirOrder) {
  EXPECT_EQ(
      Reasons({Sign(kLibrary, "0100ab", EPERM), Log(6, "ApkToolkit", "VELT can't sign\n"),
               Sign(kFile, "0100ab", EACCES), Register(65541)}),
      Lines({"the kernel did not sign " + kLibrary + " (EPERM: Operation not permitted)",
             "VELT can't sign", "the kernel did not sign " + kFile + " (EACCES: Permission denied)",
             "libzu did not register com.app (result 65541)"}));
}

TEST(Verdict, AKeyThatIsKnownAlreadyIsRegistered) {
  const Verdict verdict = Judge({kStart, Sign(kFile, "0100ab"), Register(65540), kExit});
  EXPECT_EQ(verdict.reasons, Lines());
  EXPECT_EQ(verdict.keys, 1);
}

TEST(Verdict, OnlyTheToolsOwnErrorsCount) {
  EXPECT_EQ(
      Reasons({Log(6, "ziparchive", "bad"), Log(5, "ApkToolkit", "so so"), Sign(kFile, "0100ab")}),
      Lines());
  EXPECT_EQ(Reasons({Log(7, "ApkToolkit", "worse"), Sign(kFile, "0100ab")}), Lines({"worse"}));
}

TEST(Verdict, EndOfTheToolCounts) {
  EXPECT_EQ(Reasons({Sign(kFile, "0100ab")}, {{"event", "exit"}, {"status", 1}}),
            Lines({"the tool ended with status 1"}));
  EXPECT_EQ(Reasons({Sign(kFile, "0100ab")}, {{"event", "exit"}, {"signal", 11}}),
            Lines({"the tool was killed by signal 11"}));
}

TEST(Verdict, FileThatNobodySigned) {
  EXPECT_EQ(Reasons({Sign(kLibrary, "0100ab"), Log(4, "ApkToolkit", "starts\n")}),
            Lines({"nobody asked the kernel to sign it"}));
  EXPECT_EQ(Reasons({}), Lines({"the tool left it alone: it cannot be opened, or lies on a "
                                "read-only file system"}));
}

TEST(Verdict, OddEventsAreNoHarm) {
  const Events odd = {{{"event", 5}},
                      {{"event", "sign"}, {"path", 7}, {"result", "no"}},
                      {{"no", "event"}},
                      {{"event", "log"}, {"priority", "6"}}};
  EXPECT_EQ(Judge(odd).libraries, 0);
}
