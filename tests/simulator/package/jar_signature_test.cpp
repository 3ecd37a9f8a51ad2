#include "simulator/package/jar_manifest.h"

#include <gtest/gtest.h>

using namespace simulator;

namespace {

using Names = std::set<std::string>;

}  // namespace

TEST(JarManifest, SectionsHaveAttributesAndContinuations) {
  const std::vector<ManifestSection> expected = {{{"Manifest-Version", "1.0"}},
                                                 {{"Name", "a long name"}, {"SHA1-Digest", "x"}}};
  EXPECT_EQ(ParseJarManifest("Manifest-Version: 1.0\r\n\r\nName: a lo\r\n ng name\r\n"
                             "SHA1-Digest: x\r\n\r\n"),
            expected);
  EXPECT_EQ(ParseJarManifest("Manifest-Version: 1.0\n\nName: a lo\n ng name\nSHA1-Digest: x\n"),
            expected);
  EXPECT_EQ(ParseJarManifest("Manifest-Version: 1.0\r\rName: a lo\r ng name\rSHA1-Digest: x"),
            expected);
}

TEST(JarManifest, WhatIsNoAttributeIsPassedOver) {
  EXPECT_EQ(ParseJarManifest(""), std::vector<ManifestSection>());
  EXPECT_EQ(ParseJarManifest("\n\n no start\nno colon\nKey:value\n\n"),
            std::vector<ManifestSection>());
}

TEST(JarManifest, ListedAreTheEntriesWithADigest) {
  EXPECT_EQ(ListedEntries("A: 1\n\nName: a\nSHA-256-Digest: x\n\nName: b\n\nName: c\nMD5-Digest: y"
                          "\n\nSHA1-Digest: z\n"),
            (Names{"a", "c"}));
}

TEST(SignatureFile, SaysWhichOtherSchemesThereAre) {
  EXPECT_EQ(ClaimedSchemes("Signature-Version: 1.0\r\nX-Android-APK-Signed: 2, 3\r\n\r\n"), "2, 3");
  EXPECT_EQ(ClaimedSchemes("Signature-Version: 1.0\r\n\r\nX-Android-APK-Signed: 2\r\n"), "");
  EXPECT_EQ(ClaimedSchemes(""), "");
}

TEST(SignatureFile, StatesADigestOfTheManifest) {
  EXPECT_TRUE(StatesManifestDigest("A: 1\n\nSHA-512-Digest-Manifest: x\n"));
  EXPECT_FALSE(StatesManifestDigest("SHA1-Digest-Manifest-Main-Attributes: x\n"));
}

// Bounded: a text of the largest size that is read is held in a few hundred megabytes at most.
TEST(JarManifest, AttributesBeyondReasonAreNotRead) {
  std::string text;
  for (int i = 0; i < (1 << 20) + 5; ++i) text += "a: \n";
  ASSERT_EQ(ParseJarManifest(text).size(), 1U);
  EXPECT_EQ(ParseJarManifest(text)[0].size(), 1U << 20);
}
