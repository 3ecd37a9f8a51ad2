// Whatever fails under the tool, and at whatever moment: it ends in order, or in the abort of a
// container that finds no memory, and nothing is signed that had not been verified.
#include <fcntl.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <filesystem>

#include "simulator/phone/settings.h"
#include "simulator/phone/text.h"
#include "simulator/program/run.h"
#include "simulator/program/verdict.h"
#include "support/files.h"
#include "support/package.h"
#include "support/simulation.h"

namespace {

// Standard error goes to a file while this lives: an abort says its last words there, hundreds of
// times in a sweep.
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

// A file installed in a folder of its own, and the phone that it is installed on.
class Installed {
 public:
  explicit Installed(const Package& package, bool is_trusted = false) {
    file_ = folder_.Write("app/base.apk", package.Build());
    folder_.Write("app/lib/arm64/libfoo.so", ToBytes("\177ELF foo"));
    struct stat state = {};
    if (is_trusted && stat(file_.c_str(), &state) == 0) {
      phone_.trusted = {{state.st_dev, state.st_ino}};
    }
  }

  struct Outcome {
    Ending ending;
    bool failed;  // the call that was to fail was made
    // What was signed and registered, in their order: path, payload or data.
    std::vector<std::string> grants;
    std::string errors;
  };

  // Runs the tool with the fault, such as "open:1".
  Outcome Run(const std::string& fault) {
    std::filesystem::remove(folder_ / "report");
    std::filesystem::remove(folder_ / "journal");
    phone_.journal = folder_ / "journal";
    Command command = {
        {}, TOOL_PATH, file_, FAULT_INJECTOR ":" KERNEL_STAND_IN, SettingsToEnvironment(phone_),
        20};
    if (AreProgramsEmulated()) command.runner = Split(APKTOOLKIT_RUNNER, ' ');
    command.environment.push_back("APKTOOLKIT_FAULT=" + fault);
    command.environment.push_back("APKTOOLKIT_FAULT_REPORT=" + folder_ / "report");
    Outcome outcome;
    {
      const KeptStandardError kept(folder_ / "errors");
      outcome.ending = ::Run(command);
    }
    outcome.failed = std::filesystem::exists(folder_ / "report");
    outcome.grants = Grants(ContentOf(phone_.journal));
    outcome.errors = ContentOf(folder_ / "errors");
    return outcome;
  }

 private:
  static std::vector<std::string> Grants(const std::string& journal) {
    std::vector<std::string> grants;
    for (const std::string& line : Split(journal, '\n')) {
      const auto event = nlohmann::json::parse(line, nullptr, false);
      if (!event.is_object()) continue;
      const std::string what = TextOf(event, "event");
      const bool granted = what == "sign" || what == "register";
      if (granted && NumberOf(event, "result") == 0) {
        grants.push_back(what + " " + TextOf(event, "path") + " " +
                         TextOf(event, what == "sign" ? "payload" : "data"));
      }
    }
    return grants;
  }

  TempDir folder_;
  PhoneSettings phone_;
  std::string file_;
};

bool IsExit0(const Ending& ending) { return ending.end == End::kExited && ending.value == 0; }

bool IsAbort(const Ending& ending) { return ending.end == End::kKilled && ending.value == SIGABRT; }

// Makes each call of the function fail, one in a run. Every run may grant what a run without a
// fault grants, or less.
void Sweep(Installed& file, const std::string& function, const std::vector<std::string>& allowed) {
  constexpr int kMostCalls = 20000;
  for (int call = 1; call <= kMostCalls; ++call) {
    const std::string fault = function + ":" + std::to_string(call);
    const Installed::Outcome outcome = file.Run(fault);
    const bool in_order =
        IsExit0(outcome.ending) || (function == "malloc" && IsAbort(outcome.ending));
    ASSERT_TRUE(in_order) << fault << ": ended with " << outcome.ending.value << "\n"
                          << outcome.errors;
    for (const std::string& grant : outcome.grants) {
      ASSERT_NE(std::find(allowed.begin(), allowed.end(), grant), allowed.end())
          << fault << ": " << grant;
    }
    if (!outcome.failed) {
      ASSERT_EQ(outcome.grants, allowed) << "a run without a fault";
      testing::Test::RecordProperty(function, call - 1);
      return;
    }
  }
  FAIL() << function << " is called without end";
}

class Faults : public testing::TestWithParam<const char*> {
 protected:
  // What a run without a fault grants, which must be `count` things.
  std::vector<std::string> AllowedGrants(Installed& file, size_t count) {
    const Installed::Outcome outcome = file.Run("nothing:1");
    EXPECT_TRUE(IsExit0(outcome.ending));
    EXPECT_EQ(outcome.errors, "");
    EXPECT_EQ(outcome.grants.size(), count);
    return outcome.grants;
  }
};

TEST_P(Faults, LetAGoodPackageBeSignedAsFarAsItWasVerified) {
  PackageOptions options;
  options.secure_storage = true;
  Installed file(MakePackage(options));
  Sweep(file, GetParam(), AllowedGrants(file, 3));
}

TEST_P(Faults, LetATrustedJarBeSignedAndNothingElse) {
  PackageOptions options;
  options.android_manifest = Bytes();
  Installed file(MakePackage(options), /*is_trusted=*/true);
  Sweep(file, GetParam(), AllowedGrants(file, 1));
}

TEST_P(Faults, NeverGetAnythingSignedForAPackageThatIsNotGood) {
  Package package = MakePackage();
  package.Tamper("classes.dex");
  Installed file(package);
  Sweep(file, GetParam(), AllowedGrants(file, 0));
}

TEST_P(Faults, NeverGetALibrarySignedThatIsNotTheManifests) {
  PackageOptions options;
  options.entries = {{"lib/arm64-v8a/libfoo.so", ToBytes("\177ELF other")}};
  Installed file(MakePackage(options));
  Sweep(file, GetParam(), AllowedGrants(file, 1));
}

std::string NameOf(const testing::TestParamInfo<const char*>& info) { return info.param; }

INSTANTIATE_TEST_SUITE_P(Of, Faults,
                         testing::Values("open", "read", "fopen", "readlink", "fgetxattr",
                                         "fstatvfs", "fcntl"),
                         NameOf);

#ifdef __SANITIZE_ADDRESS__
#define HAS_OWN_MALLOC true
#elif defined(__has_feature)
#define HAS_OWN_MALLOC __has_feature(address_sanitizer)
#else
#define HAS_OWN_MALLOC false
#endif

// The memory of the sanitizer is its own and does not fail.
#if !HAS_OWN_MALLOC
INSTANTIATE_TEST_SUITE_P(OfMemory, Faults, testing::Values("malloc"), NameOf);
#endif

}  // namespace
