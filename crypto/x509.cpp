#include "crypto/x509.h"

#include <cstring>
#include <initializer_list>

namespace {

// A part of the input that is still to be read. Deliberate: if an element has more bytes than the
// parser reads, the rest of the element is ignored.
struct Range {
  const uint8_t* start;
  size_t length;
};

Range Contents(const asn1_hdr& hdr) { return {hdr.payload, hdr.length}; }

// Returns the part of `range` from `position` to the end. `position` must be in `range` or at its
// end.
Range After(const Range& range, const uint8_t* position) {
  return {position, range.length - static_cast<size_t>(position - range.start)};
}

// Reads the header of the next element. `range` then starts after this element.
bool Next(Range* range, asn1_hdr* hdr) {
  if (asn1_get_next(range->start, range->length, hdr) != 0) return false;
  *range = After(*range, hdr->payload + hdr->length);
  return true;
}

bool IsUniversal(const asn1_hdr& hdr, uint32_t tag) {
  return hdr.class_ == kAsn1Universal && hdr.tag == tag;
}

bool NextUniversal(Range* range, uint32_t tag, asn1_hdr* hdr) {
  return Next(range, hdr) && IsUniversal(*hdr, tag);
}

bool NextOid(Range* range, asn1_oid* oid) {
  const uint8_t* next;
  if (asn1_get_oid(range->start, range->length, oid, &next) != 0) return false;
  *range = After(*range, next);
  return true;
}

// The low 32 bits of an INTEGER.
uint32_t ToUint32(const asn1_hdr& integer) {
  uint32_t value = 0;
  for (uint32_t i = 0; i < integer.length; ++i) value = value << 8 | integer.payload[i];
  return value;
}

bool HoldsNul(const asn1_hdr& hdr) { return memchr(hdr.payload, 0, hdr.length) != nullptr; }

// The functions that read the parts of a certificate, in order. ParseTbs, ParseVersionAndSerial,
// ParseOptionalFields and ParseSignature return a code of x509_certificate_parse. The others
// return true or 0 for success, and false or a negative number for failure. ParseTbs,
// ParseOptionalFields or ParseSignature then chooses the code for the failure.
int ParseTbs(Range tbs, x509_certificate* cert);
int ParseVersionAndSerial(Range* tbs, x509_certificate* cert);
bool ParseAlgorithm(Range* range, asn1_oid* oid, asn1_oid* params);
int x509_parse_name(const uint8_t* buf, size_t len, x509_name* name, const uint8_t** next);
int ParseRdn(Range set, x509_name* name);
bool KeepAttribute(const asn1_oid& type, const asn1_hdr& value, x509_name* name);
bool ParseValidity(Range* tbs, x509_certificate* cert);
int x509_parse_time(const uint8_t* value, size_t len, uint32_t tag, x509_parser_time* time);
bool ParsePublicKeyInfo(Range* tbs, x509_certificate* cert);
int ParseOptionalFields(Range tbs, x509_certificate* cert);
bool ParseExtension(Range extension, x509_certificate* cert);
bool ReadExtensionValue(Range extension, bool* critical, Range* value);
bool ParseKeyUsage(Range value, x509_certificate* cert);
bool ParseAltName(Range value, uint32_t present, x509_name* name, x509_certificate* cert);
bool ParseBasicConstraints(Range value, x509_certificate* cert);
int x509_parse_ext_alt_name(x509_name* name, const uint8_t* buf, size_t len);
bool KeepAltName(const asn1_hdr& hdr, x509_name* name);
bool KeepText(const asn1_hdr& hdr, const uint8_t** text, uint64_t* length);
int ParseSignature(Range certificate, x509_certificate* cert);

struct KnownAttribute {
  uint32_t type;
  size_t arc_count;
  uint32_t arcs[7];
};

constexpr KnownAttribute kAttributes[] = {
    {kX509DomainComponent, 7, {0, 9, 2342, 19200300, 100, 1, 25}},
    {kX509CommonName, 4, {2, 5, 4, 3}},
    {kX509CountryName, 4, {2, 5, 4, 6}},
    {kX509LocalityName, 4, {2, 5, 4, 7}},
    {kX509StateOrProvinceName, 4, {2, 5, 4, 8}},
    {kX509OrganizationName, 4, {2, 5, 4, 10}},
    {kX509OrganizationalUnitName, 4, {2, 5, 4, 11}},
    {kX509UserId, 7, {0, 9, 2342, 19200300, 100, 1, 1}},
};

constexpr KnownAttribute kEmailAddress = {0, 7, {1, 2, 840, 113549, 1, 9, 1}};

// The tags of the alternative names that are kept (RFC 5280 §4.2.1.6).
constexpr uint32_t kRfc822Name = 1;
constexpr uint32_t kDnsName = 2;
constexpr uint32_t kUniformResourceIdentifier = 6;
constexpr uint32_t kIpAddress = 7;
constexpr uint32_t kRegisteredId = 8;

}  // namespace

int x509_certificate_parse(const uint8_t* buf, size_t len, x509_certificate* cert) {
  if (buf == nullptr || len == 0 || cert == nullptr) return -2;
  *cert = {};
  cert->cert_start = buf;
  cert->cert_length = len;

  Range rest = {buf, len};
  asn1_hdr hdr;
  if (!NextUniversal(&rest, kAsn1Sequence, &hdr)) return -3;
  cert->cert_length = len - rest.length;

  Range certificate = Contents(hdr);
  cert->tbs_start = certificate.start;
  if (!NextUniversal(&certificate, kAsn1Sequence, &hdr)) return -3;
  if (const int result = ParseTbs(Contents(hdr), cert); result != 0) return result;
  cert->tbs_length = static_cast<uint64_t>(certificate.start - cert->tbs_start);

  return ParseSignature(certificate, cert);
}

namespace {

int ParseTbs(Range tbs, x509_certificate* cert) {
  if (const int result = ParseVersionAndSerial(&tbs, cert); result != 0) return result;
  if (!ParseAlgorithm(&tbs, &cert->signature_oid, &cert->signature_params_oid)) return -11;

  const uint8_t* next;
  if (x509_parse_name(tbs.start, tbs.length, &cert->issuer, &next) != 0) return -12;
  tbs = After(tbs, next);
  if (!ParseValidity(&tbs, cert)) return -13;
  if (x509_parse_name(tbs.start, tbs.length, &cert->subject, &next) != 0) return -12;
  tbs = After(tbs, next);
  if (!ParsePublicKeyInfo(&tbs, cert)) return -14;

  return ParseOptionalFields(tbs, cert);
}

int ParseVersionAndSerial(Range* tbs, x509_certificate* cert) {
  asn1_hdr hdr;
  if (!Next(tbs, &hdr)) return -5;
  // Deliberate: any element of the context-specific class is read as the version here.
  if (hdr.class_ == kAsn1Context) {
    Range inner = Contents(hdr);
    const Range from_inner = {inner.start, inner.length + tbs->length};
    if (!Next(&inner, &hdr)) return -5;
    if (!IsUniversal(hdr, kAsn1Integer) || hdr.length != 1 || hdr.payload[0] > 2) return -9;
    cert->version = hdr.payload[0];
    // Deliberate: the serialNumber is expected right after the version's number, not after the
    // element that contains the number.
    *tbs = After(from_inner, hdr.payload + hdr.length);
    if (!Next(tbs, &hdr)) return -5;
  }
  if (!IsUniversal(hdr, kAsn1Integer)) return -10;
  cert->serial_number = ToUint32(hdr);
  return 0;
}

// An AlgorithmIdentifier (RFC 5280 §4.1.1.2). Parameters are kept if they are an object identifier.
bool ParseAlgorithm(Range* range, asn1_oid* oid, asn1_oid* params) {
  asn1_hdr hdr;
  if (!NextUniversal(range, kAsn1Sequence, &hdr)) return false;
  Range algorithm = Contents(hdr);
  if (!NextOid(&algorithm, oid)) return false;
  NextOid(&algorithm, params);
  return true;
}

// Reads a Name (RFC 5280 §4.1.2.4). Stores the position after it in `next`. Returns 0 for success,
// -3 for a missing SEQUENCE, -7 for a missing SET, and -8 for a missing or malformed attribute
// type. Returns -1 if an attribute's value is missing or not universal. Also returns -1 for an
// attribute of kAttributes if its value contains a NUL, or if `name` already has kX509MaxAttributes
// attributes. The caller returns -12 for every failure. `name` is empty after a failure.
int x509_parse_name(const uint8_t* buf, size_t len, x509_name* name, const uint8_t** next) {
  Range range = {buf, len};
  asn1_hdr hdr;
  if (!NextUniversal(&range, kAsn1Sequence, &hdr)) return -3;
  *next = range.start;

  Range rdns = Contents(hdr);
  while (rdns.length > 0) {
    const int result = NextUniversal(&rdns, kAsn1Set, &hdr) ? ParseRdn(Contents(hdr), name) : -7;
    if (result != 0) {
      *name = {};
      return result;
    }
  }
  return 0;
}

// Returns the codes of x509_parse_name. Deliberate: only the first attribute of a
// RelativeDistinguishedName is read.
int ParseRdn(Range set, x509_name* name) {
  asn1_hdr hdr;
  if (!NextUniversal(&set, kAsn1Sequence, &hdr)) return -3;
  Range attribute = Contents(hdr);
  asn1_oid type;
  if (!NextOid(&attribute, &type)) return -8;
  if (!Next(&attribute, &hdr) || hdr.class_ != kAsn1Universal) return -1;
  return KeepAttribute(type, hdr, name) ? 0 : -1;
}

bool IsType(const asn1_oid& oid, const KnownAttribute& attribute) {
  return oid.len == attribute.arc_count &&
         memcmp(oid.oid, attribute.arcs, attribute.arc_count * sizeof(uint32_t)) == 0;
}

// Deliberate: a kept value must not contain a NUL, except for the e-mail address.
bool KeepAttribute(const asn1_oid& type, const asn1_hdr& value, x509_name* name) {
  if (IsType(type, kEmailAddress)) {
    name->email = value.payload;
    name->email_length = value.length;
    return true;
  }
  for (const KnownAttribute& attribute : kAttributes) {
    if (!IsType(type, attribute)) continue;
    if (name->attribute_count == kX509MaxAttributes || HoldsNul(value)) return false;
    name->attributes[name->attribute_count++] = {attribute.type, value.payload, value.length};
    return true;
  }
  return true;
}

bool ParseValidity(Range* tbs, x509_certificate* cert) {
  asn1_hdr hdr;
  if (!NextUniversal(tbs, kAsn1Sequence, &hdr)) return false;
  Range validity = Contents(hdr);
  for (x509_parser_time* time : {&cert->not_before, &cert->not_after}) {
    if (!Next(&validity, &hdr) || hdr.class_ != kAsn1Universal) return false;
    if (x509_parse_time(hdr.payload, hdr.length, hdr.tag, time) != 0) return false;
  }
  return true;
}

// Returns the value of two decimal digits, or -1 if one of them is not a digit.
int TwoDigits(const uint8_t* digits) {
  const int tens = digits[0] - '0';
  const int ones = digits[1] - '0';
  return tens < 0 || tens > 9 || ones < 0 || ones > 9 ? -1 : tens * 10 + ones;
}

// Reads a UTCTime or a GeneralizedTime in the form of RFC 5280 §4.1.2.5: in UTC (`Z`), with seconds
// and without fractions of a second. Returns 0, or -1 for any other form. Deliberate: the tool does
// not use the times, so the range of the numbers is not checked.
int x509_parse_time(const uint8_t* value, size_t len, uint32_t tag, x509_parser_time* time) {
  constexpr size_t kAfterYear = sizeof("MMDDHHMMSSZ") - 1;
  const size_t year_digits = tag == kAsn1UtcTime ? 2 : 4;
  if (tag != kAsn1UtcTime && tag != kAsn1GeneralizedTime) return -1;
  if (len != year_digits + kAfterYear || value[len - 1] != 'Z') return -1;

  int year = TwoDigits(value);
  if (year < 0) return -1;
  if (tag == kAsn1UtcTime) {
    year += year < 50 ? 2000 : 1900;
  } else {
    const int low = TwoDigits(value + 2);
    if (low < 0) return -1;
    year = year * 100 + low;
  }
  time->year = static_cast<uint16_t>(year);

  const uint8_t* digits = value + year_digits;
  for (uint8_t* field : {&time->month, &time->day, &time->hour, &time->minute, &time->second}) {
    const int number = TwoDigits(digits);
    if (number < 0) return -1;
    *field = static_cast<uint8_t>(number);
    digits += 2;
  }
  return 0;
}

bool ParsePublicKeyInfo(Range* tbs, x509_certificate* cert) {
  asn1_hdr hdr;
  if (!NextUniversal(tbs, kAsn1Sequence, &hdr)) return false;
  Range info = Contents(hdr);
  if (!ParseAlgorithm(&info, &cert->public_key_oid, &cert->public_key_params_oid)) return false;
  if (!NextUniversal(&info, kAsn1BitString, &hdr) || hdr.length == 0) return false;
  cert->public_key = hdr.payload + 1;
  cert->public_key_length = hdr.length - 1;
  return true;
}

int ParseOptionalFields(Range tbs, x509_certificate* cert) {
  constexpr uint32_t kExtensionsTag = 3;
  // Deliberate: a v1 certificate should not have unique identifiers or extensions. If it has them,
  // they are not read.
  if (tbs.length == 0 || cert->version == 0) return 0;
  asn1_hdr hdr;
  if (!Next(&tbs, &hdr) || hdr.class_ != kAsn1Context) return -5;
  // Deliberate: only the first of the optional fields is read. Extensions after a unique identifier
  // are therefore ignored.
  if (hdr.tag != kExtensionsTag) return 0;

  Range field = Contents(hdr);
  if (cert->version != 2 || !NextUniversal(&field, kAsn1Sequence, &hdr)) return -15;
  Range extensions = Contents(hdr);
  while (extensions.length > 0) {
    if (!NextUniversal(&extensions, kAsn1Sequence, &hdr)) return -15;
    if (!ParseExtension(Contents(hdr), cert)) return -15;
  }
  return 0;
}

// The contents of one Extension (RFC 5280 §4.2).
bool ParseExtension(Range extension, x509_certificate* cert) {
  asn1_oid id;
  bool critical;
  Range value;
  if (!NextOid(&extension, &id) || !ReadExtensionValue(extension, &critical, &value)) return false;
  // Deliberate: arcs after the fourth are ignored.
  const bool is_known = id.len >= 4 && id.oid[0] == 2 && id.oid[1] == 5 && id.oid[2] == 29;
  switch (is_known ? id.oid[3] : 0) {
    case 15:
      return ParseKeyUsage(value, cert);
    case 17:
      return ParseAltName(value, kX509SubjectAltName, &cert->subject, cert);
    case 18:
      return ParseAltName(value, kX509IssuerAltName, &cert->issuer, cert);
    case 19:
      return ParseBasicConstraints(value, cert);
    default:
      return !critical;
  }
}

// Reads the critical flag and the value of an extension. `extension` starts after the extnID.
bool ReadExtensionValue(Range extension, bool* critical, Range* value) {
  *critical = false;
  const Range from_flag = extension;
  asn1_hdr hdr;
  if (!Next(&extension, &hdr) || hdr.class_ != kAsn1Universal) return false;
  if (hdr.tag == kAsn1Boolean) {
    if (hdr.length != 1) return false;
    *critical = hdr.payload[0] != 0;
    // Deliberate: the next header is read from the flag's value byte, not from the byte after it.
    // TRUE in DER is 0xFF. This byte reads as the first octet of a long-form tag of the private
    // class. The identifier octet of the OCTET STRING, 0x04, then reads as the tag number 4, which
    // is the tag of an OCTET STRING. FALSE is 0x00, which reads as the tag 0, not 4. An extension
    // with an encoded FALSE is therefore refused. DER omits this FALSE, because it is the default.
    extension = After(from_flag, hdr.payload);
    if (!Next(&extension, &hdr)) return false;
    if (hdr.class_ != kAsn1Universal && hdr.class_ != kAsn1Private) return false;
  }
  if (hdr.tag != kAsn1OctetString) return false;
  *value = Contents(hdr);
  return true;
}

bool ParseKeyUsage(Range value, x509_certificate* cert) {
  asn1_hdr hdr;
  if (!NextUniversal(&value, kAsn1BitString, &hdr) || hdr.length == 0) return false;
  cert->extensions_present |= kX509KeyUsage;
  cert->key_usage = static_cast<uint32_t>(asn1_bit_string_to_long(hdr.payload, hdr.length));
  return true;
}

bool ParseAltName(Range value, uint32_t present, x509_name* name, x509_certificate* cert) {
  asn1_hdr hdr;
  if (!NextUniversal(&value, kAsn1Sequence, &hdr)) return false;
  cert->extensions_present |= present;
  return x509_parse_ext_alt_name(name, hdr.payload, hdr.length) == 0;
}

bool ParseBasicConstraints(Range value, x509_certificate* cert) {
  asn1_hdr hdr;
  if (!NextUniversal(&value, kAsn1Sequence, &hdr)) return false;
  cert->extensions_present |= kX509BasicConstraints;
  Range constraints = Contents(hdr);
  if (constraints.length == 0) return true;

  if (!Next(&constraints, &hdr)) return false;
  if (IsUniversal(hdr, kAsn1Boolean)) {
    if (hdr.length != 1) return false;
    cert->ca = hdr.payload[0];
    if (constraints.length == 0) return true;
    if (!Next(&constraints, &hdr)) return false;
  }
  if (!IsUniversal(hdr, kAsn1Integer)) return false;
  cert->path_len_constraint = ToUint32(hdr);
  cert->extensions_present |= kX509PathLenConstraint;
  return true;
}

// Reads GeneralNames (RFC 5280 §4.2.1.6) without the header of the SEQUENCE. Returns -1 if a header
// cannot be read, if KeepText refuses a text, or if a registeredID is malformed. Otherwise returns
// 0.
int x509_parse_ext_alt_name(x509_name* name, const uint8_t* buf, size_t len) {
  Range names = {buf, len};
  while (names.length > 0) {
    asn1_hdr hdr;
    if (!Next(&names, &hdr)) return -1;
    if (hdr.class_ == kAsn1Context && !KeepAltName(hdr, name)) return -1;
  }
  return 0;
}

bool KeepAltName(const asn1_hdr& hdr, x509_name* name) {
  switch (hdr.tag) {
    case kRfc822Name:
      return KeepText(hdr, &name->alt_email, &name->alt_email_length);
    case kDnsName:
      return KeepText(hdr, &name->dns, &name->dns_length);
    case kUniformResourceIdentifier:
      return KeepText(hdr, &name->uri, &name->uri_length);
    case kIpAddress:
      name->ip = hdr.payload;
      name->ip_length = hdr.length;
      return true;
    case kRegisteredId:
      return asn1_parse_oid(hdr.payload, hdr.length, &name->rid) == 0;
    default:
      return true;
  }
}

// Stores the contents of `hdr` in `text` and `length`. For a text with a NUL, stores an empty text
// and returns false: many programs would read this text only up to the NUL.
bool KeepText(const asn1_hdr& hdr, const uint8_t** text, uint64_t* length) {
  const bool good = !HoldsNul(hdr);
  *text = good ? hdr.payload : nullptr;
  *length = good ? hdr.length : 0;
  return good;
}

// Deliberate: the signatureAlgorithm is not compared with the signature field of the
// tbsCertificate.
int ParseSignature(Range certificate, x509_certificate* cert) {
  if (!ParseAlgorithm(&certificate, &cert->signature_algorithm_oid,
                      &cert->signature_algorithm_params_oid)) {
    return -11;
  }
  asn1_hdr hdr;
  if (!NextUniversal(&certificate, kAsn1BitString, &hdr)) return -4;
  if (hdr.length == 0) return -5;
  if (hdr.payload[0] != 0) return -6;
  cert->signature_value = hdr.payload + 1;
  cert->signature_value_length = hdr.length - 1;
  return 0;
}

}  // namespace
