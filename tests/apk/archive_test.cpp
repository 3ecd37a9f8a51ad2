// Tests how entries are found, iterated and extracted, including entries with false headers.
#include <gtest/gtest.h>

#include <algorithm>

#include "support/compiled_manifest.h"
#include "support/log_capture.h"
#include "support/open_package.h"

using ApkTools::Apk;

namespace {

constexpr int32_t kIterationEnd = -1, kInvalidEntryName = -10;

std::vector<std::string> NamesIn(Apk& apk, const std::string& prefix, const std::string& suffix) {
  std::vector<std::string> names;
  void* cookie;
  EXPECT_EQ(apk.StartIteration(&cookie, prefix, suffix), 0);
  ZipEntry entry;
  for (std::string name; apk.Next(cookie, &entry, name) == 0;) names.push_back(name);
  apk.EndIteration(cookie);
  std::sort(names.begin(), names.end());
  return names;
}

// ---- Iteration.

TEST(ApkIteration, EmptyPrefixAndSuffixSelectAllEntries) {
  OpenPackage open(WithoutDex());
  EXPECT_EQ(
      NamesIn(open.apk, "", ""),
      (std::vector<std::string>{"AndroidManifest.xml", "META-INF/CERT.RSA", "META-INF/CERT.SF",
                                "META-INF/MANIFEST.MF", "lib/arm64-v8a/libfoo.so"}));
}

TEST(ApkIteration, PrefixAndSuffixSelectEntries) {
  OpenPackage open(WithoutDex());
  EXPECT_EQ(NamesIn(open.apk, "META-INF/", ".SF"), (std::vector<std::string>{"META-INF/CERT.SF"}));
  EXPECT_EQ(NamesIn(open.apk, "lib/", ""), (std::vector<std::string>{"lib/arm64-v8a/libfoo.so"}));
  EXPECT_EQ(NamesIn(open.apk, "", ".xml"), (std::vector<std::string>{"AndroidManifest.xml"}));
  EXPECT_EQ(NamesIn(open.apk, "meta-inf/", ""), (std::vector<std::string>{}));
}

TEST(ApkIteration, NextAtTheEndLeavesTheNameAsItWas) {
  LogCapture log;
  OpenPackage open(BuildZip({{"a", ToBytes("a")}}));
  void* cookie;
  ASSERT_EQ(open.apk.StartIteration(&cookie, "", ""), 0);
  ZipEntry entry;
  std::string name = "before";
  EXPECT_EQ(open.apk.Next(cookie, &entry, name), 0);
  EXPECT_EQ(name, "a");
  EXPECT_EQ(open.apk.Next(cookie, &entry, name), kIterationEnd);
  EXPECT_EQ(name, "a");
  open.apk.EndIteration(cookie);
}

TEST(ApkIteration, FilterOf65536BytesIsAnInvalidName) {
  LogCapture log;
  OpenPackage open(BuildZip({{"a", ToBytes("a")}}));
  void* cookie;
  EXPECT_EQ(open.apk.StartIteration(&cookie, std::string(0x10000, 'a'), ""), kInvalidEntryName);
  EXPECT_EQ(open.apk.StartIteration(&cookie, "", std::string(0x10000, 'a')), kInvalidEntryName);
}

// ---- Entries with false headers or damaged data.

// The log message for a package with this Android manifest; empty if the number of messages is not
// one.
std::string LogOfAndroidManifest(const ZipItem& item) {
  Package package = MakePackage(WithoutDex());
  package.Item(kAndroidManifestName) = item;
  LogCapture log;
  OpenPackage open(package);
  EXPECT_FALSE(open.apk.IsApk());
  return log.records().size() == 1 ? log.records()[0].text : "";
}

ZipItem AndroidManifestItem(bool deflated) {
  return {kAndroidManifestName, CompiledManifest("com.example.app"), deflated};
}

TEST(ApkEntries, DeflatedAndroidManifestWithDataDescriptorIsRead) {
  PackageOptions options = WithoutDex();
  Package package = MakePackage(options);
  package.Item(kAndroidManifestName).deflated = true;
  package.Item(kAndroidManifestName).data_descriptor = true;
  OpenPackage open(package);
  EXPECT_TRUE(open.apk.IsGoodApk());
  EXPECT_EQ(open.apk.GetPackageName(), "com.example.app");
}

TEST(ApkEntries, StoredEntryThatClaimsAnotherLengthIsInconsistent) {
  const ZipItem item = AndroidManifestItem(false);
  for (const uint32_t length : {0u, 1u, static_cast<uint32_t>(item.data.size()) + 1}) {
    EXPECT_EQ(LogOfAndroidManifest(ClaimingLength(item, length)),
              "Can't extract Android Manifest: Inconsistent information\n");
  }
}

TEST(ApkEntries, DeflatedEntryWithAnImpossibleLengthIsInconsistent) {
  const ZipItem item = AndroidManifestItem(true);
  const auto compressed_length = static_cast<uint32_t>(Deflate(item.data).size());
  for (const uint32_t length : {1032 * compressed_length + 1, 0xfffffffeu}) {
    EXPECT_EQ(LogOfAndroidManifest(ClaimingLength(item, length)),
              "Can't extract Android Manifest: Inconsistent information\n");
  }
}

TEST(ApkEntries, DeflatedEntryShorterThanItClaimsIsInconsistent) {
  const ZipItem item = AndroidManifestItem(true);
  const auto length = static_cast<uint32_t>(item.data.size());
  EXPECT_EQ(LogOfAndroidManifest(ClaimingLength(item, length + 1)),
            "Can't extract Android Manifest: Inconsistent information\n");
}

TEST(ApkEntries, EntryWhoseHeadersDisagreeIsInconsistent) {
  ZipItem item = AndroidManifestItem(true);
  item.local.length = 5;
  EXPECT_EQ(LogOfAndroidManifest(item),
            "Can't extract Android Manifest: Inconsistent information\n");
}

TEST(ApkEntries, EntryWithAFalseDataDescriptorIsInconsistent) {
  ZipItem item = AndroidManifestItem(true);
  item.data_descriptor = true;
  item.descriptor.length = 5;
  EXPECT_EQ(LogOfAndroidManifest(item),
            "Can't extract Android Manifest: Inconsistent information\n");
}

// 0xFF begins a block of the type that deflate reserves (RFC 1951 section 3.2.3).
TEST(ApkEntries, EntryThatCannotBeInflatedIsReportedAsZlibError) {
  ZipItem item = AndroidManifestItem(true);
  item.raw = Bytes(Deflate(item.data).size(), 0xFF);
  EXPECT_EQ(LogOfAndroidManifest(item), "Can't extract Android Manifest: Zlib error\n");
}

TEST(ApkEntries, ArchiveWithTwoEntriesOfOneNameIsNotOpened) {
  Package package = MakePackage(WithoutDex());
  package.items.push_back(package.Item(kAndroidManifestName));
  LogCapture log;
  OpenPackage open(package);
  EXPECT_FALSE(open.apk.IsGoodZip());
}

}  // namespace
