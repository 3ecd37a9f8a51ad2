// The parts of a report. They are made in package_reason.cpp, library_items.cpp,
// installer_item.cpp, warnings.cpp and protection.cpp.
#pragma once

#include <vector>

#include "simulator/verdict/make_report.h"

namespace simulator {

// Why the tool refused a whole file before it asked the kernel. The log shows at which step the
// tool stopped, and the facts of the file show why. The file must be neither signed nor a plain
// JAR.
Reason WhyRefused(const RunRecord& run, const PackageFacts& facts);

// Why the tool did not look at a file, or was not run for a directory. A null cause if neither
// applies.
Reason WhyNotLookedAt(const RunRecord& run, const PackageFacts& facts);

// Why an archive without AndroidManifest.xml is probably not meant to be a JAR: it is an app bundle
// or a set of packages, or has parts of a package. A null cause if the archive has none of these
// signs.
Reason WhyTakenForAJar(const PackageFacts& facts);

// Why the tool refused a file, if an entry that the tool reads is encrypted: an entry of the JAR
// signature, AndroidManifest.xml or classes.dex. A null cause if none of these is encrypted.
Reason WhyEncrypted(const PackageFacts& facts);

// Why the kernel refused to sign the file, or why the tool did not ask the kernel. A null cause for
// every other outcome.
Reason WhyKernelDidNotSign(const Attempt& attempt);

// Adds an item for each native library of the package, with its result. The first item in `items`
// must be the file's own.
void AddLibraryItems(const RunRecord& run, const PackageFacts& facts, const JudgeOptions& options,
                     std::vector<Item>* items);

// Adds an item if phones of some API levels do not install the package, or if the installer's
// verifier gave up.
void AddInstallerItem(const Judgement& judgement, const JudgeOptions& options,
                      std::vector<Item>* items);

// True if the key is the JAR signer's: the key that the kernel gets and that the certificate shows.
bool IsJarSigner(const PublicKey& key, const Report& report);

// Facts that matter to the user although they change nothing for the kernel. Reads only the items,
// the signer and the key of the report. Leaves out an exponent or a changed entry that an item
// already reports. `now` is JudgeOptions::now.
std::vector<Reason> FindWarnings(const RunRecord& run, const PackageFacts& facts,
                                 const Report& report, int64_t now = 0);

// Counts the entries of the package, and their bytes: those that its signature protects, and those
// that it does not protect. `items` are the items of the report.
Protection FindProtection(const PackageFacts& facts, const std::vector<Item>& items);

// Makes the chain from the key to the entries. Looks for the first item, the package or a library,
// whose cause breaks a link. The chain is broken at this link. All members of the report except the
// chain must be filled.
std::vector<Link> MakeChain(const PackageFacts& facts, const Report& report);

}  // namespace simulator
