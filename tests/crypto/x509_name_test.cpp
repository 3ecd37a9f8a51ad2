// The names and times of a certificate.
#include <gtest/gtest.h>

#include "crypto/parsed_certificate.h"

namespace {

constexpr char kEmailAddress[] = "1.2.840.113549.1.9.1";
constexpr char kCommonName[] = "2.5.4.3";

Certificate WithSubject(const Bytes& subject) {
  Certificate certificate = Unsigned();
  certificate.subject = subject;
  return certificate;
}

// A RelativeDistinguishedName with one attribute.
Bytes Rdn(const std::string& oid, const Bytes& value) {
  return der::Set({der::Sequence({der::Oid(oid), value})});
}

std::string Value(const x509_name& name, size_t i) {
  return TextField(name.attributes[i].value, name.attributes[i].value_length);
}

x509_parser_time NotBefore(uint8_t identifier, const std::string& text, int expected_result = 0) {
  Certificate certificate = Unsigned();
  certificate.validity =
      der::Sequence({der::Element(identifier, text), der::Element(der::kUtcTime, "491231235959Z")});
  const ParsedCertificate parsed(certificate);
  EXPECT_EQ(parsed.result, expected_result) << text;
  return parsed.cert.not_before;
}

void ExpectTime(const x509_parser_time& time, int year, int month, int day, int hour, int minute,
                int second) {
  EXPECT_EQ(time.year, year);
  EXPECT_EQ(time.month, month);
  EXPECT_EQ(time.day, day);
  EXPECT_EQ(time.hour, hour);
  EXPECT_EQ(time.minute, minute);
  EXPECT_EQ(time.second, second);
}

}  // namespace

TEST(X509Name, KnownAttributesAreKeptInOrderOfAppearance) {
  const std::pair<const char*, uint32_t> known[] = {
      {"0.9.2342.19200300.100.1.1", 8},
      {"2.5.4.11", 7},
      {"2.5.4.10", 6},
      {"2.5.4.8", 5},
      {"2.5.4.7", 4},
      {"2.5.4.6", 3},
      {"2.5.4.3", 2},
      {"0.9.2342.19200300.100.1.25", 1},
  };
  std::vector<std::pair<std::string, std::string>> attributes;
  for (const auto& [oid, type] : known)
    attributes.emplace_back(oid, "value of " + std::string(oid));
  const ParsedCertificate parsed(WithSubject(Name(attributes)));
  ASSERT_EQ(parsed.result, 0);
  const x509_name& subject = parsed.cert.subject;
  ASSERT_EQ(subject.attribute_count, 8u);
  for (size_t i = 0; i < 8; ++i) {
    EXPECT_EQ(subject.attributes[i].type, known[i].second);
    EXPECT_EQ(Value(subject, i), attributes[i].second);
  }
}

TEST(X509Name, OtherAttributesAreSkipped) {
  // Each skipped object identifier differs by one arc from an identifier whose value is kept.
  const ParsedCertificate parsed(WithSubject(Name({{"2.5.4.2", "x"},
                                                   {"2.5.4.4", "x"},
                                                   {"2.5.4.5", "x"},
                                                   {"2.5.4.9", "x"},
                                                   {"2.5.4.12", "x"},
                                                   {"2.5.5.3", "x"},
                                                   {"2.5.4", "x"},
                                                   {"2.5.4.3.1", "x"},
                                                   {"0.9.2342.19200300.100.1.2", "x"},
                                                   {"1.2.840.113549.1.9.2", "x"},
                                                   {kCommonName, "kept"}})));
  ASSERT_EQ(parsed.result, 0);
  EXPECT_EQ(parsed.cert.subject.attribute_count, 1u);
  EXPECT_EQ(Value(parsed.cert.subject, 0), "kept");
  EXPECT_EQ(parsed.cert.subject.email, nullptr);
}

TEST(X509Name, EmailAddressIsKeptApartFromTheAttributes) {
  const ParsedCertificate parsed(
      WithSubject(Name({{kEmailAddress, "first"}, {kEmailAddress, "a@example.com"}})));
  ASSERT_EQ(parsed.result, 0);
  EXPECT_EQ(parsed.cert.subject.attribute_count, 0u);
  EXPECT_EQ(TextField(parsed.cert.subject.email, parsed.cert.subject.email_length),
            "a@example.com");
  EXPECT_EQ(parsed.cert.issuer.email, nullptr);
}

TEST(X509Name, EmptyNameIsAccepted) {
  const ParsedCertificate parsed(WithSubject(Name({})));
  EXPECT_EQ(parsed.result, 0);
  EXPECT_EQ(parsed.cert.subject.attribute_count, 0u);
}

TEST(X509Name, AnyUniversalValueIsAccepted) {
  for (const uint8_t identifier : {0x0c, 0x13, 0x14, 0x16, 0x1e, 0x05, 0x30}) {
    const ParsedCertificate parsed(
        WithSubject(der::Sequence({Rdn(kCommonName, der::Element(identifier, "text"))})));
    ASSERT_EQ(parsed.result, 0);
    EXPECT_EQ(Value(parsed.cert.subject, 0), "text");
  }
}

TEST(X509Name, AttributeWithAnEmptyValueIsKept) {
  const ParsedCertificate parsed(WithSubject(Name({{kCommonName, ""}})));
  ASSERT_EQ(parsed.result, 0);
  EXPECT_EQ(parsed.cert.subject.attribute_count, 1u);
  EXPECT_EQ(parsed.cert.subject.attributes[0].value_length, 0u);
}

TEST(X509Name, OnlyTheFirstAttributeOfARelativeDistinguishedNameIsRead) {
  const Bytes first = der::Sequence({der::Oid("2.5.4.10"), der::Element(der::kUtf8String, "O")});
  const Bytes second = der::Sequence({der::Oid("2.5.4.11"), der::Element(der::kUtf8String, "OU")});
  const ParsedCertificate parsed(WithSubject(der::Sequence(
      {der::Set({first, second, {0xff}}), Rdn(kCommonName, FromHex("0c 02 43 4e"))})));
  ASSERT_EQ(parsed.result, 0);
  ASSERT_EQ(parsed.cert.subject.attribute_count, 2u);
  EXPECT_EQ(Value(parsed.cert.subject, 0), "O");
  EXPECT_EQ(Value(parsed.cert.subject, 1), "CN");
}

TEST(X509Name, TwentyKnownAttributesAreKept) {
  const ParsedCertificate parsed(
      WithSubject(Name(std::vector<std::pair<std::string, std::string>>(20, {kCommonName, "x"}))));
  EXPECT_EQ(parsed.result, 0);
  EXPECT_EQ(parsed.cert.subject.attribute_count, 20u);
}

TEST(X509Name, TwentyFirstKnownAttributeIsMinus12) {
  const ParsedCertificate parsed(
      WithSubject(Name(std::vector<std::pair<std::string, std::string>>(21, {kCommonName, "x"}))));
  EXPECT_EQ(parsed.result, -12);
  EXPECT_EQ(parsed.cert.subject.attribute_count, 0u);
}

TEST(X509Name, UnknownOrEmailAttributeAfterTwentyIsAccepted) {
  std::vector<std::pair<std::string, std::string>> attributes(20, {kCommonName, "x"});
  attributes.emplace_back("2.5.4.5", "x");
  attributes.emplace_back(kEmailAddress, "a@example.com");
  EXPECT_EQ(ResultOf(WithSubject(Name(attributes))), 0);
}

TEST(X509Name, NulInAKnownAttributeIsMinus12) {
  const std::string with_nul("a\0b", 3);
  EXPECT_EQ(ResultOf(WithSubject(Name({{kCommonName, with_nul}}))), -12);
  EXPECT_EQ(ResultOf(WithSubject(Name({{"2.5.4.5", with_nul}}))), 0);
}

TEST(X509Name, NulInTheEmailAddressIsAccepted) {
  const std::string with_nul("a\0b", 3);
  const ParsedCertificate parsed(WithSubject(Name({{kEmailAddress, with_nul}})));
  ASSERT_EQ(parsed.result, 0);
  EXPECT_EQ(TextField(parsed.cert.subject.email, parsed.cert.subject.email_length), with_nul);
}

TEST(X509Name, MalformedNameIsMinus12) {
  const Bytes value = der::Element(der::kUtf8String, "x");
  const Bytes cases[] = {
      der::Set({}),                                                // no SEQUENCE
      FromHex("30 84 7f ff ff ff"),                                // runs past the end
      der::Sequence({der::Sequence({})}),                          // no SET
      der::Sequence({{0x31, 0x05}}),                               // a SET that runs past the end
      der::Sequence({der::Context(17, {})}),                       // a [17] in place of the SET
      der::Sequence({der::Set({})}),                               // an empty SET
      der::Sequence({der::Set({der::Set({})})}),                   // no SEQUENCE in the SET
      der::Sequence({der::Set({der::Sequence({})})}),              // no type
      der::Sequence({der::Set({der::Sequence({value, value})})}),  // a value in place of the type
      der::Sequence({Rdn(kCommonName, Bytes())}),                  // no value
      der::Sequence({Rdn(kCommonName, {0x0c, 0x01})}),             // a value that runs past the end
      der::Sequence({Rdn(kCommonName, der::ContextPrimitive(12, {'x'}))}),  // a [12] as the value
      der::Sequence({Rdn("1.2.3", der::ContextPrimitive(12, {'x'}))}),      // a [12], unknown type
  };
  for (const Bytes& name : cases) {
    Certificate certificate = Unsigned();
    certificate.subject = name;
    EXPECT_EQ(ResultOf(certificate), -12);
    certificate = Unsigned();
    certificate.issuer = name;
    EXPECT_EQ(ResultOf(certificate), -12);
  }
}

TEST(X509Name, FailureClearsTheSubjectButNotTheIssuer) {
  const ParsedCertificate parsed(WithSubject(
      der::Sequence({Rdn(kCommonName, FromHex("0c 01 61")), Rdn(kEmailAddress, FromHex("0c 01 62")),
                     Rdn(kCommonName, FromHex("0c 01 00"))})));
  ASSERT_EQ(parsed.result, -12);
  const x509_name& subject = parsed.cert.subject;
  EXPECT_EQ(subject.attribute_count, 0u);
  EXPECT_EQ(subject.attributes[0].type, 0u);
  EXPECT_EQ(subject.attributes[0].value, nullptr);
  EXPECT_EQ(subject.attributes[0].value_length, 0u);
  EXPECT_EQ(subject.email, nullptr);
  EXPECT_EQ(subject.email_length, 0u);
  EXPECT_EQ(parsed.cert.issuer.attribute_count, 1u);
  EXPECT_EQ(parsed.cert.not_before.year, 2020);
}

TEST(X509Time, UtcTimeOf49Is2049) {
  ExpectTime(NotBefore(der::kUtcTime, "490203040506Z"), 2049, 2, 3, 4, 5, 6);
}

TEST(X509Time, UtcTimeOf50Is1950) {
  ExpectTime(NotBefore(der::kUtcTime, "500203040506Z"), 1950, 2, 3, 4, 5, 6);
}

TEST(X509Time, UtcTimeOf00Is2000AndOf99Is1999) {
  EXPECT_EQ(NotBefore(der::kUtcTime, "000203040506Z").year, 2000);
  EXPECT_EQ(NotBefore(der::kUtcTime, "990203040506Z").year, 1999);
}

TEST(X509Time, GeneralizedTimeHasFourDigitsOfYear) {
  ExpectTime(NotBefore(der::kGeneralizedTime, "20510203040506Z"), 2051, 2, 3, 4, 5, 6);
  EXPECT_EQ(NotBefore(der::kGeneralizedTime, "00000203040506Z").year, 0);
  EXPECT_EQ(NotBefore(der::kGeneralizedTime, "99990203040506Z").year, 9999);
}

TEST(X509Time, NumbersAreNotChecked) {
  ExpectTime(NotBefore(der::kUtcTime, "209999999999Z"), 2020, 99, 99, 99, 99, 99);
  ExpectTime(NotBefore(der::kUtcTime, "200000000000Z"), 2020, 0, 0, 0, 0, 0);
}

TEST(X509Time, BothTimesAreRead) {
  Certificate certificate = Unsigned();
  certificate.validity = der::Sequence({der::Element(der::kUtcTime, "010203040506Z"),
                                        der::Element(der::kGeneralizedTime, "21111213141516Z")});
  const ParsedCertificate parsed(certificate);
  ASSERT_EQ(parsed.result, 0);
  ExpectTime(parsed.cert.not_before, 2001, 2, 3, 4, 5, 6);
  ExpectTime(parsed.cert.not_after, 2111, 12, 13, 14, 15, 16);
}

TEST(X509Time, OtherLengthsAreMinus13) {
  // Each of the two lists has a time without seconds, a time with a fraction of a second, a time
  // with an offset, an empty text, and a time of the other type's length. The last UTCTime has one
  // digit too many.
  for (const char* text : {"2001020304Z", "200102030405.5Z", "200102030405+0100", "",
                           "20200102030405Z", "2001020304050Z"}) {
    NotBefore(der::kUtcTime, text, -13);
  }
  for (const char* text :
       {"202001020304Z", "20200102030405.5Z", "20200102030405+0100", "", "200102030405Z"}) {
    NotBefore(der::kGeneralizedTime, text, -13);
  }
}

TEST(X509Time, AnotherTypeIsMinus13) {
  for (const uint8_t identifier : {der::kUtf8String, der::kPrintableString, der::kOctetString}) {
    NotBefore(identifier, "200102030405Z", -13);
    NotBefore(identifier, "20200102030405Z", -13);
  }
}

TEST(X509Time, TimeThatDoesNotEndInZIsMinus13) {
  NotBefore(der::kUtcTime, "200102030405z", -13);
  NotBefore(der::kUtcTime, "2001020304050", -13);
  NotBefore(der::kGeneralizedTime, "202001020304050", -13);
}

TEST(X509Time, NonDigitAnywhereIsMinus13) {
  const std::pair<uint8_t, std::string> times[] = {{der::kUtcTime, "200102030405Z"},
                                                   {der::kGeneralizedTime, "20200102030405Z"}};
  for (const auto& [identifier, good] : times) {
    for (size_t i = 0; i + 1 < good.size(); ++i) {
      for (const char bad : {'/', ':', ' ', '\0', 'Z', '\xb0'}) {
        std::string text = good;
        text[i] = bad;
        NotBefore(identifier, text, -13);
      }
    }
  }
}

TEST(X509Time, MalformedValidityIsMinus13) {
  const Bytes time = der::Element(der::kUtcTime, "200102030405Z");
  const Bytes cases[] = {
      der::Set({time, time}),
      FromHex("30 84 7f ff ff ff"),
      der::Sequence({}),
      der::Sequence({time}),
      der::Sequence({der::Element(der::kUtf8String, "200102030405Z"), time}),
      der::Sequence({time, der::Element(der::kUtf8String, "200102030405Z")}),
      der::Sequence({time, der::ContextPrimitive(23, ToBytes("200102030405Z"))}),
      der::Sequence({der::ContextPrimitive(23, ToBytes("200102030405Z")), time}),
  };
  for (const Bytes& validity : cases) {
    Certificate certificate = Unsigned();
    certificate.validity = validity;
    EXPECT_EQ(ResultOf(certificate), -13);
  }
}
