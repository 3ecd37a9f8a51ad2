// Tests rsa_pkcs1_verify with signatures from libcrypto, and with encoded messages ("blocks") that
// the tests make. A block already has its padding, so SignBlock applies only the private-key
// operation.
#include "crypto/rsa.h"

#include <gtest/gtest.h>
#include <openssl/nid.h>

#include <algorithm>
#include <string>
#include <vector>

#include "crypto/rsa_digests.h"
#include "support/der.h"
#include "support/failing_malloc.h"
#include "support/log_capture.h"
#include "support/rsa_keys.h"

namespace {

const Bytes kMd5Info = Concat({FromHex("3020300c06082a864886f70d020505000410"), kMd5});
const Bytes kSha1Info = Concat({FromHex("3021300906052b0e03021a05000414"), kSha1});
const Bytes kSha256Info = Concat({FromHex("3031300d060960864801650304020105000420"), kSha256});

const Records kNoRecords;

Bytes Flipped(Bytes bytes, size_t index) {
  bytes[index] ^= 0x01;
  return bytes;
}

class RsaPkcs1VerifyEveryKey : public testing::TestWithParam<std::string> {};

INSTANTIATE_TEST_SUITE_P(Keys, RsaPkcs1VerifyEveryKey,
                         testing::Values("rsa-1024", "rsa-1536", "rsa-2048", "rsa-2048-e3",
                                         "rsa-2048-e17", "rsa-3072", "rsa-4096"),
                         [](const auto& parameter) {
                           std::string name = parameter.param;
                           name.erase(std::remove(name.begin(), name.end(), '-'), name.end());
                           return name;
                         });

TEST_P(RsaPkcs1VerifyEveryKey, SignaturesOfEachDigestVerify) {
  const FixedKey key(GetParam());
  LogCapture log;
  for (const auto& [nid, digest] :
       {std::pair(NID_md5, kMd5), std::pair(NID_sha1, kSha1), std::pair(NID_sha256, kSha256)}) {
    const Bytes signature = key.Sign(nid, digest);
    EXPECT_EQ(0, Verify(key.context, signature)) << nid;
    EXPECT_EQ(0, Verify(key.context, signature)) << nid << ", again";
    EXPECT_NE(0, Verify(key.context, Flipped(signature, signature.size() - 1))) << nid;
    EXPECT_EQ(18, Verify(key.context, key.Sign(nid, Flipped(digest, digest.size() - 1)))) << nid;
  }
  EXPECT_EQ(log.records(),
            Records({Error("MD5 hash does not match"), Error("SHA hash check unsuccessfull"),
                     Error("SHA256 hash does not match")}));
}

TEST(RsaPkcs1Verify, Sha256SignatureOfA2048BitKeyVerifiesAndAChangedDigestDoesNot) {
  const FixedKey key("rsa-2048");
  ASSERT_EQ(256, key.context.len);
  const Bytes signature = key.Sign(NID_sha256, kSha256);
  LogCapture log;
  EXPECT_EQ(0, Verify(key.context, signature));
  for (size_t i = 0; i < kSha256.size(); ++i) {
    log.Clear();
    EXPECT_EQ(18, rsa_pkcs1_verify(&key.context, kSha1.data(), Flipped(kSha256, i).data(),
                                   kMd5.data(), signature.data()));
    EXPECT_EQ(log.records(), Records({Error("SHA256 hash does not match")}));
  }
}

TEST(RsaPkcs1Verify, Sha256SignatureWithoutASha256DigestIsInvalidPadding) {
  const FixedKey key("rsa-2048");
  LogCapture log;
  EXPECT_EQ(7, rsa_pkcs1_verify(&key.context, kSha1.data(), nullptr, kMd5.data(),
                                key.Sign(NID_sha256, kSha256).data()));
  EXPECT_EQ(log.records(), Records({Error("Invalid padding in RSA")}));
}

TEST(RsaPkcs1Verify, Sha1AndMd5SignaturesNeedNoSha256Digest) {
  const FixedKey key("rsa-1024");
  EXPECT_EQ(0, rsa_pkcs1_verify(&key.context, kSha1.data(), nullptr, kMd5.data(),
                                key.Sign(NID_sha1, kSha1).data()));
  EXPECT_EQ(0, rsa_pkcs1_verify(&key.context, kSha1.data(), nullptr, kMd5.data(),
                                key.Sign(NID_md5, kMd5).data()));
}

TEST(RsaPkcs1Verify, Sha1AndSha256SignaturesNeedNoMd5Digest) {
  const FixedKey key("rsa-1024");
  for (const auto& [nid, digest] : {std::pair(NID_sha1, kSha1), std::pair(NID_sha256, kSha256)}) {
    EXPECT_EQ(0, rsa_pkcs1_verify(&key.context, kSha1.data(), kSha256.data(), nullptr,
                                  key.Sign(nid, digest).data()));
  }
}

TEST(RsaPkcs1Verify, Sha1SignatureVerifiesAndAChangedDigestDoesNot) {
  const FixedKey key("rsa-1024");
  const Bytes signature = key.Sign(NID_sha1, kSha1);
  LogCapture log;
  EXPECT_EQ(0, Verify(key.context, signature));
  for (size_t i = 0; i < kSha1.size(); ++i) {
    log.Clear();
    EXPECT_EQ(18, rsa_pkcs1_verify(&key.context, Flipped(kSha1, i).data(), kSha256.data(),
                                   kMd5.data(), signature.data()));
    EXPECT_EQ(log.records(), Records({Error("SHA hash check unsuccessfull")}));
  }
}

TEST(RsaPkcs1Verify, Md5SignatureVerifiesAndAChangedDigestDoesNot) {
  const FixedKey key("rsa-1024");
  const Bytes signature = key.Sign(NID_md5, kMd5);
  LogCapture log;
  EXPECT_EQ(0, Verify(key.context, signature));
  for (size_t i = 0; i < kMd5.size(); ++i) {
    log.Clear();
    EXPECT_EQ(18, rsa_pkcs1_verify(&key.context, kSha1.data(), kSha256.data(),
                                   Flipped(kMd5, i).data(), signature.data()));
    EXPECT_EQ(log.records(), Records({Error("MD5 hash does not match")}));
  }
}

TEST(RsaPkcs1Verify, Md2Md4AndUnknownAlgorithmsAreInvalidPadding) {
  const FixedKey key("rsa-1024");
  LogCapture log;
  for (uint8_t algorithm : {0, 2, 4, 6, 255}) {
    Bytes info = kMd5Info;
    info[13] = algorithm;
    log.Clear();
    EXPECT_EQ(7, Verify(key.context, key.SignBlock(Block(128, info)))) << int{algorithm};
    EXPECT_EQ(log.records(), Records({Error("Invalid padding in RSA")}));
  }
}

TEST(RsaPkcs1Verify, EveryByteOfTheDigestInfoPrefixIsChecked) {
  const FixedKey key("rsa-1024");
  LogCapture log;
  for (size_t i = 0; i < 19; ++i) {
    log.Clear();
    EXPECT_EQ(18, Verify(key.context, key.SignBlock(Block(128, Flipped(kSha256Info, i))))) << i;
    EXPECT_EQ(log.records(), Records({Error("SHA256 hash does not match")}));
  }
  for (size_t i = 0; i < 15; ++i) {
    log.Clear();
    EXPECT_EQ(18, Verify(key.context, key.SignBlock(Block(128, Flipped(kSha1Info, i))))) << i;
    EXPECT_EQ(log.records(), Records({Error("SHA hash check unsuccessfull")}));
  }
}

TEST(RsaPkcs1Verify, WrongMdPrefixFailsSilentlyForMd5AndMd2) {
  const FixedKey key("rsa-1024");
  LogCapture log;
  for (size_t i = 0; i < 18; ++i) {
    if (i == 13) continue;
    Bytes info = Flipped(kMd5Info, i);
    EXPECT_EQ(18, Verify(key.context, key.SignBlock(Block(128, info)))) << i;
    info[13] = 2;
    EXPECT_EQ(18, Verify(key.context, key.SignBlock(Block(128, info)))) << i;
  }
  EXPECT_EQ(log.records(), kNoRecords);
}

TEST(RsaPkcs1Verify, EveryByteOfThePaddingIsChecked) {
  const FixedKey key("rsa-1024");
  const Bytes block = Block(128, kSha256Info);
  const size_t separator = 128 - 1 - kSha256Info.size();
  ASSERT_EQ(0, Verify(key.context, key.SignBlock(block)));
  LogCapture log;
  for (size_t i = 1; i <= separator; ++i) {
    EXPECT_EQ(7, Verify(key.context, key.SignBlock(Flipped(block, i)))) << i;
  }
  EXPECT_EQ(log.records(), kNoRecords);
}

// RFC 2313 §8.1 also defines block type 0, for private-key operations, and block type 2, for
// public-key operations.
TEST(RsaPkcs1Verify, BlockOfAnotherTypeThan1IsInvalidPadding) {
  const FixedKey key("rsa-1024");
  LogCapture log;
  Bytes block = Block(128, kSha256Info);
  for (int type = 0; type < 256; ++type) {
    block[1] = static_cast<uint8_t>(type);
    EXPECT_EQ(type == 1 ? 0 : 7, Verify(key.context, key.SignBlock(block))) << type;
  }
  EXPECT_EQ(log.records(), kNoRecords);
}

TEST(RsaPkcs1Verify, BlockThatDoesNotStartWithZeroIsInvalidPadding) {
  const SmallKey key(54);
  LogCapture log;
  Bytes block = Block(54, kSha256Info);
  block[0] = 0x01;
  EXPECT_EQ(7, Verify(key.context, key.SignBlock(block)));
  EXPECT_EQ(log.records(), kNoRecords);
}

TEST(RsaPkcs1Verify, EmptyPaddingIsAccepted) {
  const SmallKey key(54);
  const Bytes block = Block(54, kSha256Info);
  ASSERT_EQ(0x00, block[2]);
  EXPECT_EQ(0, Verify(key.context, key.SignBlock(block)));
}

TEST(RsaPkcs1Verify, LongerInfoAfterEmptyPaddingIsInvalidPadding) {
  const SmallKey key(55);
  LogCapture log;
  const Bytes block = Block(55, Concat({kSha256Info, {0x00}}));
  EXPECT_EQ(7, Verify(key.context, key.SignBlock(block)));
  EXPECT_EQ(log.records(), Records({Error("Invalid padding in RSA")}));
}

TEST(RsaPkcs1Verify, PaddingOfFewerThanEightBytesIsAccepted) {
  for (size_t padding = 1; padding < 8; ++padding) {
    const SmallKey key(54 + padding);
    EXPECT_EQ(0, Verify(key.context, key.SignBlock(Block(54 + padding, kSha256Info)))) << padding;
  }
}

// The block of the longer key ends where the verifier's buffer ends.
TEST(RsaPkcs1Verify, PaddingWithoutASeparatorIsInvalid) {
  LogCapture log;
  for (const char* name : {"rsa-1024", "rsa-4096"}) {
    const FixedKey key(name);
    const Bytes block = Concat({{0x00, 0x01}, Bytes(key.modulus.size() - 2, 0xFF)});
    EXPECT_EQ(7, Verify(key.context, key.SignBlock(block)));
  }
  EXPECT_EQ(log.records(), kNoRecords);
}

// The verifier recovers both blocks at the same place on the stack, the longer block first. The
// longer block has a zero right after the place where the shorter block ends. A verifier that read
// beyond the shorter block would find this zero, and would log an error.
TEST(RsaPkcs1Verify, PaddingThatRunsToTheLastByteIsNotReadBeyondIt) {
  const FixedKey longer("rsa-2048");
  const FixedKey shorter("rsa-1024");
  const Bytes zeros = longer.SignBlock(Concat({{0x00, 0x01}, Bytes(254)}));
  const Bytes padding = shorter.SignBlock(Concat({{0x00, 0x01}, Bytes(126, 0xFF)}));
  LogCapture log;
  for (int round = 0; round < 2; ++round) {
    log.Clear();
    const FixedKey& key = round == 0 ? longer : shorter;
    EXPECT_EQ(7, Verify(key.context, round == 0 ? zeros : padding));
    EXPECT_EQ(log.records(), round == 0 ? Records({Error("Invalid padding in RSA")}) : kNoRecords);
  }
}

TEST(RsaPkcs1Verify, SeparatorInTheLastByteLeavesAnEmptyInfo) {
  const FixedKey key("rsa-1024");
  LogCapture log;
  EXPECT_EQ(7,
            Verify(key.context, key.SignBlock(Concat({{0x00, 0x01}, Bytes(125, 0xFF), {0x00}}))));
  EXPECT_EQ(log.records(), Records({Error("Invalid padding in RSA")}));
}

TEST(RsaPkcs1Verify, InfoOfAnotherLengthIsInvalidPadding) {
  const FixedKey key("rsa-1024");
  LogCapture log;
  for (size_t length : {0, 1, 33, 36, 50, 52, 125}) {
    log.Clear();
    EXPECT_EQ(7, Verify(key.context, key.SignBlock(Block(128, Bytes(length, 0x30))))) << length;
    EXPECT_EQ(log.records(), Records({Error("Invalid padding in RSA")}));
  }
}

TEST(RsaPkcs1Verify, MissingArgumentsAreBadInput) {
  const FixedKey key("rsa-1024");
  const Bytes signature = key.Sign(NID_sha1, kSha1);
  const uint8_t* const sha1 = kSha1.data();
  const uint8_t* const md5 = kMd5.data();
  LogCapture log;
  EXPECT_EQ(5, rsa_pkcs1_verify(nullptr, sha1, nullptr, md5, signature.data()));
  EXPECT_EQ(5, rsa_pkcs1_verify(&key.context, nullptr, nullptr, md5, signature.data()));
  EXPECT_EQ(5, rsa_pkcs1_verify(&key.context, sha1, nullptr, md5, nullptr));
  EXPECT_EQ(log.records(), kNoRecords);
}

TEST(RsaPkcs1Verify, LengthsOf15And513AreBadInputBeforeAnyArithmetic) {
  const Bytes modulus(513, 0xFF);
  const Bytes signature(513, 0x01);
  for (uint32_t len : {1u, 15u, 513u}) {
    rsa_local context;
    ASSERT_EQ(0, rsa_set_key(&context, modulus.data(), nullptr, 3, len));
    FailingMalloc watch;
    EXPECT_EQ(5, Verify(context, signature)) << len;
    EXPECT_EQ(0, watch.calls());
  }
}

TEST(RsaPkcs1Verify, NegativeLengthIsBadInput) {
  rsa_local context;
  context.len = -1;
  EXPECT_EQ(5, Verify(context, Bytes(1)));
}

// The result is 7 (invalid padding), not 5 (bad input): the length is accepted, but 16 bytes are
// too short for any supported DigestInfo.
TEST(RsaPkcs1Verify, LengthOf16IsAccepted) {
  const SmallKey key(16);
  LogCapture log;
  EXPECT_EQ(7, Verify(key.context, key.SignBlock(Block(16, Bytes(4, 0x30)))));
  EXPECT_EQ(log.records(), Records({Error("Invalid padding in RSA")}));
}

TEST(RsaPkcs1Verify, LengthOf512IsAccepted) {
  const FixedKey key("rsa-4096");
  ASSERT_EQ(512, key.context.len);
  EXPECT_EQ(0, Verify(key.context, key.Sign(NID_sha256, kSha256)));
}

TEST(RsaPkcs1Verify, SignatureNotBelowTheModulusIsBadInput) {
  const FixedKey key("rsa-1024");
  LogCapture log;
  EXPECT_EQ(5, Verify(key.context, key.modulus));
  EXPECT_EQ(5, Verify(key.context, BigEndian(mpz_class(ToNumber(key.modulus) + 1), 128)));
  EXPECT_EQ(5, Verify(key.context, Bytes(128, 0xFF)));
  EXPECT_EQ(7, Verify(key.context, BigEndian(mpz_class(ToNumber(key.modulus) - 1), 128)));
  EXPECT_EQ(log.records(), kNoRecords);
}

TEST(RsaPkcs1Verify, NegativeModulusIsBadInput) {
  FixedKey key("rsa-1024");
  key.context.N.s = -1;
  EXPECT_EQ(5, Verify(key.context, key.Sign(NID_sha1, kSha1)));
}

TEST(RsaPkcs1Verify, EvenModulusReturns20) {
  rsa_local context;
  const Bytes modulus(128, 0xFE);
  ASSERT_EQ(0, rsa_set_key(&context, modulus.data(), nullptr, 65537, 128));
  LogCapture log;
  EXPECT_EQ(20, Verify(context, Bytes(128, 0x01)));
  EXPECT_EQ(log.records(), kNoRecords);
}

// The context's length was changed after the key was set.
TEST(RsaPkcs1Verify, ResultLongerThanTheLengthReturns24) {
  FixedKey key("rsa-1024");
  key.context.len = 127;
  LogCapture log;
  EXPECT_EQ(24, Verify(key.context, Bytes(127, 0x7F)));
  EXPECT_EQ(log.records(), kNoRecords);
}

TEST(RsaPkcs1Verify, ReportsEachAllocationThatFailsAndLeaksNothing) {
  const FixedKey key("rsa-1024");
  const Bytes signature = key.Sign(NID_sha1, kSha1);
  for (int call = 1;; ++call) {
    FailingMalloc failing(call);
    const int result = Verify(key.context, signature);
    EXPECT_EQ(0, failing.live()) << call;
    EXPECT_EQ(0, failing.freed_unwiped()) << call;
    if (!failing.failed()) {
      EXPECT_EQ(0, result);
      EXPECT_GT(call, 5);
      break;
    }
    EXPECT_EQ(17, result) << call;
  }
}

TEST(RsaPkcs1Verify, NegativeExponentActsAsItsMagnitude) {
  const FixedKey key("rsa-2048-e17");
  rsa_local context;
  ASSERT_EQ(0, rsa_set_key(&context, key.modulus.data(), nullptr, 0u - 17u, 256));
  EXPECT_EQ(-1, context.E.s);
  EXPECT_EQ(0, Verify(context, key.Sign(NID_sha256, kSha256)));
}

TEST(RsaPkcs1Verify, EmptyExponentVerifiesNothing) {
  const FixedKey key("rsa-1024");
  rsa_local context;
  ASSERT_EQ(0, rsa_set_key(&context, key.modulus.data(), nullptr, 0, 128));
  EXPECT_EQ(0, context.E.n);
  EXPECT_EQ(7, Verify(context, key.Sign(NID_sha1, kSha1)));
}

}  // namespace
