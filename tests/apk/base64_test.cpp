#include "apk/base64.h"

#include <gtest/gtest.h>
#include <openssl/evp.h>

#include <string>
#include <vector>

#include "support/guarded_bytes.h"

namespace {

// The result of base64decode(), its `*out_length`, and the contents of its `out`.
struct Decoded {
  int result;
  size_t length;
  Bytes bytes;
};

bool operator==(const Decoded& a, const Decoded& b) {
  return a.result == b.result && a.length == b.length && a.bytes == b.bytes;
}

void PrintTo(const Decoded& decoded, std::ostream* out) {
  *out << decoded.result << ", length " << decoded.length << ", bytes "
       << testing::PrintToString(decoded.bytes);
}

constexpr uint8_t kUntouched = 0xEE;

// Decodes `text` into a buffer of `room` bytes. Unreadable memory follows the text and the buffer.
Decoded Decode(const std::string& text, size_t room) {
  const GuardedBytes in(ToBytes(text));
  GuardedBytes out(Bytes(room, kUntouched));
  size_t length = room;
  const int result =
      base64decode(reinterpret_cast<const char*>(in.data()), in.size(), out.data(), &length);
  return {result, length, Bytes(out.data(), out.data() + room)};
}

// RFC 4648, section 10.
TEST(Base64Decode, DecodesThePublishedVectors) {
  EXPECT_EQ(ToBytes(""), Base64Decode(""));
  EXPECT_EQ(ToBytes("f"), Base64Decode("Zg=="));
  EXPECT_EQ(ToBytes("fo"), Base64Decode("Zm8="));
  EXPECT_EQ(ToBytes("foo"), Base64Decode("Zm9v"));
  EXPECT_EQ(ToBytes("foob"), Base64Decode("Zm9vYg=="));
  EXPECT_EQ(ToBytes("fooba"), Base64Decode("Zm9vYmE="));
  EXPECT_EQ(ToBytes("foobar"), Base64Decode("Zm9vYmFy"));
}

TEST(Base64Decode, AgreesWithLibcryptoOnLengthsBelow600) {
  Bytes bytes;
  for (uint32_t i = 0; i < 600; ++i) {
    std::string text(4 * (bytes.size() / 3 + 1) + 1, '\0');
    text.resize(
        EVP_EncodeBlock(reinterpret_cast<uint8_t*>(text.data()), bytes.data(), bytes.size()));
    EXPECT_EQ(bytes, Base64Decode(text)) << text;
    bytes.push_back(static_cast<uint8_t>(i * 167 + (i >> 3)));
  }
}

TEST(Base64Decode, GroupPaddedTwiceIsOneByte) { EXPECT_EQ(Bytes({0x41}), Base64Decode("QQ==")); }

TEST(Base64Decode, MissingPaddingIsAccepted) {
  EXPECT_EQ(ToBytes("AB"), Base64Decode("QUI"));
  EXPECT_EQ(ToBytes("A"), Base64Decode("QQ"));
}

TEST(Base64Decode, SingleLeftOverValueIsDroppedWithoutAnError) {
  EXPECT_EQ((Decoded{0, 0, {}}), Decode("Q", 0));
  EXPECT_EQ((Decoded{0, 3, ToBytes("ABC")}), Decode("QUJDR", 3));
}

TEST(Base64Decode, LineBreaksAreSkipped) {
  EXPECT_EQ(ToBytes("ABCDEF"), Base64Decode("QUJD\r\nREVG"));
  EXPECT_EQ(ToBytes("ABCDEF"), Base64Decode("\nQ\rU\nJD\rREVG\r\n"));
}

TEST(Base64Decode, NulIsSkipped) {
  EXPECT_EQ(ToBytes("ABC"), Base64Decode(std::string("Q\0UJ\0D\0", 7)));
}

TEST(Base64Decode, TextAfterTheFirstEqualsSignIsIgnored) {
  EXPECT_EQ(ToBytes("A"), Base64Decode("QQ=UJD\x01 \xFF"));
  EXPECT_EQ(ToBytes(""), Base64Decode("=QUJD"));
}

TEST(Base64Decode, TextWithASpaceGivesNoBytes) {
  EXPECT_EQ(Bytes(), Base64Decode("QUJD REVG"));
  EXPECT_EQ(Bytes(), Base64Decode(" QUJD"));
  EXPECT_EQ(Bytes(), Base64Decode("QUJD "));
}

// Each byte value is appended to four characters that encode three bytes. An accepted byte adds
// nothing to these three bytes: it is skipped, ends the text, or is a single 6-bit value, which is
// dropped. Every other byte is refused.
TEST(Base64Decode, OnlyAlphabetPaddingLineBreaksAndNulAreAccepted) {
  const std::string accepted =
      "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/=\r\n" + std::string(1, 0);
  for (int byte = 0; byte < 256; ++byte) {
    const char c = static_cast<char>(byte);
    const bool is_accepted = accepted.find(c) != std::string::npos;
    const Decoded decoded = Decode(std::string("QUJD") + c, 10);
    EXPECT_EQ(is_accepted ? 0 : 1, decoded.result) << byte;
    EXPECT_EQ(is_accepted ? 3U : 10U, decoded.length) << byte;
  }
}

// The text is the alphabet in order, so its 6-bit values are 000000, 000001, 000010, and so on.
TEST(Base64Decode, AlphabetHasTheValues0To63InOrder) {
  Bytes expected;
  for (int value = 0; value < 64; value += 4) {
    const int group = value << 18 | (value + 1) << 12 | (value + 2) << 6 | (value + 3);
    for (const int shift : {16, 8, 0}) expected.push_back(static_cast<uint8_t>(group >> shift));
  }
  EXPECT_EQ(expected,
            Base64Decode("ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/"));
}

TEST(Base64Decode, HighestValuesGiveFullBytes) {
  EXPECT_EQ(Bytes({0xFF, 0xFF, 0xFF, 0xFF, 0xFF}), Base64Decode("///////="));
  EXPECT_EQ(Bytes({0xFF, 0xFF, 0xFF, 0xFF}), Base64Decode("//////=="));
}

TEST(Base64Decode, LowBitsThatBelongToNoByteAreIgnored) {
  EXPECT_EQ(ToBytes("A"), Base64Decode("QR=="));
  EXPECT_EQ(ToBytes("AB"), Base64Decode("QUJ="));
}

TEST(Base64Decode, ErrorDropsTheBytesDecodedBefore) {
  EXPECT_EQ(Bytes(), Base64Decode("QUJDREVG!"));
}

TEST(Base64DecodeToBuffer, LengthIsTheNumberOfBytesWritten) {
  EXPECT_EQ((Decoded{0, 6, {'A', 'B', 'C', 'D', 'E', 'F', kUntouched, kUntouched}}),
            Decode("QUJDREVG", 8));
}

TEST(Base64DecodeToBuffer, BufferOfTheExactSizeIsEnough) {
  EXPECT_EQ((Decoded{0, 3, ToBytes("ABC")}), Decode("QUJD", 3));
  EXPECT_EQ((Decoded{0, 5, ToBytes("ABCDE")}), Decode("QUJDREU=", 5));
  EXPECT_EQ((Decoded{0, 4, ToBytes("ABCD")}), Decode("QUJDRA==", 4));
}

TEST(Base64DecodeToBuffer, WholeGroupBeyondTheRoomIsRefused) {
  EXPECT_EQ((Decoded{1, 2, {kUntouched, kUntouched}}), Decode("QUJD", 2));
  EXPECT_EQ((Decoded{1, 5, {'A', 'B', 'C', kUntouched, kUntouched}}), Decode("QUJDREVG", 5));
}

TEST(Base64DecodeToBuffer, TwoLeftOverBytesBeyondTheRoomAreRefused) {
  EXPECT_EQ((Decoded{1, 1, {kUntouched}}), Decode("QUI=", 1));
  EXPECT_EQ((Decoded{1, 4, {'A', 'B', 'C', kUntouched}}), Decode("QUJDREU", 4));
}

TEST(Base64DecodeToBuffer, OneLeftOverByteBeyondTheRoomIsRefused) {
  EXPECT_EQ((Decoded{1, 0, {}}), Decode("QQ==", 0));
  EXPECT_EQ((Decoded{1, 3, ToBytes("ABC")}), Decode("QUJDRA", 3));
}

TEST(Base64DecodeToBuffer, EmptyTextNeedsNoBuffers) {
  size_t length = 0;
  EXPECT_EQ(0, base64decode(nullptr, 0, nullptr, &length));
  EXPECT_EQ(0U, length);
}

TEST(Base64DecodeToBuffer, InvalidByteLeavesTheLengthAsItWas) {
  EXPECT_EQ((Decoded{1, 4, {'A', 'B', 'C', kUntouched}}), Decode("QUJD!", 4));
}

}  // namespace
