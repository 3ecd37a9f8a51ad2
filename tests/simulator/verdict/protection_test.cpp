#include "simulator/verdict/parts.h"

#include <gtest/gtest.h>

using namespace simulator;

namespace {

// A package with a dex file, two libraries, a resource, an entry that the manifest does not list,
// and the signature file. Each entry has a different number of bytes, so a sum shows which entries
// it counts.
PackageFacts Package() {
  PackageFacts facts;
  facts.jar.manifest = Archive::ReadResult::kRead;
  facts.jar.signature_files = {"META-INF/CERT.SF"};
  facts.jar.certificate.emplace();
  facts.jar.certificate->subject = "CN=a";
  facts.jar.certificate->key.algorithm = "RSA";
  facts.jar.certificate->key.bits = 2048;
  facts.entries = {{{"classes.dex", 1, false}, true, false, EntryDigest::kMatches},
                   {{"lib/arm64-v8a/a.so", 10, false}, true, false, EntryDigest::kMatches},
                   {{"lib/x86/a.so", 100, false}, true, false, EntryDigest::kMatches},
                   {{"res/a", 1000, false}, true, false, EntryDigest::kMatches},
                   {{"added", 10000, false}, false, false},
                   {{"META-INF/CERT.SF", 100000, false}, false, true}};
  return facts;
}

Item PackageItem(const Cause* why, bool is_verified = false) {
  const ItemState state = why == nullptr ? ItemState::kDone : ItemState::kRefused;
  return {ItemKind::kPackage, "package", "", state, {why, ""}, is_verified};
}

Item LibraryItem(const Cause* why, bool is_verified = false) {
  const ItemState state = why == nullptr ? ItemState::kDone : ItemState::kRefused;
  return {ItemKind::kLibrary, "lib/arm64/a.so", "lib/arm64-v8a/a.so", state,
          {why, ""},          is_verified};
}

Report With(const std::vector<Item>& items) {
  Report report;
  report.items = items;
  report.signer = Package().jar.certificate;
  report.key = {std::string(64, 'a'), 2048, true};
  report.protection.verified = {2, 11};
  return report;
}

// Returns one letter per link of the chain: "h" if the link holds, "x" if it is broken, "-" if it
// was not reached.
std::string ChainOf(const std::vector<Item>& items) {
  std::string text;
  for (const Link& link : MakeChain(Package(), With(items))) {
    text += "hx-"[static_cast<size_t>(link.state)];
  }
  return text;
}

}  // namespace

TEST(Protection, CountsEntriesAndBytesOfEachKind) {
  const Protection protection =
      FindProtection(Package(), {PackageItem(nullptr, true), LibraryItem(nullptr, true)});
  EXPECT_EQ(protection.verified.bytes, 11U);
  EXPECT_EQ(protection.verified.entries, 2U);
  EXPECT_EQ(protection.vouched.bytes, 1100U);
  EXPECT_EQ(protection.vouched.entries, 2U);
  EXPECT_EQ(protection.unlisted.bytes, 10000U);
  EXPECT_EQ(protection.signature.bytes, 100000U);
  EXPECT_EQ(protection.unlisted_names, std::vector<std::string>({"added"}));
}

TEST(Protection, OnlyComparedEntriesAreVerified) {
  const auto verified = [](bool package, bool library) {
    return FindProtection(Package(), {PackageItem(nullptr, package), LibraryItem(nullptr, library)})
        .verified.bytes;
  };
  EXPECT_EQ(verified(false, false), 0U);
  EXPECT_EQ(verified(true, false), 1U);
  EXPECT_EQ(verified(false, true), 10U);
}

// The tool verified the library on disk, beside the package. The copy of this library inside the
// package differs from the manifest, and so does the resource.
TEST(Protection, EntryThatDiffersFromTheManifestIsNotVerified) {
  PackageFacts facts = Package();
  facts.entries[1].digest = EntryDigest::kDiffers;
  facts.entries[3].digest = EntryDigest::kDiffers;
  facts.entries[2].digest = EntryDigest::kNotCompared;
  facts.missing = {"gone"};
  const Protection protection =
      FindProtection(facts, {PackageItem(nullptr, true), LibraryItem(nullptr, true)});
  EXPECT_EQ(protection.verified.bytes, 1U);
  EXPECT_EQ(protection.vouched.bytes, 0U);
  EXPECT_EQ(protection.differing.bytes, 1010U);
  EXPECT_EQ(protection.differing_seen, 1U);
  EXPECT_EQ(protection.differing_names, std::vector<std::string>({"lib/arm64-v8a/a.so", "res/a"}));
  EXPECT_EQ(protection.uncompared.bytes, 100U);
  EXPECT_EQ(protection.missing_names, std::vector<std::string>({"gone"}));
}

TEST(Protection, LibraryThatTheToolFoundChangedIsNotVerified) {
  const Protection protection =
      FindProtection(Package(), {PackageItem(nullptr, true), LibraryItem(&cause::kLibraryChanged)});
  EXPECT_EQ(protection.verified.bytes, 1U);
  EXPECT_EQ(protection.vouched.bytes, 1110U);
}

TEST(Chain, BreaksWhereTheCauseSays) {
  EXPECT_EQ(ChainOf({PackageItem(nullptr)}), "hhhhh");
  EXPECT_EQ(ChainOf({PackageItem(&cause::kKernelRefused)}), "hhhhh");
  EXPECT_EQ(ChainOf({PackageItem(&cause::kExponentRefused)}), "x----");
  EXPECT_EQ(ChainOf({PackageItem(&cause::kCertificateIssued)}), "hx---");
  EXPECT_EQ(ChainOf({PackageItem(&cause::kSignedAttributes)}), "hhx--");
  EXPECT_EQ(ChainOf({PackageItem(&cause::kManifestChanged)}), "hhhx-");
  EXPECT_EQ(ChainOf({PackageItem(&cause::kDexChanged)}), "hhhhx");
  EXPECT_EQ(ChainOf({PackageItem(&cause::kNotReached)}), "hhhhx");
}

TEST(Chain, BreaksAtALibraryUnlessThePackageDoesBefore) {
  EXPECT_EQ(ChainOf({PackageItem(nullptr), LibraryItem(&cause::kLibraryChanged)}), "hhhhx");
  EXPECT_EQ(ChainOf({PackageItem(nullptr), LibraryItem(&cause::kLibraryMissing)}), "hhhhh");
  EXPECT_EQ(ChainOf({PackageItem(nullptr), LibraryItem(&cause::kKernelRefused)}), "hhhhh");
  EXPECT_EQ(ChainOf({PackageItem(&cause::kUnsigned), LibraryItem(&cause::kPackageRefused)}),
            "x----");
}

// The item `tool` reports a failure of the tool's run. Only the items of the package and of the
// libraries can break a link.
TEST(Chain, IsNotBrokenByAnotherItem) {
  const Item tool = {ItemKind::kTool, "tool", "", ItemState::kRefused, {&cause::kToolError, "x"}};
  EXPECT_EQ(ChainOf({PackageItem(nullptr), tool}), "hhhhh");
}

TEST(Chain, ShowsTheValueOfEachLinkOrWhyItBreaks) {
  const std::vector<Link> chain =
      MakeChain(Package(), With({PackageItem(&cause::kManifestChanged)}));
  EXPECT_EQ(chain[0].text, "RSA-2048");
  EXPECT_EQ(chain[1].text, "CN=a");
  EXPECT_EQ(chain[2].text, "META-INF/CERT.SF");
  EXPECT_EQ(chain[3].text, "META-INF/MANIFEST.MF was changed after it was signed");
  EXPECT_EQ(MakeChain(Package(), With({PackageItem(nullptr)}))[3].text, "META-INF/MANIFEST.MF");
  EXPECT_EQ(MakeChain(Package(), With({PackageItem(nullptr)}))[4].text,
            "2 compared with the manifest");
  EXPECT_EQ(
      MakeChain(Package(), With({PackageItem(nullptr), LibraryItem(&cause::kLibraryDigest)}))[4]
          .text,
      std::string("lib/arm64/a.so: ") + cause::kLibraryDigest.reason);
}

TEST(Chain, HasNoTextForMissingFacts) {
  Report report = With({PackageItem(&cause::kUnsigned)});
  report.signer.reset();
  report.key.reset();
  for (const Link& link : MakeChain({}, report)) {
    EXPECT_EQ(link.text, link.state == LinkState::kBroken      ? cause::kUnsigned.reason
                         : link.name == std::string("entries") ? "2 compared with the manifest"
                                                               : "")
        << link.name;
  }
}
