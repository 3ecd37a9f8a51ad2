#include "simulator/package/entries.h"

#include <unordered_set>

#include "apk/apk.h"
#include "apk/base64.h"
#include "apk/entry_digests.h"
#include "apk/manifest_mf.h"
#include "util/digest.h"
#include "util/text.h"

namespace simulator {

namespace {

using ApkTools::Apk;
using ApkTools::EntryDigests;

EntryDigest Compare(Archive* archive, const EntryDigests& manifest, const ArchiveEntry& entry,
                    Apk* tool);
bool IsSha1Digest(const std::string& name, Apk* tool);
bool IsKnownDigest(const std::string& name, Apk* tool);
bool IsSignatureName(const std::string& name);
std::vector<std::string> FindMissing(std::vector<uint8_t> text, const EntryDigests& manifest,
                                     const std::vector<ListedEntry>& entries);

}  // namespace

PackageEntries CompareEntries(Archive* archive, std::vector<uint8_t> manifest,
                              const IsLate& is_late) {
  EntryDigests digests;
  digests.Load(manifest);
  digests.List();
  Apk tool(-1);  // without a file; it only compares digests
  PackageEntries entries;
  std::string digest_name, digest;
  for (ArchiveEntry& entry : archive->Entries()) {
    const bool is_listed = digests.Find(entry.name, digest_name, digest);
    EntryDigest result = EntryDigest::kUnlisted;
    if (is_listed) {
      result = is_late() ? EntryDigest::kNotCompared : Compare(archive, digests, entry, &tool);
    }
    const bool is_signature = IsSignatureName(entry.name);
    const bool has_sha1 = is_listed && IsSha1Digest(digest_name, &tool);
    entries.all.push_back({std::move(entry), is_listed, is_signature, result, has_sha1});
  }
  entries.missing = FindMissing(std::move(manifest), digests, entries.all);
  return entries;
}

bool IsSha1Digest(const std::string& name) {
  Apk tool(-1);
  return IsSha1Digest(name, &tool);
}

namespace {

EntryDigest Compare(Archive* archive, const EntryDigests& manifest, const ArchiveEntry& entry,
                    Apk* tool) {
  std::string digest_name, digest;
  std::vector<uint8_t> content;
  if (entry.is_damaged || !manifest.Find(entry.name, digest_name, digest) ||
      archive->ReadToCompare(entry.name, &content) != Archive::ReadResult::kRead) {
    return EntryDigest::kNotCompared;
  }
  if (tool->VerifyData(digest_name, Base64Decode(digest), content)) return EntryDigest::kMatches;
  return IsKnownDigest(digest_name, tool) ? EntryDigest::kDiffers : EntryDigest::kNotCompared;
}

// True if the tool treats `name` as the name of a SHA-1 digest. Asks the tool whether the SHA-1
// digest of an empty text is right under this name.
bool IsSha1Digest(const std::string& name, Apk* tool) {
  std::vector<uint8_t> sha1;
  ComputeSHA1Digest({}, sha1);
  return tool->VerifyData(name, sha1, {});
}

// True if the tool supports digests with this name. Tries the SHA-1 and the SHA-256 digest of an
// empty text.
bool IsKnownDigest(const std::string& name, Apk* tool) {
  std::vector<uint8_t> sha256;
  ComputeSHA256Digest({}, sha256);
  return IsSha1Digest(name, tool) || tool->VerifyData(name, sha256, {});
}

// True for the names of the manifest, of signature files and of signature blocks. Signing programs
// do not list these entries in the manifest.
bool IsSignatureName(const std::string& name) {
  constexpr std::string_view kDirectory = "META-INF/";
  if (name == Apk::kMANIFEST_MF) return true;
  if (name.compare(0, kDirectory.size(), kDirectory) != 0) return false;
  if (name.find('/', kDirectory.size()) != std::string::npos) return false;
  return EndsWith(name, ".SF") || EndsWith(name, ".RSA") || EndsWith(name, ".EC") ||
         EndsWith(name, ".DSA");
}

// Returns the names that have a digest in the manifest but are not in `entries`. Each name is
// returned once, in the order of the manifest.
std::vector<std::string> FindMissing(std::vector<uint8_t> text, const EntryDigests& manifest,
                                     const std::vector<ListedEntry>& entries) {
  std::unordered_set<std::string> known;
  for (const ListedEntry& each : entries) known.insert(each.entry.name);
  ManifestMf sections;
  sections.load(std::move(text));
  std::vector<std::string> missing;
  std::string digest_name, digest;
  for (const ManifestMf::Section& section : sections.getSections()) {
    std::string name(section.find("Name"));
    if (!manifest.Find(name, digest_name, digest) || !known.insert(name).second) continue;
    missing.push_back(std::move(name));
  }
  return missing;
}

}  // namespace

}  // namespace simulator
