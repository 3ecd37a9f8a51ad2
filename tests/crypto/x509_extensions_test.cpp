// The extensions of a certificate.
#include <gtest/gtest.h>

#include "crypto/parsed_certificate.h"

namespace {

constexpr char kKeyUsage[] = "2.5.29.15";
constexpr char kSubjectAltName[] = "2.5.29.17";
constexpr char kIssuerAltName[] = "2.5.29.18";
constexpr char kBasicConstraints[] = "2.5.29.19";
constexpr char kUnknown[] = "2.5.29.32";

Certificate With(std::vector<Bytes> extensions) {
  Certificate certificate = Unsigned();
  certificate.extensions = std::move(extensions);
  return certificate;
}

// An Extension whose critical flag and value are replaced by `rest`.
Bytes RawExtension(const std::string& oid, const Bytes& rest) {
  return der::Sequence({der::Oid(oid), rest});
}

const Bytes& DigitalSignature() {
  static const auto& value = *new Bytes(der::BitString({0x80}, 7));
  return value;
}

}  // namespace

TEST(X509Extensions, CriticalExtensionWithAnUnknownOidIsMinus15) {
  EXPECT_EQ(ResultOf(With({Extension(kUnknown, der::Null(), true)})), -15);
}

TEST(X509Extensions, NonCriticalExtensionWithAnUnknownOidIsSkipped) {
  const ParsedCertificate parsed(
      With({Extension(kUnknown, der::Null()), Extension(kKeyUsage, DigitalSignature())}));
  EXPECT_EQ(parsed.result, 0);
  EXPECT_EQ(parsed.cert.extensions_present, kX509KeyUsage);
}

TEST(X509Extensions, OidsNextToTheKnownOnesAreUnknown) {
  for (const char* oid :
       {"2.5.29.14", "2.5.29.16", "2.5.29.20", "2.5.29", "2.5.28.15", "2.4.29.15", "1.5.29.15"}) {
    EXPECT_EQ(ResultOf(With({Extension(oid, DigitalSignature(), true)})), -15) << oid;
    EXPECT_EQ(ResultOf(With({Extension(oid, DigitalSignature())})), 0) << oid;
  }
}

TEST(X509Extensions, ArcsAfterTheFourthMakeNoDifference) {
  const ParsedCertificate parsed(With({Extension("2.5.29.15.1", DigitalSignature(), true)}));
  EXPECT_EQ(parsed.result, 0);
  EXPECT_EQ(parsed.cert.key_usage, 1u);
}

TEST(X509Extensions, KnownExtensionMayBeCritical) {
  const ParsedCertificate parsed(With({Extension(kKeyUsage, DigitalSignature(), true)}));
  EXPECT_EQ(parsed.result, 0);
  EXPECT_EQ(parsed.cert.extensions_present, kX509KeyUsage);
}

TEST(X509Extensions, FlagOfFalseIsMinus15) {
  const Bytes value = der::OctetString(DigitalSignature());
  EXPECT_EQ(ResultOf(With({RawExtension(kKeyUsage, Concat({der::Boolean(0), value}))})), -15);
  EXPECT_EQ(ResultOf(With({RawExtension(kKeyUsage, Concat({der::Boolean(0xff), value}))})), 0);
}

TEST(X509Extensions, FlagOtherThanFfIsReadAsAnIdentifier) {
  const Bytes value = der::OctetString(DigitalSignature());
  // The parser reads the flag's byte as an identifier octet. 0x01 is the identifier octet of a
  // BOOLEAN. Each other byte below starts a long-form tag. The next octet, 04, is then the tag
  // number, and 4 is the tag number of an OCTET STRING. The parser accepts this tag in the private
  // class (0xdf) and in the universal class (0x1f). It refuses the tag in the application class
  // (0x5f) and in the context-specific class (0x9f). The usual flag, 0xff, is also in the private
  // class.
  const std::pair<uint8_t, int> cases[] = {
      {0x01, -15}, {0xdf, 0}, {0x5f, -15}, {0x9f, -15}, {0x1f, 0}};
  for (const auto& [flag, result] : cases) {
    EXPECT_EQ(ResultOf(With({RawExtension(kKeyUsage, Concat({der::Boolean(flag), value}))})),
              result);
  }
}

// A parser that ignored the flag's length would read FF 04 04 as the header of an element of the
// private class. The contents of this element, 03 02 05 A0, are a valid KeyUsage.
TEST(X509Extensions, FlagOfTwoBytesOnAKnownExtensionIsMinus15) {
  const Bytes rest = FromHex("04 03 02 05 a0");
  EXPECT_EQ(ResultOf(With({RawExtension(kKeyUsage, Concat({FromHex("01 01 04"), rest}))})), 0);
  EXPECT_EQ(ResultOf(With({RawExtension(kKeyUsage, Concat({FromHex("01 02 ff 04"), rest}))})), -15);
}

TEST(X509Extensions, NonzeroFlagMakesAnUnknownExtensionCritical) {
  const Bytes value = der::OctetString(DigitalSignature());
  for (const uint8_t flag : {0xdf, 0x1f, 0x04}) {
    const Bytes rest = Concat({der::Boolean(flag), flag == 4 ? FromHex("04 03 02 05 a0") : value});
    EXPECT_EQ(ResultOf(With({RawExtension(kKeyUsage, rest)})), 0) << int{flag};
    EXPECT_EQ(ResultOf(With({RawExtension(kUnknown, rest)})), -15) << int{flag};
  }
}

TEST(X509Extensions, HeaderAfterTheFlagIsReadFromTheFlagsByte) {
  // The flag's value byte is 04, and the bytes after it are 04 03 02 05 a0. Together, these six
  // bytes are an OCTET STRING with four bytes of contents: 03 02 05 a0. The contents are a BIT
  // STRING in which the named bits 0 and 2 are set.
  const ParsedCertificate parsed(
      With({RawExtension(kKeyUsage, Concat({der::Boolean(4), FromHex("04 03 02 05 a0")}))}));
  EXPECT_EQ(parsed.result, 0);
  EXPECT_EQ(parsed.cert.key_usage, 5u);
}

TEST(X509Extensions, MalformedExtensionIsMinus15) {
  const Bytes value = der::OctetString(DigitalSignature());
  const Bytes cases[] = {
      der::Set({}),                                                     // no SEQUENCE
      {0x30, 0x05},                                                     // ends beyond its container
      der::Context(16, {}),                                             // tag 16 of another class
      der::Sequence({}),                                                // no OID
      der::Sequence({value, value}),                                    // no OID, but values
      RawExtension(kUnknown, {}),                                       // no value
      RawExtension(kUnknown, der::Null()),                              // a NULL as the value
      RawExtension(kUnknown, der::ContextPrimitive(4, {})),             // tag 4 of another class
      RawExtension(kUnknown, Concat({FromHex("01 00"), value})),        // an empty flag
      RawExtension(kUnknown, Concat({FromHex("01 02 ff ff"), value})),  // a flag of two bytes
      RawExtension(kUnknown, der::Boolean(0xff)),                       // no value after the flag
      RawExtension(kKeyUsage, Concat({der::Boolean(0xff), der::Null()})),
      RawExtension(kKeyUsage, Concat({der::Boolean(0xff), {0x04, 0x05}})),
  };
  for (const Bytes& extension : cases) EXPECT_EQ(ResultOf(With({extension})), -15);
}

TEST(X509Extensions, FieldThatHoldsNoSequenceIsMinus15) {
  for (const Bytes& contents : {Bytes(), der::Set({}), FromHex("30 05"), der::Context(16, {})}) {
    Certificate certificate = Unsigned();
    certificate.tbs_tail = der::Context(3, contents);
    EXPECT_EQ(ResultOf(certificate), -15);
  }
}

TEST(X509Extensions, EmptySequenceOfExtensionsIsAccepted) {
  Certificate certificate = Unsigned();
  certificate.tbs_tail = der::Context(3, der::Sequence({}));
  EXPECT_EQ(ResultOf(certificate), 0);
}

TEST(X509Extensions, AreMinus15InAVersion2Certificate) {
  Certificate certificate = With({Extension(kUnknown, der::Null())});
  certificate.version = der::Context(0, der::Integer(1));
  EXPECT_EQ(ResultOf(certificate), -15);
  certificate.version = der::Context(0, der::Integer(2));
  EXPECT_EQ(ResultOf(certificate), 0);
}

TEST(X509Extensions, BitsOfExtensionsPresentAreTheFirstFive) {
  EXPECT_EQ(kX509BasicConstraints, 1u);
  EXPECT_EQ(kX509PathLenConstraint, 2u);
  EXPECT_EQ(kX509KeyUsage, 4u);
  EXPECT_EQ(kX509SubjectAltName, 8u);
  EXPECT_EQ(kX509IssuerAltName, 16u);
}

TEST(X509KeyUsage, NamedBitsKeepTheirNumbers) {
  // keyCertSign (5), cRLSign (6) and decipherOnly (8).
  const ParsedCertificate parsed(With({Extension(kKeyUsage, der::BitString({0x06, 0x80}, 7))}));
  EXPECT_EQ(parsed.result, 0);
  EXPECT_EQ(parsed.cert.key_usage, 0x160u);
  EXPECT_EQ(parsed.cert.extensions_present, kX509KeyUsage);
}

TEST(X509KeyUsage, EmptyBitStringIsPresent) {
  const ParsedCertificate parsed(With({Extension(kKeyUsage, der::BitString({}))}));
  EXPECT_EQ(parsed.result, 0);
  EXPECT_EQ(parsed.cert.key_usage, 0u);
  EXPECT_EQ(parsed.cert.extensions_present, kX509KeyUsage);
}

TEST(X509KeyUsage, MalformedValueIsMinus15) {
  for (const char* digits : {"", "04 02 00 80", "83 02 00 80", "03 00", "03 05 00"}) {
    EXPECT_EQ(ResultOf(With({Extension(kKeyUsage, FromHex(digits))})), -15) << digits;
  }
}

TEST(X509BasicConstraints, EmptySequenceLeavesCaAtZero) {
  const ParsedCertificate parsed(With({Extension(kBasicConstraints, der::Sequence({}))}));
  EXPECT_EQ(parsed.result, 0);
  EXPECT_EQ(parsed.cert.extensions_present, kX509BasicConstraints);
  EXPECT_EQ(parsed.cert.ca, 0u);
}

TEST(X509BasicConstraints, CaIsTheByteAsWritten) {
  for (const uint8_t byte : {0xff, 0x01, 0x00}) {
    const ParsedCertificate parsed(
        With({Extension(kBasicConstraints, der::Sequence({der::Boolean(byte)}))}));
    EXPECT_EQ(parsed.result, 0);
    EXPECT_EQ(parsed.cert.extensions_present, kX509BasicConstraints);
    EXPECT_EQ(parsed.cert.ca, byte);
  }
}

TEST(X509BasicConstraints, PathLengthFollowsCa) {
  const ParsedCertificate parsed(With(
      {Extension(kBasicConstraints, der::Sequence({der::Boolean(0xff), der::Integer(0x0102)}))}));
  EXPECT_EQ(parsed.result, 0);
  EXPECT_EQ(parsed.cert.extensions_present, kX509BasicConstraints | kX509PathLenConstraint);
  EXPECT_EQ(parsed.cert.ca, 0xffu);
  EXPECT_EQ(parsed.cert.path_len_constraint, 0x0102u);
}

TEST(X509BasicConstraints, PathLengthIsReadWithoutCa) {
  const ParsedCertificate parsed(
      With({Extension(kBasicConstraints, der::Sequence({der::Integer(7)}))}));
  EXPECT_EQ(parsed.result, 0);
  EXPECT_EQ(parsed.cert.extensions_present, kX509BasicConstraints | kX509PathLenConstraint);
  EXPECT_EQ(parsed.cert.ca, 0u);
  EXPECT_EQ(parsed.cert.path_len_constraint, 7u);
}

TEST(X509BasicConstraints, MalformedValueIsMinus15) {
  // The first three values are not a SEQUENCE: no bytes, another tag, another class. In the next
  // six values, the first element is wrong. It is unreadable, has another tag, has another class
  // (two values), is a BOOLEAN with two bytes, or is a BOOLEAN without a byte. In the last four
  // values, the second element is wrong. It is unreadable, has another tag, has another class, or
  // is a second BOOLEAN.
  for (const char* digits :
       {"", "31 00", "b0 00", "30 01 01", "30 02 05 00", "30 03 81 01 ff", "30 03 82 01 01",
        "30 04 01 02 ff ff", "30 02 01 00", "30 04 01 01 ff 02", "30 05 01 01 ff 05 00",
        "30 06 01 01 ff 82 01 01", "30 06 01 01 ff 01 01 ff"}) {
    EXPECT_EQ(ResultOf(With({Extension(kBasicConstraints, FromHex(digits))})), -15) << digits;
  }
}

TEST(X509AltName, FiveKindsOfNamesAreKept) {
  const ParsedCertificate parsed(With(
      {Extension(kSubjectAltName, der::Sequence({
                                      der::ContextPrimitive(1, ToBytes("a@example.com")),
                                      der::ContextPrimitive(2, ToBytes("www.example.com")),
                                      der::ContextPrimitive(6, ToBytes("https://example.com/")),
                                      der::ContextPrimitive(7, {10, 0, 0, 1}),
                                      der::ContextPrimitive(8, der::OidContents("1.2.840")),
                                  }))}));
  ASSERT_EQ(parsed.result, 0);
  EXPECT_EQ(parsed.cert.extensions_present, kX509SubjectAltName);
  const x509_name& subject = parsed.cert.subject;
  EXPECT_EQ(TextField(subject.alt_email, subject.alt_email_length), "a@example.com");
  EXPECT_EQ(TextField(subject.dns, subject.dns_length), "www.example.com");
  EXPECT_EQ(TextField(subject.uri, subject.uri_length), "https://example.com/");
  EXPECT_EQ(Field(subject.ip, subject.ip_length), (Bytes{10, 0, 0, 1}));
  EXPECT_EQ(DottedText(subject.rid), "1.2.840");
  EXPECT_EQ(parsed.cert.issuer.dns, nullptr);
}

TEST(X509AltName, IssuersNamesGoToTheIssuer) {
  const ParsedCertificate parsed(With({Extension(
      kIssuerAltName, der::Sequence({der::ContextPrimitive(2, ToBytes("ca.example"))}))}));
  ASSERT_EQ(parsed.result, 0);
  EXPECT_EQ(parsed.cert.extensions_present, kX509IssuerAltName);
  EXPECT_EQ(TextField(parsed.cert.issuer.dns, parsed.cert.issuer.dns_length), "ca.example");
  EXPECT_EQ(parsed.cert.subject.dns, nullptr);
}

TEST(X509AltName, LaterNameReplacesAnEarlierOneOfTheSameKind) {
  const ParsedCertificate parsed(With(
      {Extension(kSubjectAltName, der::Sequence({der::ContextPrimitive(2, ToBytes("first")),
                                                 der::ContextPrimitive(2, ToBytes("second"))}))}));
  ASSERT_EQ(parsed.result, 0);
  EXPECT_EQ(TextField(parsed.cert.subject.dns, parsed.cert.subject.dns_length), "second");
}

TEST(X509AltName, EmptySequenceIsPresent) {
  for (const auto& [oid, bit] :
       {std::make_pair(kSubjectAltName, 8u), std::make_pair(kIssuerAltName, 16u)}) {
    const ParsedCertificate parsed(With({Extension(oid, der::Sequence({}))}));
    EXPECT_EQ(parsed.result, 0);
    EXPECT_EQ(parsed.cert.extensions_present, bit);
  }
}

TEST(X509AltName, OtherTagsAndClassesAreSkipped) {
  const ParsedCertificate parsed(With({Extension(
      kSubjectAltName, der::Sequence({der::Context(0, der::Null()), der::Context(4, Name({})),
                                      der::Element(0x02, "integer"), der::Element(0x42, "other"),
                                      der::ContextPrimitive(9, {1})}))}));
  ASSERT_EQ(parsed.result, 0);
  EXPECT_EQ(parsed.cert.extensions_present, kX509SubjectAltName);
  EXPECT_EQ(parsed.cert.subject.dns, nullptr);
}

TEST(X509AltName, NulInATextIsMinus15AndClearsTheEarlierText) {
  const Bytes with_nul = {'a', 0, 'b'};
  for (const uint8_t tag : {1, 2, 6}) {
    const ParsedCertificate parsed(With(
        {Extension(kSubjectAltName, der::Sequence({der::ContextPrimitive(tag, ToBytes("before")),
                                                   der::ContextPrimitive(tag, with_nul)}))}));
    EXPECT_EQ(parsed.result, -15);
    const x509_name& subject = parsed.cert.subject;
    EXPECT_EQ(subject.alt_email, nullptr);
    EXPECT_EQ(subject.alt_email_length, 0u);
    EXPECT_EQ(subject.dns, nullptr);
    EXPECT_EQ(subject.dns_length, 0u);
    EXPECT_EQ(subject.uri, nullptr);
    EXPECT_EQ(subject.uri_length, 0u);
  }
}

TEST(X509AltName, EmptyRegisteredIdHasNoArcs) {
  const ParsedCertificate parsed(With(
      {Extension(kSubjectAltName, der::Sequence({der::ContextPrimitive(8, der::OidContents("1.2")),
                                                 der::ContextPrimitive(8, {})}))}));
  EXPECT_EQ(parsed.result, 0);
  EXPECT_EQ(parsed.cert.subject.rid.len, 0u);
}

TEST(X509AltName, MalformedValueIsMinus15) {
  // The first three values are not a SEQUENCE: no bytes, another tag, another class. In the next
  // two values, the name is unreadable. In the last value, a registeredID ends within an arc.
  for (const char* oid : {kSubjectAltName, kIssuerAltName}) {
    for (const char* digits :
         {"", "31 00", "b0 00", "30 01 82", "30 02 82 05", "30 04 88 02 2a 86"}) {
      EXPECT_EQ(ResultOf(With({Extension(oid, FromHex(digits))})), -15) << digits;
    }
  }
}
