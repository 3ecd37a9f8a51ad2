// An installer calls SignPackage to sign an installed package. If the kernel already trusts the
// package, nothing is signed. Otherwise apktoolkit-bound runs apktoolkit if the package's JAR
// signer is one of the package manager's signers. SignPackage then asks the kernel for the result.
// SignPackage keeps no state and logs nothing. Any thread may call it.
//
// Call SignPackage during an install when the package has its final path and its native libraries
// are beside it. The call must come before any code of the package is run, mapped, or compiled
// ahead of time (dexopt). From the start of the call on, nobody may write to the package or to
// files beside it. The caller must not hold a lock: the call starts up to three processes in
// turn, and each of them can take the whole time limit. After an update of the system, the kernel
// can refuse to trust files that it signed before. SignPackage must therefore be called again for
// every installed package. main.cpp in this directory does this.
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
  kNoJarSigner,  // unreadable, no package, or without a good JAR signature; apktoolkit was not run
  kNotTrusted,   // any other reason; if apktoolkit refused the package, see apktoolkit's log
  kTimedOut,     // apktoolkit or apktoolkit-bound was killed at the time limit
  kOutOfMemory,  // apktoolkit or apktoolkit-bound aborted, as both do at the memory limit
  kCannotBeRun,  // apktoolkit or apktoolkit-bound is missing or cannot be started
};

// Runs the programs apktoolkit-verify, apktoolkit-bound and apktoolkit in `directory`
// ("/system/bin").
//
// The caller decides how to react. The caller should treat an untrusted package like a package
// whose signer the kernel does not know. After kTimedOut and kOutOfMemory, some libraries can be
// signed already, because apktoolkit signs the libraries before the package. In both cases, the
// last run of apktoolkit-verify did not report that the package itself is trusted. Do not try again
// at once: the same file needs the same time and memory.
SignOutcome SignPackage(const std::string& directory, const InstalledPackage& package,
                        const RunLimits& limits);

// A text for a log, such as "trusted already".
const char* Describe(SignOutcome outcome);
