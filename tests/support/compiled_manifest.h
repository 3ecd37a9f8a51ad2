// Writes Android's compiled XML, good and bad: a string pool, then the nodes in the order of the
// calls that add nodes. CompiledXml does not check that elements nest.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "support/der.h"

// One attribute of an element. Names and texts are UTF-8 and can contain NUL. Three bytes can
// encode an unpaired surrogate: U+D800 is ED A0 80.
struct XmlAttribute {
  std::string name;
  uint8_t type;            // of the typed value (Res_value)
  std::string text;        // the raw value; also the typed value if `type` is string
  bool has_raw = false;    // whether the attribute has a raw value
  uint32_t data = 0;       // the typed value, unless `type` is string
  std::string name_space;  // the URI of the namespace; empty: no namespace
  bool has_name = true;    // whether the name is in the string pool
};

inline constexpr char kAndroidNamespace[] = "http://schemas.android.com/apk/res/android";

XmlAttribute StringAttribute(const std::string& name, const std::string& text);
XmlAttribute ReferenceAttribute(const std::string& name, uint32_t resource);
XmlAttribute IntAttribute(const std::string& name, uint32_t value);
// An attribute whose typed value has the type string, but whose text is missing.
XmlAttribute StringAttributeWithoutText(const std::string& name);
// Returns `attribute` in Android's namespace.
XmlAttribute InAndroidNamespace(XmlAttribute attribute);

class CompiledXml {
 public:
  enum class Pool { kUtf8, kUtf16 };

  explicit CompiledXml(Pool pool = Pool::kUtf8) : pool_(pool) {}

  CompiledXml& StartNamespace(const std::string& prefix, const std::string& uri);
  CompiledXml& EndNamespace(const std::string& prefix, const std::string& uri);
  CompiledXml& Start(const std::string& name, const std::vector<XmlAttribute>& attributes = {});
  CompiledXml& End(const std::string& name);
  // A start and an end tag.
  CompiledXml& Element(const std::string& name, const std::vector<XmlAttribute>& attributes = {});
  // A start tag that claims `count` attributes of size 0. All of them are at the offset of
  // `attribute`.
  CompiledXml& StartWithSizelessAttributes(const std::string& name, const XmlAttribute& attribute,
                                           uint16_t count);
  CompiledXml& Text(const std::string& text);
  // A node whose header is too short. The document is bad from here on.
  CompiledXml& BadNode();
  // A start tag whose name is not in the string pool.
  CompiledXml& StartWithoutName();
  // A start of a namespace. The prefix and the URI of the namespace are not in the string pool.
  CompiledXml& StartNamespaceWithoutUri();

  Bytes Build() const;

 private:
  uint32_t Ref(const std::string& text);
  void PutNodeHeader(uint16_t type, size_t extra_length);
  void PutStartTag(const std::string& name, size_t attributes_length, uint16_t attribute_length,
                   size_t count);
  void PutAttribute(const XmlAttribute& attribute);

  Pool pool_;
  std::vector<std::string> strings_;
  Bytes nodes_;
};

// The manifest of a package of this name. It requests the secure-storage permission if
// `secure_storage` is true.
Bytes CompiledManifest(const std::string& package_name, bool secure_storage = false);
