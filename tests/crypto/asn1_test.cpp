#include "crypto/asn1.h"

#include <gtest/gtest.h>
#include <sys/mman.h>

#include <cstring>
#include <string>
#include <vector>

#include "support/der.h"
#include "support/guarded_bytes.h"

namespace {

// Returns a copy of the first `length` bytes. A read past the end of the copy crashes.
GuardedBytes Cut(const Bytes& bytes, size_t length) {
  return GuardedBytes(Bytes(bytes.begin(), bytes.begin() + static_cast<ptrdiff_t>(length)));
}

int Read(const GuardedBytes& bytes, asn1_hdr* hdr) {
  return asn1_get_next(bytes.data(), bytes.size(), hdr);
}
int Read(const Bytes& bytes, asn1_hdr* hdr) {
  return asn1_get_next(bytes.data(), bytes.size(), hdr);
}

// A header with 0xee in every byte. A field that a call does not set keeps these bytes.
asn1_hdr Used() {
  asn1_hdr hdr;
  memset(&hdr, 0xee, sizeof(hdr));
  return hdr;
}

std::vector<uint32_t> Arcs(const asn1_oid& oid) {
  return std::vector<uint32_t>(oid.oid, oid.oid + oid.len);
}

asn1_oid OidOf(const std::vector<uint32_t>& arcs) {
  asn1_oid oid = {};
  for (const uint32_t arc : arcs) oid.oid[oid.len++] = arc;
  return oid;
}

std::string Text(const asn1_oid& oid, size_t size = 80) {
  std::vector<char> text(size, 'x');
  asn1_oid_to_str(&oid, text.data(), size);
  EXPECT_EQ(text[size - 1], '\0');
  return text.data();
}

}  // namespace

TEST(Asn1GetNext, EveryFieldOfAHeaderIsDecoded) {
  const Bytes bytes = FromHex("a3 02 05 00");
  asn1_hdr hdr = Used();
  EXPECT_EQ(Read(bytes, &hdr), 0);
  EXPECT_EQ(hdr.payload, bytes.data() + 2);
  EXPECT_EQ(hdr.identifier, 0xa3);
  EXPECT_EQ(hdr.class_, kAsn1Context);
  EXPECT_EQ(hdr.constructed, 1);
  EXPECT_EQ(hdr.tag, 3u);
  EXPECT_EQ(hdr.length, 2u);
}

TEST(Asn1GetNext, ClassIsTheTopTwoBits) {
  const std::pair<uint8_t, uint8_t> cases[] = {{0x02, 0}, {0x42, 1}, {0x82, 2}, {0xc2, 3}};
  for (const auto& [identifier, expected] : cases) {
    asn1_hdr hdr;
    EXPECT_EQ(Read({identifier, 0}, &hdr), 0);
    EXPECT_EQ(hdr.class_, expected);
    EXPECT_EQ(hdr.constructed, 0);
    EXPECT_EQ(hdr.tag, 2u);
  }
}

TEST(Asn1GetNext, IndefiniteLengthReadsAsZeroAndSetsThePayload) {
  const Bytes bytes = FromHex("30 80");
  asn1_hdr hdr = Used();
  EXPECT_EQ(Read(bytes, &hdr), 0);
  EXPECT_EQ(hdr.tag, kAsn1Sequence);
  EXPECT_EQ(hdr.length, 0u);
  EXPECT_EQ(hdr.payload, bytes.data() + 2);
}

TEST(Asn1GetNext, FiveLengthOctetsFail) {
  const Bytes bytes = FromHex("04 85 00 00 00 00 01 ff");
  asn1_hdr hdr = Used();
  EXPECT_EQ(Read(bytes, &hdr), -1);
  EXPECT_EQ(hdr.payload, nullptr);
}

TEST(Asn1GetNext, ThreeAndFourLengthOctetsAreAcceptedIfTheContentsFit) {
  const Bytes bytes = FromHex("04 84 00 00 00 01 ff");
  asn1_hdr hdr;
  EXPECT_EQ(Read(bytes, &hdr), 0);
  EXPECT_EQ(hdr.length, 1u);
  EXPECT_EQ(hdr.payload, bytes.data() + 6);

  const Bytes large = der::OctetString(Bytes(0x12345));
  EXPECT_EQ(Read(large, &hdr), 0);
  EXPECT_EQ(hdr.length, 0x12345u);
  EXPECT_EQ(hdr.payload, large.data() + 5);
}

TEST(Asn1GetNext, FourLengthOctetsFailIfTheContentsDoNotFit) {
  asn1_hdr hdr;
  EXPECT_EQ(Read(FromHex("04 84 00 00 00 02 ff"), &hdr), -1);
  EXPECT_EQ(Read(FromHex("04 84 ff ff ff ff ff"), &hdr), -1);
}

TEST(Asn1GetNext, LengthOctetFfFails) {
  asn1_hdr hdr = Used();
  EXPECT_EQ(Read(Concat({FromHex("04 ff"), Bytes(200)}), &hdr), -1);
  EXPECT_EQ(hdr.payload, nullptr);
}

TEST(Asn1GetNext, LongFormTagOf1F8101Is129) {
  const Bytes bytes = FromHex("1f 81 01 00");
  asn1_hdr hdr;
  EXPECT_EQ(Read(bytes, &hdr), 0);
  EXPECT_EQ(hdr.tag, 129u);
  EXPECT_EQ(hdr.identifier, 0x1f);
  EXPECT_EQ(hdr.payload, bytes.data() + 4);
}

TEST(Asn1GetNext, LongFormTagMayHaveOneOctet) {
  asn1_hdr hdr;
  EXPECT_EQ(Read(FromHex("ff 04 01 aa"), &hdr), 0);
  EXPECT_EQ(hdr.class_, kAsn1Private);
  EXPECT_EQ(hdr.tag, 4u);
  EXPECT_EQ(hdr.length, 1u);
}

TEST(Asn1GetNext, LongFormTagKeepsItsLow32Bits) {
  // The tag number has ten octets with seven bits each. The low 32 bits are 0x11223344, and all
  // higher bits are ones. In groups of seven bits, 0x11223344 is 0001 0001001 0001000 1100110
  // 1000100. The first group has only four bits. The three next higher bits, which are ones,
  // complete the group: 1110001. With the continuation bit, this is the octet 0xf1.
  asn1_hdr hdr;
  EXPECT_EQ(Read(FromHex("1f ff ff ff ff ff f1 89 88 e6 44 00"), &hdr), 0);
  EXPECT_EQ(hdr.tag, 0x11223344u);
}

TEST(Asn1GetNext, NonMinimalTagAndLengthAreAccepted) {
  asn1_hdr hdr;
  EXPECT_EQ(Read(FromHex("1f 80 80 02 82 00 01 aa"), &hdr), 0);
  EXPECT_EQ(hdr.tag, 2u);
  EXPECT_EQ(hdr.length, 1u);
}

TEST(Asn1GetNext, LongFormTagThatRunsPastTheEndFails) {
  for (const char* digits : {"1f", "1f 81", "1f 81 82"}) {
    asn1_hdr hdr = Used();
    EXPECT_EQ(Read(FromHex(digits), &hdr), -1) << digits;
    EXPECT_EQ(hdr.payload, nullptr);
  }
}

TEST(Asn1GetNext, LengthOctetsThatRunPastTheEndFail) {
  for (const char* digits : {"04", "04 81", "04 82 00", "04 84 00 00 00", "1f 81 01"}) {
    asn1_hdr hdr = Used();
    EXPECT_EQ(Read(FromHex(digits), &hdr), -1) << digits;
    EXPECT_EQ(hdr.payload, nullptr);
  }
}

TEST(Asn1GetNext, ElementMustEndWithinTheBytes) {
  asn1_hdr hdr;
  EXPECT_EQ(Read(FromHex("04 02 aa bb"), &hdr), 0);
  EXPECT_EQ(Read(FromHex("04 03 aa bb"), &hdr), -1);
  EXPECT_EQ(Read(FromHex("04 00"), &hdr), 0);
}

TEST(Asn1GetNext, EmptyRangeFailsAndClearsTheHeader) {
  asn1_hdr hdr = Used();
  EXPECT_EQ(asn1_get_next(nullptr, 0, &hdr), -1);
  EXPECT_EQ(hdr.payload, nullptr);
  EXPECT_EQ(hdr.identifier, 0);
  EXPECT_EQ(hdr.class_, 0);
  EXPECT_EQ(hdr.constructed, 0);
  EXPECT_EQ(hdr.tag, 0u);
  EXPECT_EQ(hdr.length, 0u);
}

TEST(Asn1GetNext, OneByteFailsAndLeavesTheIdentifierDecoded) {
  asn1_hdr hdr = Used();
  EXPECT_EQ(Read({0xb1}, &hdr), -1);
  EXPECT_EQ(hdr.payload, nullptr);
  EXPECT_EQ(hdr.identifier, 0xb1);
  EXPECT_EQ(hdr.class_, kAsn1Context);
  EXPECT_EQ(hdr.constructed, 1);
  EXPECT_EQ(hdr.tag, 17u);
  EXPECT_EQ(hdr.length, 0u);
}

TEST(Asn1GetNext, FailureLeavesTheLengthReadSoFar) {
  asn1_hdr hdr = Used();
  EXPECT_EQ(Read(FromHex("04 83 01 02"), &hdr), -1);
  EXPECT_EQ(hdr.tag, kAsn1OctetString);
  EXPECT_EQ(hdr.length, 0x0102u);
  EXPECT_EQ(hdr.payload, nullptr);
}

TEST(Asn1GetNext, RemainingBytesAreCountedIn32Bits) {
  // 4 GiB and 6 bytes. The header has 2 bytes, so the low 32 bits of the remaining length are 4.
  constexpr size_t kLength = (size_t{1} << 32) + 6;
  void* pages = mmap(nullptr, kLength, PROT_READ | PROT_WRITE,
                     MAP_PRIVATE | MAP_ANONYMOUS | MAP_NORESERVE, -1, 0);
  ASSERT_NE(pages, MAP_FAILED);
  auto* bytes = static_cast<uint8_t*>(pages);
  bytes[0] = der::kOctetString;
  asn1_hdr hdr;
  bytes[1] = 4;
  EXPECT_EQ(asn1_get_next(bytes, kLength, &hdr), 0);
  bytes[1] = 5;
  EXPECT_EQ(asn1_get_next(bytes, kLength, &hdr), -1);
  munmap(pages, kLength);
}

TEST(Asn1GetNext, EveryTruncationFailsWithoutReadingPastTheEnd) {
  const Bytes whole = Concat({FromHex("1f 81 82 03 84 00 00 00 05"), Bytes(5, 0xaa)});
  asn1_hdr hdr;
  EXPECT_EQ(Read(whole, &hdr), 0);
  for (size_t length = 0; length < whole.size(); ++length) {
    EXPECT_EQ(Read(Cut(whole, length), &hdr), -1) << length;
    EXPECT_EQ(hdr.payload, nullptr);
  }
}

TEST(Asn1GetNextBounded, LengthIsComparedWithTheBound) {
  const Bytes bytes = FromHex("04 05 aa");
  asn1_hdr hdr;
  EXPECT_EQ(asn1_get_next_bounded(bytes.data(), bytes.size(), 7, &hdr), 0);
  EXPECT_EQ(hdr.length, 5u);
  EXPECT_EQ(hdr.payload, bytes.data() + 2);
  EXPECT_EQ(asn1_get_next_bounded(bytes.data(), bytes.size(), 6, &hdr), -1);
}

TEST(Asn1GetNextBounded, HeaderMustEndWithinTheAvailableBytes) {
  const Bytes whole = FromHex("1f 81 01 82 00 01");
  asn1_hdr hdr;
  EXPECT_EQ(asn1_get_next_bounded(whole.data(), whole.size(), 100, &hdr), 0);
  for (size_t length = 0; length < whole.size(); ++length) {
    const GuardedBytes cut = Cut(whole, length);
    EXPECT_EQ(asn1_get_next_bounded(cut.data(), cut.size(), 100, &hdr), -1) << length;
    EXPECT_EQ(hdr.payload, nullptr);
  }
}

TEST(Asn1GetNextBounded, HeaderMustEndWithinTheBound) {
  const Bytes bytes = FromHex("04 00");
  asn1_hdr hdr;
  EXPECT_EQ(asn1_get_next_bounded(bytes.data(), bytes.size(), 2, &hdr), 0);
  EXPECT_EQ(asn1_get_next_bounded(bytes.data(), bytes.size(), 1, &hdr), -1);
  EXPECT_EQ(asn1_get_next_bounded(bytes.data(), bytes.size(), 0, &hdr), -1);
}

TEST(Asn1ParseOid, RsaEncryptionHasSevenArcsAndPrintsAsDottedText) {
  const Bytes contents = FromHex("2a 86 48 86 f7 0d 01 01 01");
  asn1_oid oid;
  EXPECT_EQ(asn1_parse_oid(contents.data(), contents.size(), &oid), 0);
  EXPECT_EQ(Arcs(oid), (std::vector<uint32_t>{1, 2, 840, 113549, 1, 1, 1}));
  EXPECT_EQ(Text(oid), "1.2.840.113549.1.1.1");
}

TEST(Asn1ParseOid, FirstValue120GivesArcs2And40) {
  asn1_oid oid;
  const uint8_t value = 120;
  EXPECT_EQ(asn1_parse_oid(&value, 1, &oid), 0);
  EXPECT_EQ(Arcs(oid), (std::vector<uint32_t>{2, 40}));
}

TEST(Asn1ParseOid, FirstValueIsSplitAtFortyAndEighty) {
  const std::pair<uint8_t, std::vector<uint32_t>> cases[] = {
      {0, {0, 0}}, {39, {0, 39}}, {40, {1, 0}}, {79, {1, 39}}, {80, {2, 0}}, {127, {2, 47}}};
  for (const auto& [value, arcs] : cases) {
    asn1_oid oid;
    EXPECT_EQ(asn1_parse_oid(&value, 1, &oid), 0);
    EXPECT_EQ(Arcs(oid), arcs);
  }
}

TEST(Asn1ParseOid, LargeFirstValueIsSplitBeforeItIsCut) {
  // The value is 2^32 + 80 = 0x100000050. In groups of seven bits, it is 10000 0000000 0000000
  // 0000000 1010000. The second arc is the value minus 80, which is 2^32. The low 32 bits of 2^32
  // are 0.
  const Bytes contents = FromHex("90 80 80 80 50");
  asn1_oid oid;
  EXPECT_EQ(asn1_parse_oid(contents.data(), contents.size(), &oid), 0);
  EXPECT_EQ(Arcs(oid), (std::vector<uint32_t>{2, 0}));
}

TEST(Asn1ParseOid, FirstValue2To32GivesArcs2AndFfffffb0) {
  // In groups of seven bits, 2^32 is 10000 and four groups of zeros. The second arc is 2^32 - 80 =
  // 0xffffffb0.
  const Bytes contents = FromHex("90 80 80 80 00");
  asn1_oid oid;
  EXPECT_EQ(asn1_parse_oid(contents.data(), contents.size(), &oid), 0);
  EXPECT_EQ(Arcs(oid), (std::vector<uint32_t>{2, 0xffffffb0}));
}

TEST(Asn1ParseOid, ArcKeepsItsLow32Bits) {
  // The last arc has ten octets with seven bits each. Only the lowest of the 70 bits is zero, so
  // the arc is 2^70 - 2.
  const Bytes contents = FromHex("2a ff ff ff ff ff ff ff ff ff 7e");
  asn1_oid oid;
  EXPECT_EQ(asn1_parse_oid(contents.data(), contents.size(), &oid), 0);
  EXPECT_EQ(Arcs(oid), (std::vector<uint32_t>{1, 2, 0xfffffffe}));
}

TEST(Asn1ParseOid, EmptyContentsGiveNoArcs) {
  asn1_oid oid = OidOf({1, 2, 3});
  EXPECT_EQ(asn1_parse_oid(nullptr, 0, &oid), 0);
  EXPECT_EQ(Arcs(oid), std::vector<uint32_t>());
  EXPECT_EQ(oid.oid[0], 0u);
}

TEST(Asn1ParseOid, ContentsThatEndWithinAnArcFail) {
  const Bytes whole = FromHex("2a 86 48");
  const GuardedBytes cut = Cut(whole, 2);
  asn1_oid oid;
  EXPECT_EQ(asn1_parse_oid(whole.data(), whole.size(), &oid), 0);
  EXPECT_EQ(asn1_parse_oid(cut.data(), cut.size(), &oid), -1);
  EXPECT_EQ(Arcs(oid), (std::vector<uint32_t>{1, 2}));
}

TEST(Asn1ParseOid, TwentyArcsAreAccepted) {
  const Bytes contents = Concat({{0x2a}, Bytes(18, 7)});
  asn1_oid oid;
  EXPECT_EQ(asn1_parse_oid(contents.data(), contents.size(), &oid), 0);
  EXPECT_EQ(oid.len, 20u);
  EXPECT_EQ(oid.oid[19], 7u);
}

TEST(Asn1ParseOid, TwentyOneArcsFail) {
  const Bytes contents = Concat({{0x2a}, Bytes(19, 7)});
  asn1_oid oid;
  EXPECT_EQ(asn1_parse_oid(contents.data(), contents.size(), &oid), -1);
  EXPECT_EQ(oid.len, 20u);
}

TEST(Asn1GetOid, ElementIsDecodedAndTheNextPositionStored) {
  const Bytes bytes = Concat({der::Oid("1.3.14.3.2.26"), der::Null()});
  asn1_oid oid;
  const uint8_t* next = nullptr;
  EXPECT_EQ(asn1_get_oid(bytes.data(), bytes.size(), &oid, &next), 0);
  EXPECT_EQ(Arcs(oid), (std::vector<uint32_t>{1, 3, 14, 3, 2, 26}));
  EXPECT_EQ(next, bytes.data() + 7);
}

TEST(Asn1GetOid, EmptyOidIsRefused) {
  const Bytes bytes = FromHex("06 00");
  asn1_oid oid;
  const uint8_t* next = nullptr;
  EXPECT_EQ(asn1_get_oid(bytes.data(), bytes.size(), &oid, &next), -1);
  EXPECT_EQ(next, nullptr);
}

TEST(Asn1GetOid, OtherOrTruncatedElementsAreRefused) {
  // Another tag, another class, an element that ends beyond the bytes, no bytes.
  for (const char* digits : {"05 01 2a", "86 01 2a", "06 02 2a", ""}) {
    const Bytes bytes = FromHex(digits);
    asn1_oid oid;
    const uint8_t* next = nullptr;
    EXPECT_EQ(asn1_get_oid(bytes.data(), bytes.size(), &oid, &next), -1) << digits;
    EXPECT_EQ(next, nullptr);
  }
}

TEST(Asn1GetOid, BadContentsFailAfterTheNextPositionIsStored) {
  const Bytes cut = FromHex("06 02 2a 86");
  const Bytes long_one = der::Element(der::kOid, Bytes(20, 1));
  asn1_oid oid;
  const uint8_t* next = nullptr;
  EXPECT_EQ(asn1_get_oid(cut.data(), cut.size(), &oid, &next), -1);
  EXPECT_EQ(next, cut.data() + 4);
  EXPECT_EQ(asn1_get_oid(long_one.data(), long_one.size(), &oid, &next), -1);
  EXPECT_EQ(next, long_one.data() + long_one.size());
}

TEST(Asn1OidToStr, TextThatDoesNotFitMayBeCutAfterADot) {
  char text[6] = {'x', 'x', 'x', 'x', 'x', 'x'};
  const asn1_oid oid = OidOf({1, 2, 840});
  asn1_oid_to_str(&oid, text, 5);
  EXPECT_EQ(memcmp(text, "1.2.\0x", 6), 0);
}

TEST(Asn1OidToStr, TextThatDoesNotFitMayBeCutWithinAnArc) {
  EXPECT_EQ(Text(OidOf({1, 2, 840, 7}), 7), "1.2.84");
}

TEST(Asn1OidToStr, TextThatJustFitsIsWhole) {
  EXPECT_EQ(Text(OidOf({1, 2, 840}), 8), "1.2.840");
  EXPECT_EQ(Text(OidOf({1, 2, 840}), 7), "1.2.84");
}

TEST(Asn1OidToStr, EverySizeOfTheBufferHoldsTheStartOfTheText) {
  const std::string whole = "1.2.840.113549.1.1.1";
  const asn1_oid oid = OidOf({1, 2, 840, 113549, 1, 1, 1});
  for (size_t size = 1; size <= whole.size() + 2; ++size) {
    const std::string behind(40, '!');
    std::string text = std::string(size, 'x') + behind;
    asn1_oid_to_str(&oid, text.data(), size);
    EXPECT_EQ(text.c_str(), whole.substr(0, size - 1));
    EXPECT_EQ(text[size - 1], '\0');
    EXPECT_EQ(text.substr(size), behind);
  }
}

TEST(Asn1OidToStr, WritesNothingWithoutRoom) {
  char text = 'x';
  const asn1_oid oid = OidOf({1, 2});
  asn1_oid_to_str(&oid, &text, 0);
  EXPECT_EQ(text, 'x');
  asn1_oid_to_str(&oid, &text, 1);
  EXPECT_EQ(text, '\0');
}

TEST(Asn1OidToStr, OidWithoutArcsGivesAnEmptyText) { EXPECT_EQ(Text(OidOf({})), ""); }

TEST(Asn1OidToStr, ArcsArePrintedAsUnsignedNumbers) {
  EXPECT_EQ(Text(OidOf({2, 4294967295})), "2.4294967295");
}

TEST(Asn1OidToStr, LastByteOfALargerBufferIsNul) {
  char text[8] = {'x', 'x', 'x', 'x', 'x', 'x', 'x', 'x'};
  const asn1_oid oid = OidOf({1, 2});
  asn1_oid_to_str(&oid, text, sizeof(text));
  EXPECT_EQ(memcmp(text, "1.2\0xxx\0", sizeof(text)), 0);
}

TEST(Asn1BitStringToLong, FirstBitIsBitZero) {
  EXPECT_EQ(asn1_bit_string_to_long(FromHex("07 80").data(), 2), 1u);
}

TEST(Asn1BitStringToLong, LastBitOfTheFirstByteIsBitSeven) {
  EXPECT_EQ(asn1_bit_string_to_long(FromHex("00 01").data(), 2), 0x80u);
}

TEST(Asn1BitStringToLong, FirstByteIsTheLowestAndBitsAreReversed) {
  // The bits of each byte are reversed: 0x12 = 00010010 becomes 01001000 = 0x48. In the same way,
  // 0x34 becomes 0x2c, 0x56 becomes 0x6a, and 0x78 becomes 0x1e. The first byte after the count of
  // unused bits becomes the lowest byte.
  EXPECT_EQ(asn1_bit_string_to_long(FromHex("00 12 34 56 78").data(), 5), 0x1e6a2c48u);
}

TEST(Asn1BitStringToLong, BytesBeyondTheFifthAreIgnored) {
  EXPECT_EQ(asn1_bit_string_to_long(FromHex("00 80 00 00 01 ff ff").data(), 7), 0x80000001u);
}

TEST(Asn1BitStringToLong, CountOfUnusedBitsIsIgnored) {
  EXPECT_EQ(asn1_bit_string_to_long(FromHex("ff ff").data(), 2), 0xffu);
}

TEST(Asn1BitStringToLong, LessThanTwoBytesGiveZero) {
  EXPECT_EQ(asn1_bit_string_to_long(nullptr, 0), 0u);
  EXPECT_EQ(asn1_bit_string_to_long(Bytes{0xff}.data(), 1), 0u);
}
