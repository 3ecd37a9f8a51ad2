// Reads two facts from the compiled Android manifest: the package's name, and whether the package
// asks for secure storage. A hostile document can make the parser return the same long text many
// times, and each conversion to UTF-8 would read the whole text. Texts are therefore compared as
// UTF-16, by length first, and only the package's name is converted.
#include <androidfw/ResourceTypes.h>
#include <utils/String8.h>

#include <cstring>
#include <set>
#include <string_view>

#include "apk/apk.h"
#include "util/log.h"

namespace ApkTools {

namespace {

using android::ResXMLParser;
using android::String8;
using Text = std::u16string_view;

// A text that the parser returned; empty if it returned null.
Text View(const char16_t* text, size_t size) { return text == nullptr ? Text() : Text(text, size); }

String8 ReadPackageName(const ResXMLParser& parser, std::set<const char16_t*>* nameless);
bool AsksForSecureStorage(const ResXMLParser& parser, Text element);
Text getStrAttr(const ResXMLParser& parser, std::string_view name);
bool Equals(Text text, std::string_view wanted);
bool IsUnpairedSurrogate(Text text);
uint16_t FirstUnit(Text text);

}  // namespace

bool Apk::ParseAndroidManifest(std::vector<uint8_t> bytes) {
  // The platform's parser can read a chunk header or an attribute that ends beyond the document.
  // The buffer is therefore longer than the document by the size of an attribute. A chunk header is
  // smaller than an attribute. If the document is shorter than a chunk header, the parser gets the
  // size 0 and refuses the document.
  const size_t size = bytes.size(), room = size + sizeof(android::ResXMLTree_attribute);
  bytes.reserve(room);
  bytes.resize(room);
  android::ResXMLTree parser;
  parser.setTo(bytes.data(), size < sizeof(android::ResChunk_header) ? 0 : size, false);
  if (const android::status_t error = parser.getError(); error != 0) {
    LogError("%s failed to init xml parser, error=0x%08x\n", "ParseAndroidManifest",
             static_cast<unsigned>(error));
    return false;
  }

  String8 package_name;
  std::set<const char16_t*> nameless;
  for (ResXMLParser::event_code_t event = parser.next(); event != ResXMLParser::END_DOCUMENT;
       event = parser.next()) {
    // Deliberate: a malformed node ends the document. The facts found before that node count.
    if (event == ResXMLParser::BAD_DOCUMENT) break;
    // The depth of an element does not matter.
    if (event != ResXMLParser::START_TAG) continue;
    size_t length = 0;
    const char16_t* const element_name = parser.getElementName(&length);
    const Text element = View(element_name, length);
    if (Equals(element, "manifest")) {
      // NOLINTNEXTLINE(readability-container-size-empty): only later releases' String8 has empty().
      if (package_name.length() == 0) package_name = ReadPackageName(parser, &nameless);
    } else if (!ss_permission_required_) {
      ss_permission_required_ = AsksForSecureStorage(parser, element);
    }
  }
  package_name_.assign(package_name.c_str(), package_name.length());
  return true;
}

namespace {

// Returns the element's attribute "package" in UTF-8. The result is empty if getStrAttr returns an
// empty text, or a text that has only unpaired surrogates. `nameless` has the address of each text
// that was converted before. This function is called only until a name is found, so these texts
// gave an empty name. They are not converted again.
String8 ReadPackageName(const ResXMLParser& parser, std::set<const char16_t*>* nameless) {
  const Text name = getStrAttr(parser, "package");
  if (name.empty() || !nameless->insert(name.data()).second) return String8();
  return String8(name.data(), name.size());
}

// Deliberate: a package that declares the permission counts as one that asks for it.
bool AsksForSecureStorage(const ResXMLParser& parser, Text element) {
  if (Equals(element, "meta-data")) {
    return Equals(getStrAttr(parser, "name"), "access") &&
           Equals(getStrAttr(parser, "value"), "SS_META");
  }
  if (!Equals(element, "uses-permission") && !Equals(element, "permission")) return false;
  const Text name = getStrAttr(parser, "name");
  return Equals(name, "com.qix.android.SECURE_STORAGE") ||
         Equals(name, "com.qix.android.securestorage.permission.SECURE_STORAGE");
}

// The text of the first attribute that has this name and a string as its value. References, numbers
// and strings without a text are skipped. Empty if no attribute matches.
Text getStrAttr(const ResXMLParser& parser, std::string_view name) {
  ResXMLParser::ResXMLPosition position;
  parser.getPosition(&position);
  android::ResXMLTree_attrExt tag;
  memcpy(&tag, position.curExt, sizeof(tag));
  for (size_t i = 0; i < parser.getAttributeCount(); ++i) {
    // Attributes of size 0 are all at the same address, so they are all the same attribute. A
    // document can declare up to 65,535 of them.
    if (i > 0 && tag.attributeSize == 0) break;
    size_t length = 0;
    const char16_t* text = parser.getAttributeName(i, &length);
    // Deliberate: only the local name of an attribute is compared. Its namespace does not matter.
    if (!Equals(View(text, length), name)) continue;

    android::Res_value value = {};
    if (parser.getAttributeValue(i, &value) == 0) continue;
    if (value.dataType != android::Res_value::TYPE_STRING) continue;
    length = 0;
    text = parser.getAttributeStringValue(i, &length);
    if (text != nullptr) return Text(text, length);
  }
  return {};
}

// True if the platform would convert `text` to `wanted`, an ASCII text. The conversion drops
// unpaired surrogates. Deliberate: a text with more than kMostSurrogates of them does not match, so
// that no comparison reads a long text.
bool Equals(Text text, std::string_view wanted) {
  constexpr size_t kMostSurrogates = 16;
  if (text.size() < wanted.size() || text.size() > wanted.size() + kMostSurrogates) return false;
  for (; !text.empty(); text.remove_prefix(1)) {
    if (IsUnpairedSurrogate(text)) continue;
    if (wanted.empty() || FirstUnit(text) != wanted.front()) return false;
    wanted.remove_prefix(1);
  }
  return wanted.empty();
}

// True if the first unit is an unpaired surrogate. `text` must not begin in the middle of a pair.
bool IsUnpairedSurrogate(Text text) {
  constexpr int kHigh = 0xD800 >> 10, kLow = 0xDC00 >> 10;
  const int kind = FirstUnit(text) >> 10;
  const bool is_pair = text.size() > 1 && FirstUnit(text.substr(1)) >> 10 == kLow;
  return kind == kLow || (kind == kHigh && !is_pair);
}

// A hostile document can put texts and elements at odd addresses, so they are read with memcpy.
uint16_t FirstUnit(Text text) {
  uint16_t unit;
  memcpy(&unit, static_cast<const void*>(text.data()), sizeof(unit));
  return unit;
}

}  // namespace

}  // namespace ApkTools
