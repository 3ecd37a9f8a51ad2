#include "simulator/package/android_manifest.h"

#include <gtest/gtest.h>

#include "simulator/package/facts.h"
#include "support/compiled_manifest.h"
#include "support/files.h"
#include "support/package.h"

using namespace simulator;

namespace {

XmlAttribute Boolean(const std::string& name, bool value) {
  XmlAttribute attribute = IntAttribute(name, value ? 0xffffffff : 0);
  attribute.type = 0x12;
  return InAndroidNamespace(attribute);
}

constexpr CompiledXml::Pool kPools[] = {CompiledXml::Pool::kUtf8, CompiledXml::Pool::kUtf16};

// Parses a manifest whose <application> element has `attributes`. Returns the parsed value of
// extractNativeLibs.
std::optional<bool> Extracts(const std::vector<XmlAttribute>& attributes,
                             CompiledXml::Pool pool = CompiledXml::Pool::kUtf8) {
  CompiledXml xml(pool);
  xml.Start("manifest", {StringAttribute("package", "p")})
      .Element("application", attributes)
      .End("manifest");
  return ParseAndroidManifest(xml.Build()).extracts_libraries;
}

// Returns the document with every offset in the string pool changed to the offset of the longest
// string. The 203 strings then have 5000 bytes each, together about 90 times the 11244 bytes of the
// document.
Bytes WithStringsInOneAnother(Bytes bytes) {
  constexpr size_t kPool = 8;          // after the document's header
  constexpr size_t kOffsets = 8 + 28;  // after the pool's header
  const auto number = [&bytes](size_t at) {
    return bytes[at] | bytes[at + 1] << 8 | bytes[at + 2] << 16 | bytes[at + 3] << 24;
  };
  const int count = number(kPool + 8);
  EXPECT_GT(count, 200);
  // In the pool, the longest string is 5000 bytes between its length and a NUL. The next string
  // therefore starts more than 5000 bytes after it. All other strings are shorter.
  int longest = 0;
  for (int i = 0; i + 1 < count; ++i) {
    const size_t at = kOffsets + 4 * static_cast<size_t>(i);
    if (number(at + 4) - number(at) > 5000) longest = number(at);
  }
  EXPECT_NE(longest, 0);
  for (int i = 0; i < count; ++i) {
    for (size_t byte = 0; byte < 4; ++byte) {
      bytes[kOffsets + 4 * static_cast<size_t>(i) + byte] =
          static_cast<uint8_t>(longest >> (8 * byte));
    }
  }
  return bytes;
}

}  // namespace

TEST(AndroidManifestFacts, PackageNameIsReadInEitherEncoding) {
  for (const auto pool : kPools) {
    for (const std::string& name :
         {std::string("com.example.\u00fc\u20ac\U0001f600"), std::string(300, 'n')}) {
      CompiledXml xml(pool);
      xml.Element("manifest", {StringAttribute("package", name)});
      const AndroidManifest manifest = ParseAndroidManifest(xml.Build());
      EXPECT_EQ(manifest.package_name, name);
      EXPECT_EQ(manifest.installer_name, name);
    }
  }
}

// The tool uses the first attribute with the local name "package". The installer uses the attribute
// "package" without a namespace.
TEST(AndroidManifestFacts, PackageNameWithANamespaceCountsOnlyForTheTool) {
  for (const auto pool : kPools) {
    CompiledXml xml(pool);
    xml.Element("manifest", {InAndroidNamespace(StringAttribute("package", "com.victim")),
                             StringAttribute("package", "com.evil")});
    const AndroidManifest manifest = ParseAndroidManifest(xml.Build());
    EXPECT_EQ(manifest.package_name, "com.victim");
    EXPECT_EQ(manifest.installer_name, "com.evil");
  }
}

TEST(AndroidManifestFacts, PackageNameThatIsNoTextIsEmpty) {
  const AndroidManifest manifest =
      ParseAndroidManifest(CompiledXml().Element("manifest", {IntAttribute("package", 5)}).Build());
  EXPECT_EQ(manifest.package_name, "");
  EXPECT_EQ(manifest.installer_name, "");
}

TEST(AndroidManifestFacts, PackageNameOfAnInnerElementCountsOnlyForTheTool) {
  CompiledXml xml;
  xml.Start("manifest").Element("manifest", {StringAttribute("package", "p")}).End("manifest");
  EXPECT_EQ(ParseAndroidManifest(xml.Build()).package_name, "p");
  EXPECT_EQ(ParseAndroidManifest(xml.Build()).installer_name, "");
}

TEST(AndroidManifestFacts, BooleanExtractNativeLibsIsRead) {
  for (const auto pool : kPools) {
    EXPECT_EQ(Extracts({}, pool), std::nullopt);
    EXPECT_EQ(Extracts({Boolean("extractNativeLibs", true)}, pool), true);
    EXPECT_EQ(Extracts({Boolean("debuggable", true), Boolean("extractNativeLibs", false)}, pool),
              false);
    EXPECT_EQ(Extracts({StringAttribute("extractNativeLibs", "false")}, pool), std::nullopt);
    EXPECT_EQ(Extracts({Boolean("extractNativeLibz", false)}, pool), std::nullopt);
  }
}

// An installer reads a number as a Boolean value.
TEST(AndroidManifestFacts, LibrariesAreExtractedForAnyNumberButZero) {
  EXPECT_EQ(Extracts({IntAttribute("extractNativeLibs", 0)}), false);
  EXPECT_EQ(Extracts({IntAttribute("extractNativeLibs", 7)}), true);
  EXPECT_EQ(Extracts({ReferenceAttribute("extractNativeLibs", 0)}), std::nullopt);
}

TEST(AndroidManifestFacts, FirstOfTwoApplicationsCounts) {
  CompiledXml xml;
  xml.Start("manifest", {StringAttribute("package", "p")})
      .Element("application", {Boolean("extractNativeLibs", true)})
      .Element("application", {Boolean("extractNativeLibs", false)})
      .End("manifest");
  EXPECT_EQ(ParseAndroidManifest(xml.Build()).extracts_libraries, true);
  CompiledXml other;
  other.Start("manifest", {StringAttribute("package", "p")})
      .Element("application")
      .Element("application", {Boolean("extractNativeLibs", false)})
      .End("manifest");
  EXPECT_EQ(ParseAndroidManifest(other.Build()).extracts_libraries, std::nullopt);
}

TEST(AndroidManifestFacts, MalformedDocumentHasNoPackageName) {
  EXPECT_EQ(ParseAndroidManifest({}).package_name, std::nullopt);
  EXPECT_EQ(ParseAndroidManifest(ToBytes("<manifest package=\"p\"/>")).package_name, std::nullopt);
  const Bytes whole = CompiledManifest("com.example.app", true);
  for (size_t size = 0; size < whole.size(); ++size) {
    const Bytes cut(whole.begin(), whole.begin() + static_cast<ptrdiff_t>(size));
    EXPECT_EQ(ParseAndroidManifest(cut).package_name, std::nullopt) << size;
    EXPECT_EQ(ParseAndroidManifest(cut).installer_name, "") << size;
  }
  EXPECT_EQ(ParseAndroidManifest(CompiledXml().Start("x").StartWithoutName().Build()).package_name,
            "");
  EXPECT_EQ(ParseAndroidManifest(CompiledXml().Start("manifest").BadNode().Build()).package_name,
            "");
}

TEST(AndroidManifestFacts, DocumentWithOverlappingStringsIsNotRead) {
  std::vector<XmlAttribute> attributes = {StringAttribute("package", std::string(5000, 'p'))};
  for (int i = 0; i < 200; ++i) attributes.push_back(IntAttribute("a" + std::to_string(i), 0));
  PackageOptions options;
  options.android_manifest = CompiledXml().Element("manifest", attributes).Build();
  EXPECT_FALSE(ParseAndroidManifest(*options.android_manifest).has_overlaps);
  EXPECT_EQ(ParseAndroidManifest(*options.android_manifest).installer_name, std::string(5000, 'p'));
  EXPECT_TRUE(LookAt(DiskFile(MakePackage(options).Build()).path()).too_long.empty());
  options.android_manifest = WithStringsInOneAnother(*options.android_manifest);
  const AndroidManifest manifest = ParseAndroidManifest(*options.android_manifest);
  EXPECT_TRUE(manifest.has_overlaps);
  EXPECT_EQ(manifest.package_name, std::nullopt);
  EXPECT_EQ(manifest.installer_name, "");
  EXPECT_EQ(LookAt(DiskFile(MakePackage(options).Build()).path()).too_long,
            std::vector<std::string>({"AndroidManifest.xml"}));
}
