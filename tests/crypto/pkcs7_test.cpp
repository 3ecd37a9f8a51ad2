// Tests processCert from the start of the block to the signer's public key.
#include "crypto/pkcs7.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstddef>
#include <cstring>

#include "crypto/processed_block.h"
#include "support/package.h"

namespace {

// The offset of `part` in `whole`. The test fails if `part` is missing.
size_t Find(const Bytes& whole, const Bytes& part) {
  const auto found = std::search(whole.begin(), whole.end(), part.begin(), part.end());
  EXPECT_NE(found, whole.end());
  return static_cast<size_t>(found - whole.begin());
}

}  // namespace

TEST(ProcessCert, GoodBlockGivesKeySignaturesAndTbs) {
  for (const Digest digest : {Digest::kMd5, Digest::kSha1, Digest::kSha256}) {
    SignatureBlock block;
    block.digest = digest;
    const ProcessedBlock processed(block);
    const pkcs7& record = processed.record;
    ASSERT_EQ(processed.result, 0);
    EXPECT_EQ(processed.output, "");
    const Bytes tbs = block.SignerCertificate().Tbs();
    EXPECT_EQ(Field(record.modulus, record.modulus_length), ModulusOf("rsa-2048"));
    EXPECT_EQ(Field(record.tbs_data, record.tbs_data_length), tbs);
    EXPECT_EQ(Field(record.cert_signature, record.cert_signature_length),
              SignWith("rsa-2048", digest, tbs));
    EXPECT_EQ(Field(record.signed_digest, record.signed_digest_length),
              SignWith("rsa-2048", digest, kSignatureFile));
  }
}

TEST(ProcessCert, BytesAfterTheFirstCertificateAreIgnored) {
  SignatureBlock block;
  block.certificates = Concat({block.SignerCertificate().Build(), Bytes(20, 0xff)});
  const ProcessedBlock processed(block);
  EXPECT_EQ(processed.result, 0);
  EXPECT_EQ(Field(processed.record.modulus, processed.record.modulus_length),
            ModulusOf("rsa-2048"));
}

TEST(ProcessCert, TagsOfTheFirstTwoElementsAreNotChecked) {
  Bytes bytes = WithRsaKey(Bytes(64, 0x77), {3}).Build(kSignatureFile);
  bytes[0] = 0x04;
  ASSERT_EQ(bytes[1], 0x82);  // two octets of length, then the contentType
  ASSERT_EQ(bytes[4], 0x06);
  bytes[4] = 0x99;
  EXPECT_EQ(ProcessedBlock(bytes).result, 0);
}

TEST(ProcessCertHeader, UnreadableFirstHeaderIsReportedWithoutItsTag) {
  for (const char* digits : {"ff ff ff", "30 ff", "1f 81", "30 85 00 00 00 00 00"}) {
    const ProcessedBlock processed(FromHex(digits));
    EXPECT_EQ(processed.result, 1);
    EXPECT_EQ(processed.output,
              std::string("CERT_PARCER [ERROR]: CANT PROCESS CERTIFICATE TAG\n") + kHeaderTrailer);
  }
}

TEST(ProcessCertHeader, EmptyBlockIsReportedWithoutATag) {
  const ProcessedBlock processed{Bytes()};
  EXPECT_EQ(processed.result, 1);
  EXPECT_EQ(processed.output,
            std::string("CERT_PARCER [ERROR]: CANT PROCESS CERTIFICATE TAG\n") + kHeaderTrailer);
}

TEST(ProcessCertHeader, UnreadableContentTypeIsReportedWithoutItsTag) {
  for (const char* digits : {"30 00", "30 01 06", "30 02 06 05"}) {
    const ProcessedBlock processed(FromHex(digits));
    EXPECT_EQ(processed.result, 1);
    EXPECT_EQ(processed.output,
              std::string("CERT_PARCER [ERROR]: CANT PROCESS CERTIFICATE TAG\n") + kHeaderTrailer);
  }
}

TEST(ProcessCertHeader, LaterUnreadableHeaderIsReportedWithItsTagAndTheOffsetOfANullPayload) {
  // Each block ends after the first octet of one element. The elements are, in this order: the [0]
  // of the content, the SignedData, its version, digestAlgorithms, contentInfo, certificates.
  const std::pair<const char*, int32_t> cases[] = {
      {"30 04 06 01 2a a0", 0},
      {"30 06 06 01 2a a0 01 30", 16},
      {"30 08 06 01 2a a0 03 30 01 02", 2},
      {"30 0b 06 01 2a a0 06 30 04 02 01 01 31", 17},
      {"30 0d 06 01 2a a0 08 30 06 02 01 01 31 00 30", 16},
      {"30 0f 06 01 2a a0 0a 30 08 02 01 01 31 00 30 00 a7", 7},
  };
  for (const auto& [digits, tag] : cases) {
    const ProcessedBlock processed(FromHex(digits));
    EXPECT_EQ(processed.result, 1);
    EXPECT_EQ(processed.output, processed.UnreadableTag(tag) + kHeaderTrailer) << digits;
  }
}

TEST(ProcessCertHeader, TagIsPrintedAsASignedNumber) {
  // The tags are 2^31 - 1, 2^31 and 2^32 - 1. Each octet after the first has seven bits of the tag.
  const std::pair<const char*, int32_t> cases[] = {{"bf 87 ff ff ff 7f", 2147483647},
                                                   {"bf 88 80 80 80 00", INT32_MIN},
                                                   {"bf 8f ff ff ff 7f", -1}};
  for (const auto& [digits, tag] : cases) {
    const ProcessedBlock processed(Concat({FromHex("30 09 06 01 2a"), FromHex(digits)}));
    EXPECT_EQ(processed.result, 1);
    EXPECT_EQ(processed.output, processed.UnreadableTag(tag) + kHeaderTrailer) << digits;
  }
}

TEST(ProcessCertHeader, HeaderThatWouldStartAtOrBeyondTheEndHasTagZero) {
  // In the first case, the contentType ends at the end of the block. In the second case, it would
  // end two bytes beyond the end of the block.
  for (const char* digits : {"30 03 06 01 2a", "30 03 06 03 2a"}) {
    const ProcessedBlock processed(FromHex(digits));
    EXPECT_EQ(processed.result, 1);
    EXPECT_EQ(processed.output, processed.UnreadableTag(0) + kHeaderTrailer) << digits;
  }
}

TEST(ProcessCertHeader, SignedDataMayBeAsLongAsTheWholeBlock) {
  // The SignedData may end beyond the block. With its header of 4 bytes, it may be as long as the
  // whole block.
  Bytes bytes = WithRsaKey(Bytes(64, 0x77), {3}).Build(kSignatureFile);
  const size_t signed_data = Find(bytes, FromHex("02 01 01 31")) - 4;
  ASSERT_EQ(bytes[signed_data + 1], 0x82);
  const size_t most = bytes.size() - 4;
  bytes[signed_data + 2] = static_cast<uint8_t>(most >> 8);
  bytes[signed_data + 3] = static_cast<uint8_t>(most);
  EXPECT_EQ(ProcessedBlock(bytes).result, 0);

  bytes[signed_data + 2] = static_cast<uint8_t>((most + 1) >> 8);
  bytes[signed_data + 3] = static_cast<uint8_t>(most + 1);
  const ProcessedBlock processed(bytes);
  EXPECT_EQ(processed.result, 1);
  EXPECT_EQ(processed.output, processed.UnreadableTag(16) + kHeaderTrailer);
}

TEST(ProcessCertCertificate, EmptySetOfCertificatesGivesMinus2) {
  SignatureBlock block;
  block.certificates = Bytes();
  const ProcessedBlock processed(block);
  EXPECT_EQ(processed.result, 1);
  EXPECT_EQ(processed.output, "CERT_PARCER [ERROR]: x509_certificate_parse() error -2\n");
}

TEST(ProcessCertCertificate, MalformedCertificateGivesItsCode) {
  Certificate certificate;
  certificate.version = der::Context(0, der::Integer(3));
  SignatureBlock block;
  block.certificates = certificate.Build();
  const ProcessedBlock processed(block);
  EXPECT_EQ(processed.result, 1);
  EXPECT_EQ(processed.output, "CERT_PARCER [ERROR]: x509_certificate_parse() error -9\n");
  EXPECT_EQ(processed.record.tbs_data, nullptr);
}

TEST(ProcessCertCertificate, SetThatRunsPastTheEndIsReadUpToTheEnd) {
  Certificate certificate;
  certificate.public_key_info = PublicKeyInfoAround({});
  Bytes certificates = der::Context(0, certificate.Build());
  EXPECT_EQ(ProcessedBlock(BlockEndingIn(certificates)).output,
            std::string(kUnreadable) + kKeyTrailer);
  certificates.pop_back();
  EXPECT_EQ(ProcessedBlock(BlockEndingIn(certificates)).output,
            "CERT_PARCER [ERROR]: x509_certificate_parse() error -3\n");
  // Only the header of the [0] is left.
  EXPECT_EQ(ProcessedBlock(BlockEndingIn(FromHex("a0 05"))).output,
            "CERT_PARCER [ERROR]: x509_certificate_parse() error -2\n");
}

TEST(ProcessCertKey, EcPointIsReportedAsAMissingSequence) {
  const Bytes point = Concat({{0x04, 0x20}, Bytes(63, 0x11)});  // 0x04, X, Y
  Certificate certificate;
  certificate.key = "ec-p256";
  certificate.public_key_info =
      der::Sequence({AlgorithmIdentifier("1.2.840.10045.2.1", der::Oid("1.2.840.10045.3.1.7")),
                     der::BitString(point)});
  SignatureBlock block;
  block.certificates = certificate.Build();
  const ProcessedBlock processed(block);
  EXPECT_EQ(processed.result, 1);
  EXPECT_EQ(processed.output, std::string(kNoSequence) + kKeyTrailer);
  EXPECT_EQ(processed.record.modulus, nullptr);
}

TEST(ProcessCertKey, EcPointWithAWrongLengthByteIsReportedAsUnreadable) {
  const ProcessedBlock processed(WithPublicKey(Concat({{0x04, 0x7f}, Bytes(63, 0x11)})));
  EXPECT_EQ(processed.result, 1);
  EXPECT_EQ(processed.output, std::string(kUnreadable) + kKeyTrailer);
}

TEST(ProcessCertKey, UnreadableKeyIsReported) {
  // No bytes; half a header; a SEQUENCE that ends beyond the key; an empty SEQUENCE. Then half a
  // header of the modulus, and a modulus without its contents.
  for (const char* digits : {"", "30", "30 05 02 01 03", "30 00", "30 01 02", "30 02 02 05"}) {
    const ProcessedBlock processed(WithPublicKey(FromHex(digits)));
    EXPECT_EQ(processed.result, 1);
    EXPECT_EQ(processed.output, std::string(kUnreadable) + kKeyTrailer) << digits;
  }
}

// The BIT STRING has only the first `length` bytes of the key. The rest follows the BIT STRING, in
// a part of the tbsCertificate that is not read.
TEST(ProcessCertKey, KeyMustEndWithinItsBitString) {
  const Bytes key = der::Sequence({der::Integer(Bytes(64, 0x77)), der::Integer(3)});
  for (size_t length = 0; length <= key.size(); ++length) {
    const auto cut = key.begin() + static_cast<ptrdiff_t>(length);
    Certificate certificate;
    certificate.version = {};
    certificate.public_key_info = PublicKeyInfoAround(Bytes(key.begin(), cut));
    certificate.tbs_tail = Bytes(cut, key.end());
    certificate.signature = der::BitString(Bytes(8, 0x5a));
    SignatureBlock block;
    block.certificates = certificate.Build();
    block.encrypted_digest = der::OctetString(Bytes(8, 0xa5));
    const ProcessedBlock processed(block);
    const bool whole = length == key.size();
    EXPECT_EQ(processed.result, whole ? 0 : 1) << length;
    EXPECT_EQ(processed.output, whole ? "" : std::string(kUnreadable) + kKeyTrailer) << length;
  }
}

TEST(ProcessCertKey, ModulusMustEndWithinTheSequence) {
  const Bytes exponent = der::Integer(3);
  Bytes modulus = der::Integer(Bytes(64, 0x77));
  EXPECT_EQ(ProcessedBlock(WithPublicKey(Concat({der::Sequence({modulus}), exponent}))).result, 0);
  ++modulus[1];
  const ProcessedBlock processed(
      WithPublicKey(Concat({der::Sequence({modulus}), {0x77}, exponent})));
  EXPECT_EQ(processed.result, 1);
  EXPECT_EQ(processed.output, std::string(kUnreadable) + kKeyTrailer);
}

TEST(ProcessCertKey, ClassesAreNotChecked) {
  // The key is a [16] that contains two [2], in place of a SEQUENCE that contains two INTEGERs.
  const Bytes modulus(64, 0x77);
  const ProcessedBlock processed(WithPublicKey(der::Context(
      16, Concat({der::ContextPrimitive(2, modulus), der::ContextPrimitive(2, {3})}))));
  EXPECT_EQ(processed.result, 0);
  EXPECT_EQ(Field(processed.record.modulus, processed.record.modulus_length), modulus);
}

TEST(ProcessCertKey, ModulusThatIsNotAnIntegerIsReported) {
  const ProcessedBlock processed(
      WithPublicKey(der::Sequence({der::OctetString(Bytes(64, 0x77)), der::Integer(3)})));
  EXPECT_EQ(processed.result, 1);
  EXPECT_EQ(processed.output, std::string(kNoInteger) + kKeyTrailer);
  EXPECT_EQ(processed.record.modulus, nullptr);
}

TEST(ProcessCertKey, ModulusLosesItsLeadingZero) {
  const ProcessedBlock processed(WithRsaKey(Concat({{0x00}, Bytes(64, 0x99)}), {3}));
  EXPECT_EQ(processed.result, 0);
  EXPECT_EQ(Field(processed.record.modulus, processed.record.modulus_length), Bytes(64, 0x99));
}

TEST(ProcessCertKey, ModulusThatDoesNotStartWithZeroIsKeptWhole) {
  const ProcessedBlock processed(WithRsaKey(Bytes(64, 0x77), {3}));
  EXPECT_EQ(processed.result, 0);
  EXPECT_EQ(Field(processed.record.modulus, processed.record.modulus_length), Bytes(64, 0x77));
}

TEST(ProcessCertKey, ModulusLosesExactlyOneZero) {
  const Bytes rest = Concat({{0x00}, Bytes(64, 0x99)});
  const ProcessedBlock processed(WithRsaKey(Concat({{0x00}, rest}), {3}));
  EXPECT_EQ(processed.result, 0);
  EXPECT_EQ(Field(processed.record.modulus, processed.record.modulus_length), rest);
}

// In the first case, the modulus is empty and a zero byte follows it. In the second case the
// modulus is one zero byte, and in the third case two zero bytes.
TEST(ProcessCertKey, ShortModulusLeavesNoRoomForTheExponent) {
  const std::pair<const char*, uint32_t> cases[] = {
      {"30 03 02 00 00", 0}, {"30 06 02 01 00 02 01 03", 0}, {"30 07 02 02 00 00 02 01 03", 1}};
  for (const auto& [digits, length] : cases) {
    const ProcessedBlock processed(WithPublicKey(FromHex(digits)));
    EXPECT_EQ(processed.result, 1);
    EXPECT_EQ(processed.output, std::string(kUnreadable) + kKeyTrailer);
    EXPECT_EQ(processed.record.modulus_length, length) << digits;
  }
}

TEST(ProcessCertKey, ExponentElementMayNotBeLongerThanTheModulus) {
  // The exponent's element has five bytes: header 02 03, contents 01 00 01.
  EXPECT_EQ(ProcessedBlock(WithRsaKey(Bytes(5, 0x77), {1, 0, 1})).result, 0);
  const ProcessedBlock processed(WithRsaKey(Bytes(4, 0x77), {1, 0, 1}));
  EXPECT_EQ(processed.result, 1);
  EXPECT_EQ(processed.output, std::string(kUnreadable) + kKeyTrailer);
  EXPECT_EQ(processed.record.modulus_length, 4u);
}

// Both moduli begin with a zero byte. The first modulus has five bytes with this zero, and the
// second modulus has four bytes with it. The exponent's element has five bytes. The record leaves
// out the zero, but the limit for the exponent's element counts the zero.
TEST(ProcessCertKey, ExponentMayBeAsLongAsTheModulusWithItsLeadingZero) {
  const ProcessedBlock processed(WithRsaKey(Concat({{0x00}, Bytes(4, 0x77)}), {1, 0, 1}));
  EXPECT_EQ(processed.result, 0);
  EXPECT_EQ(processed.record.modulus_length, 4u);
  EXPECT_EQ(ProcessedBlock(WithRsaKey(Concat({{0x00}, Bytes(3, 0x77)}), {1, 0, 1})).result, 1);
}

TEST(ProcessCertKey, ExponentMayFollowTheKey) {
  const ProcessedBlock processed(
      WithPublicKey(Concat({der::Sequence({der::Integer(Bytes(64, 0x77))}), der::Integer(3)})));
  EXPECT_EQ(processed.result, 0);
  EXPECT_EQ(processed.record.exponent[0], 3);
}

TEST(ProcessCertKey, ExponentThatIsNotAnIntegerIsReported) {
  const ProcessedBlock processed(
      WithPublicKey(der::Sequence({der::Integer(Bytes(64, 0x77)), der::OctetString({3})})));
  EXPECT_EQ(processed.result, 1);
  EXPECT_EQ(processed.output, std::string(kNoInteger) + kKeyTrailer);
  EXPECT_EQ(processed.record.modulus_length, 64u);
}

TEST(ProcessCertKey, ExponentMustBeInTheBlock) {
  // The key ends after the exponent's header. The length in this header first covers exactly the
  // rest of the block, and then one byte more. In both cases, the exponent's element is shorter
  // than the modulus.
  SignatureBlock block =
      WithPublicKey(Concat({der::Sequence({der::Integer(Bytes(200, 0x77))}), {0x02, 0x81, 0x00}}));
  block.signer_infos = Bytes();
  Bytes bytes = block.Build(kSignatureFile);
  const size_t length_at = Find(bytes, {0x02, 0x81, 0x00}) + 2;
  const size_t rest = bytes.size() - (length_at + 1);
  ASSERT_LT(rest, 190u);

  bytes[length_at] = static_cast<uint8_t>(rest);
  EXPECT_EQ(ProcessedBlock(bytes).output, std::string(kUnreadable) + kSignerTrailer);
  bytes[length_at] = static_cast<uint8_t>(rest + 1);
  EXPECT_EQ(ProcessedBlock(bytes).output, std::string(kUnreadable) + kKeyTrailer);
}

TEST(ProcessCertKey, ExponentOf65537IsStoredAs01000100) {
  const ProcessedBlock processed{SignatureBlock()};
  EXPECT_EQ(processed.result, 0);
  EXPECT_EQ(Field(processed.record.exponent, 4), FromHex("01 00 01 00"));
}

TEST(ProcessCertKey, ExponentIsCopiedAsItIsAndFilledWithZeros) {
  const std::pair<const char*, const char*> cases[] = {{"", "00 00 00 00"},
                                                       {"03", "03 00 00 00"},
                                                       {"00 01 00 01", "00 01 00 01"},
                                                       {"ff ff ff ff", "ff ff ff ff"}};
  for (const auto& [contents, expected] : cases) {
    const ProcessedBlock processed(WithRsaKey(Bytes(64, 0x77), FromHex(contents)));
    EXPECT_EQ(processed.result, 0);
    EXPECT_EQ(Field(processed.record.exponent, 4), FromHex(expected)) << contents;
    EXPECT_EQ(processed.record.modulus_length, 64u);
  }
}

TEST(ProcessCertKey, ExponentIsFilledWithZerosEvenInAUsedRecord) {
  const Bytes block = WithRsaKey(Bytes(64, 0x77), {3}).Build(kSignatureFile);
  pkcs7 record;
  memset(&record, 0x11, sizeof(record));
  EXPECT_EQ(processCert(block.data(), static_cast<uint32_t>(block.size()), &record), 0);
  EXPECT_EQ(Field(record.exponent, 4), FromHex("03 00 00 00"));
}

TEST(ProcessCertKey, LongerExponentOverwritesTheModulusLength) {
  // The modulus length is 64. Its bytes in memory are 40 00 00 00 (hexadecimal).
  const std::pair<const char*, const char*> cases[] = {
      {"11 22 33 44 55", "11 22 33 44 55 00 00 00"},
      {"11 22 33 44 55 66 77 88", "11 22 33 44 55 66 77 88"}};
  for (const auto& [contents, expected] : cases) {
    const ProcessedBlock processed(WithRsaKey(Bytes(64, 0x77), FromHex(contents)));
    EXPECT_EQ(processed.result, 0);
    Bytes memory(8);
    memcpy(memory.data(), processed.record.exponent, 4);
    memcpy(memory.data() + 4, &processed.record.modulus_length, 4);
    EXPECT_EQ(memory, FromHex(expected)) << contents;
  }
}

TEST(ProcessCertKey, LongExponentIsCutAfterTheModulusLength) {
  Bytes exponent(40, 0xee);
  const Bytes block = WithRsaKey(Bytes(64, 0x77), exponent).Build(kSignatureFile);
  struct {
    pkcs7 record;
    uint8_t behind[32];
  } place;
  memset(&place, 0x11, sizeof(place));
  EXPECT_EQ(processCert(block.data(), static_cast<uint32_t>(block.size()), &place.record), 0);
  EXPECT_EQ(place.record.modulus_length, 0xeeeeeeeeu);
  Bytes after(sizeof(place) - offsetof(pkcs7, modulus_length) - 4);
  memcpy(after.data(), reinterpret_cast<uint8_t*>(&place) + sizeof(place) - after.size(),
         after.size());
  EXPECT_EQ(after, Bytes(after.size(), 0x11));
}
