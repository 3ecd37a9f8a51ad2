#include "crypto/x509.h"

#include <gtest/gtest.h>
#include <openssl/mem.h>
#include <openssl/rsa.h>

#include "crypto/parsed_certificate.h"
#include "support/keys.h"

namespace {

constexpr char kEcPublicKey[] = "1.2.840.10045.2.1";
constexpr char kPrime256v1[] = "1.2.840.10045.3.1.7";

// A certificate with the four known extensions and an unknown one. Its issuer has an e-mail
// address.
Certificate Full() {
  Certificate certificate = Unsigned();
  certificate.issuer =
      Name({{"2.5.4.6", "DE"}, {"2.5.4.3", "Issuer"}, {"1.2.840.113549.1.9.1", "i@example.com"}});
  certificate.extensions = {
      Extension("2.5.29.19", der::Sequence({der::Boolean(0xff), der::Integer(3)}), true),
      Extension("2.5.29.15", der::BitString({0x06}, 1), true),
      Extension("2.5.29.17", der::Sequence({der::ContextPrimitive(2, ToBytes("a.example")),
                                            der::ContextPrimitive(8, der::OidContents("1.2.3"))})),
      Extension("2.5.29.18", der::Sequence({der::ContextPrimitive(1, ToBytes("i@b.example"))})),
      Extension("1.2.3.4", der::Null()),
  };
  return certificate;
}

// True if the `length` bytes at `value` are inside `bytes`. If `value` is null, true only if
// `length` is 0.
bool Inside(const GuardedBytes& bytes, const uint8_t* value, uint64_t length) {
  if (value == nullptr) return length == 0;
  const uint8_t* end = bytes.data() + bytes.size();
  return value >= bytes.data() && value <= end && length <= static_cast<uint64_t>(end - value);
}

bool Inside(const GuardedBytes& bytes, const x509_name& name) {
  if (name.attribute_count > kX509MaxAttributes || name.rid.len > kAsn1MaxArcs) return false;
  for (const x509_name_attribute& attribute : name.attributes) {
    if (!Inside(bytes, attribute.value, attribute.value_length)) return false;
  }
  return Inside(bytes, name.email, name.email_length) &&
         Inside(bytes, name.alt_email, name.alt_email_length) &&
         Inside(bytes, name.dns, name.dns_length) && Inside(bytes, name.uri, name.uri_length) &&
         Inside(bytes, name.ip, name.ip_length);
}

bool Inside(const GuardedBytes& bytes, const x509_certificate& cert) {
  return Inside(bytes, cert.issuer) && Inside(bytes, cert.subject) &&
         Inside(bytes, cert.public_key, cert.public_key_length) &&
         Inside(bytes, cert.signature_value, cert.signature_value_length) &&
         Inside(bytes, cert.cert_start, cert.cert_length) &&
         Inside(bytes, cert.tbs_start, cert.tbs_length);
}

}  // namespace

TEST(X509CertificateParse, EveryFieldPointsIntoTheCertificate) {
  const Certificate certificate = Full();
  const ParsedCertificate parsed(certificate);
  const x509_certificate& cert = parsed.cert;
  ASSERT_EQ(parsed.result, 0);
  EXPECT_EQ(cert.next, nullptr);
  EXPECT_EQ(cert.version, 2u);
  EXPECT_EQ(cert.serial_number, 0x1234u);
  EXPECT_EQ(DottedText(cert.signature_oid), "1.2.840.113549.1.1.11");
  EXPECT_EQ(DottedText(cert.signature_algorithm_oid), "1.2.840.113549.1.1.11");
  EXPECT_EQ(DottedText(cert.public_key_oid), "1.2.840.113549.1.1.1");
  EXPECT_EQ(cert.cert_start, parsed.bytes.data());
  EXPECT_EQ(cert.cert_length, parsed.bytes.size());
  EXPECT_EQ(Field(cert.tbs_start, cert.tbs_length), certificate.Tbs());
  EXPECT_EQ(Field(cert.signature_value, cert.signature_value_length), Bytes(8, 0x5a));
  EXPECT_TRUE(Inside(parsed.bytes, cert));
  EXPECT_EQ(cert.extensions_present, 31u);
}

TEST(X509CertificateParse, PublicKeyIsTheBitStringAfterTheCountOfUnusedBits) {
  uint8_t* expected = nullptr;
  const int length = i2d_RSAPublicKey(TestRsaKey("rsa-2048"), &expected);
  ASSERT_GT(length, 0);
  const ParsedCertificate parsed{Unsigned()};
  ASSERT_EQ(parsed.result, 0);
  EXPECT_EQ(Field(parsed.cert.public_key, parsed.cert.public_key_length),
            Bytes(expected, expected + length));
  OPENSSL_free(expected);
}

TEST(X509CertificateParse, BytesAfterTheCertificateAreNotPartOfIt) {
  const Bytes der = Unsigned().Build();
  const ParsedCertificate parsed(Concat({der, Bytes(50, 0xff)}));
  EXPECT_EQ(parsed.result, 0);
  EXPECT_EQ(parsed.cert.cert_length, der.size());
}

TEST(X509CertificateParse, MissingArgumentsAreMinus2) {
  const Bytes der = Unsigned().Build();
  x509_certificate cert;
  EXPECT_EQ(x509_certificate_parse(nullptr, der.size(), &cert), -2);
  EXPECT_EQ(x509_certificate_parse(der.data(), 0, &cert), -2);
  EXPECT_EQ(x509_certificate_parse(der.data(), der.size(), nullptr), -2);
  EXPECT_EQ(x509_certificate_parse(der.data(), der.size(), &cert), 0);
}

TEST(X509CertificateParse, CertificateThatIsNotASequenceIsMinus3) {
  EXPECT_EQ(ResultOf(der::Set({})), -3);
  EXPECT_EQ(ResultOf(Bytes{0x30}), -3);
  EXPECT_EQ(ResultOf(der::Context(16, {})), -3);
}

TEST(X509CertificateParse, CertificateThatRunsPastTheEndIsMinus3AndKeepsTheGivenLength) {
  Bytes der = Unsigned().Build();
  der.pop_back();
  const ParsedCertificate parsed(der);
  EXPECT_EQ(parsed.result, -3);
  EXPECT_EQ(parsed.cert.cert_start, parsed.bytes.data());
  EXPECT_EQ(parsed.cert.cert_length, der.size());
  EXPECT_EQ(parsed.cert.tbs_start, nullptr);
}

TEST(X509CertificateParse, TbsCertificateThatIsNotASequenceIsMinus3) {
  EXPECT_EQ(ResultOf(der::Sequence({})), -3);
  EXPECT_EQ(ResultOf(der::Sequence({der::Set({})})), -3);
  Certificate certificate = Unsigned();
  certificate.tbs = certificate.Tbs();
  EXPECT_EQ(ResultOf(certificate), 0);
  certificate.tbs->front() = 0x70;  // the same element in the application class
  EXPECT_EQ(ResultOf(certificate), -3);
}

TEST(X509CertificateParse, EmptyTbsCertificateIsMinus5) {
  EXPECT_EQ(ResultOf(der::Sequence({der::Sequence({})})), -5);
}

TEST(X509Version, ExtensionsOfAVersion1CertificateAreNotRead) {
  Certificate certificate = Full();
  certificate.version = {};
  const ParsedCertificate parsed(certificate);
  EXPECT_EQ(parsed.result, 0);
  EXPECT_EQ(parsed.cert.version, 0u);
  EXPECT_EQ(parsed.cert.serial_number, 0x1234u);
  EXPECT_EQ(parsed.cert.extensions_present, 0u);
}

TEST(X509Version, ExtensionsAfterAnEncodedVersion1AreNotRead) {
  Certificate certificate = Full();
  certificate.version = der::Context(0, der::Integer(0));
  const ParsedCertificate parsed(certificate);
  EXPECT_EQ(parsed.result, 0);
  EXPECT_EQ(parsed.cert.version, 0u);
  EXPECT_EQ(parsed.cert.extensions_present, 0u);
}

TEST(X509Version, Version2IsStoredAs1) {
  Certificate certificate = Unsigned();
  certificate.version = der::Context(0, der::Integer(1));
  const ParsedCertificate parsed(certificate);
  EXPECT_EQ(parsed.result, 0);
  EXPECT_EQ(parsed.cert.version, 1u);
}

TEST(X509Version, ByteOf3IsMinus9) {
  Certificate certificate = Unsigned();
  certificate.version = der::Context(0, der::Integer(3));
  EXPECT_EQ(ResultOf(certificate), -9);
}

TEST(X509Version, IsMinus9UnlessItIsAnIntegerOfOneByte) {
  Certificate certificate = Unsigned();
  for (const char* digits :
       {"a0 04 02 02 00 02", "a0 02 02 00", "a0 03 03 01 02", "a0 03 82 01 02"}) {
    certificate.version = FromHex(digits);
    EXPECT_EQ(ResultOf(certificate), -9) << digits;
  }
}

TEST(X509Version, HeaderThatCannotBeReadIsMinus5) {
  Certificate certificate = Unsigned();
  certificate.version = der::Context(0, {});
  EXPECT_EQ(ResultOf(certificate), -5);
  certificate.version = der::Context(0, FromHex("02 02 02"));
  EXPECT_EQ(ResultOf(certificate), -5);
}

TEST(X509Version, TagNumberIsNotChecked) {
  Certificate certificate = Unsigned();
  certificate.version = der::Context(7, der::Integer(1));
  const ParsedCertificate parsed(certificate);
  EXPECT_EQ(parsed.result, 0);
  EXPECT_EQ(parsed.cert.version, 1u);
}

TEST(X509Version, SerialNumberIsReadRightAfterTheVersionNumber) {
  Certificate certificate = Unsigned();
  certificate.version = der::Context(0, Concat({der::Integer(2), der::Integer(0x77)}));
  certificate.serial = {};
  const ParsedCertificate parsed(certificate);
  EXPECT_EQ(parsed.result, 0);
  EXPECT_EQ(parsed.cert.serial_number, 0x77u);

  certificate.version = der::Context(0, Concat({der::Integer(2), der::Null()}));
  certificate.serial = der::Integer(0x77);
  EXPECT_EQ(ResultOf(certificate), -10);
}

TEST(X509SerialNumber, LastFourOfTwentyBytesAreKept) {
  Certificate certificate = Unsigned();
  certificate.serial = der::Integer(FromHex("0102030405060708090a0b0c0d0e0f10 a1b2c3d4"));
  const ParsedCertificate parsed(certificate);
  EXPECT_EQ(parsed.result, 0);
  EXPECT_EQ(parsed.cert.serial_number, 0xa1b2c3d4u);
}

TEST(X509SerialNumber, AnyLengthIsAccepted) {
  Certificate certificate = Unsigned();
  certificate.serial = der::Integer(Bytes());
  const ParsedCertificate none(certificate);
  EXPECT_EQ(none.result, 0);
  EXPECT_EQ(none.cert.serial_number, 0u);

  certificate.serial = der::Integer(Bytes(300, 0x11));
  const ParsedCertificate many(certificate);
  EXPECT_EQ(many.result, 0);
  EXPECT_EQ(many.cert.serial_number, 0x11111111u);
}

TEST(X509SerialNumber, IsMinus10UnlessItIsAUniversalInteger) {
  Certificate certificate = Unsigned();
  for (const Bytes& version : {Bytes(), der::Context(0, der::Integer(2))}) {
    certificate.version = version;
    for (const char* digits : {"04 01 05", "c2 01 05", "42 01 05"}) {
      certificate.serial = FromHex(digits);
      EXPECT_EQ(ResultOf(certificate), -10) << digits;
    }
  }
  certificate.serial = FromHex("82 01 05");  // context-specific, after a version
  EXPECT_EQ(ResultOf(certificate), -10);
}

TEST(X509SerialNumber, HeaderThatCannotBeReadIsMinus5) {
  Certificate certificate = Unsigned();
  certificate.tbs = der::Sequence({certificate.version});
  EXPECT_EQ(ResultOf(certificate), -5);
  certificate.tbs = der::Sequence({certificate.version, FromHex("02 05 01")});
  EXPECT_EQ(ResultOf(certificate), -5);
}

TEST(X509Algorithm, ParametersAreKeptWhenTheyAreAnOid) {
  Certificate certificate = Unsigned();
  certificate.tbs_algorithm = AlgorithmIdentifier("1.2.3", der::Oid("1.2.4"));
  certificate.signature_algorithm = AlgorithmIdentifier("1.2.5", der::Oid("1.2.6"));
  const ParsedCertificate parsed(certificate);
  EXPECT_EQ(parsed.result, 0);
  EXPECT_EQ(DottedText(parsed.cert.signature_oid), "1.2.3");
  EXPECT_EQ(DottedText(parsed.cert.signature_params_oid), "1.2.4");
  EXPECT_EQ(DottedText(parsed.cert.signature_algorithm_oid), "1.2.5");
  EXPECT_EQ(DottedText(parsed.cert.signature_algorithm_params_oid), "1.2.6");
}

TEST(X509Algorithm, ParametersOfAnotherKindAreLeftEmpty) {
  Certificate certificate = Unsigned();
  for (const Bytes& parameters : {Bytes(), der::Null(), der::Sequence({der::Oid("1.2.3")})}) {
    certificate.tbs_algorithm = AlgorithmIdentifier("1.2.3", parameters);
    certificate.signature_algorithm = AlgorithmIdentifier("1.2.3", parameters);
    const ParsedCertificate parsed(certificate);
    EXPECT_EQ(parsed.result, 0);
    EXPECT_EQ(parsed.cert.signature_params_oid.len, 0u);
    EXPECT_EQ(parsed.cert.signature_algorithm_params_oid.len, 0u);
  }
}

TEST(X509Algorithm, MalformedSignatureAlgorithmIsMinus11) {
  // No SEQUENCE, another class, an empty SEQUENCE, a SEQUENCE without an OID, and a SEQUENCE that
  // ends beyond its container.
  for (const char* digits :
       {"31 00", "70 03 06 01 2a", "30 00", "30 02 05 00", "30 84 7f ff ff ff"}) {
    Certificate certificate = Unsigned();
    certificate.tbs_algorithm = FromHex(digits);
    EXPECT_EQ(ResultOf(certificate), -11) << digits;
    certificate = Unsigned();
    certificate.signature_algorithm = FromHex(digits);
    EXPECT_EQ(ResultOf(certificate), -11) << digits;
  }
}

TEST(X509PublicKey, CurveIsKeptAsParameters) {
  Certificate certificate = Unsigned();
  certificate.key = "ec-p256";
  const ParsedCertificate parsed(certificate);
  EXPECT_EQ(parsed.result, 0);
  EXPECT_EQ(DottedText(parsed.cert.public_key_oid), kEcPublicKey);
  EXPECT_EQ(DottedText(parsed.cert.public_key_params_oid), kPrime256v1);
  EXPECT_EQ(parsed.cert.public_key_length, 65u);  // an uncompressed point
  EXPECT_EQ(parsed.cert.public_key[0], 0x04);
}

TEST(X509PublicKey, BitStringOfOneByteIsAnEmptyKey) {
  Certificate certificate = Unsigned();
  certificate.public_key_info = PublicKeyInfoAround({});
  const ParsedCertificate parsed(certificate);
  EXPECT_EQ(parsed.result, 0);
  EXPECT_NE(parsed.cert.public_key, nullptr);
  EXPECT_EQ(parsed.cert.public_key_length, 0u);
}

TEST(X509PublicKey, MalformedKeyInfoIsMinus14) {
  const Bytes algorithm = AlgorithmIdentifier(kEcPublicKey);
  const Bytes cases[] = {
      der::Set({algorithm, der::BitString({1})}),                         // no SEQUENCE
      FromHex("30 84 7f ff ff ff"),                                       // runs past the end
      der::Sequence({}),                                                  // no algorithm
      der::Sequence({der::Set({}), der::BitString({1})}),                 // SET as algorithm
      der::Sequence({der::Sequence({}), der::BitString({1})}),            // algorithm without OID
      der::Sequence({algorithm}),                                         // no key
      der::Sequence({algorithm, der::OctetString({1})}),                  // OCTET STRING as key
      der::Sequence({algorithm, der::ContextPrimitive(3, {1})}),          // key of another class
      der::Sequence({algorithm, der::Element(der::kBitString, Bytes())})  // no contents
  };
  for (const Bytes& info : cases) {
    Certificate certificate = Unsigned();
    certificate.public_key_info = info;
    EXPECT_EQ(ResultOf(certificate), -14);
  }
}

TEST(X509OptionalFields, ExtensionsAfterAnIssuerUniqueIdAreNotRead) {
  Certificate certificate = Full();
  certificate.issuer_unique_id = der::ContextPrimitive(1, {0, 1});
  const ParsedCertificate parsed(certificate);
  EXPECT_EQ(parsed.result, 0);
  EXPECT_EQ(parsed.cert.version, 2u);
  EXPECT_EQ(parsed.cert.extensions_present, 0u);
}

TEST(X509OptionalFields, ExtensionsAfterASubjectUniqueIdAreNotRead) {
  Certificate certificate = Full();
  certificate.subject_unique_id = der::ContextPrimitive(2, {0, 1});
  const ParsedCertificate parsed(certificate);
  EXPECT_EQ(parsed.result, 0);
  EXPECT_EQ(parsed.cert.extensions_present, 0u);
}

TEST(X509OptionalFields, UniqueIdsAreAcceptedWithoutExtensions) {
  Certificate certificate = Unsigned();
  certificate.issuer_unique_id = der::ContextPrimitive(1, {0, 1});
  EXPECT_EQ(ResultOf(certificate), 0);
  certificate.subject_unique_id = der::ContextPrimitive(2, {0, 1});
  EXPECT_EQ(ResultOf(certificate), 0);
  certificate.issuer_unique_id = {};
  EXPECT_EQ(ResultOf(certificate), 0);
}

TEST(X509OptionalFields, OtherTagsAreIgnored) {
  Certificate certificate = Unsigned();
  certificate.tbs_tail = Concat({der::Context(4, der::Null()), FromHex("ff ff ff")});
  EXPECT_EQ(ResultOf(certificate), 0);
}

TEST(X509OptionalFields, HeaderThatCannotBeReadIsMinus5) {
  Certificate certificate = Unsigned();
  certificate.tbs_tail = {0xa3};
  EXPECT_EQ(ResultOf(certificate), -5);
  certificate.tbs_tail = {0xa3, 0x01};
  EXPECT_EQ(ResultOf(certificate), -5);
}

TEST(X509OptionalFields, AnotherClassIsMinus5) {
  Certificate certificate = Unsigned();
  certificate.tbs_tail = der::Null();
  EXPECT_EQ(ResultOf(certificate), -5);
}

TEST(X509OptionalFields, BytesAfterTheExtensionsAreIgnored) {
  Certificate certificate = Full();
  certificate.tbs_tail = {0xff};
  const ParsedCertificate parsed(certificate);
  EXPECT_EQ(parsed.result, 0);
  EXPECT_EQ(parsed.cert.extensions_present, 31u);
  EXPECT_EQ(Field(parsed.cert.tbs_start, parsed.cert.tbs_length), certificate.Tbs());
}

TEST(X509Signature, IsMinus4UnlessItIsABitString) {
  Certificate certificate = Unsigned();
  for (const Bytes& signature :
       {der::OctetString({0, 1}), der::ContextPrimitive(3, {0, 1}), FromHex("03 05 00"), Bytes()}) {
    certificate.signature = signature;
    EXPECT_EQ(ResultOf(certificate), -4);
  }
}

TEST(X509Signature, EmptyBitStringIsMinus5) {
  Certificate certificate = Unsigned();
  certificate.signature = der::Element(der::kBitString, Bytes());
  EXPECT_EQ(ResultOf(certificate), -5);
}

TEST(X509Signature, OneUnusedBitIsMinus6) {
  Certificate certificate = Unsigned();
  certificate.signature = der::BitString({0x5a, 0x5a}, 1);
  const ParsedCertificate parsed(certificate);
  EXPECT_EQ(parsed.result, -6);
  EXPECT_EQ(parsed.cert.signature_value, nullptr);
  EXPECT_EQ(parsed.cert.serial_number, 0x1234u);
}

TEST(X509DamagedCertificate, EveryTruncationIsRefused) {
  const Bytes whole = Full().Build();
  for (size_t length = 0; length < whole.size(); ++length) {
    const ParsedCertificate parsed(
        Bytes(whole.begin(), whole.begin() + static_cast<ptrdiff_t>(length)));
    EXPECT_EQ(parsed.result, length == 0 ? -2 : -3) << length;
  }
}

TEST(X509DamagedCertificate, TruncatedTbsCertificateFailsAndIsNotReadBeyondItsEnd) {
  Certificate certificate = Full();
  const Bytes tbs = certificate.Tbs();
  const size_t header = 4;  // 30 82 and two octets
  ASSERT_EQ(tbs[1], 0x82);
  for (size_t length = header; length <= tbs.size(); ++length) {
    certificate.tbs =
        der::Sequence({Bytes(tbs.begin() + header, tbs.begin() + static_cast<ptrdiff_t>(length))});
    // The tbsCertificate ends where readable memory ends, so a read beyond its end crashes.
    const ParsedCertificate parsed(der::Sequence({*certificate.tbs}));
    EXPECT_LT(parsed.result, 0) << length;
    EXPECT_TRUE(Inside(parsed.bytes, parsed.cert)) << length;
  }
}

TEST(X509DamagedCertificate, FieldsAreInsideTheCertificateAfterEveryChangeOfOneByte) {
  GuardedBytes bytes(Full().Build());
  x509_certificate cert;
  for (size_t i = 0; i < bytes.size(); ++i) {
    uint8_t& byte = bytes.data()[i];
    for (int change = 1; change < 256; ++change) {
      byte = static_cast<uint8_t>(byte + 1);
      const int result = x509_certificate_parse(bytes.data(), bytes.size(), &cert);
      ASSERT_TRUE(result <= 0 && result >= -15);
      ASSERT_TRUE(Inside(bytes, cert)) << "at " << i;
    }
    byte = static_cast<uint8_t>(byte + 1);
  }
  EXPECT_EQ(x509_certificate_parse(bytes.data(), bytes.size(), &cert), 0);
}
