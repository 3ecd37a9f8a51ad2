// Reading the compiled Android manifest.
#include <gtest/gtest.h>

#include <algorithm>

#include "apk/apk.h"
#include "support/compiled_manifest.h"
#include "support/log_capture.h"
#include "support/package.h"

using ApkTools::Apk;

namespace {

constexpr char kPermission[] = "com.qix.android.SECURE_STORAGE";
constexpr char kOtherPermission[] = "com.qix.android.securestorage.permission.SECURE_STORAGE";

XmlAttribute Package(const std::string& name) { return StringAttribute("package", name); }
XmlAttribute AndroidName(const std::string& name) {
  return InAndroidNamespace(StringAttribute("name", name));
}
XmlAttribute AndroidValue(const std::string& value) {
  return InAndroidNamespace(StringAttribute("value", value));
}

// The facts that the tool reads from one document.
struct Facts {
  std::string package_name;
  bool ss_permission_required;
};
bool operator==(const Facts& a, const Facts& b) {
  return a.package_name == b.package_name && a.ss_permission_required == b.ss_permission_required;
}
std::ostream& operator<<(std::ostream& out, const Facts& facts) {
  return out << facts.package_name << (facts.ss_permission_required ? " with" : " without");
}

// Reads the document. The test fails if the tool refuses the document or logs a message.
Facts Read(const CompiledXml& xml) {
  LogCapture log;
  Apk apk(-1);
  log.Clear();
  EXPECT_TRUE(apk.ParseAndroidManifest(xml.Build()));
  EXPECT_EQ(log.records(), Records());
  return {apk.GetPackageName(), apk.IsSsPermissionRequired()};
}

// Builds a document with the element inside an element "manifest". Returns true if the document
// asks for the secure-storage permission.
bool Asks(const std::string& element, const std::vector<XmlAttribute>& attributes) {
  CompiledXml xml;
  xml.Start("manifest", {Package("p")}).Element(element, attributes).End("manifest");
  const Facts facts = Read(xml);
  EXPECT_EQ(facts.package_name, "p");
  return facts.ss_permission_required;
}

// ---- The package's name.

TEST(AndroidManifestPackage, NameIsReadFromUtf8AndUtf16) {
  for (const auto pool : {CompiledXml::Pool::kUtf8, CompiledXml::Pool::kUtf16}) {
    EXPECT_EQ(Read(CompiledXml(pool).Element("manifest",
                                             {Package("com.example.\u00fc\u20ac\U0001f600")})),
              (Facts{"com.example.\u00fc\u20ac\U0001f600", false}));
  }
}

TEST(AndroidManifestPackage, LongNameIsReadWhole) {
  const std::string name(300, 'n');
  for (const auto pool : {CompiledXml::Pool::kUtf8, CompiledXml::Pool::kUtf16}) {
    EXPECT_EQ(Read(CompiledXml(pool).Element("manifest", {Package(name)})), (Facts{name, false}));
  }
}

TEST(AndroidManifestPackage, SecondManifestSuppliesTheNameThatTheFirstLacks) {
  EXPECT_EQ(Read(CompiledXml()
                     .Element("manifest", {ReferenceAttribute("package", 0x7f010001)})
                     .Element("manifest", {Package("second")})),
            (Facts{"second", false}));
}

TEST(AndroidManifestPackage, EmptyNameIsReplacedByTheSecondManifestsName) {
  EXPECT_EQ(
      Read(CompiledXml().Element("manifest", {Package("")}).Element("manifest", {Package("b")})),
      (Facts{"b", false}));
}

TEST(AndroidManifestPackage, FirstManifestWithANameWins) {
  EXPECT_EQ(
      Read(CompiledXml().Element("manifest", {Package("a")}).Element("manifest", {Package("b")})),
      (Facts{"a", false}));
}

TEST(AndroidManifestPackage, ManifestInsideOtherElementsIsFound) {
  EXPECT_EQ(Read(CompiledXml()
                     .Start("root")
                     .Start("inner")
                     .Text("text")
                     .Element("manifest", {Package("deep")})
                     .End("inner")
                     .End("root")),
            (Facts{"deep", false}));
}

TEST(AndroidManifestPackage, ReferenceIsNotAName) {
  EXPECT_EQ(Read(CompiledXml().Element("manifest", {ReferenceAttribute("package", 0x7f010001)})),
            (Facts{"", false}));
}

TEST(AndroidManifestPackage, IntegerIsNotAName) {
  EXPECT_EQ(Read(CompiledXml().Element("manifest", {IntAttribute("package", 17)})),
            (Facts{"", false}));
}

TEST(AndroidManifestPackage, ElementAndAttributeNamesAreCaseSensitive) {
  EXPECT_EQ(Read(CompiledXml()
                     .Element("Manifest", {Package("a")})
                     .Element("manifest", {StringAttribute("Package", "b")})),
            (Facts{"", false}));
}

TEST(AndroidManifestPackage, DocumentWithoutManifestHasNoName) {
  EXPECT_EQ(Read(CompiledXml().Element("resources")), (Facts{"", false}));
}

TEST(AndroidManifestPackage, SecondDocumentWithoutNameClearsTheName) {
  LogCapture log;
  Apk apk(-1);
  ASSERT_TRUE(apk.ParseAndroidManifest(CompiledManifest("first")));
  EXPECT_EQ(apk.GetPackageName(), "first");
  ASSERT_TRUE(apk.ParseAndroidManifest(CompiledXml().Element("manifest").Build()));
  EXPECT_EQ(apk.GetPackageName(), "");
}

TEST(AndroidManifestPackage, NulInsideTheNameIsKept) {
  const std::string name("com\0example", 11);
  for (const auto pool : {CompiledXml::Pool::kUtf8, CompiledXml::Pool::kUtf16}) {
    EXPECT_EQ(Read(CompiledXml(pool).Element("manifest", {Package(name)})), (Facts{name, false}));
  }
}

// ---- The secure-storage permission.

TEST(AndroidManifestPermission, UsesPermissionElementAsksWithEitherName) {
  EXPECT_TRUE(Asks("uses-permission", {AndroidName(kPermission)}));
  EXPECT_TRUE(Asks("uses-permission", {AndroidName(kOtherPermission)}));
  EXPECT_FALSE(Asks("uses-permission", {AndroidName("android.permission.INTERNET")}));
}

TEST(AndroidManifestPermission, PermissionElementAsksWithEitherName) {
  EXPECT_TRUE(Asks("permission", {AndroidName(kPermission)}));
  EXPECT_TRUE(Asks("permission", {AndroidName(kOtherPermission)}));
  EXPECT_FALSE(Asks("permission", {AndroidName("com.example.OWN")}));
}

TEST(AndroidManifestPermission, OtherElementsDoNotAsk) {
  EXPECT_FALSE(Asks("uses-permission-sdk-23", {AndroidName(kPermission)}));
  EXPECT_FALSE(Asks("Permission", {AndroidName(kPermission)}));
  EXPECT_FALSE(Asks("service", {AndroidName(kPermission)}));
}

TEST(AndroidManifestPermission, NamesMustMatchExactly) {
  EXPECT_FALSE(Asks("uses-permission", {AndroidName("com.qix.android.Secure_Storage")}));
  EXPECT_FALSE(Asks("uses-permission", {AndroidName("com.qix.android.SECURE_STORAGE2")}));
  EXPECT_FALSE(Asks("uses-permission", {AndroidName("com.qix.android.SECURE_STORAG")}));
}

TEST(AndroidManifestPermission, NulDoesNotEndAName) {
  EXPECT_FALSE(
      Asks("uses-permission", {AndroidName(std::string(kPermission) + std::string("\0x", 2))}));
  EXPECT_FALSE(Asks("uses-permission", {AndroidName(std::string(kPermission) + '\0')}));
  EXPECT_FALSE(Asks(std::string("uses-permission\0", 16), {AndroidName(kPermission)}));
  EXPECT_FALSE(Asks("uses-permission", {StringAttribute(std::string("name\0", 5), kPermission)}));
}

TEST(AndroidManifestPermission, MetaDataWithAccessAndSsMetaAsks) {
  EXPECT_TRUE(Asks("meta-data", {AndroidName("access"), AndroidValue("SS_META")}));
  EXPECT_TRUE(Asks("meta-data", {AndroidValue("SS_META"), AndroidName("access")}));
}

TEST(AndroidManifestPermission, MetaDataInAnotherLetterCaseDoesNotAsk) {
  EXPECT_FALSE(Asks("meta-data", {AndroidName("Access"), AndroidValue("SS_META")}));
  EXPECT_FALSE(Asks("meta-data", {AndroidName("access"), AndroidValue("ss_meta")}));
  EXPECT_FALSE(Asks("Meta-Data", {AndroidName("access"), AndroidValue("SS_META")}));
}

TEST(AndroidManifestPermission, MetaDataNeedsBothAttributes) {
  EXPECT_FALSE(Asks("meta-data", {AndroidName("access")}));
  EXPECT_FALSE(Asks("meta-data", {AndroidValue("SS_META")}));
  EXPECT_FALSE(Asks("meta-data", {AndroidName("access"), IntAttribute("value", 1)}));
}

TEST(AndroidManifestPermission, MetaDataWithAPermissionsNameDoesNotAsk) {
  EXPECT_FALSE(Asks("meta-data", {AndroidName(kPermission)}));
}

TEST(AndroidManifestPermission, IsNotClearedByLaterElements) {
  EXPECT_EQ(Read(CompiledXml()
                     .Element("uses-permission", {AndroidName(kPermission)})
                     .Element("uses-permission", {AndroidName("android.permission.INTERNET")})
                     .Element("meta-data", {AndroidName("other")})
                     .Element("manifest", {Package("p")})),
            (Facts{"p", true}));
}

// ---- The attribute that is read.

TEST(AndroidManifestAttribute, NamesMatchInAnyNamespace) {
  EXPECT_TRUE(Asks("uses-permission", {StringAttribute("name", kPermission)}));
  XmlAttribute other = StringAttribute("name", kPermission);
  other.name_space = "http://example.com/other";
  EXPECT_TRUE(Asks("uses-permission", {other}));
}

TEST(AndroidManifestAttribute, FirstOfTwoStringsWithTheNameIsUsed) {
  EXPECT_EQ(Read(CompiledXml().Element("manifest", {Package("a"), Package("b")})),
            (Facts{"a", false}));
}

TEST(AndroidManifestAttribute, ReferenceBeforeAStringIsSkipped) {
  EXPECT_EQ(Read(CompiledXml().Element("manifest",
                                       {ReferenceAttribute("package", 0x7f010001), Package("b")})),
            (Facts{"b", false}));
}

TEST(AndroidManifestAttribute, StringWithoutTextBeforeAnotherStringIsSkipped) {
  EXPECT_EQ(Read(CompiledXml().Element("manifest",
                                       {StringAttributeWithoutText("package"), Package("b")})),
            (Facts{"b", false}));
}

// An attribute's raw value is its text in the XML source. The typed value was compiled from this
// text. The raw value is read only if the type of the typed value is string.
TEST(AndroidManifestAttribute, RawTextOfReferenceOrIntegerIsIgnored) {
  for (XmlAttribute attribute :
       {ReferenceAttribute("package", 0x7f010000), IntAttribute("package", 7)}) {
    attribute.has_raw = true;
    attribute.text = "raw";
    EXPECT_EQ(Read(CompiledXml().Element("manifest", {attribute})), (Facts{"", false}));
  }
}

TEST(AndroidManifestAttribute, AttributeWithoutNameIsSkipped) {
  XmlAttribute nameless = Package("wrong");
  nameless.has_name = false;
  EXPECT_EQ(Read(CompiledXml().Element("manifest", {nameless, Package("right")})),
            (Facts{"right", false}));
}

TEST(AndroidManifestAttribute, LoneStringWithoutTextCountsAsMissing) {
  EXPECT_EQ(Read(CompiledXml().Element("manifest", {StringAttributeWithoutText("package")})),
            (Facts{"", false}));
}

// ---- Unpaired surrogates. The platform drops them when it converts a text to UTF-8. The tool
// converts only the package's name. It compares all other texts without a conversion. If a compared
// text has at most 16 unpaired surrogates, the comparison ignores these surrogates.

const std::string kHigh = "\xED\xA0\x80", kLow = "\xED\xB0\x80";  // U+D800, U+DC00

std::string Times(size_t count, const std::string& text) {
  std::string all;
  while (count-- > 0) all += text;
  return all;
}

// The text after the platform's conversion.
std::string Converted(const std::string& text) {
  CompiledXml xml(CompiledXml::Pool::kUtf16);
  return Read(xml.Element("manifest", {Package(text)})).package_name;
}

TEST(AndroidManifestSurrogates, AreDroppedFromNamesAndValuesOnlyIfUnpaired) {
  const std::string pair = "\U00010000";
  for (const std::string& before : {kHigh, kLow, kHigh + kHigh, kLow + kHigh, kHigh + pair, pair}) {
    for (const size_t at : {0, 3, 15}) {
      const auto with = [&](std::string text) {
        return text.insert(std::min(at, text.size()), before);
      };
      const bool is_dropped = Converted(with("uses-permission")) == "uses-permission";
      EXPECT_EQ(is_dropped, before.find(pair) == std::string::npos);
      CompiledXml xml(CompiledXml::Pool::kUtf16);
      xml.Element(with("uses-permission"), {StringAttribute(with("name"), with(kPermission))});
      EXPECT_EQ(Read(xml).ss_permission_required, is_dropped) << before << at;
      CompiledXml other(CompiledXml::Pool::kUtf16);
      other.Element("manifest", {StringAttribute(with("package"), "p")});
      EXPECT_EQ(Read(other).package_name, is_dropped ? "p" : "") << before << at;
    }
  }
}

TEST(AndroidManifestSurrogates, DoNotMakeAShorterNameMatch) {
  CompiledXml xml(CompiledXml::Pool::kUtf16);
  xml.Element("manifes" + kHigh + kHigh, {Package("p")});
  EXPECT_EQ(Read(xml), (Facts{"", false}));
}

// A text with more than 16 unpaired surrogates matches no name. Without this limit, a hostile
// document could make each comparison read a very long text.
TEST(AndroidManifestSurrogates, PreventAMatchIfThereAreMoreThan16) {
  for (const size_t count : {16, 17}) {
    CompiledXml xml(CompiledXml::Pool::kUtf16);
    xml.Element("manifest" + Times(count, kLow), {Package("p")});
    EXPECT_EQ(Read(xml), (Facts{count == 16 ? "p" : "", false}));
  }
}

TEST(AndroidManifestSurrogates, PackageNameOfSurrogatesAloneCountsAsEmpty) {
  CompiledXml xml(CompiledXml::Pool::kUtf16);
  xml.Element("manifest", {Package(Times(40, kHigh))}).Element("manifest", {Package("b")});
  EXPECT_EQ(Read(xml), (Facts{"b", false}));
}

TEST(AndroidManifestSurrogates, AllAreDroppedFromThePackageName) {
  CompiledXml xml(CompiledXml::Pool::kUtf16);
  xml.Element("manifest", {Package(Times(40, kHigh) + "a" + Times(40, kLow))});
  EXPECT_EQ(Read(xml), (Facts{"a", false}));
}

// ---- Malformed documents.

TEST(AndroidManifestDocument, BytesThatAreNotCompiledXmlAreReported) {
  LogCapture log;
  Apk apk(-1);
  ASSERT_TRUE(apk.ParseAndroidManifest(CompiledManifest("before", true)));
  log.Clear();
  EXPECT_FALSE(apk.ParseAndroidManifest(ToBytes("<?xml version='1.0'?><manifest/>")));
  // 0x80000001 is BAD_TYPE of the platform's status codes.
  EXPECT_EQ(log.records(), Records({Error("ParseAndroidManifest failed to init xml parser, "
                                          "error=0x80000001\n")}));
  EXPECT_EQ(apk.GetPackageName(), "before");
  EXPECT_TRUE(apk.IsSsPermissionRequired());
}

TEST(AndroidManifestDocument, EmptyDocumentIsReported) {
  LogCapture log;
  Apk apk(-1);
  log.Clear();
  EXPECT_FALSE(apk.ParseAndroidManifest({}));
  EXPECT_EQ(log.records(), Records({Error("ParseAndroidManifest failed to init xml parser, "
                                          "error=0x80000001\n")}));
}

TEST(AndroidManifestDocument, KeepsTheNameReadBeforeABadNode) {
  EXPECT_EQ(Read(CompiledXml()
                     .Start("manifest", {Package("found")})
                     .BadNode()
                     .Element("uses-permission", {AndroidName(kPermission)})),
            (Facts{"found", false}));
}

TEST(AndroidManifestDocument, KeepsThePermissionReadBeforeABadNode) {
  EXPECT_EQ(Read(CompiledXml()
                     .Element("uses-permission", {AndroidName(kPermission)})
                     .BadNode()
                     .Element("manifest", {Package("lost")})),
            (Facts{"", true}));
}

// The document's first `length` bytes, with the length in its header set to `length`.
Bytes CutTo(size_t length, const Bytes& document) {
  Bytes cut(document.begin(), document.begin() + static_cast<ptrdiff_t>(length));
  for (size_t i = 4; i < 8 && i < length; ++i) {
    cut[i] = static_cast<uint8_t>(length >> (8 * (i - 4)));
  }
  cut.shrink_to_fit();
  return cut;
}

TEST(AndroidManifestDocument, EveryTruncationIsReadOrReported) {
  const Bytes whole = CompiledManifest("com.example.app", true);
  LogCapture log;
  size_t read = 0;
  for (size_t length = 0; length < whole.size(); ++length) {
    Apk apk(-1);
    log.Clear();
    const bool good = apk.ParseAndroidManifest(CutTo(length, whole));
    EXPECT_EQ(good, log.records().empty());
    if (good) ++read;
  }
  EXPECT_GT(read, 0u);
  EXPECT_LT(read, whole.size());
}

// Returns the document with `new_bytes` in place of the first occurrence of `old_bytes`. The
// document must contain `old_bytes`.
Bytes Replaced(Bytes document, const Bytes& old_bytes, const Bytes& new_bytes) {
  const auto at = std::search(document.begin(), document.end(), old_bytes.begin(), old_bytes.end());
  EXPECT_NE(at, document.end());
  std::copy(new_bytes.begin(), new_bytes.end(), at);
  return document;
}

// The changed document claims a length of 9 for the name "manifest". The NUL at the end of the name
// is then the ninth byte, and no NUL follows it. The platform's library then returns the name's
// length but no text.
TEST(AndroidManifestDocument, ElementWhoseNameDoesNotEndIsSkipped) {
  CompiledXml xml;
  xml.Element("manifest", {Package("a")}).Element("permission", {AndroidName(kPermission)});
  const Bytes bad = Replaced(xml.Build(), {8, 8, 'm', 'a'}, {8, 9, 'm', 'a'});
  LogCapture log;
  Apk apk(-1);
  EXPECT_TRUE(apk.ParseAndroidManifest(bad));
  EXPECT_EQ(apk.GetPackageName(), "");
  EXPECT_TRUE(apk.IsSsPermissionRequired());
}

TEST(AndroidManifestDocument, ElementWithoutNameIsSkipped) {
  EXPECT_EQ(Read(CompiledXml().StartWithoutName().Element("manifest", {Package("p")})),
            (Facts{"p", false}));
}

TEST(AndroidManifestDocument, NamespaceWithoutUriIsSkipped) {
  EXPECT_EQ(Read(CompiledXml().StartNamespaceWithoutUri().Element("manifest", {Package("p")})),
            (Facts{"p", false}));
}

}  // namespace
