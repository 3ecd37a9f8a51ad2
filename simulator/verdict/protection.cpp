// What a package's signature protects.
#include <algorithm>
#include <set>
#include <string>

#include "simulator/verdict/parts.h"
#include "simulator/verdict/wording.h"

namespace simulator {

Protection FindProtection(const PackageFacts& facts, const std::vector<Item>& items) {
  std::set<std::string> verified;
  for (const Item& item : items) {
    if (!item.is_verified) continue;
    verified.insert(item.kind == ItemKind::kPackage ? "classes.dex" : item.entry);
  }
  Protection protection;
  for (const ListedEntry& entry : facts.entries) {
    Share* share = &protection.unlisted;
    if (entry.is_signature) {
      share = &protection.signature;
    } else if (entry.is_listed) {
      const bool is_verified = verified.count(entry.entry.name) > 0;
      share = is_verified ? &protection.verified : &protection.vouched;
    } else {
      protection.unlisted_names.push_back(entry.entry.name);
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
  // The package itself is the first item.
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
