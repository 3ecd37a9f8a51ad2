#include "simulator/package/android_manifest.h"

#include <androidfw/ResourceTypes.h>

#include <algorithm>
#include <string_view>

#include "apk/apk.h"

namespace simulator {

namespace {

using android::ResStringPool;
using android::ResXMLParser;

bool Open(const std::vector<uint8_t>& bytes, android::ResXMLTree* document);
bool HasOverlaps(const ResStringPool& strings, size_t document_size);
void ReadAsInstaller(ResXMLParser* parser, AndroidManifest* manifest);
std::optional<bool> ExtractsLibraries(const ResXMLParser& application);
bool Is(const ResStringPool& strings, int32_t index, std::string_view text);

}  // namespace

AndroidManifest ParseAndroidManifest(const std::vector<uint8_t>& bytes) {
  AndroidManifest manifest;
  android::ResXMLTree document;
  if (Open(bytes, &document)) ReadAsInstaller(&document, &manifest);
  return manifest;
}

std::optional<std::string> ToolPackageName(const std::vector<uint8_t>& bytes) {
  android::ResXMLTree document;
  if (!Open(bytes, &document) || HasOverlaps(document.getStrings(), bytes.size())) return {};
  ApkTools::Apk tool(-1);  // without a file; it is asked for this alone
  if (!tool.ParseAndroidManifest(bytes)) return {};
  return tool.GetPackageName();
}

namespace {

// The parser reads the document's header without asking whether there is room for one.
bool Open(const std::vector<uint8_t>& bytes, android::ResXMLTree* document) {
  return bytes.size() >= sizeof(android::ResXMLTree_header) &&
         document->setTo(bytes.data(), bytes.size(), false) == 0;
}

// The platform's parser keeps a copy of each UTF-8 string that it is asked for. Strings that lie in
// one another can be many times as long, all together, as the document.
bool HasOverlaps(const ResStringPool& strings, size_t document_size) {
  uint64_t length = 0;
  for (size_t i = 0; strings.isUTF8() && i < strings.size(); ++i) {
    size_t each = 0;
    if (strings.string8At(i, &each) != nullptr) length += each;
  }
  return length > document_size;
}

// Texts are compared where they lie, without the parser's copies.
void ReadAsInstaller(ResXMLParser* parser, AndroidManifest* manifest) {
  const ResStringPool& strings = parser->getStrings();
  bool has_root = false;
  for (auto event = parser->next();
       event != ResXMLParser::END_DOCUMENT && event != ResXMLParser::BAD_DOCUMENT;
       event = parser->next()) {
    if (event != ResXMLParser::START_TAG) continue;
    if (!has_root) {
      has_root = true;
      const ssize_t package = parser->indexOfAttribute(nullptr, "package");
      size_t length = 0;
      const char16_t* const name =
          package < 0 ? nullptr
                      : parser->getAttributeStringValue(static_cast<size_t>(package), &length);
      if (name != nullptr) manifest->installer_name = android::String8(name, length).c_str();
    } else if (Is(strings, parser->getElementNameID(), "application")) {
      manifest->extracts_libraries = ExtractsLibraries(*parser);
      return;
    }
  }
}

std::optional<bool> ExtractsLibraries(const ResXMLParser& application) {
  std::optional<bool> extracts;
  for (size_t i = 0; i < application.getAttributeCount(); ++i) {
    if (!Is(application.getStrings(), application.getAttributeNameID(i), "extractNativeLibs")) {
      continue;
    }
    const int32_t type = application.getAttributeDataType(i);
    const bool is_number =
        type >= android::Res_value::TYPE_FIRST_INT && type <= android::Res_value::TYPE_LAST_INT;
    if (is_number) extracts = application.getAttributeData(i) != 0;
  }
  return extracts;
}

// Whether the string of this index is `text`, which is ASCII.
bool Is(const ResStringPool& strings, int32_t index, std::string_view text) {
  if (index < 0) return false;
  size_t length = 0;
  if (strings.isUTF8()) {
    const char* const found = strings.string8At(static_cast<size_t>(index), &length);
    return found != nullptr && std::string_view(found, length) == text;
  }
  const char16_t* const found = strings.stringAt(static_cast<size_t>(index), &length);
  return found != nullptr && length == text.size() &&
         std::equal(text.begin(), text.end(), found,
                    [](char a, char16_t b) { return static_cast<char16_t>(a) == b; });
}

}  // namespace

}  // namespace simulator
