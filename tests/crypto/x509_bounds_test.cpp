// Tests elements that end beyond their containers. In most tests, the bytes after the container
// would be valid as the end of the element. A parser that used these bytes would therefore accept
// the certificate. Also tests bytes after the last element of a container.
#include <gtest/gtest.h>

#include "crypto/parsed_certificate.h"

namespace {

constexpr char kCommonName[] = "2.5.4.3";
constexpr char kKeyUsage[] = "2.5.29.15";
constexpr char kSubjectAltName[] = "2.5.29.17";
constexpr char kBasicConstraints[] = "2.5.29.19";
constexpr char kUnknown[] = "1.2.3.4";

// Returns the element with `more` added to its length octet. All other octets stay as they are. The
// new length must be less than 128, because DER encodes a greater length in more than one octet.
Bytes RunningOn(Bytes element, size_t more = 1) {
  EXPECT_LT(element[1] + more, 0x80u);
  element[1] = static_cast<uint8_t>(element[1] + more);
  return element;
}

Bytes Value() { return der::Element(der::kUtf8String, "Test"); }
Bytes DigitalSignature() { return der::BitString({0x80}, 7); }

Certificate WithSubject(const Bytes& subject) {
  Certificate certificate = Unsigned();
  certificate.subject = subject;
  return certificate;
}

int ResultOfExtensions(const std::vector<Bytes>& extensions) {
  Certificate certificate = Unsigned();
  certificate.extensions = extensions;
  return ResultOf(certificate);
}

}  // namespace

TEST(X509TooLongElement, CertificatesSignatureIsMinus4) {
  Certificate certificate = Unsigned();
  const Bytes good = der::BitString(Bytes(8, 0x5a));
  for (const auto& [signature, result] : {std::pair(good, 0), std::pair(RunningOn(good), -4)}) {
    certificate.signature = signature;
    EXPECT_EQ(ResultOf(Concat({certificate.Build(), {0x5a}})), result);
  }
}

TEST(X509TooLongElement, OidOfAnAlgorithmIsMinus11OrMinus14) {
  const Bytes good = der::Sequence({der::Oid("1.2.3")});
  const Bytes bad = der::Sequence({RunningOn(der::Oid("1.2.3"))});
  const Bytes key = der::BitString({1});
  for (const auto& [algorithm, is_good] : {std::pair(good, true), std::pair(bad, false)}) {
    Certificate certificate = Unsigned();
    certificate.tbs_algorithm = algorithm;
    EXPECT_EQ(ResultOf(certificate), is_good ? 0 : -11);
    certificate = Unsigned();
    certificate.signature_algorithm = algorithm;
    EXPECT_EQ(ResultOf(certificate), is_good ? 0 : -11);
    certificate = Unsigned();
    certificate.public_key_info = der::Sequence({algorithm, key});
    EXPECT_EQ(ResultOf(certificate), is_good ? 0 : -14);
  }
}

TEST(X509TooLongElement, AlgorithmsParametersAreLeftEmpty) {
  Certificate certificate = Unsigned();
  const Bytes algorithm = der::Sequence({der::Oid("1.2.3"), RunningOn(der::Oid("1.2.3"))});
  certificate.tbs_algorithm = algorithm;
  certificate.signature_algorithm = algorithm;
  certificate.public_key_info = der::Sequence({algorithm, der::BitString({1})});
  const ParsedCertificate parsed(certificate);
  EXPECT_EQ(parsed.result, 0);
  EXPECT_EQ(parsed.cert.signature_params_oid.len, 0u);
  EXPECT_EQ(parsed.cert.public_key_params_oid.len, 0u);
  EXPECT_EQ(parsed.cert.signature_algorithm_params_oid.len, 0u);
}

TEST(X509TooLongElement, ElementsOfANameAreMinus12) {
  const Bytes type = der::Oid(kCommonName);
  const Bytes attribute = der::Sequence({type, Value()});
  EXPECT_EQ(ResultOf(WithSubject(der::Sequence({der::Set({attribute})}))), 0);
  const Bytes cases[] = {
      der::Sequence({RunningOn(der::Set({attribute}))}),                        // the SET
      der::Sequence({der::Set({RunningOn(attribute)})}),                        // its SEQUENCE
      der::Sequence({der::Set({der::Sequence({type, RunningOn(Value())})})}),   // a value
      der::Sequence({der::Set({der::Sequence({RunningOn(type, 7)}), Value()})}  // a type
                    )};
  for (const Bytes& name : cases) {
    Certificate certificate = WithSubject(name);
    EXPECT_EQ(ResultOf(certificate), -12);
    certificate = Unsigned();
    certificate.issuer = name;
    EXPECT_EQ(ResultOf(certificate), -12);
  }
}

// In each case, the parser could read an element only by using bytes after the element's container.
// These bytes exist, but they belong to an outer container.
TEST(X509TooLongElement, ElementsOfANameMayNotUseBytesAfterTheirContainer) {
  const Bytes type = der::Oid(kCommonName);
  const Bytes attribute = der::Sequence({type, Value()});
  const Bytes rdn = der::Set({attribute});
  ASSERT_EQ(ResultOf(WithSubject(der::Sequence({rdn, rdn}))), 0);
  const Bytes cases[] = {
      // an attribute whose length includes the next SET
      der::Sequence({der::Set({RunningOn(attribute, rdn.size())}), rdn}),
      // a value whose length includes the next SET
      der::Sequence({der::Set({der::Sequence({type, RunningOn(Value(), rdn.size())})}), rdn}),
      // a value after its SEQUENCE, in the SET
      der::Sequence({der::Set({der::Sequence({type}), Value()})}),
      // a type after its SEQUENCE, in the SET
      der::Sequence({der::Set({der::Sequence({}), type, Value()})}),
      // a SEQUENCE after its SET, in the name
      der::Sequence({der::Set({}), attribute}),
  };
  for (const Bytes& name : cases) EXPECT_EQ(ResultOf(WithSubject(name)), -12);
}

// The subject follows the times. The subject has 90 bytes of contents, so its first bytes are
// 30 5a. As text, these bytes are "0Z". In the first case, notAfter has the right length, but its
// own last character is "0" instead of "Z". In the second case, notAfter has two characters fewer
// than its length says, and the "0Z" of the subject would complete it.
TEST(X509TooLongElement, TimeIsMinus13) {
  Certificate certificate = WithSubject(Name({{kCommonName, std::string(79, 'x')}}));
  ASSERT_EQ(certificate.subject[0], '0');
  ASSERT_EQ(certificate.subject[1], 'Z');
  const Bytes not_before = der::Element(der::kUtcTime, "200102030405Z");
  certificate.validity = der::Sequence({not_before, der::Element(der::kUtcTime, "4901020304050")});
  EXPECT_EQ(ResultOf(certificate), -13);
  const Bytes not_after = der::Element(der::kUtcTime, "49010203040");
  certificate.validity = der::Sequence({not_before, RunningOn(not_after, 2)});
  EXPECT_EQ(ResultOf(certificate), -13);
}

TEST(X509TooLongElement, KeyIsMinus14) {
  const Bytes algorithm = AlgorithmIdentifier("1.2.3");
  const Bytes key = der::BitString({1, 2, 3});
  Certificate certificate = Unsigned();
  certificate.public_key_info = der::Sequence({algorithm, key});
  EXPECT_EQ(ResultOf(certificate), 0);
  certificate.public_key_info = der::Sequence({algorithm, RunningOn(key)});
  EXPECT_EQ(ResultOf(certificate), -14);
  certificate.public_key_info = der::Sequence({RunningOn(algorithm, key.size()), key});
  EXPECT_EQ(ResultOf(certificate), -14);
}

// In each case, an element begins or ends after the SEQUENCE that should contain the element. All
// elements are still in the tbsCertificate.
TEST(X509TooLongElement, KeyAfterItsInfoIsMinus14) {
  const Bytes algorithm = AlgorithmIdentifier("1.2.3");
  const Bytes key = der::BitString({1, 2, 3});
  const Bytes cases[] = {
      Concat({der::Sequence({algorithm}), key}),
      der::Sequence({der::Sequence({}), der::Oid("1.2.3"), key}),
      Concat({der::Sequence({algorithm, RunningOn(key, key.size())}), key}),
  };
  for (const Bytes& info : cases) {
    Certificate certificate = Unsigned();
    certificate.public_key_info = info;
    EXPECT_EQ(ResultOf(certificate), -14);
  }
}

// An Extension follows the element [3], which contains the SEQUENCE of extensions. In the second
// case, the SEQUENCE has a length that includes this Extension.
TEST(X509TooLongElement, SequenceOfExtensionsIsMinus15) {
  const Bytes extension = Extension(kUnknown, der::Null());
  const Bytes extensions = der::Sequence({extension});
  Certificate certificate = Unsigned();
  certificate.tbs_tail = Concat({der::Context(3, extensions), extension});
  EXPECT_EQ(ResultOf(certificate), 0);
  certificate.tbs_tail =
      Concat({der::Context(3, RunningOn(extensions, extension.size())), extension});
  EXPECT_EQ(ResultOf(certificate), -15);
}

TEST(X509TooLongElement, ExtensionIsMinus15) {
  const Bytes extension = Extension(kUnknown, der::Null());
  EXPECT_EQ(ResultOfExtensions({extension, extension}), 0);
  EXPECT_EQ(ResultOfExtensions({extension, RunningOn(extension)}), -15);
}

TEST(X509TooLongElement, ElementsOfAnExtensionAreMinus15) {
  const Bytes value = der::OctetString(DigitalSignature());
  EXPECT_EQ(ResultOfExtensions({der::Sequence({der::Oid(kKeyUsage), value})}), 0);
  EXPECT_EQ(ResultOfExtensions({der::Sequence({der::Oid(kKeyUsage), RunningOn(value)})}), -15);
  // After the critical flag (a BOOLEAN), the parser expects the next header at the flag's value
  // byte, 04. It therefore reads the OCTET STRING 04 04 03 02 05 a0 in the first case.
  const Bytes id = Concat({der::Oid(kKeyUsage), der::Boolean(4)});
  const Bytes whole = FromHex("04 03 02 05 a0");
  const Bytes cut = FromHex("04 03 02 05");
  EXPECT_EQ(ResultOfExtensions({der::Sequence({id, whole}), Extension(kUnknown, {})}), 0);
  EXPECT_EQ(ResultOfExtensions({der::Sequence({id, cut}), Extension(kUnknown, {})}), -15);
}

TEST(X509TooLongElement, ValueInItsOctetStringIsMinus15) {
  const Bytes key_usage = RunningOn(DigitalSignature());
  const Bytes constraints = der::Sequence({der::Boolean(0xff), der::Integer(3)});
  const Bytes names = der::Sequence({der::ContextPrimitive(2, ToBytes("a"))});
  const Bytes another = der::ContextPrimitive(2, ToBytes("b"));
  EXPECT_EQ(ResultOfExtensions({Extension(kKeyUsage, key_usage), Extension(kUnknown, {})}), -15);
  EXPECT_EQ(ResultOfExtensions({Extension(kBasicConstraints, constraints)}), 0);
  EXPECT_EQ(ResultOfExtensions({Extension(kBasicConstraints, RunningOn(constraints))}), -15);
  const auto with_another = [&](const Bytes& value) {
    return der::Sequence({der::Oid(kSubjectAltName), der::OctetString(value), another});
  };
  EXPECT_EQ(ResultOfExtensions({with_another(names)}), 0);
  EXPECT_EQ(ResultOfExtensions({with_another(RunningOn(names, another.size()))}), -15);
}

TEST(X509TooLongElement, ElementsOfAValueAreMinus15) {
  const Bytes ca = der::Boolean(0xff);
  const Bytes length = der::Integer(3);
  const auto result_of = [](const std::string& oid, const Bytes& sequence) {
    // An element that is one byte too long would use the byte 0. This byte follows the SEQUENCE,
    // but is still in the extension's value.
    return ResultOfExtensions({Extension(oid, Concat({sequence, {0}}))});
  };
  EXPECT_EQ(result_of(kBasicConstraints, der::Sequence({ca, length})), 0);
  EXPECT_EQ(result_of(kBasicConstraints, der::Sequence({ca, RunningOn(length)})), -15);
  EXPECT_EQ(result_of(kBasicConstraints, der::Sequence({RunningOn(length)})), -15);
  EXPECT_EQ(result_of(kBasicConstraints, der::Sequence({FromHex("01 01")})), -15);
  const Bytes address = der::ContextPrimitive(7, {10, 0, 0, 1});
  EXPECT_EQ(result_of(kSubjectAltName, der::Sequence({address})), 0);
  EXPECT_EQ(result_of(kSubjectAltName, der::Sequence({RunningOn(address)})), -15);
}

TEST(X509TrailingBytes, LoneByteInANameIsMinus12) {
  const Bytes rdn = der::Set({der::Sequence({der::Oid(kCommonName), Value()})});
  for (const uint8_t byte : {0x00, 0x31}) {
    EXPECT_EQ(ResultOf(WithSubject(der::Sequence({rdn, {byte}}))), -12);
    EXPECT_EQ(ResultOf(WithSubject(der::Sequence({{byte}}))), -12);
  }
}

TEST(X509TrailingBytes, LoneByteInTheExtensionsIsMinus15) {
  for (const uint8_t byte : {0x00, 0x30}) {
    EXPECT_EQ(ResultOfExtensions({Extension(kUnknown, der::Null()), {byte}}), -15);
    EXPECT_EQ(ResultOfExtensions({{byte}}), -15);
  }
}

TEST(X509TrailingBytes, LoneByteInTheAlternativeNamesIsMinus15) {
  for (const uint8_t byte : {0x00, 0x82}) {
    EXPECT_EQ(ResultOfExtensions({Extension(kSubjectAltName, der::Sequence({{byte}}))}), -15);
  }
}

TEST(X509TrailingBytes, LoneByteAfterTheKeyIsMinus5) {
  Certificate certificate = Unsigned();
  certificate.tbs_tail = {0xa4};
  EXPECT_EQ(ResultOf(certificate), -5);
  // In a v1 certificate, the parser reads nothing between the key and the end of the
  // tbsCertificate.
  certificate.version = {};
  EXPECT_EQ(ResultOf(certificate), 0);
}

// The parser does not read some containers to their end. In each of these containers, the byte 30,
// which is half of a header, follows the last element that the parser reads.
TEST(X509TrailingBytes, BytesAfterTheLastElementThatIsReadAreIgnored) {
  const Bytes rest = {0x30};
  const Bytes time = der::Element(der::kUtcTime, "200102030405Z");
  const Bytes algorithm = der::Sequence({der::Oid("1.2.3"), der::Oid("1.2.4"), rest});
  Certificate certificate = Unsigned();
  certificate.tbs_algorithm = algorithm;
  certificate.validity = der::Sequence({time, time, rest});
  certificate.subject =
      der::Sequence({der::Set({der::Sequence({der::Oid(kCommonName), Value(), rest}), rest})});
  certificate.public_key_info = der::Sequence({algorithm, der::BitString({1}), rest});
  certificate.tbs_tail = Concat(
      {der::Context(3, Concat({der::Sequence({der::Sequence(
                                   {der::Oid(kKeyUsage),
                                    der::OctetString(Concat({DigitalSignature(), rest})), rest})}),
                               rest})),
       rest});
  certificate.signature_algorithm = algorithm;
  certificate.signature = Concat({der::BitString({1}), rest});
  const ParsedCertificate parsed(certificate);
  EXPECT_EQ(parsed.result, 0);
  EXPECT_EQ(parsed.cert.signature_value_length, 1u);
  EXPECT_EQ(parsed.cert.subject.attribute_count, 1u);
  EXPECT_EQ(parsed.cert.key_usage, 1u);
}
