// Makes each call of the tool to certain C library functions fail, one per run. The tool must end
// normally, or abort because a C++ container gets no memory. The kernel must never sign a file that
// the tool did not verify.
#include <fcntl.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <map>
#include <set>

#include "simulator/phone/settings.h"
#include "simulator/phone/text.h"
#include "simulator/run/events.h"
#include "simulator/run/tool_process.h"
#include "support/expected_timeline.h"
#include "support/files.h"
#include "support/package.h"
#include "support/simulation.h"

using namespace simulator;

namespace {

// Sends standard error to a file during the object's life. Otherwise the tool's aborts would fill
// the output of the tests with hundreds of messages.
class KeptStandardError {
 public:
  explicit KeptStandardError(const std::string& path) : saved_(dup(STDERR_FILENO)) {
    const int file = open(path.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_APPEND, 0600);
    dup2(file, STDERR_FILENO);
    close(file);
  }
  ~KeptStandardError() {
    dup2(saved_, STDERR_FILENO);
    close(saved_);
  }
  KeptStandardError(const KeptStandardError&) = delete;
  KeptStandardError& operator=(const KeptStandardError&) = delete;

 private:
  const int saved_;
};

// Runs `tool` on `file` on the phone, with the fault, such as "open:1". If the call that the fault
// names is made, this call fails, and the file `report` exists afterwards.
ToolEnd RunWithFault(const std::string& tool, const std::string& file, const std::string& fault,
                     const std::string& report, const PhoneSettings& phone) {
  ToolCommand command = {
      {}, tool, file, FAULT_INJECTOR ":" KERNEL_STAND_IN, SettingsToEnvironment(phone)};
  if (AreProgramsEmulated()) command.runner = Split(APKTOOLKIT_RUNNER, ' ');
  command.environment.push_back("APKTOOLKIT_FAULT=" + fault);
  command.environment.push_back("APKTOOLKIT_FAULT_REPORT=" + report);
  return RunTool(command, Deadline(20));
}

// A file installed in its own directory, and the phone that it is installed on.
class Installed {
 public:
  explicit Installed(const Package& package, bool is_trusted = false) {
    file_ = directory_.Write("app/base.apk", package.Build());
    directory_.Write("app/lib/arm64/libfoo.so", ToBytes("\177ELF foo"));
    struct stat state = {};
    if (is_trusted && stat(file_.c_str(), &state) == 0) {
      phone_.trusted = {{state.st_dev, state.st_ino}};
    }
  }

  struct Outcome {
    ToolEnd ending;
    bool failed;  // the run made the call that the fault names, and this call failed
    // The kernel's signatures and libzu's registrations in order, one letter each. L: the library.
    // P: the package. J: a JAR. K: the package's key. N: this key under an empty name. ?: anything
    // else.
    std::string grants;
    std::string errors;
  };

  // Runs the tool with the fault, such as "open:1".
  Outcome Run(const std::string& fault) {
    std::filesystem::remove(directory_ / "report");
    std::filesystem::remove(directory_ / "journal");
    phone_.journal = directory_ / "journal";
    Outcome outcome;
    {
      const KeptStandardError kept(directory_ / "errors");
      outcome.ending = RunWithFault(TOOL_PATH, file_, fault, directory_ / "report", phone_);
    }
    outcome.failed = std::filesystem::exists(directory_ / "report");
    outcome.grants = Grants(ContentOf(phone_.journal), file_);
    outcome.errors = ContentOf(directory_ / "errors");
    return outcome;
  }

 private:
  static std::string Grants(const std::string& journal, const std::string& file) {
    std::string grants;
    for (const auto& event : ParseEvents(journal)) {
      if (NumberOf(event, "result") != 0) continue;
      const std::string what = TextOf(event, "event");
      if (what == "sign") grants += Signed(event, file);
      if (what == "register") grants += Registered(event);
    }
    return grants;
  }

  static std::string Registered(const nlohmann::json& event) {
    if (TextOf(event, "data") != Hex(ModulusOf("rsa-2048"))) return "?";
    return TextOf(event, "name").empty() ? "N" : "K";
  }

  static std::string Signed(const nlohmann::json& event, const std::string& file) {
    const bool is_library = TextOf(event, "path") != file;
    const std::string payload = TextOf(event, "payload");
    if (payload == Hex(PackagePayload())) return is_library ? "L" : "P";
    return payload == "0000" && !is_library ? "J" : "?";
  }

  TempDir directory_;
  PhoneSettings phone_;
  std::string file_;
};

bool IsExit0(const ToolEnd& ending) {
  return ending.how == ToolEnd::How::kExited && ending.value == 0;
}

// The expected grants for one function, one text per run. The function's first call fails in the
// first run, its second call in the second run, and so on. In the tables below, most comments
// name the calls of one function in order.
using Runs = std::vector<std::string>;
using Table = std::map<std::string, Runs>;

// Makes each call of the functions in `table` fail, one per run. In one more run for each function,
// the fault names a call that the tool never makes, so no call fails. `all` are the grants of a run
// without a failed call.
void ExpectRuns(Installed& file, const std::string& all, const Table& table) {
  for (const auto& [function, runs] : table) {
    for (size_t call = 1; call <= runs.size() + 1; ++call) {
      const std::string fault = function + ":" + std::to_string(call);
      const Installed::Outcome outcome = file.Run(fault);
      EXPECT_TRUE(IsExit0(outcome.ending)) << fault << ": " << outcome.ending.value;
      EXPECT_EQ(outcome.failed, call <= runs.size()) << fault;
      EXPECT_EQ(outcome.grants, call <= runs.size() ? runs[call - 1] : all) << fault;
      EXPECT_EQ(outcome.errors, "") << fault;
    }
  }
}

Installed GoodPackage() {
  PackageOptions options;
  options.secure_storage = true;
  return Installed(MakePackage(options));
}

Installed TrustedJar() { return Installed(MakePackage(PlainJar()), /*is_trusted=*/true); }

Installed PackageWithABadDex() {
  Package package = MakePackage();
  package.Tamper("classes.dex");
  return Installed(package);
}

Installed PackageWithAnotherLibrary() {
  PackageOptions options;
  options.entries = {{"lib/arm64-v8a/libfoo.so", ToBytes("\177ELF other")}};
  return Installed(MakePackage(options));
}

TEST(FailedCalls, RemoveOnlyDependentGrantsOfAGoodPackage) {
  Installed file = GoodPackage();
  ExpectRuns(file, "LPK",
             {{"open", {"", "PK", "PK"}},     // the package; the library twice: to read, to sign
              {"read", {"PK"}},               // the library
              {"fstat", {"PK", "PK"}},        // the library: before its digest, and after it
              {"fopen", {"PK", "LK"}},        // the tool's integrity value, before each signing
              {"fcntl", {"PK", "PK", "LK"}},  // a copy of the library's descriptor; each signing
              {"readlink", {"PK", "LPK"}},    // to find the libraries; to report a missing path
              {"fstatvfs", {"LPK"}},          // on failure, the file system counts as writable
              {"fgetxattr", {}}});            // the tool calls it only for JARs
}

TEST(FailedCalls, RemoveOnlyDependentGrantsOfATrustedJar) {
  Installed file = TrustedJar();
  ExpectRuns(file, "J",
             {{"open", {""}},
              {"read", {}},
              {"fstat", {}},
              {"fopen", {""}},
              {"fcntl", {"", ""}},  // the JAR's verification; its signing
              {"readlink", {"J"}},
              {"fstatvfs", {"J"}},
              {"fgetxattr", {"J"}}});
}

TEST(FailedCalls, LeaveABadPackageWithoutGrants) {
  Installed file = PackageWithABadDex();
  ExpectRuns(file, "",
             {{"open", {""}},
              {"read", {}},
              {"fstat", {}},
              {"fopen", {}},
              {"fcntl", {}},
              {"readlink", {""}},
              {"fstatvfs", {""}},
              {"fgetxattr", {}}});
}

TEST(FailedCalls, LeaveADifferentLibraryUnsigned) {
  Installed file = PackageWithAnotherLibrary();
  ExpectRuns(file, "P",
             {{"open", {"", "P"}},
              {"read", {"P"}},
              {"fstat", {"P"}},
              {"fopen", {""}},
              {"fcntl", {"P", ""}},
              {"readlink", {"P"}},
              {"fstatvfs", {"P"}},
              {"fgetxattr", {}}});
}

// Runs apktoolkit-verify for a trusted file. The call that `fault` names fails in this run. Returns
// the exit status, and the end of the printed line.
std::string AnswerOfVerify(const std::string& fault) {
  const TempDir directory;
  const std::string file = directory.Write("file", {});
  PhoneSettings phone;
  phone.journal = directory / "journal";
  struct stat state = {};
  EXPECT_EQ(stat(file.c_str(), &state), 0);
  phone.trusted = {{state.st_dev, state.st_ino}};
  const ToolEnd ending = RunWithFault(VERIFY_PATH, file, fault, directory / "report", phone);
  std::string answer = "status " + std::to_string(ending.value) + ", ";
  for (const auto& event : ParseEvents(ContentOf(phone.journal))) {
    if (TextOf(event, "event") == "stdout") answer += TextOf(event, "text").substr(file.size());
  }
  return answer;
}

TEST(FailedCalls, AreTheReasonWhyVerifyDoesNotTrustAFile) {
  EXPECT_EQ(AnswerOfVerify("open:1"), "status 1, : cannot be opened (errno 24, EMFILE)\n");
  EXPECT_EQ(AnswerOfVerify("fstat:1"), "status 1, : not trusted (errno 5, EIO)\n");
  EXPECT_EQ(AnswerOfVerify("fcntl:1"), "status 1, : not trusted (errno 5, EIO)\n");
  EXPECT_EQ(AnswerOfVerify("fcntl:2"), "status 0, : trusted\n");
}

#ifdef __SANITIZE_ADDRESS__
#define HAS_OWN_MALLOC true
#elif defined(__has_feature)
#define HAS_OWN_MALLOC __has_feature(address_sanitizer)
#else
#define HAS_OWN_MALLOC false
#endif

// AddressSanitizer has its own allocator, and the injector cannot make this allocator fail.
#if !HAS_OWN_MALLOC

bool IsAbort(const ToolEnd& ending) {
  return ending.how == ToolEnd::How::kKilled && ending.value == SIGABRT;
}

// Makes each request for memory fail, one per run. If a C++ container gets no memory, it aborts, or
// the fault injector turns its crash into an abort. A run may therefore end with an abort. The
// grants of an aborted run must be the start of `all`. They must not be shorter than those of an
// earlier aborted run. A run with a failed request may also end normally, if the tool and its
// libraries handle the missing memory. The grants of such a normal run must be one of `ways`. In
// the last run, no request fails, and the grants must be `all`.
void ExpectRunsWithoutMemory(Installed& file, const std::string& all,
                             const std::set<std::string>& ways) {
  constexpr int kMostCalls = 20000;
  size_t before = 0;
  for (int call = 1; call <= kMostCalls; ++call) {
    const std::string fault = "malloc:" + std::to_string(call);
    const Installed::Outcome outcome = file.Run(fault);
    if (!outcome.failed) {
      EXPECT_EQ(outcome.grants, all);
      EXPECT_GT(call, 50);
      return;
    }
    if (IsExit0(outcome.ending)) {
      ASSERT_EQ(ways.count(outcome.grants), 1u) << fault << ": " << outcome.grants;
    } else {
      ASSERT_TRUE(IsAbort(outcome.ending)) << fault << ": " << outcome.errors;
      ASSERT_EQ(outcome.grants, all.substr(0, outcome.grants.size())) << fault;
      ASSERT_GE(outcome.grants.size(), before) << fault;
      before = outcome.grants.size();
    }
  }
  FAIL() << "the tool requests memory without end";
}

TEST(FailedAllocations, GiveAGoodPackageOnlyTheAllowedGrants) {
  Installed file = GoodPackage();
  // The list has these texts. "": nothing is verified. "PK": the tool could not read the integrity
  // value when it tried to sign the library. "LK": it could not read the value when it tried to
  // sign the package. "LP": the permission is not found. "LPN": the package's name is empty. "LPK":
  // the missing memory has no effect.
  ExpectRunsWithoutMemory(file, "LPK", {"", "PK", "LK", "LP", "LPN", "LPK"});
}

TEST(FailedAllocations, GiveATrustedJarOnlyTheAllowedGrants) {
  Installed file = TrustedJar();
  ExpectRunsWithoutMemory(file, "J", {"", "J"});
}

TEST(FailedAllocations, LeaveABadPackageWithoutGrants) {
  Installed file = PackageWithABadDex();
  ExpectRunsWithoutMemory(file, "", {""});
}

TEST(FailedAllocations, LeaveADifferentLibraryUnsigned) {
  Installed file = PackageWithAnotherLibrary();
  ExpectRunsWithoutMemory(file, "P", {"", "P"});
}

#endif

}  // namespace
