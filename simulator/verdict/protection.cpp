// Finds the entries of a package that its signature protects. Also makes the chain from the key to
// the entries.
#include <algorithm>
#include <map>
#include <string>

#include "simulator/verdict/parts.h"
#include "simulator/verdict/wording.h"

namespace simulator {

namespace {

// The entries that the tool checked against the manifest. The value is true if the check succeeded.
// For a library, the tool checks the file beside the package.
std::map<std::string, bool> EntriesSeen(const std::vector<Item>& items) {
  std::map<std::string, bool> seen;
  for (const Item& item : items) {
    const Cause* const why = item.reason.cause;
    const bool has_differed = why == &cause::kDexChanged || why == &cause::kLibraryChanged ||
                              why == &cause::kLibraryChangedInside;
    if (!item.is_verified && !has_differed) continue;
    seen[item.kind == ItemKind::kPackage ? "classes.dex" : item.entry] = item.is_verified;
  }
  return seen;
}

}  // namespace

Protection FindProtection(const PackageFacts& facts, const std::vector<Item>& items) {
  const std::map<std::string, bool> seen = EntriesSeen(items);
  Protection protection;
  protection.missing_names = facts.missing;
  for (const ListedEntry& entry : facts.entries) {
    const std::string& name = entry.entry.name;
    const auto look = seen.find(name);
    Share* share = &protection.uncompared;
    if (entry.is_signature) {
      share = &protection.signature;
    } else if (!entry.is_listed) {
      share = &protection.unlisted;
      protection.unlisted_names.push_back(name);
    } else if (entry.digest == EntryDigest::kDiffers) {
      share = &protection.differing;
      protection.differing_names.push_back(name);
      protection.differing_seen += look != seen.end() ? 1 : 0;
    } else if (entry.digest == EntryDigest::kMatches) {
      share = look != seen.end() && look->second ? &protection.verified : &protection.vouched;
    }
    ++share->entries;
    share->bytes += entry.entry.size;
  }
  return protection;
}

std::vector<Link> MakeChain(const PackageFacts& facts, const Report& report) {
  const JarSignatureFacts& jar = facts.jar;
  const bool has_manifest = jar.manifest != Archive::ReadResult::kMissing;
  std::vector<Link> chain = {
      {"key", LinkState::kHolds, KeyName(report)},
      {"certificate", LinkState::kHolds, report.signer ? report.signer->subject : ""},
      {"signature file", LinkState::kHolds,
       jar.signature_files.empty() ? "" : jar.signature_files[0]},
      {"manifest", LinkState::kHolds, has_manifest ? "META-INF/MANIFEST.MF" : ""},
      {"entries", LinkState::kHolds,
       std::to_string(report.protection.verified.entries) + " compared with the manifest"}};
  // The package is the first item, so its fault is found before those of the libraries.
  const auto is_broken = [](const Item& item) {
    return item.reason.cause != nullptr && item.reason.cause->link != ChainLink::kNone &&
           (item.kind == ItemKind::kPackage || item.kind == ItemKind::kLibrary);
  };
  const auto broken = std::find_if(report.items.begin(), report.items.end(), is_broken);
  if (broken == report.items.end()) return chain;
  const auto at = static_cast<size_t>(broken->reason.cause->link);
  const std::string whose = broken->kind == ItemKind::kLibrary ? broken->name + ": " : "";
  chain[at] = {chain[at].name, LinkState::kBroken, whose + broken->reason.Text()};
  for (size_t i = at + 1; i < chain.size(); ++i) chain[i].state = LinkState::kNotReached;
  return chain;
}

}  // namespace simulator
