#include "simulator/package/compiled_manifest.h"

#include <gtest/gtest.h>

#include "support/compiled_manifest.h"

using namespace simulator;

namespace {

AndroidManifest Read(const Bytes& bytes) {
  return ParseCompiledManifest({reinterpret_cast<const char*>(bytes.data()), bytes.size()});
}

XmlAttribute Boolean(const std::string& name, bool value) {
  XmlAttribute attribute = IntAttribute(name, value ? 0xffffffff : 0);
  attribute.type = 0x12;
  return InAndroidNamespace(attribute);
}

}  // namespace

TEST(CompiledManifestFacts, PackageNameInEitherEncoding) {
  for (const auto pool : {CompiledXml::Pool::kUtf8, CompiledXml::Pool::kUtf16}) {
    for (const std::string& name :
         {std::string("com.example.\u00fc\u20ac\U0001f600"), std::string(300, 'n')}) {
      const CompiledXml xml =
          CompiledXml(pool).Element("manifest", {StringAttribute("package", name)});
      EXPECT_EQ(Read(xml.Build()).package_name, name);
    }
  }
}

TEST(CompiledManifestFacts, WhetherLibrariesAreExtracted) {
  const auto extracts = [](const std::vector<XmlAttribute>& attributes) {
    CompiledXml xml;
    xml.Start("manifest", {StringAttribute("package", "p")})
        .Element("application", attributes)
        .End("manifest");
    return Read(xml.Build()).extracts_libraries;
  };
  EXPECT_EQ(extracts({}), std::nullopt);
  EXPECT_EQ(extracts({Boolean("extractNativeLibs", true)}), true);
  EXPECT_EQ(extracts({Boolean("debuggable", true), Boolean("extractNativeLibs", false)}), false);
  EXPECT_EQ(extracts({StringAttribute("extractNativeLibs", "false")}), std::nullopt);
}

TEST(CompiledManifestFacts, TextsBeyondReasonAreNotThere) {
  for (const auto pool : {CompiledXml::Pool::kUtf8, CompiledXml::Pool::kUtf16}) {
    const CompiledXml xml =
        CompiledXml(pool).Element("manifest", {StringAttribute("package", std::string(1025, 'n'))});
    EXPECT_EQ(Read(xml.Build()).package_name, "");
  }
}

TEST(CompiledManifestFacts, WhatDoesNotReadIsNotThere) {
  EXPECT_EQ(Read({}).package_name, "");
  EXPECT_EQ(Read(ToBytes("<manifest package=\"p\"/>")).package_name, "");
  const Bytes whole = CompiledManifest("com.example.app", true);
  for (size_t size = 0; size < whole.size(); ++size) {
    const Bytes cut(whole.begin(), whole.begin() + static_cast<ptrdiff_t>(size));
    EXPECT_EQ(Read(cut).package_name, "") << size;  // the document's size no longer fits
  }
  EXPECT_EQ(Read(CompiledXml().StartWithoutName().Build()).package_name, "");
  EXPECT_EQ(Read(CompiledXml().Start("manifest").BadNode().Build()).package_name, "");
}
