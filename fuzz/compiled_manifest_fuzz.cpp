// apk/android_manifest.cpp: any bytes as the compiled Android manifest. The sanitizers do not check
// the platform's parser. The tool's buffer for the bytes is therefore put before a page that cannot
// be read (support/memory_end.h). The tool compares texts without conversion. A second reader, in
// this file, converts texts to UTF-8 before it compares them. Both readers must find the same
// facts. A document with an element of more than 1000 attributes is not compared.
#include <androidfw/ResourceTypes.h>
#include <utils/String8.h>

#include <string>

#include "apk/apk.h"
#include "fuzz/fuzz.h"
#include "support/memory_end.h"

namespace {

using android::ResXMLParser;
using android::String8;

struct Facts {
  std::string package_name;
  bool asks = false;
};

// The conversion drops unpaired surrogates, so a longer text can equal the wanted text. As in the
// tool, a text does not match if it is longer than the wanted text by more than this many UTF-16
// units.
constexpr size_t kMostDropped = 16;

bool Is(const char16_t* text, size_t length, const std::string& wanted) {
  if (text == nullptr || length > wanted.size() + kMostDropped) return false;
  const String8 converted(text, length);
  return std::string(converted.c_str(), converted.length()) == wanted;
}

// Calls `use` with the text of the first attribute `name` that has a text. Returns the result of
// `use`, or false if the element has no such attribute.
template <typename Use>
bool WithAttribute(const ResXMLParser& parser, const char* name, Use use) {
  for (size_t i = 0; i < parser.getAttributeCount(); ++i) {
    size_t length = 0;
    const char16_t* text = parser.getAttributeName(i, &length);
    android::Res_value value = {};
    if (!Is(text, length, name) || parser.getAttributeValue(i, &value) == 0 ||
        value.dataType != android::Res_value::TYPE_STRING) {
      continue;
    }
    text = parser.getAttributeStringValue(i, &length);
    if (text != nullptr) return use(text, length);
  }
  return false;
}

bool Has(const ResXMLParser& parser, const char* name, const char* wanted) {
  return WithAttribute(
      parser, name, [&](const char16_t* text, size_t length) { return Is(text, length, wanted); });
}

void ReadElement(const ResXMLParser& parser, Facts* facts) {
  size_t length = 0;
  const char16_t* const element = parser.getElementName(&length);
  if (Is(element, length, "manifest") && facts->package_name.empty()) {
    WithAttribute(parser, "package", [&](const char16_t* text, size_t size) {
      const String8 name(text, size);
      facts->package_name = std::string(name.c_str(), name.length());
      return true;
    });
  }
  if (Is(element, length, "uses-permission") || Is(element, length, "permission")) {
    facts->asks |= Has(parser, "name", "com.qix.android.SECURE_STORAGE") ||
                   Has(parser, "name", "com.qix.android.securestorage.permission.SECURE_STORAGE");
  }
  if (Is(element, length, "meta-data")) {
    facts->asks |= Has(parser, "name", "access") && Has(parser, "value", "SS_META");
  }
}

// Returns false if an element has so many attributes that this reader would be too slow.
bool ReadByConversion(std::vector<uint8_t> bytes, Facts* facts) {
  const size_t size = bytes.size();
  bytes.resize(size + sizeof(android::ResXMLTree_attribute));
  android::ResXMLTree parser;
  parser.setTo(bytes.data(), size, false);
  for (int event = parser.next(); event > ResXMLParser::END_DOCUMENT; event = parser.next()) {
    if (event != ResXMLParser::START_TAG) continue;
    if (parser.getAttributeCount() > 1000) return false;
    ReadElement(parser, facts);
  }
  return true;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  ApkTools::Apk apk(-1);
  const std::vector<uint8_t> bytes(data, data + size);
  PutNextBlockAtMemoryEnd(size + sizeof(android::ResXMLTree_attribute));
  const bool parsed = apk.ParseAndroidManifest(bytes);
  Require(WasPutAtMemoryEnd(), "the document's block is as large as this target expects");
  if (!parsed) {
    Require(apk.GetPackageName().empty() && !apk.IsSsPermissionRequired(),
            "a document that does not parse has no facts");
    return 0;
  }
  Facts facts;
  if (!ReadByConversion(bytes, &facts)) return 0;
  Require(apk.GetPackageName() == facts.package_name, "both readers find the same package name");
  Require(apk.IsSsPermissionRequired() == facts.asks, "both readers find the same permission");
  return 0;
}
