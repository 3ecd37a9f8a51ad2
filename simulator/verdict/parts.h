// Functions that make parts of a report. They are defined in package_reason.cpp, library_items.cpp,
// installer_item.cpp, warnings.cpp and protection.cpp.
#pragma once

#include <vector>

#include "simulator/verdict/make_report.h"

namespace simulator {

// Why the tool refused a whole file and did not try to sign it. The log shows at which step the
// tool stopped, and the facts of the file show why. The file must not be a plain JAR.
Reason WhyRefused(const RunRecord& run, const PackageFacts& facts);

// Why the tool did not look at a file, or why the simulator did not run the tool for a directory. A
// null cause if no such reason is known.
Reason WhyNotLookedAt(const RunRecord& run, const PackageFacts& facts);

// The tool takes an archive without AndroidManifest.xml for a JAR. Returns why the archive is
// probably something else: it is an app bundle or a set of packages, or has parts of a package. A
// null cause for every other archive.
Reason WhyTakenForAJar(const PackageFacts& facts);

// Why the tool refused a file, if one of these entries is encrypted: AndroidManifest.xml,
// classes.dex, or an entry of the JAR signature. A null cause if none of them is encrypted.
Reason WhyEncrypted(const PackageFacts& facts);

// Why the kernel refused to sign the file of `attempt`, or why the tool's integrity value prevented
// the request to the kernel. A null cause for every other outcome.
Reason WhyKernelDidNotSign(const Attempt& attempt);

// Adds an item with the result for each native library of the package. The first item in `items`
// must be the item for the file itself.
void AddLibraryItems(const RunRecord& run, const PackageFacts& facts, const JudgeOptions& options,
                     std::vector<Item>* items);

// Adds an item if phones of some API levels do not install the package, or if the installer's
// verifier gave up.
void AddInstallerItem(const Judgement& judgement, const JudgeOptions& options,
                      std::vector<Item>* items);

// True if `key` has the modulus of Report::key and is the key of the certificate Report::signer. If
// the report lacks one of these members, the function skips the comparison with this member.
bool IsJarSigner(const PublicKey& key, const Report& report);

// The warnings: facts that the user should look at. Reads only three members of `report`: the
// items, the signer and the key. Does not warn about a forgeable key or a changed entry that an
// item already reports. `now` is JudgeOptions::now.
std::vector<Reason> FindWarnings(const RunRecord& run, const PackageFacts& facts,
                                 const Report& report, int64_t now = 0);

// Shows which entries of the package its signature protects. Counts each entry, and its bytes, in
// one Share of the result. `items` are the items of the report.
Protection FindProtection(const PackageFacts& facts, const std::vector<Item>& items);

// Makes the chain from the key to the entries. Only the items of the package and its libraries can
// break a link of the chain. The first of these items whose Cause::link is not kNone breaks the
// link that Cause::link names. All members of the report except the chain must be filled.
std::vector<Link> MakeChain(const PackageFacts& facts, const Report& report);

}  // namespace simulator
