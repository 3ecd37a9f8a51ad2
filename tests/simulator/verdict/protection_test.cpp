#include "simulator/verdict/protection.h"

#include <gtest/gtest.h>

using namespace simulator;

namespace {

// A package with a dex file, two libraries, a resource, an entry that is not listed, and its
// signature; each entry has another number of bytes.
PackageFacts Package() {
  PackageFacts facts;
  facts.jar.has_manifest = true;
  facts.jar.signature_files = {"META-INF/CERT.SF"};
  facts.jar.certificate.emplace();
  facts.jar.certificate->subject = "CN=a";
  facts.jar.certificate->key.algorithm = "RSA";
  facts.jar.certificate->key.bits = 2048;
  facts.entries = {{{"classes.dex", 1, 1, false}, true, false},
                   {{"lib/arm64-v8a/a.so", 10, 10, false}, true, false},
                   {{"lib/x86/a.so", 100, 100, false}, true, false},
                   {{"res/a", 1000, 1000, false}, true, false},
                   {{"added", 10000, 10000, false}, false, false},
                   {{"META-INF/CERT.SF", 100000, 100000, false}, false, true}};
  return facts;
}

Item PackageItem(const Cause* why) {
  const ItemState state = why == nullptr ? ItemState::kDone : ItemState::kRefused;
  return {ItemKind::kPackage, "package", "", state, {why, ""}};
}

Item LibraryItem(const Cause* why) {
  const ItemState state = why == nullptr ? ItemState::kDone : ItemState::kRefused;
  return {ItemKind::kLibrary, "lib/arm64/a.so", "lib/arm64-v8a/a.so", state, {why, ""}};
}

uint64_t Verified(const Cause* package, const Cause* library) {
  return FindProtection(Package(), {PackageItem(package), LibraryItem(library)}).verified.bytes;
}

// "h" for a link that holds, "x" for the broken one, "-" for one that was not reached.
std::string ChainOf(const Cause* why) {
  std::string text;
  for (const Link& link : MakeChain(Package(), {PackageItem(why)}, {})) {
    text += "hx-"[static_cast<size_t>(link.state)];
  }
  return text;
}

}  // namespace

TEST(Protection, IsByWhatWasComparedListedAndNot) {
  const Protection protection =
      FindProtection(Package(), {PackageItem(nullptr), LibraryItem(nullptr)});
  EXPECT_EQ(protection.verified.bytes, 11U);
  EXPECT_EQ(protection.verified.entries, 2U);
  EXPECT_EQ(protection.vouched.bytes, 1100U);
  EXPECT_EQ(protection.unlisted.bytes, 10000U);
  EXPECT_EQ(protection.signature.bytes, 100000U);
  EXPECT_EQ(protection.unlisted_names, std::vector<std::string>({"added"}));
}

TEST(Protection, NothingIsVerifiedThatWasRefusedForItsSignature) {
  EXPECT_EQ(Verified(&cause::kManifestChanged, &cause::kPackageRefused), 0U);
  EXPECT_EQ(Verified(&cause::kDexChanged, &cause::kPackageRefused), 0U);
  EXPECT_EQ(Verified(nullptr, &cause::kLibraryChanged), 1U);
}

TEST(Protection, WhatTheKernelRefusedWasVerifiedBefore) {
  EXPECT_EQ(Verified(&cause::kKernelRefused, &cause::kIntegrityZero), 11U);
}

TEST(Chain, BreaksWhereTheCauseIs) {
  EXPECT_EQ(ChainOf(nullptr), "hhhhh");
  EXPECT_EQ(ChainOf(&cause::kKernelRefused), "hhhhh");
  EXPECT_EQ(ChainOf(&cause::kExponentRefused), "x----");
  EXPECT_EQ(ChainOf(&cause::kCertificateIssued), "hx---");
  EXPECT_EQ(ChainOf(&cause::kSignedAttributes), "hhx--");
  EXPECT_EQ(ChainOf(&cause::kManifestChanged), "hhhx-");
  EXPECT_EQ(ChainOf(&cause::kDexChanged), "hhhhx");
}

TEST(Chain, SaysWhatStandsThereOrWhyItBreaks) {
  const std::vector<Link> chain = MakeChain(Package(), {PackageItem(&cause::kManifestChanged)}, {});
  EXPECT_EQ(chain[0].text, "RSA-2048");
  EXPECT_EQ(chain[1].text, "CN=a");
  EXPECT_EQ(chain[2].text, "META-INF/CERT.SF");
  EXPECT_EQ(chain[3].text, "META-INF/MANIFEST.MF was changed after it was signed");
}

TEST(Chain, EndsWithWhatWasComparedOrTheLibraryThatIsAnother) {
  const auto end = [](const Cause* package, const Cause* library) {
    return MakeChain(Package(), {PackageItem(package), LibraryItem(library)}, {2, 11})[4];
  };
  EXPECT_EQ(end(nullptr, nullptr).text, "2 compared with the manifest");
  EXPECT_EQ(end(nullptr, &cause::kKernelRefused).state, LinkState::kHolds);
  EXPECT_EQ(end(nullptr, &cause::kLibraryMissing).state, LinkState::kHolds);
  for (const Cause* why :
       {&cause::kLibraryChanged, &cause::kLibraryNotListed, &cause::kLibraryDigest}) {
    EXPECT_EQ(end(nullptr, why).state, LinkState::kBroken);
    EXPECT_EQ(end(nullptr, why).text, std::string("lib/arm64/a.so: ") + why->reason);
  }
  EXPECT_EQ(end(&cause::kManifestChanged, &cause::kPackageRefused).state, LinkState::kNotReached);
}
