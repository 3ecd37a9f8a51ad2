// An installer calls this code to sign an installed package. The code checks the signers, runs
// apktoolkit, and asks the kernel for the result. It keeps no state and logs nothing. Any thread
// may call it.
//
// Call SignPackage during an install when the package has its final path and its native libraries
// are beside it. It must be called before any code of the package is run, mapped, or compiled ahead
// of time (dexopt). From the start of the call on, nobody may write to the package or to files
// beside it. The caller must not hold a lock: the call runs up to three programs in turn, and each
// run can take the whole time limit. After an update of the system, the kernel can refuse to trust
// files that it signed before. SignPackage must therefore be called again for every installed
// package (main.cpp).
#pragma once

#include <string>

#include "integration/caller/run_program.h"

struct InstalledPackage {
  std::string path;
  // The package manager's signers, from SignerDigests.java: "DIGEST[,DIGEST]...", or empty if no
  // signer has an RSA key.
  std::string signer_digests;
};

enum class SignOutcome {
  kTrustedAlready,  // apktoolkit was not run
  kTrusted,
  kOtherSigner,  // the package manager does not know the JAR signer; apktoolkit was not run
  kNoJarSigner,  // the package has no good JAR signature; apktoolkit was not run
  kNotTrusted,   // any other reason; if apktoolkit refused the package, see its log
  kTimedOut,     // apktoolkit or apktoolkit-bound was killed at the time limit
  kOutOfMemory,  // apktoolkit or apktoolkit-bound aborted, as it does at the memory limit
  kCannotBeRun,  // apktoolkit or apktoolkit-bound is missing or cannot be started
};

// Runs the programs apktoolkit-verify, apktoolkit-bound and apktoolkit in `directory`
// ("/system/bin").
//
// The caller decides how to react. It should treat an untrusted package like a package for which
// the kernel has no payload (the digest of the signer's key). After kTimedOut and kOutOfMemory,
// some libraries can be signed already, because apktoolkit signs them first. The package itself is
// not trusted: if it were, the result would be kTrusted. Do not try again at once: the same file
// needs the same time and memory.
SignOutcome SignPackage(const std::string& directory, const InstalledPackage& package,
                        const RunLimits& limits);

// A text for a log, such as "trusted already".
const char* Describe(SignOutcome outcome);
