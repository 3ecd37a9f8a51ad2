// Runs one good package on simulated phones. The phones differ in the integrity value, and in the
// answers of the kernel and of libzu.
#include <gtest/gtest.h>

#include <cerrno>
#include <cstring>
#include <regex>

#include "support/expected_timeline.h"
#include "support/files.h"
#include "support/package.h"
#include "support/simulation.h"

namespace {

class GoodPackageOn : public testing::Test {
 protected:
  GoodPackageOn() {
    PackageOptions options;
    options.secure_storage = true;
    MakePackage(options).WriteTo(apk_);
  }

  // The last events of a run in which libzu returns 0.
  std::string RegisteredAndExit() const {
    return Timeline({Register(3, apk_, "com.example.app", ModulusOf("rsa-2048")),
                     Log(4, "ZuAddCertificate: ZuNewCertificate return 0.\n"), Exit(0)});
  }

  const TempDir directory_;
  const std::string apk_ = directory_ / "base.apk";
  const std::string library_ = directory_.Write("lib/arm64/libfoo.so", ToBytes("\177ELF foo"));
};

// The events of one failed attempt to sign a file. `kernels_part` has the events between the tool's
// two messages: the reads of the integrity value, and, if the tool asked the kernel to sign, the
// kernel's refusal.
std::string Refusal(const std::string& kernels_part, int error) {
  return Timeline({Log(4, "VeltSignOat: Apk case.\n"), kernels_part,
                   Log(6, "VELT can't sign a file (result=10000, errno " + std::to_string(error) +
                              ": " + strerror(error) + ").\n")});
}

// The events of VeltSignJni and VeltSign if both attempts to sign fail: first the library, then the
// package. Refusal gets `library_part` as its `kernels_part` for the library, and `package_part`
// for the package.
std::string BothRefused(const std::string& library_part, const std::string& package_part,
                        int error) {
  return Timeline({LibraryStep({Refusal(library_part, error)}),
                   Log(4, "VeltSign starts: zip_fd = 3, fd = 3.\n"), Refusal(package_part, error),
                   Log(4, "VeltSign finished: 65536.\n")});
}

TEST_F(GoodPackageOn, PhoneSignsOnceItsIntegrityValueSettles) {
  const Simulation run = Simulate(apk_, {"--integrity", "ffffffff,ffffffff,1f"});

  EXPECT_EQ(run.timeline,
            Timeline({LibraryStep({Log(4, "VeltSignOat: Apk case.\n"), Integrity("ffffffff"),
                                   Integrity("ffffffff"), Integrity("1f"),
                                   Sign(4, library_, PackagePayload())}),
                      PackageStep(apk_), RegisteredAndExit()}));
  EXPECT_EQ(run.status, 0);
}

TEST_F(GoodPackageOn, PhoneThatLosesItsIntegritySignsOnlyTheLibrary) {
  const Simulation run = Simulate(apk_, {"--integrity", "1f,missing"});

  EXPECT_EQ(run.timeline, Timeline({LibraryStep({SignedLibrary(library_)}),
                                    Log(4, "VeltSign starts: zip_fd = 3, fd = 3.\n"),
                                    Refusal(IntegrityMissing(), ENOENT),
                                    Log(4, "VeltSign finished: 65536.\n"), RegisteredAndExit()}));
  EXPECT_EQ(run.status, 1);
}

TEST_F(GoodPackageOn, PhoneWithoutIntegrityFilesSignsNothing) {
  const Simulation run = Simulate(apk_, {"--integrity", "missing"});

  EXPECT_EQ(run.timeline, Timeline({BothRefused(IntegrityMissing(), IntegrityMissing(), ENOENT),
                                    RegisteredAndExit()}));
  EXPECT_EQ(run.status, 1);
}

// The timeline without the values of errno. If the tool reads an integrity value that does not
// allow signing, no system call fails. The tool then logs the errno that an earlier call left.
std::string WithoutErrno(const std::string& timeline) {
  return std::regex_replace(timeline, std::regex("errno [0-9]+: [^)]*"), "errno");
}

class PhoneThatMayNotSign : public GoodPackageOn,
                            public testing::WithParamInterface<const char*> {};

TEST_P(PhoneThatMayNotSign, IsNotAskedToSign) {
  const Simulation run = Simulate(apk_, {"--integrity", GetParam()});

  EXPECT_EQ(WithoutErrno(run.timeline),
            WithoutErrno(Timeline({BothRefused(Integrity(GetParam()), Integrity(GetParam()), 0),
                                   RegisteredAndExit()})));
  EXPECT_EQ(run.status, 1);
}

INSTANTIATE_TEST_SUITE_P(IntegrityValues, PhoneThatMayNotSign, testing::Values("0", "none", ""));

TEST_F(GoodPackageOn, PhoneWhoseKernelRefusesStillRegistersTheKey) {
  const Simulation run = Simulate(apk_, {"--sign-errno", "EACCES"});

  EXPECT_EQ(
      run.timeline,
      Timeline({BothRefused(Integrity("1f") + Sign(4, library_, PackagePayload(), EACCES),
                            Integrity("1f") + Sign(3, apk_, PackagePayload(), EACCES), EACCES),
                RegisteredAndExit()}));
  EXPECT_EQ(run.status, 1);
}

TEST_F(GoodPackageOn, PhoneThatTrustsNoFileStillSignsThePackage) {
  const Simulation run = Simulate(apk_, {"--verify-errno", "EPERM"});

  EXPECT_EQ(run.timeline, Timeline({LibraryStep({SignedLibrary(library_)}), PackageStep(apk_),
                                    RegisteredAndExit()}));
  EXPECT_EQ(run.status, 0);
}

class LibzuAnswer : public GoodPackageOn, public testing::WithParamInterface<int> {
 protected:
  // The part of the timeline before the tool reports libzu's answer.
  std::string UpToTheAnswer(int answer) const {
    return Timeline({LibraryStep({SignedLibrary(library_)}), PackageStep(apk_),
                     Register(3, apk_, "com.example.app", ModulusOf("rsa-2048"), answer)});
  }
};

class LibzuSuccess : public LibzuAnswer {};

TEST_P(LibzuSuccess, IsReportedAsInformation) {
  const std::string answer = std::to_string(GetParam());

  const Simulation run = Simulate(apk_, {"--zu-result", answer});

  EXPECT_EQ(
      run.timeline,
      Timeline({UpToTheAnswer(GetParam()),
                Log(4, "ZuAddCertificate: ZuNewCertificate return " + answer + ".\n"), Exit(0)}));
  EXPECT_EQ(run.status, 0);
}

INSTANTIATE_TEST_SUITE_P(Answers, LibzuSuccess, testing::Values(0, 65540));

class LibzuFailure : public LibzuAnswer {};

TEST_P(LibzuFailure, IsReportedAsAnError) {
  const std::string answer = std::to_string(GetParam());

  const Simulation run = Simulate(apk_, {"--zu-result", answer});

  EXPECT_EQ(
      run.timeline,
      Timeline({UpToTheAnswer(GetParam()),
                Log(6, "ZuAddCertificate: ZuNewCertificate failed " + answer + ".\n"), Exit(0)}));
  EXPECT_EQ(run.status, 1);
}

INSTANTIATE_TEST_SUITE_P(Answers, LibzuFailure, testing::Values(1, -1, 65536, 65539, 65541));

}  // namespace
