#include "simulator/package/android_manifest.h"

#include <androidfw/ResourceTypes.h>
#include <utils/String8.h>

#include <string_view>

#include "apk/apk.h"
#include "simulator/package/resource_library.h"

namespace simulator {

namespace {

using android::ResXMLParser;

bool HasOverlaps(const android::ResStringPool& strings, size_t document_size);
void ReadAsInstaller(ResXMLParser* parser, AndroidManifest* manifest);
std::optional<bool> ExtractsLibraries(const ResXMLParser& application);
bool Is(const char16_t* text, const size_t* length, std::string_view expected);
std::string Text(const char16_t* text, size_t length);

}  // namespace

AndroidManifest ParseAndroidManifest(const std::vector<uint8_t>& bytes) {
  AndroidManifest manifest;
  android::ResXMLTree document;
  // The parser reads the document's header without checking that the bytes are long enough.
  const bool has_header = bytes.size() >= sizeof(android::ResXMLTree_header);
  if (!has_header || document.setTo(bytes.data(), bytes.size(), false) != 0) return manifest;
  manifest.has_overlaps = HasOverlaps(document.getStrings(), bytes.size());
  if (manifest.has_overlaps) return manifest;
  ReadAsInstaller(&document, &manifest);
  ApkTools::Apk tool(-1);  // without a file; only its parser is used
  if (tool.ParseAndroidManifest(bytes)) manifest.package_name = tool.GetPackageName();
  return manifest;
}

namespace {

// The parser keeps a copy of each UTF-8 string that it returns. The copies of overlapping strings
// together can be many times as long as the document.
bool HasOverlaps(const android::ResStringPool& strings, size_t document_size) {
  uint64_t length = 0;
  for (size_t i = 0; strings.isUTF8() && i < strings.size(); ++i) {
    length += StringLength(strings, i);
  }
  return length > document_size;
}

void ReadAsInstaller(ResXMLParser* parser, AndroidManifest* manifest) {
  bool has_root = false;
  for (auto event = parser->next();
       event != ResXMLParser::END_DOCUMENT && event != ResXMLParser::BAD_DOCUMENT;
       event = parser->next()) {
    if (event != ResXMLParser::START_TAG) continue;
    size_t length = 0;
    if (!has_root) {
      has_root = true;
      const ssize_t package = parser->indexOfAttribute(nullptr, "package");
      if (package < 0) continue;
      const char16_t* const name =
          parser->getAttributeStringValue(static_cast<size_t>(package), &length);
      manifest->installer_name = Text(name, length);
    } else if (Is(parser->getElementName(&length), &length, "application")) {
      manifest->extracts_libraries = ExtractsLibraries(*parser);
      return;
    }
  }
}

// Accepts the attribute extractNativeLibs in any namespace, as installers do.
std::optional<bool> ExtractsLibraries(const ResXMLParser& application) {
  std::optional<bool> extracts;
  for (size_t i = 0; i < application.getAttributeCount(); ++i) {
    size_t length = 0;
    if (!Is(application.getAttributeName(i, &length), &length, "extractNativeLibs")) continue;
    const int32_t type = application.getAttributeDataType(i);
    const bool is_number =
        type >= android::Res_value::TYPE_FIRST_INT && type <= android::Res_value::TYPE_LAST_INT;
    if (is_number) extracts = application.getAttributeData(i) != 0;
  }
  return extracts;
}

// Compares the lengths first, so that a long name that occurs many times is not converted each
// time.
bool Is(const char16_t* text, const size_t* length, std::string_view expected) {
  return *length == expected.size() && Text(text, *length) == expected;
}

std::string Text(const char16_t* text, size_t length) {
  return text == nullptr ? std::string() : android::String8(text, length).c_str();
}

}  // namespace

}  // namespace simulator
