#include "integration/caller/sign_package.h"

#include <signal.h>

namespace {

// Exit statuses with which apktoolkit-bound ends if it does not run apktoolkit. apktoolkit itself
// ends with 0 or 1.
constexpr int kStatusOtherSigner = 3;
constexpr int kStatusNoJarSigner = 4;
constexpr int kStatusNotStarted = 5;

bool IsTrusted(const std::string& directory, const std::string& path, const RunLimits& limits) {
  const RunResult run = RunProgram({directory + "/apktoolkit-verify", path}, limits);
  return run.end == RunEnd::kExited && run.value == 0;
}

// The reason why the kernel does not trust the package after this run.
SignOutcome WhyNotTrusted(const RunResult& run) {
  switch (run.end) {
    case RunEnd::kTimedOut:
      return SignOutcome::kTimedOut;
    case RunEnd::kKilled:
      return run.value == SIGABRT ? SignOutcome::kOutOfMemory : SignOutcome::kNotTrusted;
    case RunEnd::kNotStarted:
      return SignOutcome::kCannotBeRun;
    case RunEnd::kLost:
      return SignOutcome::kNotTrusted;
    case RunEnd::kExited:
      break;
  }
  switch (run.value) {
    case kStatusOtherSigner:
      return SignOutcome::kOtherSigner;
    case kStatusNoJarSigner:
      return SignOutcome::kNoJarSigner;
    case kStatusNotStarted:
      return SignOutcome::kCannotBeRun;
    default:
      return SignOutcome::kNotTrusted;
  }
}

}  // namespace

SignOutcome SignPackage(const std::string& directory, const InstalledPackage& package,
                        const RunLimits& limits) {
  if (IsTrusted(directory, package.path, limits)) return SignOutcome::kTrustedAlready;
  const RunResult run = RunProgram({directory + "/apktoolkit-bound", package.signer_digests,
                                    directory + "/apktoolkit", package.path},
                                   limits);
  // apktoolkit's exit status does not show whether the package was signed. Only the kernel knows.
  if (IsTrusted(directory, package.path, limits)) return SignOutcome::kTrusted;
  return WhyNotTrusted(run);
}

const char* Describe(SignOutcome outcome) {
  switch (outcome) {
    case SignOutcome::kTrustedAlready:
      return "trusted already";
    case SignOutcome::kTrusted:
      return "trusted";
    case SignOutcome::kOtherSigner:
      return "not trusted: its JAR signer is not one of the package manager's signers";
    case SignOutcome::kNoJarSigner:
      return "not trusted: it cannot be read, is not a package, or has no good JAR signature";
    case SignOutcome::kNotTrusted:
      return "not trusted: see the log of apktoolkit, or check that apktoolkit-verify runs";
    case SignOutcome::kTimedOut:
      return "not trusted: apktoolkit or apktoolkit-bound took too long and was killed";
    case SignOutcome::kOutOfMemory:
      return "not trusted: apktoolkit or apktoolkit-bound ran out of memory";
    case SignOutcome::kCannotBeRun:
      return "not trusted: apktoolkit or apktoolkit-bound cannot be started";
  }
  return "";
}
