#include "support/compiled_manifest.h"

#include <algorithm>

#include "support/little_endian.h"

namespace {

constexpr uint32_t kNone = 0xffffffff;

constexpr uint16_t kPoolChunk = 0x0001, kXmlChunk = 0x0003;
constexpr uint16_t kStartNamespace = 0x0100, kEndNamespace = 0x0101;
constexpr uint16_t kStartElement = 0x0102, kEndElement = 0x0103, kText = 0x0104;

constexpr uint8_t kTypeReference = 0x01, kTypeString = 0x03, kTypeInt = 0x10;

constexpr uint16_t kNodeHeaderLength = 16;
constexpr uint16_t kAttributeLength = 20;

void PutChunkHeader(Bytes& out, uint16_t type, uint16_t header_length, size_t length) {
  Put16(out, type);
  Put16(out, header_length);
  Put32(out, static_cast<uint32_t>(length));
}

// Converts UTF-8, in which three bytes may also encode an unpaired surrogate, to UTF-16. The C++
// library's own conversion is deprecated: with a newer C++ library, the compiler warns about it.
std::u16string ToUtf16(const std::string& text) {
  std::u16string units;
  for (size_t at = 0; at < text.size();) {
    const auto first = static_cast<uint8_t>(text[at++]);
    const int more = first < 0x80 ? 0 : first < 0xe0 ? 1 : first < 0xf0 ? 2 : 3;
    uint32_t code = more == 0 ? first : first & (0x3fu >> more);
    for (int i = 0; i < more; ++i) code = code << 6 | (static_cast<uint8_t>(text.at(at++)) & 0x3f);
    if (code > 0xffff) units.push_back(static_cast<char16_t>(0xd800 + ((code - 0x10000) >> 10)));
    units.push_back(static_cast<char16_t>(code > 0xffff ? 0xdc00 + (code & 0x3ff) : code));
  }
  return units;
}

// A length in a UTF-8 pool: one byte, or two bytes, the first of which has its highest bit set.
void PutLength8(Bytes& out, size_t length) {
  if (length > 0x7f) out.push_back(static_cast<uint8_t>(0x80 | (length >> 8)));
  out.push_back(static_cast<uint8_t>(length & 0xff));
}

void PutString8(Bytes& out, const std::string& text) {
  PutLength8(out, ToUtf16(text).size());
  PutLength8(out, text.size());
  out.insert(out.end(), text.begin(), text.end());
  out.push_back(0);
}

// A string in a UTF-16 pool. It starts with its length: one 16-bit unit, or two, the first of which
// has its highest bit set.
void PutString16(Bytes& out, const std::string& text) {
  const std::u16string units = ToUtf16(text);
  if (units.size() > 0x7fff) Put16(out, static_cast<uint16_t>(0x8000 | (units.size() >> 16)));
  Put16(out, static_cast<uint16_t>(units.size() & 0xffff));
  for (const char16_t unit : units) Put16(out, unit);
  Put16(out, 0);
}

Bytes StringPool(const std::vector<std::string>& strings, CompiledXml::Pool encoding) {
  constexpr uint16_t kHeaderLength = 28;
  constexpr uint32_t kUtf8Flag = 1 << 8;
  const bool utf8 = encoding == CompiledXml::Pool::kUtf8;

  Bytes offsets, data;
  for (const std::string& text : strings) {
    Put32(offsets, static_cast<uint32_t>(data.size()));
    utf8 ? PutString8(data, text) : PutString16(data, text);
  }
  while (data.empty() || data.size() % 4 != 0) data.push_back(0);

  Bytes out;
  PutChunkHeader(out, kPoolChunk, kHeaderLength, kHeaderLength + offsets.size() + data.size());
  Put32(out, static_cast<uint32_t>(strings.size()));
  Put32(out, 0);  // styles
  Put32(out, utf8 ? kUtf8Flag : 0);
  Put32(out, static_cast<uint32_t>(kHeaderLength + offsets.size()));
  Put32(out, 0);  // start of styles
  return Concat({out, offsets, data});
}

}  // namespace

XmlAttribute StringAttribute(const std::string& name, const std::string& text) {
  return {name, kTypeString, text, true, 0, ""};
}

XmlAttribute ReferenceAttribute(const std::string& name, uint32_t resource) {
  return {name, kTypeReference, "", false, resource, ""};
}

XmlAttribute IntAttribute(const std::string& name, uint32_t value) {
  return {name, kTypeInt, "", false, value, ""};
}

XmlAttribute StringAttributeWithoutText(const std::string& name) {
  return {name, kTypeString, "", false, kNone, ""};
}

XmlAttribute InAndroidNamespace(XmlAttribute attribute) {
  attribute.name_space = kAndroidNamespace;
  return attribute;
}

CompiledXml& CompiledXml::StartNamespace(const std::string& prefix, const std::string& uri) {
  PutNodeHeader(kStartNamespace, 8);
  Put32(nodes_, Ref(prefix));
  Put32(nodes_, Ref(uri));
  return *this;
}

CompiledXml& CompiledXml::EndNamespace(const std::string& prefix, const std::string& uri) {
  PutNodeHeader(kEndNamespace, 8);
  Put32(nodes_, Ref(prefix));
  Put32(nodes_, Ref(uri));
  return *this;
}

CompiledXml& CompiledXml::Start(const std::string& name,
                                const std::vector<XmlAttribute>& attributes) {
  PutStartTag(name, kAttributeLength * attributes.size(), kAttributeLength, attributes.size());
  for (const XmlAttribute& attribute : attributes) PutAttribute(attribute);
  return *this;
}

CompiledXml& CompiledXml::StartWithSizelessAttributes(const std::string& name,
                                                      const XmlAttribute& attribute,
                                                      uint16_t count) {
  PutStartTag(name, kAttributeLength, 0, count);
  PutAttribute(attribute);
  return *this;
}

CompiledXml& CompiledXml::End(const std::string& name) {
  PutNodeHeader(kEndElement, 8);
  Put32(nodes_, kNone);  // namespace
  Put32(nodes_, Ref(name));
  return *this;
}

CompiledXml& CompiledXml::Element(const std::string& name,
                                  const std::vector<XmlAttribute>& attributes) {
  return Start(name, attributes).End(name);
}

CompiledXml& CompiledXml::Text(const std::string& text) {
  PutNodeHeader(kText, 12);
  Put32(nodes_, Ref(text));
  Put16(nodes_, 8);  // an empty typed value
  Put16(nodes_, 0);
  Put32(nodes_, 0);
  return *this;
}

CompiledXml& CompiledXml::BadNode() {
  constexpr uint16_t kTooShort = 8;
  PutChunkHeader(nodes_, kStartElement, kTooShort, kNodeHeaderLength);
  Put32(nodes_, 0);
  Put32(nodes_, 0);
  return *this;
}

CompiledXml& CompiledXml::StartWithoutName() {
  PutNodeHeader(kStartElement, 20);
  Put32(nodes_, kNone);  // namespace
  Put32(nodes_, kNone);  // name
  Put16(nodes_, 20);
  Put16(nodes_, kAttributeLength);
  for (int i = 0; i < 4; ++i) Put16(nodes_, 0);
  return *this;
}

CompiledXml& CompiledXml::StartNamespaceWithoutUri() {
  PutNodeHeader(kStartNamespace, 8);
  Put32(nodes_, kNone);
  Put32(nodes_, kNone);
  return *this;
}

Bytes CompiledXml::Build() const {
  constexpr uint16_t kHeaderLength = 8;
  const Bytes pool = StringPool(strings_, pool_);
  Bytes out;
  PutChunkHeader(out, kXmlChunk, kHeaderLength, kHeaderLength + pool.size() + nodes_.size());
  return Concat({out, pool, nodes_});
}

// The index of the text in the string pool. A new text is added to the pool.
uint32_t CompiledXml::Ref(const std::string& text) {
  const auto found = std::find(strings_.begin(), strings_.end(), text);
  const auto index = static_cast<uint32_t>(found - strings_.begin());
  if (found == strings_.end()) strings_.push_back(text);
  return index;
}

void CompiledXml::PutNodeHeader(uint16_t type, size_t extra_length) {
  PutChunkHeader(nodes_, type, kNodeHeaderLength, kNodeHeaderLength + extra_length);
  Put32(nodes_, 1);      // line
  Put32(nodes_, kNone);  // comment
}

void CompiledXml::PutStartTag(const std::string& name, size_t attributes_length,
                              uint16_t attribute_length, size_t count) {
  constexpr uint16_t kElementLength = 20;
  PutNodeHeader(kStartElement, kElementLength + attributes_length);
  Put32(nodes_, kNone);  // namespace
  Put32(nodes_, Ref(name));
  Put16(nodes_, kElementLength);  // where the attributes start
  Put16(nodes_, attribute_length);
  Put16(nodes_, static_cast<uint16_t>(count));
  Put16(nodes_, 0);  // id
  Put16(nodes_, 0);  // class
  Put16(nodes_, 0);  // style
}

void CompiledXml::PutAttribute(const XmlAttribute& attribute) {
  const uint32_t raw = attribute.has_raw ? Ref(attribute.text) : kNone;
  Put32(nodes_, attribute.name_space.empty() ? kNone : Ref(attribute.name_space));
  Put32(nodes_, attribute.has_name ? Ref(attribute.name) : kNone);
  Put32(nodes_, raw);
  Put16(nodes_, 8);  // length of the typed value
  nodes_.push_back(0);
  nodes_.push_back(attribute.type);
  Put32(nodes_, attribute.type == kTypeString ? raw : attribute.data);
}

Bytes CompiledManifest(const std::string& package_name, bool secure_storage) {
  CompiledXml xml;
  xml.StartNamespace("android", kAndroidNamespace)
      .Start("manifest", {StringAttribute("package", package_name)});
  if (secure_storage) {
    xml.Element("uses-permission",
                {InAndroidNamespace(StringAttribute("name", "com.qix.android.SECURE_STORAGE"))});
  }
  return xml.Element("application")
      .End("manifest")
      .EndNamespace("android", kAndroidNamespace)
      .Build();
}
