// The parts of a report, each made by a file of its own: package_reason.cpp, library_items.cpp,
// installer_item.cpp, warnings.cpp and protection.cpp.
#pragma once

#include <vector>

#include "simulator/verdict/make_report.h"

namespace simulator {

// Why the tool refused a whole file before it asked the kernel: what it logged says where it
// stopped, what can be seen in the file says why. For a file that is neither signed nor a plain
// JAR.
Reason WhyRefused(const RunRecord& run, const PackageFacts& facts);

// For a file that the tool did not look at, or a directory that it was not run for; a null cause
// when there was no reason not to.
Reason WhyNotLookedAt(const RunRecord& run, const PackageFacts& facts);

// The reason for an archive without AndroidManifest.xml that was hardly meant for a JAR; a null
// cause for one that may be a JAR.
Reason WhyTakenForAJar(const PackageFacts& facts);

// Why the kernel did not sign the file; a null cause when it did.
Reason WhyKernelDidNotSign(const Attempt& attempt);

// Adds an item for each of a package's native libraries: which of them were to be signed, and what
// came of each. The first item is the file's own.
void AddLibraryItems(const RunRecord& run, const PackageFacts& facts, const JudgeOptions& options,
                     std::vector<Item>* items);

// Adds an item if phones of some levels do not install the package, or if that could not be found
// out.
void AddInstallerItem(const Judgement& judgement, const JudgeOptions& options,
                      std::vector<Item>* items);

// Whether the key is the JAR signer's, as the kernel gets it and as the certificate shows it.
bool IsJarSigner(const PublicKey& key, const Report& report);

// Facts that matter to the user although they change nothing for the kernel. Of the report the
// items, the signers and the key are filled. A fact of the file's own item is not told twice. `now`
// is that of JudgeOptions.
std::vector<Reason> FindWarnings(const RunRecord& run, const PackageFacts& facts,
                                 const Report& report, int64_t now = 0);

// The parts of a package that its signature protects, in bytes. `items` are the report's, the
// package's own first.
Protection FindProtection(const PackageFacts& facts, const std::vector<Item>& items);

// The chain from the key to the entries. It breaks where the cause says for which the package
// itself was refused, else where a library is not the one that was signed. Of the report all but
// the chain is filled.
std::vector<Link> MakeChain(const PackageFacts& facts, const Report& report);

}  // namespace simulator
