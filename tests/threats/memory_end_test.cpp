// Puts three kinds of data in a block at the end of a memory area (support/memory_end.h): compiled
// Android manifests, JAR manifests, and the tables that the tool makes from JAR manifests. If the
// platform's parser or the tool's code reads beyond the area, the test crashes.
#include <gtest/gtest.h>

#include "apk/apk.h"
#include "apk/entry_digests.h"
#include "apk/manifest_mf.h"
#include "support/compiled_manifest.h"
#include "support/log_capture.h"
#include "support/memory_end.h"

namespace {

// Parses the document. The block that the tool allocates for the document is put at the end of the
// memory area. The block is 20 bytes longer than the document, because the platform's parser can
// read an attribute (20 bytes) or a chunk header (8 bytes) that ends beyond the document.
bool ParseAtMemoryEnd(ApkTools::Apk* apk, const Bytes& document) {
  PutNextBlockAtMemoryEnd(document.size() + 20);
  const bool parsed = apk->ParseAndroidManifest(document);
  EXPECT_TRUE(WasPutAtMemoryEnd());
  return parsed;
}

TEST(CompiledManifestAtMemoryEnd, IsNotReadBeyondTheBlockAtAnyLength) {
  const Bytes whole = CompiledManifest("com.example.app", true);
  for (size_t size = 0; size <= whole.size(); ++size) {
    LogCapture log;
    ApkTools::Apk apk(-1);
    EXPECT_EQ(ParseAtMemoryEnd(&apk, Bytes(whole.begin(), whole.begin() + static_cast<int>(size))),
              size == whole.size())
        << size;
  }
}

// Sets the size of the chunk that starts at `chunk`.
void SetSize(Bytes* document, size_t chunk, size_t size) {
  for (size_t i = 0; i < 4; ++i) (*document)[chunk + 4 + i] = static_cast<uint8_t>(size >> (8 * i));
}

// The last node ends `rest` bytes before the end of the document. The parser looks for another
// header in these bytes.
TEST(CompiledManifestAtMemoryEnd, IsNotReadBeyondTheBlockForAMissingNode) {
  for (uint8_t rest = 1; rest <= 8; ++rest) {
    Bytes document = CompiledManifest("com.example.app", true);
    document.insert(document.end(), rest, 0);
    SetSize(&document, 0, document.size());
    LogCapture log;
    ApkTools::Apk apk(-1);
    EXPECT_TRUE(ParseAtMemoryEnd(&apk, document));
    EXPECT_EQ(apk.GetPackageName(), "com.example.app");
    EXPECT_TRUE(apk.IsSsPermissionRequired());
  }
}

// An attribute of size 0 can be at the end of its element. All its fields are then beyond the
// element.
TEST(CompiledManifestAtMemoryEnd, IsNotReadBeyondTheBlockForAMissingAttribute) {
  constexpr size_t kNode = 36, kAttribute = 20;
  Bytes document =
      CompiledXml()
          .Start("manifest", {StringAttribute("package", "p")})
          .StartWithSizelessAttributes("permission", StringAttribute("name", "other"), 1)
          .Build();
  document.resize(document.size() - kAttribute);
  SetSize(&document, 0, document.size());
  SetSize(&document, document.size() - kNode, kNode);
  LogCapture log;
  ApkTools::Apk apk(-1);
  EXPECT_TRUE(ParseAtMemoryEnd(&apk, document));
  EXPECT_EQ(apk.GetPackageName(), "p");
}

TEST(CompiledManifestAtMemoryEnd, IsRefusedIfShorterThanAHeader) {
  const Bytes whole = CompiledManifest("com.example.app");
  for (int size = 0; size < 8; ++size) {
    ApkTools::Apk apk(-1);
    LogCapture log;
    EXPECT_FALSE(ParseAtMemoryEnd(&apk, Bytes(whole.begin(), whole.begin() + size)));
    // 0x80000001 is the parser's code for a type that it does not accept.
    EXPECT_EQ(log.records(), Records({Error("ParseAndroidManifest failed to init xml parser, "
                                            "error=0x80000001\n")}))
        << size;
  }
}

// The table for sorting has a hash and an index for each section.
TEST(EntryDigestsAtMemoryEnd, AreSortedWithoutAccessBeyondTheTable) {
  constexpr size_t kSections = 33;
  std::string text;
  for (size_t i = kSections; i > 0; --i) {
    text +=
        "Name: " + std::to_string(50 + i) + "\r\nSHA1-Digest: " + std::to_string(i) + "\r\n\r\n";
  }
  ApkTools::EntryDigests digests;
  ASSERT_TRUE(digests.Load({text.begin(), text.end()}));
  PutNextBlockAtMemoryEnd(sizeof(std::pair<size_t, uint32_t>) * kSections);
  digests.List();
  EXPECT_TRUE(WasPutAtMemoryEnd());
  std::string digest_name, digest;
  EXPECT_TRUE(digests.Find("83", digest_name, digest));
  EXPECT_EQ(digest, "33");
  EXPECT_TRUE(digests.Find("51", digest_name, digest));
  EXPECT_EQ(digest, "1");
}

// In the first section, the table is sorted for the first time when a new attribute's name starts
// at offset 1024 of the text or later. Each attribute of this test takes 32 bytes of text, so the
// 33rd attribute starts at offset 1024. The 33rd attribute also fills the table.
TEST(ManifestSectionsAtMemoryEnd, AreNotReadBeyondTheLastAttribute) {
  constexpr uint32_t kAttributes = 33;
  std::string text;
  for (uint32_t i = kAttributes; i > 0; --i) text += std::to_string(50 + i) + std::string(30, 'v');
  ASSERT_EQ(text.size(), 32 * kAttributes);
  ManifestSections sections;
  PutNextBlockAtMemoryEnd(sizeof(ManifestAttribute) * kAttributes);
  sections.reset(reinterpret_cast<const uint8_t*>(text.data()), text.size());
  ASSERT_TRUE(WasPutAtMemoryEnd());
  for (uint32_t i = 0; i < kAttributes; ++i) sections.add({{32 * i, 2}, {32 * i + 2, 30}});
  sections.endSection();
  ASSERT_EQ(sections[0].size(), kAttributes);
  EXPECT_EQ(sections[0][0].first, "51");
  EXPECT_EQ(sections[0].find("83"), std::string(30, 'v'));
}

// The parser reads eight bytes at once. The test therefore uses names and value lines of every
// length from 1 to 19 bytes. These lengths are below and above eight bytes, and leave every
// remainder when they are divided by eight. The text is cut at each multiple of 4 bytes, because
// only a block of such a size ends exactly at the end of the area.
TEST(JarManifestAtMemoryEnd, IsNotReadBeyondTheBlockAtAnyLength) {
  for (size_t length = 1; length < 20; ++length) {
    const std::string run(length, 'v');
    const std::string whole = run + ": " + run + "\r\n " + run + "\r\nKey:\r\n " + run + "\r\n\r\n";
    for (size_t size = 4; size <= whole.size(); size += 4) {
      LogCapture log;
      ManifestMf expected, manifest;
      const bool parses = expected.load(whole.substr(0, size));
      PutNextBlockAtMemoryEnd(size);
      Bytes text(whole.begin(), whole.begin() + static_cast<ptrdiff_t>(size));
      EXPECT_TRUE(WasPutAtMemoryEnd());
      EXPECT_EQ(parses, manifest.load(std::move(text)));
      EXPECT_EQ(expected.getSections().size(), manifest.getSections().size());
    }
  }
}

}  // namespace
