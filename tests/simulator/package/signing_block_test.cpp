#include "simulator/package/signing_block.h"

#include <gtest/gtest.h>

#include "support/files.h"
#include "support/signing_block.h"
#include "support/zip.h"

using namespace simulator;

namespace {

std::string_view View(const Bytes& bytes) {
  return {reinterpret_cast<const char*>(bytes.data()), bytes.size()};
}

// "scheme certificate" for each signer, then "damaged" if the block is damaged.
std::vector<std::string> Read(const Bytes& block) {
  const SigningBlock parsed = ParseSigningBlock(View(block));
  std::vector<std::string> lines;
  for (const NewerSigner& signer : parsed.signers) {
    lines.push_back(std::string(signer.scheme) + " " + std::string(signer.certificate));
  }
  if (parsed.is_damaged) lines.emplace_back("damaged");
  return lines;
}

using Lines = std::vector<std::string>;

const Bytes kSigner = SignerBytes(ToBytes("CERT"));

}  // namespace

TEST(SigningBlock, EachSchemeHasItsSigners) {
  const Bytes block = SigningBlockBytes(
      {{kSchemeV2, Signers({kSigner})},
       {0x42726577, Bytes(4000, 0)},  // padding
       {kSchemeV3, Signers({SignerBytes(ToBytes("A")), SignerBytes(ToBytes("B"))})},
       {kSchemeV31, Signers({kSigner})}});
  EXPECT_EQ(Read(block), Lines({"v2 CERT", "v3 A", "v3 B", "v3.1 CERT"}));
}

TEST(SigningBlock, EmptyInputHasNoSignersAndNoDamage) { EXPECT_EQ(Read({}), Lines()); }

// The platform uses the first value of a scheme, and ignores other values of the same scheme.
TEST(SigningBlock, FirstOfTwoValuesForASchemeCounts) {
  const Bytes own = Signers({SignerBytes(ToBytes("OWN"))});
  const Bytes other = Signers({SignerBytes(ToBytes("OTHER"))});
  EXPECT_EQ(Read(SigningBlockBytes({{kSchemeV2, own}, {kSchemeV2, other}, {kSchemeV3, other}})),
            Lines({"v2 OWN", "v3 OTHER"}));
  EXPECT_EQ(Read(SigningBlockBytes({{kSchemeV2, own}, {kSchemeV2, {}}})), Lines({"v2 OWN"}));
}

TEST(SigningBlock, SchemeWithoutSignersIsDamage) {
  EXPECT_EQ(Read(SigningBlockBytes({{kSchemeV2, Signers({})}})), Lines({"damaged"}));
}

TEST(SigningBlock, HasNoSignersWithoutAKnownScheme) {
  EXPECT_EQ(Read(SigningBlockBytes({{7, ToBytes("whatever")}})), Lines());
  EXPECT_EQ(Read(SigningBlockBytes({})), Lines());
}

TEST(SigningBlock, DamageKeepsTheSignersBeforeIt) {
  const Bytes good = Signers({kSigner});
  Bytes cut = good;
  cut.pop_back();
  EXPECT_EQ(Read(SigningBlockBytes({{kSchemeV2, good}, {kSchemeV3, cut}})),
            Lines({"v2 CERT", "damaged"}));
  EXPECT_EQ(Read(SigningBlockBytes({{kSchemeV2, {}}})), Lines({"damaged"}));
  EXPECT_EQ(Read(Bytes(31, 0)), Lines({"damaged"}));
}

// Each of these blocks has one length that reaches past the end of the enclosing element.
TEST(SigningBlock, LengthsThatReachTooFarAreDamage) {
  const Bytes whole = Signers({kSigner});
  for (size_t field : {0, 4, 8, 12, 16, 20}) {
    Bytes value = whole;
    value[field + 3] = 0x7f;
    EXPECT_EQ(Read(SigningBlockBytes({{kSchemeV2, value}})), Lines({"damaged"})) << field;
  }
  Bytes block = SigningBlockBytes({{kSchemeV2, whole}});
  block[8 + 7] = 0xff;  // the highest byte of the pair's length
  EXPECT_EQ(Read(block), Lines({"damaged"}));
}

TEST(SigningBlock, SignersAfterThe16thAreNotRead) {
  const std::vector<Bytes> many(17, kSigner);
  EXPECT_EQ(Read(SigningBlockBytes({{kSchemeV2, Signers(many)}})).size(), 17U);
  EXPECT_EQ(Read(SigningBlockBytes({{kSchemeV2, Signers(many)}})).back(), "damaged");
}

namespace {

// Returns the result of ReadSigningBlock() for an archive with `block` before its central
// directory.
std::string ReadFrom(const Bytes& block, const std::string& comment = "",
                     bool expect_too_large = false) {
  const MemoryFile file(ArchiveWithBlock(BuildZip({{"a", ToBytes("data")}}), block, comment));
  const auto end = FindArchiveEnd(file.fd());
  if (!end) return "no end";
  bool is_too_large = !expect_too_large;
  const std::string read = ReadSigningBlock(file.fd(), *end, &is_too_large);
  EXPECT_EQ(is_too_large, expect_too_large);
  return read;
}

// A signing block that has `size` bytes after its first size field.
Bytes BlockOfSize(uint64_t size) {
  // Subtracts the second size, the magic, and the size and the ID of the pair.
  return SigningBlockBytes({{7, Bytes(static_cast<size_t>(size) - 8 - 16 - 8 - 4, 0)}});
}

}  // namespace

TEST(ReadSigningBlock, FindsItBeforeTheCentralDirectory) {
  const Bytes block = SigningBlockBytes({{kSchemeV2, Signers({kSigner})}});
  EXPECT_EQ(ReadFrom(block), View(block));
  EXPECT_EQ(ReadFrom(block, "a comment with PK in it"), View(block));
}

TEST(ReadSigningBlock, FindsNothingWithoutMagicOrRoom) {
  Bytes block = SigningBlockBytes({{kSchemeV2, Signers({kSigner})}});
  EXPECT_EQ(ReadFrom({}), "");
  Bytes other = block;
  other.back() = '3';
  EXPECT_EQ(ReadFrom(other), "");
  Bytes too_long = block;
  too_long[too_long.size() - 18] = 0x7f;  // the second highest byte of the second size field
  EXPECT_EQ(ReadFrom(too_long), "");
  Bytes too_short = block;
  for (size_t i = 0; i < 8; ++i) too_short[too_short.size() - 24 + i] = 0;
  EXPECT_EQ(ReadFrom(too_short), "");
}

// The platform accepts a block only if the size fields at its start and at its end are equal.
TEST(ReadSigningBlock, FindsNothingIfTheTwoSizesDiffer) {
  Bytes block = SigningBlockBytes({{kSchemeV2, Signers({kSigner})}});
  ++block[0];
  EXPECT_EQ(ReadFrom(block), "");
}

TEST(ReadSigningBlock, ReadsBlocksOfAtMost16Mebibytes) {
  const Bytes largest = BlockOfSize(kMostBlockBytes);
  EXPECT_EQ(ReadFrom(largest), View(largest));
  EXPECT_EQ(ReadFrom(BlockOfSize(kMostBlockBytes + 1), "", true), "");
}
