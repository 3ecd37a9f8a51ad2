#include "simulator/show/protection_bar.h"

#include <gtest/gtest.h>

#include <cstdint>

using namespace simulator;

namespace {

Protection WithShares(Share verified, Share vouched, Share unlisted, Share signature) {
  Protection protection;
  protection.verified = verified;
  protection.vouched = vouched;
  protection.unlisted = unlisted;
  protection.signature = signature;
  return protection;
}

std::vector<double> Percents(const std::vector<DrawnPart>& parts) {
  std::vector<double> percents;
  for (const DrawnPart& part : parts) percents.push_back(part.percent);
  return percents;
}

}  // namespace

// The file has 1000 bytes, and 100 of them are between the entries.
TEST(ProtectionBar, HasEachPartAndTheBytesBetweenTheEntries) {
  const auto parts = DrawBar(WithShares({1, 400}, {2, 300}, {3, 150}, {4, 50}), 1000);
  EXPECT_EQ(Percents(parts), std::vector<double>({40, 30, 15, 5, 10}));
  EXPECT_EQ(parts[4].share.bytes, 100U);
  EXPECT_FALSE(parts[4].has_entries);
}

// The bar is 100 wide. Each of its five parts is at least 0.75 wide, and the parts share the
// remaining 96.25 by their bytes. The first part has half of the bytes: 0.75 + 96.25 / 2 = 48.875.
TEST(ProtectionBar, FillsItsWidthAndShowsASingleByte) {
  const auto parts = DrawBar(WithShares({1, 500'000}, {1, 499'000}, {1, 1}, {1, 499}), 1'000'000);
  EXPECT_DOUBLE_EQ(parts[0].width, 48.875);
  double end = 0;
  for (const DrawnPart& part : parts) {
    EXPECT_DOUBLE_EQ(part.start, end);
    EXPECT_GE(part.width, 0.75);
    end = part.start + part.width;
  }
  EXPECT_NEAR(end, 100, 1e-9);
}

TEST(ProtectionBar, GivesEmptyPartsNoWidth) {
  const auto parts = DrawBar(WithShares({}, {1, 1000}, {}, {}), 1000);
  EXPECT_EQ(Percents(parts), std::vector<double>({0, 100, 0, 0, 0}));
  EXPECT_EQ(parts[0].width, 0);
  EXPECT_EQ(parts[1].start, 0);
  EXPECT_DOUBLE_EQ(parts[1].width, 100);
}

// Entries of an archive can overlap. Together they can then have more bytes than the file.
TEST(ProtectionBar, AcceptsMoreBytesThanTheFileHas) {
  const auto parts = DrawBar(WithShares({1, UINT64_MAX}, {1, UINT64_MAX}, {}, {}), 1000);
  EXPECT_EQ(Percents(parts), std::vector<double>({50, 50, 0, 0, 0}));
}

TEST(ProtectionBar, IsEmptyWithoutEntriesAndAllZeroWithoutBytes) {
  EXPECT_TRUE(DrawBar({}, 1000).empty());
  const auto empty = DrawBar(WithShares({1, 0}, {}, {}, {}), 0);
  EXPECT_EQ(Percents(empty), std::vector<double>({0, 0, 0, 0, 0}));
}

TEST(ProtectionBar, HasAPartForEachKindOfFault) {
  Protection protection = WithShares({1, 400}, {}, {}, {});
  protection.differing = {2, 300};
  protection.uncompared = {1, 200};
  protection.missing_names = {"a", "b", "c"};
  std::string codes;
  for (const DrawnPart& part : DrawBar(protection, 1000)) {
    codes += part.code + std::string(" ") + std::to_string(part.share.entries) + ", ";
  }
  EXPECT_EQ(codes,
            "verified 1, vouched 0, differing 2, uncompared 1, missing 3, unlisted 0, signature 0, "
            "between 0, ");
  EXPECT_EQ(Percents(DrawBar(protection, 1000))[2], 30);
}
