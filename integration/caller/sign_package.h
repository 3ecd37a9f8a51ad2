// Having an installed package signed, as an installer does it: bind the signers, run apktoolkit,
// ask the kernel. Nothing is kept between calls, nothing is logged, and any thread may call.
//
// When, in an install: after the package has its final path and its native libraries lie beside it,
// and before anything of it is run, mapped, or compiled ahead of time (dexopt). Nobody may write to
// the package or beside it any more. Hold no lock over the call: it may take as long as the limits
// allow. An update of the system may bring another key; then the same is done for every package
// that is installed (main.cpp).
#pragma once

#include <string>

#include "integration/caller/run_program.h"

struct InstalledPackage {
  std::string path;
  // The package manager's signers, as SignerDigests.java has them: "DIGEST[,DIGEST]...", or empty.
  std::string signer_digests;
};

enum class SignOutcome {
  kTrustedAlready,  // nothing was run
  kTrusted,
  kOtherSigner,  // the JAR signer is none of the package manager's; nothing was run
  kNoJarSigner,  // there is no JAR signature that holds; nothing was run
  kNotTrusted,   // the tool ran, and the kernel does not trust the package: the tool's log says why
  kTimedOut,     // the tool was killed at its limit
  kOutOfMemory,  // the tool ended at its limit
  kCannotBeRun,  // a program of the kit is missing, or this process may not start it
};

// Runs the programs apktoolkit-verify, apktoolkit-bound and apktoolkit in `directory`
// ("/system/bin").
//
// The product decides what to do with the outcome. It treats an untrusted package like any other
// that has no payload. After kTimedOut and kOutOfMemory its libraries may be signed and itself is
// not, since it comes last. Do not try again at once: the same file takes the same time.
SignOutcome SignPackage(const std::string& directory, const InstalledPackage& package,
                        const RunLimits& limits);

// What to write into a log, such as "trusted already".
const char* Describe(SignOutcome outcome);
