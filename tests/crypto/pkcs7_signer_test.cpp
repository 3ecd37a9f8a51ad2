// Tests how processCert reads the first SignerInfo. Also tests that processCert stays inside
// damaged blocks.
#include <gtest/gtest.h>

#include <cstdlib>
#include <fstream>
#include <iterator>

#include "crypto/processed_block.h"
#include "support/files.h"
#include "support/keys.h"

namespace {

// A block with these signerInfos.
SignatureBlock WithSigners(const Bytes& signer_infos) {
  SignatureBlock block = WithRsaKey(Bytes(64, 0x77), {3});
  block.signer_infos = signer_infos;
  return block;
}

// A SET of one SignerInfo. The SignerInfo has a version, an issuer, and then `elements`.
Bytes SignerOf(const std::vector<Bytes>& elements) {
  return der::Set({der::Sequence({der::Integer(1), der::Sequence({}), Concat(elements)})});
}

const Bytes& Sha256Algorithm() {
  static const auto& algorithm = *new Bytes(AlgorithmIdentifier(DigestOid(Digest::kSha256)));
  return algorithm;
}

// A block whose last parts are the [0] of the certificates and then `signers`. The enclosing
// elements have the indefinite form (see BlockEndingIn).
Bytes BlockEndingInSigners(const Bytes& signers) {
  return BlockEndingIn(
      Concat({der::Context(0, *WithRsaKey(Bytes(64, 0x77), {3}).certificates), signers}));
}

// True if tbs_data and cert_signature are inside the block, and if modulus and signed_digest start
// inside the block or at its end. A null modulus or signed_digest is accepted. A null tbs_data or
// cert_signature is accepted only if its length is 0.
bool Inside(const GuardedBytes& block, const pkcs7& record) {
  const auto inside = [&](const uint8_t* value, size_t length) {
    if (value == nullptr) return length == 0;
    return value >= block.data() && value <= block.data() + block.size() &&
           length <= static_cast<size_t>(block.data() + block.size() - value);
  };
  return inside(record.tbs_data, record.tbs_data_length) &&
         inside(record.cert_signature, record.cert_signature_length) && inside(record.modulus, 0) &&
         inside(record.signed_digest, 0);
}

// Calls processCert for a damaged block. True if the result is 0 or 1 and Inside returns true for
// the record.
bool StaysInside(const GuardedBytes& block) {
  pkcs7 record = {};
  const int result = processCert(block.data(), static_cast<uint32_t>(block.size()), &record);
  return (result == 0 || result == 1) && Inside(block, record);
}

}  // namespace

TEST(ProcessCertSigner, UnreadableHeadersAreReported) {
  // No signerInfos, half of a header, a SET without its contents, no SignerInfo, no version, no
  // issuer, an issuer without its contents.
  for (const char* digits : {"", "31", "31 05", "31 00", "31 02 30 00", "31 05 30 03 02 01 01",
                             "31 07 30 05 02 01 01 30 05"}) {
    const ProcessedBlock processed(WithSigners(FromHex(digits)));
    EXPECT_EQ(processed.result, 1);
    EXPECT_EQ(processed.output, std::string(kUnreadable) + kSignerTrailer) << digits;
    EXPECT_EQ(processed.record.modulus_length, 64u);
    EXPECT_EQ(processed.record.signed_digest, nullptr);
  }
}

TEST(ProcessCertSigner, SignersBeyondTheEndAreReportedAsUnreadable) {
  // The block ends with the [0] of the certificates. The header of the [0] declares five bytes more
  // than the [0] contains.
  const Bytes certificate = *WithRsaKey(Bytes(64, 0x77), {3}).certificates;
  Bytes certificates = der::Context(0, Concat({certificate, Bytes(5)}));
  certificates.resize(certificates.size() - 5);
  const ProcessedBlock processed(BlockEndingIn(certificates));
  EXPECT_EQ(processed.result, 1);
  EXPECT_EQ(processed.output, std::string(kUnreadable) + kSignerTrailer);
}

// The signerInfos and the first SignerInfo may each end beyond their container, but not beyond the
// block.
TEST(ProcessCertSigner, SignerInfosAndTheFirstSignerInfoMayEndWithTheBlock) {
  const Bytes signer = der::Sequence({der::Integer(1), der::Sequence({}), Sha256Algorithm(),
                                      AlgorithmIdentifier("1.2.3"), der::OctetString(Bytes(8, 1))});
  for (const Bytes& set : {der::Set({signer}), Concat({{0x31, 0x00}, signer})}) {
    Bytes block = BlockEndingInSigners(set);
    EXPECT_EQ(ProcessedBlock(block).result, 0);
    const bool is_empty = set[1] == 0;
    ++block[block.size() - (is_empty ? signer : set).size() + 1];
    const ProcessedBlock processed(block);
    EXPECT_EQ(processed.result, 1);
    EXPECT_EQ(processed.output, std::string(kUnreadable) + kSignerTrailer);
  }
}

TEST(ProcessCertSigner, VersionAndIssuerMayFollowAnEmptySignerInfo) {
  // The SignerInfo is empty. The version and the issuer are read from the bytes after it, and the
  // digestAlgorithm is missing. In the first and the third case, the issuer ends with the block.
  // The second case is the first case, but the header of the version declares one byte more. The
  // fourth case is the third case, but the header of the issuer declares one byte more.
  const std::pair<const char*, const char*> cases[] = {
      {"31 00 30 00 02 03 01 02 03 30 00", kNoAlgorithm},
      {"31 00 30 00 02 04 01 02 03 30 00", kUnreadable},
      {"31 00 30 00 02 01 01 30 02 05 00", kNoAlgorithm},
      {"31 00 30 00 02 01 01 30 03 05 00", kUnreadable},
  };
  for (const auto& [digits, line] : cases) {
    const ProcessedBlock processed(BlockEndingInSigners(FromHex(digits)));
    EXPECT_EQ(processed.result, 1);
    EXPECT_EQ(processed.output, std::string(line) + kSignerTrailer) << digits;
  }
}

TEST(ProcessCertSigner, MalformedDigestAlgorithmIsReported) {
  const Bytes rest = Concat({AlgorithmIdentifier("1.2.3"), der::OctetString(Bytes(8))});
  const Bytes cases[] = {
      SignerOf({}),                                               // missing
      SignerOf({{0x30}}),                                         // half of a header
      SignerOf({der::Set({der::Oid("1.2.3")}), rest}),            // no SEQUENCE
      SignerOf({der::Context(16, der::Oid("1.2.3")), rest}),      // another class
      SignerOf({der::Sequence({}), rest}),                        // no OID
      SignerOf({der::Sequence({der::Null()}), rest}),             // no OID either
      SignerOf({der::Sequence({FromHex("06 00")}), rest}),        // an empty OID
      SignerOf({der::Sequence({FromHex("06 02 2a 86")}), rest}),  // an OID that ends within an arc
  };
  for (const Bytes& signer_infos : cases) {
    const ProcessedBlock processed(WithSigners(signer_infos));
    EXPECT_EQ(processed.result, 1);
    EXPECT_EQ(processed.output, std::string(kNoAlgorithm) + kSignerTrailer);
    EXPECT_EQ(processed.record.signed_digest, nullptr);
  }
}

TEST(ProcessCertSigner, DigestAlgorithmMustEndWithinTheSignerInfo) {
  // Four blocks that differ only in the length in the SignerInfo's header. By this length, the
  // SignerInfo ends one byte before the digestAlgorithm, at the start of the digestAlgorithm, one
  // byte before the end of the digestAlgorithm, or at the end of the digestAlgorithm.
  const Bytes start = Concat({der::Integer(1), der::Sequence({})});
  const Bytes rest = Concat({AlgorithmIdentifier("1.2.3"), der::OctetString(Bytes(8, 1))});
  const size_t algorithm_end = start.size() + Sha256Algorithm().size();
  for (const size_t length : {start.size() - 1, start.size(), algorithm_end - 1, algorithm_end}) {
    const Bytes signer = Concat(
        {{0x31, 0x00}, {0x30, static_cast<uint8_t>(length)}, start, Sha256Algorithm(), rest});
    const ProcessedBlock processed(WithSigners(signer));
    const bool good = length == algorithm_end;
    EXPECT_EQ(processed.result, good ? 0 : 1);
    EXPECT_EQ(processed.output, good ? "" : std::string(kNoAlgorithm) + kSignerTrailer);
  }
}

TEST(ProcessCertSigner, AnyDigestAlgorithmAndParametersAreAccepted) {
  for (const Bytes& parameters : {Bytes(), der::Null(), der::Oid("1.2.3"), FromHex("06 00")}) {
    SignatureBlock block = WithRsaKey(Bytes(64, 0x77), {3});
    block.digest_algorithm = AlgorithmIdentifier("1.2.3.4", parameters);
    EXPECT_EQ(ProcessedBlock(block).result, 0);
  }
}

TEST(ProcessCertSigner, MissingEncryptedDigestIsReportedAsUnreadable) {
  // In the first two cases, the digestEncryptionAlgorithm is missing or is half of a header. In the
  // others, the encryptedDigest is missing, is half of a header, or is half of a long-form tag.
  const Bytes algorithm = AlgorithmIdentifier("1.2.3");
  for (const Bytes& rest : {Bytes(), Bytes{0x30}, algorithm, Concat({algorithm, {0x04}}),
                            Concat({algorithm, {0x1f}})}) {
    const ProcessedBlock processed(WithSigners(SignerOf({Sha256Algorithm(), rest})));
    EXPECT_EQ(processed.result, 1);
    EXPECT_EQ(processed.output, std::string(kUnreadable) + kSignerTrailer);
    EXPECT_EQ(processed.record.signed_digest, nullptr);
  }
}

TEST(ProcessCertSigner, EncryptedDigestIsBoundedByTheOffsetAfterDigestAlgorithm) {
  const Bytes algorithm = AlgorithmIdentifier("1.2.3");
  Bytes bytes = WithSigners(SignerOf({Sha256Algorithm(), algorithm, FromHex("04 82 00 00")}))
                    .Build(kSignatureFile);
  const size_t bound = bytes.size() - algorithm.size() - 4;
  const size_t most = bound - 4;
  bytes[bytes.size() - 2] = static_cast<uint8_t>(most >> 8);
  bytes[bytes.size() - 1] = static_cast<uint8_t>(most);
  const ProcessedBlock longest(bytes);
  EXPECT_EQ(longest.result, 0);
  EXPECT_EQ(longest.record.signed_digest, longest.bytes.data() + longest.bytes.size());
  EXPECT_EQ(longest.record.signed_digest_length, most);

  bytes[bytes.size() - 2] = static_cast<uint8_t>((most + 1) >> 8);
  bytes[bytes.size() - 1] = static_cast<uint8_t>(most + 1);
  const ProcessedBlock too_long(bytes);
  EXPECT_EQ(too_long.result, 1);
  EXPECT_EQ(too_long.output, std::string(kUnreadable) + kSignerTrailer);
}

TEST(ProcessCertSigner, DigestEncryptionIsBoundedByTheOffsetAfterDigestAlgorithm) {
  const Bytes up_to_algorithm =
      BlockEndingInSigners(Concat({FromHex("31 80 30 14 02 01 01 30 80"), Sha256Algorithm()}));
  const size_t most = up_to_algorithm.size() - 4;  // 4: the header of `algorithm`
  for (const size_t length : {most, most + 1}) {
    const Bytes algorithm = der::Element(der::kSequence, Bytes(length));
    ASSERT_EQ(algorithm.size(), length + 4);
    const ProcessedBlock processed(
        Concat({up_to_algorithm, algorithm, der::OctetString(Bytes(8, 1))}));
    EXPECT_EQ(processed.result, length == most ? 0 : 1);
    EXPECT_EQ(processed.output, length == most ? "" : std::string(kUnreadable) + kSignerTrailer);
  }
}

TEST(ProcessCertSigner, EncryptedDigestBeyondTheEndIsReportedAsUnreadable) {
  const ProcessedBlock processed(
      WithSigners(SignerOf({Sha256Algorithm(), FromHex("30 10 06 01"), FromHex("04 01 aa")})));
  EXPECT_EQ(processed.result, 1);
  EXPECT_EQ(processed.output, std::string(kUnreadable) + kSignerTrailer);
}

TEST(ProcessCertSigner, AuthenticatedAttributesGiveTheWrongEncryptedDigest) {
  SignatureBlock block;
  block.authenticated_attributes = true;
  const ProcessedBlock processed(block);
  EXPECT_EQ(processed.result, 0);
  EXPECT_EQ(processed.output, "");
  // The digestEncryptionAlgorithm is read as the encryptedDigest. The contents of the
  // digestEncryptionAlgorithm are rsaEncryption and NULL.
  EXPECT_EQ(Field(processed.record.signed_digest, processed.record.signed_digest_length),
            Concat({der::Oid("1.2.840.113549.1.1.1"), der::Null()}));
}

TEST(ProcessCertDamagedBlock, EveryTruncationIsRefused) {
  const Bytes whole = WithRsaKey(Bytes(64, 0x77), {3}).Build(kSignatureFile);
  for (size_t length = 0; length < whole.size(); ++length) {
    const ProcessedBlock processed(
        Bytes(whole.begin(), whole.begin() + static_cast<ptrdiff_t>(length)));
    EXPECT_EQ(processed.result, 1) << length;
    EXPECT_TRUE(Inside(processed.bytes, processed.record)) << length;
  }
}

TEST(ProcessCertDamagedBlock, FieldsStartInsideEveryTruncationOfABlockOfIndefiniteLengths) {
  // By its length, the SignerInfo ends with the digestAlgorithm. processCert can accept an
  // encryptedDigest that ends beyond the block. A block that is cut inside the encryptedDigest can
  // therefore be accepted, so this test does not check the result.
  const Bytes whole = BlockEndingInSigners(Concat({
      FromHex("31 80 30 14 02 01 01 30 80"),
      Sha256Algorithm(),
      AlgorithmIdentifier("1.2.840.113549.1.1.1"),
      der::OctetString(Bytes(77, 0xa5)),
  }));
  EXPECT_EQ(ProcessedBlock(whole).result, 0);
  for (size_t length = 0; length < whole.size(); ++length) {
    const ProcessedBlock processed(
        Bytes(whole.begin(), whole.begin() + static_cast<ptrdiff_t>(length)));
    EXPECT_TRUE(Inside(processed.bytes, processed.record)) << length;
  }
}

TEST(ProcessCertDamagedBlock, FieldsStartInsideTheBlockAfterEveryChangeOfOneByte) {
  const Bytes whole = WithRsaKey(Bytes(64, 0x77), {3}).Build(kSignatureFile);
  GuardedBytes block(whole);
  testing::internal::CaptureStdout();
  size_t outside = 0;
  for (size_t i = 0; i < whole.size(); ++i) {
    uint8_t& byte = block.data()[i];
    const uint8_t good = byte;
    for (const int change : {0x00, 0x01, 0x1f, 0x7f, 0x80, 0x81, 0x82, 0x84, 0xff, good + 1,
                             good - 1, good ^ 0x80, good ^ 0x20}) {
      byte = static_cast<uint8_t>(change);
      if (!StaysInside(block)) ++outside;
    }
    byte = good;
  }
  testing::internal::GetCapturedStdout();
  EXPECT_EQ(outside, 0u);
  EXPECT_EQ(ProcessedBlock(whole).result, 0);
}

TEST(ProcessCert, BlockMadeByOpensslIsRead) {
  const TempDir directory;
  const std::string base = directory / "block";
  const std::string key = TestKeyPath("rsa-2048");
  WriteFile(base + ".sf", kSignatureFile);
  const std::string command = "openssl req -x509 -new -key " + key + " -subj /CN=Test -out " +
                              base + ".pem 2>/dev/null && openssl smime -sign -noattr -binary " +
                              "-md sha256 -outform DER -signer " + base + ".pem -inkey " + key +
                              " -in " + base + ".sf -out " + base + ".rsa";
  ASSERT_EQ(system(command.c_str()), 0);
  const ProcessedBlock processed{ToBytes(ContentOf(base + ".rsa"))};
  ASSERT_EQ(processed.result, 0);
  const pkcs7& record = processed.record;
  EXPECT_EQ(Field(record.signed_digest, record.signed_digest_length),
            SignWith("rsa-2048", Digest::kSha256, kSignatureFile));
  EXPECT_EQ(Field(record.cert_signature, record.cert_signature_length),
            SignWith("rsa-2048", Digest::kSha256, Field(record.tbs_data, record.tbs_data_length)));
}
