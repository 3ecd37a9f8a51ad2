#include "simulator/package/distinguished_name.h"

#include <vector>

#include "simulator/package/certificate.h"
#include "simulator/package/der.h"
#include "simulator/package/utf8.h"

namespace simulator {

namespace {

constexpr struct {
  const char* oid;
  const char* keyword;
} kKeywords[] = {
    {"2.5.4.3", "CN"},
    {"2.5.4.6", "C"},
    {"2.5.4.7", "L"},
    {"2.5.4.8", "ST"},
    {"2.5.4.10", "O"},
    {"2.5.4.11", "OU"},
    {"2.5.4.12", "T"},
    {"2.5.4.9", "STREET"},
    {"2.5.4.5", "SERIALNUMBER"},
    {"2.5.4.4", "SURNAME"},
    {"2.5.4.42", "GIVENNAME"},
    {"2.5.4.43", "INITIALS"},
    {"2.5.4.44", "GENERATION"},
    {"2.5.4.46", "DNQ"},
    {"0.9.2342.19200300.100.1.25", "DC"},
    {"0.9.2342.19200300.100.1.1", "UID"},
    {"1.2.840.113549.1.9.1", "EMAILADDRESS"},
    {"1.3.6.1.4.1.42.2.11.2.1", "IP"},
};

// Names with more parts than this are cut; real ones have ten at most.
constexpr size_t kMostParts = 256;

std::string PartText(CBS part);
std::string AttributeText(CBS attribute);
std::string Keyword(const std::string& oid);
bool DecodeString(CBS value, std::string* text);
std::string Quoted(const std::string& value);

}  // namespace

std::string NameText(std::string_view der) {
  CBS input = ToCbs(der);
  CBS name;
  if (!CBS_get_asn1(&input, &name, CBS_ASN1_SEQUENCE)) return {};
  std::vector<std::string> parts;
  CBS part;
  while (CBS_len(&name) > 0 && parts.size() < kMostParts) {
    if (!CBS_get_asn1(&name, &part, CBS_ASN1_SET)) break;
    parts.push_back(PartText(part));
  }
  std::string text;
  for (auto each = parts.rbegin(); each != parts.rend(); ++each) {
    text += (text.empty() ? "" : ", ") + *each;
  }
  return text;
}

namespace {

// A RelativeDistinguishedName, mostly of one attribute.
std::string PartText(CBS part) {
  std::string text;
  CBS attribute;
  while (CBS_get_asn1(&part, &attribute, CBS_ASN1_SEQUENCE)) {
    text += (text.empty() ? "" : " + ") + AttributeText(attribute);
  }
  return text;
}

std::string AttributeText(CBS attribute) {
  CBS oid;
  if (!CBS_get_asn1(&attribute, &oid, CBS_ASN1_OBJECT)) return {};
  std::string value;
  const bool is_text = DecodeString(attribute, &value);
  return Keyword(OidText(oid)) + "=" + (is_text ? Quoted(value) : "#" + HexText(ToView(attribute)));
}

std::string Keyword(const std::string& oid) {
  for (const auto& known : kKeywords) {
    if (oid == known.oid) return known.keyword;
  }
  return "OID." + oid;
}

// What a string type holds, as UTF-8; false when the value is no string.
bool DecodeString(CBS value, std::string* text) {
  CBS contents;
  unsigned tag = 0;
  if (!CBS_get_any_asn1(&value, &contents, &tag)) return false;
  uint8_t byte = 0;
  uint16_t unit = 0;
  switch (tag) {
    case CBS_ASN1_UTF8STRING:
    case CBS_ASN1_PRINTABLESTRING:
    case CBS_ASN1_IA5STRING:
      *text = ToView(contents);
      return true;
    case CBS_ASN1_T61STRING:
      while (CBS_get_u8(&contents, &byte)) AppendUtf8(byte, text);
      return true;
    case CBS_ASN1_BMPSTRING:
      while (CBS_get_u16(&contents, &unit)) AppendUtf8(unit, text);
      return true;
    default:
      return false;
  }
}

// In quotation marks where a special character, or a space in an odd place, asks for them.
std::string Quoted(const std::string& value) {
  constexpr char kSpecial[] = ",+=\n<>#;\\\"";
  const bool is_quoted = value.size() > 1 && value.front() == '"' && value.back() == '"';
  if (is_quoted || value.empty()) return value;
  const auto is_white = [](char c) { return c == ' ' || c == '\n'; };
  bool needs_quotes = is_white(value.front()) || is_white(value.back());
  std::string text;
  for (size_t i = 0; i < value.size(); ++i) {
    const char c = value[i];
    const bool is_special = std::string_view(kSpecial).find(c) != std::string_view::npos;
    needs_quotes = needs_quotes || is_special || (i > 0 && is_white(c) && is_white(value[i - 1]));
    if (c == '"' || c == '\\') text += '\\';
    text += c;
  }
  return needs_quotes ? "\"" + text + "\"" : text;
}

}  // namespace

}  // namespace simulator
