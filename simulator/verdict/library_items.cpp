#include "simulator/verdict/library_items.h"

#include <sys/stat.h>

#include <cerrno>
#include <cstdio>

namespace simulator {

namespace {

// A library that the tool takes up, and what came of it; null when the tool did not say.
struct Library {
  std::string entry;
  std::string place;
  const Attempt* attempt = nullptr;
};

std::vector<Library> MatchAttempts(const RunRecord& run, const PackageFacts& facts);
Item LibraryItem(const Library& library, const RunRecord& run, const PackageFacts& facts,
                 bool is_strict);
Reason WhyNotVerified(const Attempt& attempt, const std::string& place, const RunRecord& run,
                      const PackageFacts& facts);
Reason WhyNotThere(const std::string& place, const RunRecord& run, const PackageFacts& facts);
bool IsAbsent(const Reason& reason);
std::string FolderOf(const std::string& path);

}  // namespace

void AddLibraryItems(const RunRecord& run, const PackageFacts& facts, const Item& own,
                     bool is_strict, std::vector<Item>* items) {
  // A JAR's entries are nobody's libraries.
  if (own.kind != ItemKind::kPackage) return;
  const bool is_walked = own.state == ItemState::kDone || run.own || !run.libraries.empty();
  for (const Library& library : MatchAttempts(run, facts)) {
    if (library.place.empty()) {
      items->push_back({ItemKind::kLibrary,
                        library.entry,
                        library.entry,
                        ItemState::kNothing,
                        {&cause::kLibraryOtherAbi, ""}});
    } else if (library.attempt == nullptr) {
      const Cause& why = is_walked ? cause::kNotReached : cause::kPackageRefused;
      items->push_back(
          {ItemKind::kLibrary, library.place, library.entry, ItemState::kRefused, {&why, ""}});
    } else {
      items->push_back(LibraryItem(library, run, facts, is_strict));
    }
  }
}

Reason WhyKernelDidNotSign(const Attempt& attempt) {
  if (attempt.outcome == Attempt::Outcome::kKernelRefused) {
    return {&cause::kKernelRefused, DescribeErrno(attempt.error)};
  }
  if (attempt.outcome != Attempt::Outcome::kNotAsked) return {};
  if (!attempt.integrity) return {&cause::kIntegrityMissing, ""};
  unsigned value = 0;
  // Read as the tool reads it.
  if (sscanf(attempt.integrity->c_str(), "%x", &value) != 1) {
    return {&cause::kIntegrityUnreadable, *attempt.integrity};
  }
  return {&cause::kIntegrityZero, ""};
}

// The first row whose folder the name begins with wins; nothing need follow it.
std::string InstalledPlace(const std::string& entry) {
  constexpr struct {
    const char* prefix;
    const char* folder;
  } kFolders[] = {{"lib/armeabi-v7a", "lib/arm"},
                  {"lib/armeabi-v8a", "lib/arm64"},
                  {"lib/arm64-v8a", "lib/arm64"},
                  {"lib/armeabi", "lib/arm"}};
  for (const auto& row : kFolders) {
    const std::string prefix = row.prefix;
    if (entry.compare(0, prefix.size(), prefix) == 0) {
      return row.folder + entry.substr(prefix.size());
    }
  }
  return {};
}

namespace {

// The tool takes the libraries up in the order of the archive, which is known from the file. Where
// that does not fit what it did, the paths that it named are all there is to go by.
std::vector<Library> MatchAttempts(const RunRecord& run, const PackageFacts& facts) {
  std::vector<Library> libraries;
  size_t expected = 0;
  for (const ArchiveEntry& entry : facts.libraries) {
    libraries.push_back({entry.name, InstalledPlace(entry.name), nullptr});
    if (!libraries.back().place.empty()) ++expected;
  }
  // A package is refused as a whole, or else each library is taken up.
  if (run.libraries.size() <= expected) {
    auto attempt = run.libraries.begin();
    for (Library& library : libraries) {
      if (library.place.empty() || attempt == run.libraries.end()) continue;
      library.attempt = &*attempt++;
    }
    return libraries;
  }
  libraries.clear();
  const std::string folder = FolderOf(run.path);
  for (const Attempt& attempt : run.libraries) {
    const bool is_below = attempt.path.compare(0, folder.size(), folder) == 0;
    const std::string place = is_below ? attempt.path.substr(folder.size()) : attempt.path;
    libraries.push_back({"", place, &attempt});
  }
  return libraries;
}

Item LibraryItem(const Library& library, const RunRecord& run, const PackageFacts& facts,
                 bool is_strict) {
  const Attempt& attempt = *library.attempt;
  Item item = {ItemKind::kLibrary, library.place, library.entry, ItemState::kRefused, {}};
  if (attempt.outcome == Attempt::Outcome::kNotVerified) {
    item.reason = WhyNotVerified(attempt, library.place, run, facts);
  } else if (attempt.outcome == Attempt::Outcome::kNotOpened) {
    item.reason = {&cause::kLibraryNotOpened, DescribeErrno(attempt.error)};
  } else {
    item.reason = WhyKernelDidNotSign(attempt);
  }
  if (item.reason.cause == nullptr) item.state = ItemState::kDone;
  if (!is_strict && IsAbsent(item.reason)) item.state = ItemState::kAbsent;
  return item;
}

Reason WhyNotVerified(const Attempt& attempt, const std::string& place, const RunRecord& run,
                      const PackageFacts& facts) {
  for (const std::string& line : attempt.errors) {
    if (Between(line, "Can't open file: ", "")) return WhyNotThere(place, run, facts);
    if (Between(line, "Can't read file: ", "")) return {&cause::kLibraryNoFile, ""};
    if (Between(line, "Can't find file in ", "")) return {&cause::kLibraryNotListed, ""};
    if (Between(line, "verifyData: ", "")) return {&cause::kLibraryDigest, ""};
  }
  return {&cause::kLibraryChanged, ""};
}

// The tool does not log why a file does not open; the file system still knows.
Reason WhyNotThere(const std::string& place, const RunRecord& run, const PackageFacts& facts) {
  const std::string path = FolderOf(run.path) + place;
  struct stat state = {};
  if (stat(path.c_str(), &state) == 0) return {&cause::kLibraryNoPermission, ""};
  const int error = errno;
  if (error == EACCES) return {&cause::kLibraryNoPermission, ""};
  if (error != ENOENT && error != ENOTDIR) {
    return {&cause::kLibraryNotOpened, DescribeErrno(error)};
  }
  if (facts.manifest.extracts_libraries == false) return {&cause::kLibraryInPackage, ""};
  const bool has_folder = stat(FolderOf(path).c_str(), &state) == 0;
  return {has_folder ? &cause::kLibraryMissing : &cause::kLibraryNotInstalled, ""};
}

bool IsAbsent(const Reason& reason) {
  return reason.cause == &cause::kLibraryInPackage ||
         reason.cause == &cause::kLibraryNotInstalled || reason.cause == &cause::kLibraryMissing;
}

// With its "/" at the end; empty when there is none.
std::string FolderOf(const std::string& path) { return path.substr(0, path.rfind('/') + 1); }

}  // namespace

}  // namespace simulator
