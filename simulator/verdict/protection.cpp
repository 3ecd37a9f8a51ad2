#include "simulator/verdict/protection.h"

#include <algorithm>
#include <set>
#include <string>

namespace simulator {

namespace {

enum { kKey, kCertificate, kSignatureFile, kManifest, kEntries, kLinkCount };

int BreakOf(const Cause* why);
std::string KeyText(const PackageFacts& facts);
bool WasVerified(const Item& library);
bool IsOtherThanSigned(const Item& item);

}  // namespace

Protection FindProtection(const PackageFacts& facts, const std::vector<Item>& items) {
  constexpr char kDex[] = "classes.dex";
  std::set<std::string> verified;
  for (const Item& item : items) {
    if (item.kind == ItemKind::kPackage && BreakOf(item.reason.cause) == kLinkCount) {
      verified.insert(kDex);
    }
    if (item.kind == ItemKind::kLibrary && WasVerified(item)) verified.insert(item.entry);
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

std::vector<Link> MakeChain(const PackageFacts& facts, const std::vector<Item>& items,
                            const Share& verified) {
  const JarSignatureFacts& jar = facts.jar;
  std::vector<Link> chain = {
      {"key", LinkState::kHolds, KeyText(facts)},
      {"certificate", LinkState::kHolds, jar.certificate ? jar.certificate->subject : ""},
      {"signature file", LinkState::kHolds,
       jar.signature_files.empty() ? "" : jar.signature_files[0]},
      {"manifest", LinkState::kHolds, jar.has_manifest ? "META-INF/MANIFEST.MF" : ""},
      {"entries", LinkState::kHolds,
       std::to_string(verified.entries) + " compared with the manifest"}};
  const int broken = BreakOf(items[0].reason.cause);
  for (int i = 0; i < kLinkCount; ++i) {
    Link& link = chain[static_cast<size_t>(i)];
    if (i > broken) link.state = LinkState::kNotReached;
    if (i == broken) {
      link.state = LinkState::kBroken;
      link.text = items[0].reason.Text();
    }
  }
  const auto other = std::find_if(items.begin(), items.end(), IsOtherThanSigned);
  if (broken == kLinkCount && other != items.end()) {
    chain[kEntries] = {"entries", LinkState::kBroken, other->name + ": " + other->reason.Text()};
  }
  return chain;
}

namespace {

// The link that a cause is about; kLinkCount for one that breaks none, such as the kernel's.
int BreakOf(const Cause* why) {
  static const struct {
    int link;
    std::set<const Cause*> causes;
  } kBreaks[] = {
      {kKey,
       {&cause::kUnsigned, &cause::kNewerSchemeOnly, &cause::kEcKey, &cause::kDsaKey,
        &cause::kKeyTooLarge, &cause::kKeyTooSmall, &cause::kExponentRefused}},
      {kCertificate,
       {&cause::kCertificateIssued, &cause::kCertificateDigest, &cause::kCertificateChanged,
        &cause::kSignatureBlockMissing, &cause::kSignatureBlockUnreadable,
        &cause::kSignatureBlockMalformed, &cause::kNoMemory}},
      {kSignatureFile,
       {&cause::kSignatureFileMissing, &cause::kSignatureFileUnreadable,
        &cause::kSignatureFileMalformed, &cause::kSignedAttributes, &cause::kSignatureDigest,
        &cause::kSignatureFileChanged, &cause::kSignatureWrong}},
      {kManifest,
       {&cause::kManifestChanged, &cause::kManifestDigest, &cause::kManifestMalformed,
        &cause::kManifestUnreadable, &cause::kAndroidManifestText}},
      {kEntries,
       {&cause::kDexChanged, &cause::kDexNotListed, &cause::kDexDigest, &cause::kToolError,
        &cause::kDamagedArchive, &cause::kNotReached}}};
  for (const auto& row : kBreaks) {
    if (row.causes.count(why) > 0) return row.link;
  }
  return kLinkCount;
}

std::string KeyText(const PackageFacts& facts) {
  if (!facts.jar.certificate) return {};
  const PublicKey& key = facts.jar.certificate->key;
  return key.algorithm + "-" + std::to_string(key.bits);
}

// What the kernel refused, or was not asked to sign, had its digest compared all the same.
bool WasVerified(const Item& library) {
  const Cause* const why = library.reason.cause;
  return library.state == ItemState::kDone || why == &cause::kKernelRefused ||
         why == &cause::kIntegrityZero || why == &cause::kIntegrityMissing ||
         why == &cause::kIntegrityUnreadable || why == &cause::kLibraryNotOpened;
}

// A library that does not match the manifest.
bool IsOtherThanSigned(const Item& item) {
  const Cause* const why = item.reason.cause;
  return why == &cause::kLibraryChanged || why == &cause::kLibraryNotListed ||
         why == &cause::kLibraryDigest;
}

}  // namespace

}  // namespace simulator
