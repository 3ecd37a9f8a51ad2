#include "simulator/package/compiled_manifest.h"

#include <cstdint>
#include <vector>

#include "simulator/package/byte_reader.h"
#include "simulator/package/utf8.h"

namespace simulator {

namespace {

// Chunks: a type and a header size of 16 bits each, the whole size as 32 bits.
constexpr uint16_t kXml = 0x0003;
constexpr uint16_t kStringPool = 0x0001;
constexpr uint16_t kStartElement = 0x0102;

struct Chunk {
  uint16_t type = 0;
  uint16_t header_size = 0;
  std::string_view bytes;  // the whole chunk
};

struct Attribute {
  uint32_t name = 0;
  uint8_t type = 0;
  uint32_t data = 0;
};

// Longer texts are none that is looked for here.
constexpr size_t kMostText = 1024;

constexpr uint8_t kTypeString = 0x03;
constexpr uint8_t kTypeBoolean = 0x12;

// The pool's strings by their number, decoded when they are asked for.
class Strings {
 public:
  explicit Strings(const Chunk& pool);
  std::string At(uint32_t index) const;

 private:
  std::string Utf8At(size_t offset) const;
  std::string Utf16At(size_t offset) const;

  std::string_view bytes_;
  uint32_t count_ = 0;
  bool is_utf8_ = false;
  uint32_t start_ = 0;
};

bool TakeChunk(std::string_view* bytes, Chunk* chunk);
void ReadElement(const Chunk& element, const Strings& strings, AndroidManifest* manifest);
bool ReadAttribute(ByteReader* reader, uint16_t size, Attribute* attribute);

}  // namespace

AndroidManifest ParseCompiledManifest(std::string_view bytes) {
  AndroidManifest manifest;
  Chunk document;
  Chunk pool;
  if (!TakeChunk(&bytes, &document) || document.type != kXml) return manifest;
  std::string_view rest = document.bytes.substr(document.header_size);
  if (!TakeChunk(&rest, &pool) || pool.type != kStringPool) return manifest;
  const Strings strings(pool);
  for (Chunk chunk; TakeChunk(&rest, &chunk);) {
    if (chunk.type == kStartElement) ReadElement(chunk, strings, &manifest);
  }
  return manifest;
}

namespace {

bool TakeChunk(std::string_view* bytes, Chunk* chunk) {
  constexpr size_t kLeast = 8;
  ByteReader reader(*bytes);
  uint32_t size = 0;
  if (!reader.U16(&chunk->type) || !reader.U16(&chunk->header_size) || !reader.U32(&size)) {
    return false;
  }
  if (size < kLeast || size > bytes->size()) return false;
  if (chunk->header_size < kLeast || chunk->header_size > size) return false;
  chunk->bytes = bytes->substr(0, size);
  bytes->remove_prefix(size);
  return true;
}

// Of the first element of each name, those attributes that are asked for.
void ReadElement(const Chunk& element, const Strings& strings, AndroidManifest* manifest) {
  // Namespace and name, then where the attributes start from there on, their size and number.
  ByteReader reader(element.bytes.substr(element.header_size));
  uint32_t space = 0;
  uint32_t name = 0;
  uint16_t start = 0;
  uint16_t size = 0;
  uint16_t count = 0;
  if (!reader.U32(&space) || !reader.U32(&name) || !reader.U16(&start) || !reader.U16(&size) ||
      !reader.U16(&count)) {
    return;
  }
  const std::string element_name = strings.At(name);
  const bool is_manifest = element_name == "manifest" && manifest->package_name.empty();
  const bool is_application = element_name == "application" && !manifest->extracts_libraries;
  if (!is_manifest && !is_application) return;
  if (element.header_size + start > element.bytes.size()) return;
  ByteReader attributes(element.bytes.substr(element.header_size + start));
  Attribute attribute;
  for (; count > 0 && ReadAttribute(&attributes, size, &attribute); --count) {
    const std::string attribute_name = strings.At(attribute.name);
    if (is_manifest && attribute_name == "package" && attribute.type == kTypeString) {
      manifest->package_name = strings.At(attribute.data);
    }
    if (is_application && attribute_name == "extractNativeLibs" && attribute.type == kTypeBoolean) {
      manifest->extracts_libraries = attribute.data != 0;
    }
  }
}

// Namespace, name and raw text, then the typed value: its size, a zero, its type, its data.
bool ReadAttribute(ByteReader* reader, uint16_t size, Attribute* attribute) {
  std::string_view bytes;
  uint32_t number = 0;
  uint16_t value_size = 0;
  uint16_t type = 0;
  if (!reader->Bytes(size, &bytes)) return false;
  ByteReader fields(bytes);
  if (!fields.U32(&number) || !fields.U32(&attribute->name) || !fields.U32(&number) ||
      !fields.U16(&value_size) || !fields.U16(&type) || !fields.U32(&attribute->data)) {
    return false;
  }
  attribute->type = static_cast<uint8_t>(type >> 8);
  return true;
}

// Its own header: strings, styles, flags, where strings start, where styles start; then the offset
// of each string.
Strings::Strings(const Chunk& pool) : bytes_(pool.bytes) {
  constexpr uint32_t kUtf8Flag = 1 << 8;
  constexpr size_t kCommonHeader = 8;
  ByteReader reader(bytes_.substr(kCommonHeader));
  uint32_t styles = 0;
  uint32_t flags = 0;
  if (!reader.U32(&count_) || !reader.U32(&styles) || !reader.U32(&flags) || !reader.U32(&start_)) {
    count_ = 0;
  }
  is_utf8_ = (flags & kUtf8Flag) != 0;
}

std::string Strings::At(uint32_t index) const {
  constexpr uint64_t kHeader = 28;
  const uint64_t at = kHeader + uint64_t{index} * sizeof(uint32_t);
  if (index >= count_ || at > bytes_.size()) return {};
  uint32_t offset = 0;
  if (!ByteReader(bytes_.substr(static_cast<size_t>(at))).U32(&offset)) return {};
  const uint64_t place = uint64_t{start_} + offset;
  if (place >= bytes_.size()) return {};
  return is_utf8_ ? Utf8At(static_cast<size_t>(place)) : Utf16At(static_cast<size_t>(place));
}

// The length in UTF-16 units and that in bytes, each of one byte, or of two when the first has its
// highest bit set.
std::string Strings::Utf8At(size_t offset) const {
  const std::string_view from = bytes_.substr(offset);
  size_t at = 0;
  size_t length = 0;
  for (int i = 0; i < 2; ++i) {
    if (at >= from.size()) return {};
    length = static_cast<uint8_t>(from[at++]);
    if ((length & 0x80) == 0) continue;
    if (at >= from.size()) return {};
    length = (length & 0x7f) << 8 | static_cast<uint8_t>(from[at++]);
  }
  const bool is_there = length <= kMostText && length <= from.size() - at;
  return is_there ? std::string(from.substr(at, length)) : std::string();
}

// The length in units: one, or two when the first has its highest bit set.
std::string Strings::Utf16At(size_t offset) const {
  ByteReader reader(bytes_.substr(offset));
  uint16_t unit = 0;
  uint32_t length = 0;
  if (!reader.U16(&unit)) return {};
  length = unit;
  if ((unit & 0x8000) != 0) {
    if (!reader.U16(&unit)) return {};
    length = (length & 0x7fff) << 16 | unit;
  }
  if (length > kMostText) return {};
  std::string text;
  uint32_t high = 0;
  for (; length > 0 && reader.U16(&unit); --length) {
    if (unit >= 0xd800 && unit < 0xdc00) {
      high = unit;
    } else if (unit >= 0xdc00 && unit < 0xe000) {
      if (high != 0) AppendUtf8(0x10000U + ((high - 0xd800U) << 10) + (unit - 0xdc00U), &text);
      high = 0;
    } else {
      AppendUtf8(unit, &text);
    }
  }
  return text;
}

}  // namespace

}  // namespace simulator
