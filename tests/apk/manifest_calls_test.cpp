// Counts the tool's calls of two functions of the platform's library. A hostile document can make
// each call expensive, and the tool's results do not show the number of calls. The linker redirects
// these calls to the functions below, which count them and call the library. CMakeLists.txt has the
// mangled names.
#include <androidfw/ResourceTypes.h>
#include <gtest/gtest.h>
#include <utils/String8.h>

#include "apk/apk.h"
#include "support/compiled_manifest.h"
#include "support/log_capture.h"

namespace {

int attribute_names = 0;  // requested
int conversions = 0;      // to UTF-8

}  // namespace

const char16_t* RealAttributeName(const android::ResXMLParser*, size_t,
                                  size_t*) __asm__("__real_" GET_ATTRIBUTE_NAME);
const char16_t* WrapAttributeName(const android::ResXMLParser*, size_t,
                                  size_t*) __asm__("__wrap_" GET_ATTRIBUTE_NAME);
void RealString8(android::String8*, const char16_t*, size_t) __asm__("__real_" STRING8_FROM_UTF16);
void WrapString8(android::String8*, const char16_t*, size_t) __asm__("__wrap_" STRING8_FROM_UTF16);

const char16_t* WrapAttributeName(const android::ResXMLParser* parser, size_t index,
                                  size_t* length) {
  ++attribute_names;
  return RealAttributeName(parser, index, length);
}

void WrapString8(android::String8* string, const char16_t* text, size_t length) {
  ++conversions;
  RealString8(string, text, length);
}

namespace {

class AndroidManifestCalls : public testing::Test {
 protected:
  void Read(const CompiledXml& xml) {
    apk_.Init(-1, nullptr);
    attribute_names = conversions = 0;
    ASSERT_TRUE(apk_.ParseAndroidManifest(xml.Build()));
  }

  LogCapture log_;
  ApkTools::Apk apk_{-1};
};

TEST_F(AndroidManifestCalls, OnlyThePackageNameIsConverted) {
  CompiledXml xml;
  xml.StartNamespace("android", kAndroidNamespace)
      .Start("manifest", {IntAttribute("versionCode", 1), StringAttribute("package", "p")})
      .Element("meta-data", {StringAttribute("name", "access"), StringAttribute("value", "none")})
      .Element("uses-permission", {StringAttribute("name", "com.qix.android.SECURE_STORAGE")})
      .End("manifest");
  Read(xml);
  EXPECT_EQ(apk_.GetPackageName(), "p");
  EXPECT_TRUE(apk_.IsSsPermissionRequired());
  EXPECT_EQ(conversions, 1);
}

TEST_F(AndroidManifestCalls, AttributesOfSizeZeroAreReadAsOne) {
  for (const uint16_t count : {1, 2, 65535}) {
    Read(CompiledXml()
             .StartWithSizelessAttributes("meta-data", StringAttribute("other", "access"), count)
             .End("meta-data"));
    EXPECT_EQ(attribute_names, 1) << count;
    EXPECT_FALSE(apk_.IsSsPermissionRequired());
  }
}

TEST_F(AndroidManifestCalls, AttributeOfSizeZeroCanSupplyThePackageName) {
  Read(CompiledXml()
           .StartWithSizelessAttributes("manifest", StringAttribute("package", "p"), 65535)
           .End("manifest"));
  EXPECT_EQ(apk_.GetPackageName(), "p");
  EXPECT_EQ(attribute_names, 1);
}

TEST_F(AndroidManifestCalls, AttributesAreNotReadIfTheirCountIsZero) {
  Read(CompiledXml()
           .StartWithSizelessAttributes("manifest", StringAttribute("package", "p"), 0)
           .End("manifest"));
  EXPECT_EQ(apk_.GetPackageName(), "");
  EXPECT_EQ(attribute_names, 0);
}

// Each text is converted once, even if many elements have it as the package's name.
TEST_F(AndroidManifestCalls, TextThatConvertsToAnEmptyNameIsConvertedOnce) {
  CompiledXml xml(CompiledXml::Pool::kUtf16);
  for (int i = 0; i < 5; ++i) {
    xml.Element("manifest", {StringAttribute("package", "\xED\xA0\x80")});
    xml.Element("manifest", {StringAttribute("package", "\xED\xB0\x80\xED\xB0\x80")});
  }
  Read(xml);
  EXPECT_EQ(apk_.GetPackageName(), "");
  EXPECT_EQ(conversions, 2);
  Read(xml.Element("manifest", {StringAttribute("package", "p")}));
  EXPECT_EQ(apk_.GetPackageName(), "p");
  EXPECT_EQ(conversions, 3);
}

}  // namespace
