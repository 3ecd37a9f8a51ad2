// The report's items (Item in report.h) for a package's native libraries.
#include <algorithm>
#include <cerrno>
#include <cstdio>

#include "simulator/verdict/parts.h"

namespace simulator {

namespace {

// A library of the package. `attempt` is the tool's attempt to sign it; null if the RunRecord has
// none.
struct Library {
  LibraryFacts facts;
  const Attempt* attempt = nullptr;
};

std::vector<Library> MatchAttempts(const RunRecord& run, const std::vector<LibraryFacts>& present);
Reason WhyNotSigned(const Library& library, const RunRecord& run, const PackageFacts& facts,
                    bool is_walked);
Reason WhyNotVerified(const Library& library, const RunRecord& run, const PackageFacts& facts);
Reason WhyNotThere(const LibraryFacts& library, const RunRecord& run, const PackageFacts& facts);

}  // namespace

void AddLibraryItems(const RunRecord& run, const PackageFacts& facts, const JudgeOptions& options,
                     std::vector<Item>* items) {
  const bool is_walked = run.own || !run.libraries.empty();
  // Only a package has libraries. If the tool tried to sign libraries for a file that is not a
  // package, each attempt still gets an item.
  const bool is_package = items->front().kind == ItemKind::kPackage;
  for (const Library& library :
       MatchAttempts(run, is_package ? facts.libraries : std::vector<LibraryFacts>())) {
    const LibraryFacts& found = library.facts;
    const std::string& name = found.place.empty() ? found.entry : found.place;
    const Reason reason = WhyNotSigned(library, run, facts, is_walked);
    Item item = {ItemKind::kLibrary, name, "", ItemState::kDone, {}};
    if (reason.cause != nullptr) item = NotDone(ItemKind::kLibrary, name, reason, options);
    item.entry = found.entry;
    // Each outcome except kNotVerified comes after the library's bytes matched the manifest.
    item.is_verified =
        library.attempt != nullptr && library.attempt->outcome != Attempt::Outcome::kNotVerified;
    items->push_back(item);
  }
}

Reason WhyKernelDidNotSign(const Attempt& attempt) {
  if (attempt.outcome == Attempt::Outcome::kKernelRefused) {
    return {&cause::kKernelRefused, DescribeErrno(attempt.error)};
  }
  if (attempt.outcome != Attempt::Outcome::kNotAsked) return {};
  if (!attempt.integrity) return {&cause::kIntegrityMissing, ""};
  unsigned value = 0;
  // The tool reads the value with the same format, %x.
  if (sscanf(attempt.integrity->c_str(), "%x", &value) != 1) {
    return {&cause::kIntegrityUnreadable, *attempt.integrity};
  }
  return {&cause::kIntegrityZero, ""};
}

namespace {

// Pairs each library with its attempt. The tool handles the libraries in the order of the zip
// library's iteration, and `present` has that order. If attempts are left over, the pairs cannot be
// right. The result then has one library for each attempt, and the only fact of each library is its
// path.
std::vector<Library> MatchAttempts(const RunRecord& run, const std::vector<LibraryFacts>& present) {
  std::vector<Library> libraries;
  auto attempt = run.libraries.begin();
  for (const LibraryFacts& library : present) {
    libraries.push_back({library, nullptr});
    const bool is_taken_up = library.is_met && !library.place.empty();
    if (is_taken_up && attempt != run.libraries.end()) libraries.back().attempt = &*attempt++;
  }
  if (attempt == run.libraries.end()) return libraries;
  libraries.clear();
  const std::string directory = run.PathForTool().substr(0, run.PathForTool().rfind('/') + 1);
  for (const Attempt& each : run.libraries) {
    const bool is_below = each.path.compare(0, directory.size(), directory) == 0;
    Library library;
    library.facts.place = is_below ? each.path.substr(directory.size()) : each.path;
    library.attempt = &each;
    libraries.push_back(library);
  }
  return libraries;
}

// A null cause if the library was signed.
Reason WhyNotSigned(const Library& library, const RunRecord& run, const PackageFacts& facts,
                    bool is_walked) {
  const LibraryFacts& found = library.facts;
  const auto& lost = run.not_extracted;
  if (std::find(lost.begin(), lost.end(), found.entry) != lost.end()) {
    const bool is_encrypted =
        std::any_of(facts.entries.begin(), facts.entries.end(), [&found](const ListedEntry& each) {
          return each.entry.name == found.entry && each.entry.is_encrypted;
        });
    if (is_encrypted) return {&cause::kEntryEncrypted, found.entry};
    return {&cause::kLibraryNotExtracted, ""};
  }
  if (library.attempt != nullptr) {
    const Attempt& attempt = *library.attempt;
    if (attempt.outcome == Attempt::Outcome::kNotVerified)
      return WhyNotVerified(library, run, facts);
    if (attempt.outcome == Attempt::Outcome::kVanished) {
      return {&cause::kLibraryNotOpened, DescribeErrno(attempt.error)};
    }
    return WhyKernelDidNotSign(attempt);
  }
  if (found.place.empty()) return {&cause::kLibraryOtherAbi, ""};
  if (!is_walked) return {&cause::kPackageRefused, ""};
  if (found.is_met) return {&cause::kNotReached, ""};
  if (found.error != 0) return WhyNotThere(found, run, facts);
  return {&cause::kLibraryBehindDamage, ""};
}

Reason WhyNotVerified(const Library& library, const RunRecord& run, const PackageFacts& facts) {
  const LogMeaning why = library.attempt->why;
  if (why == LogMeaning::kFileNotOpened) return WhyNotThere(library.facts, run, facts);
  if (why == LogMeaning::kFileNotRead) return {&cause::kLibraryNoFile, ""};
  if (why == LogMeaning::kNotListed) return {&cause::kLibraryNotListed, ""};
  if (why == LogMeaning::kDigestUnknown) return {&cause::kLibraryDigest, ""};
  const std::string& name = library.facts.entry;
  const bool is_changed_inside =
      std::any_of(facts.entries.begin(), facts.entries.end(), [&](const ListedEntry& each) {
        return each.entry.name == name && each.digest == EntryDigest::kDiffers;
      });
  return {is_changed_inside ? &cause::kLibraryChangedInside : &cause::kLibraryChanged, ""};
}

// If the tool cannot open a library to compute its digest, the log does not say why. The simulator
// therefore opens the library as well: `library.error` is the errno that the simulator got.
Reason WhyNotThere(const LibraryFacts& library, const RunRecord& run, const PackageFacts& facts) {
  const int error = library.error;
  if (error == EACCES || error == EPERM) return {&cause::kLibraryNoPermission, ""};
  if (error == EWOULDBLOCK) return {&cause::kLibraryLeased, ""};
  if (error == 0) return {&cause::kLibraryNotOpened, "the reason is not known"};
  if (error != ENOENT && error != ENOTDIR) {
    return {&cause::kLibraryNotOpened, DescribeErrno(error)};
  }
  if (facts.manifest.extracts_libraries == false) return {&cause::kLibraryInPackage, ""};
  // Installers extract no library into a subdirectory of lib/arm64 or lib/arm.
  if (std::count(library.place.begin(), library.place.end(), '/') > 2) {
    return {&cause::kLibraryInSubdirectory, library.place};
  }
  if (run.of_other_abis.count(library.entry) > 0) return {&cause::kLibraryNotLaidOut, ""};
  return {library.has_directory ? &cause::kLibraryMissing : &cause::kLibraryNotInstalled, ""};
}

}  // namespace

}  // namespace simulator
