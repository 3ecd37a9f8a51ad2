// Tests the table of a manifest's sections: iteration, look-up, and repeated names.
#include "apk/manifest_sections.h"

#include <gtest/gtest.h>
#include <sys/mman.h>

#include <cstring>
#include <map>
#include <random>
#include <string>
#include <utility>
#include <vector>

namespace {

using Pairs = std::vector<std::pair<std::string, std::string>>;

// A table of sections, and the text that its attributes point into.
class Table {
 public:
  // Reserves `room` bytes, so that the text does not move when it grows.
  explicit Table(size_t room = 1 << 20) {
    text_.reserve(room);
    sections.reset(reinterpret_cast<const uint8_t*>(text_.data()), 0);
  }
  Table& Add(const std::string& name, const std::string& value) {
    sections.add({Put(name), Put(value)});
    return *this;
  }
  Table& End() {
    sections.endSection();
    return *this;
  }

  ManifestSections sections;

 private:
  ManifestPiece Put(const std::string& piece) {
    text_ += piece;
    EXPECT_LE(text_.size(), text_.capacity());
    return {static_cast<uint32_t>(text_.size() - piece.size()),
            static_cast<uint32_t>(piece.size())};
  }

  std::string text_;
};

Pairs PairsOf(const ManifestSection& section) { return Pairs(section.begin(), section.end()); }

TEST(ManifestSections, AreIteratedInTheirOrder) {
  Table table;
  table.Add("b", "1").End().End().Add("a", "2").Add("c", "3").End();
  std::vector<Pairs> walked;
  for (const ManifestSection& section : table.sections) walked.push_back(PairsOf(section));
  EXPECT_EQ((std::vector<Pairs>{{{"b", "1"}}, {}, {{"a", "2"}, {"c", "3"}}}), walked);
  EXPECT_EQ(3u, table.sections.size());
  EXPECT_EQ(walked[2], PairsOf(table.sections[2]));
}

TEST(ManifestSections, OpenSectionIsNotCounted) {
  Table table;
  table.Add("a", "1").End().Add("b", "2");
  EXPECT_EQ(1u, table.sections.size());
  EXPECT_EQ(Pairs({{"a", "1"}}), PairsOf(table.sections[0]));
}

TEST(ManifestSections, AreEmptyAtFirstAndAfterReset) {
  ManifestSections fresh;
  EXPECT_EQ(0u, fresh.size());
  EXPECT_FALSE(fresh.begin() != fresh.end());
  Table table;
  table.Add("a", "1").End().sections.reset(nullptr, 0);
  EXPECT_EQ(0u, table.sections.size());
}

TEST(ManifestSection, AttributesAreInByteOrderOfTheirNames) {
  Table table;
  table.Add("b", "1").Add("\xff", "2").Add("B", "3").Add("ab", "4").Add("a", "5").End();
  EXPECT_EQ(Pairs({{"B", "3"}, {"a", "5"}, {"ab", "4"}, {"b", "1"}, {"\xff", "2"}}),
            PairsOf(table.sections[0]));
}

TEST(ManifestSection, FindsAnAttributeByItsWholeName) {
  Table table;
  table.Add("ab", "1").Add("a", "2").Add("c", "3").End();
  const ManifestSection section = table.sections[0];
  EXPECT_EQ("2", section.find("a"));
  EXPECT_EQ("1", section.find("ab"));
  EXPECT_EQ("3", section.find("c"));
  for (const char* name : {"", "A", "abc", "b", "d"}) EXPECT_EQ("", section.find(name)) << name;
}

TEST(ManifestSection, FindsTheLastNameWithTheSuffix) {
  Table table;
  table.Add("SHA1-X", "1")
      .Add("SHA-256-X", "2")
      .Add("Z", "3")
      .Add("-Y", "4")
      .Add("SHA9-XX", "5")
      .End();
  const ManifestSection section = table.sections[0];
  EXPECT_EQ(std::make_pair(std::string_view("SHA1-X"), std::string_view("1")),
            section.findLastEndingIn("-X"));
  EXPECT_EQ("4", section.findLastEndingIn("-Y").second);
  EXPECT_EQ("3", section.findLastEndingIn("").second);
  EXPECT_EQ(std::make_pair(std::string_view(), std::string_view()), section.findLastEndingIn("-Q"));
}

// The test has many equal names, because a wrong sort can leave a few equal names in order by
// chance. Some sections are large, so that the table's memory grows while a section is open.
TEST(ManifestSection, LastOfEqualNamesCounts) {
  std::mt19937 random(1);
  Table table(8 << 20);
  std::vector<std::map<std::string, std::string>> expected;
  for (int count : {2, 16, 17, 40, 500, 1, 5000, 63, 64, 65, 20000}) {
    expected.emplace_back();
    for (int i = 0; i < count; ++i) {
      const std::string name =
          "name" + std::to_string(random() % (1 + static_cast<uint32_t>(count) / 4));
      expected.back()[name] = std::to_string(i + 1);
      table.Add(name, std::to_string(i + 1));
    }
    table.End();
  }
  ASSERT_EQ(expected.size(), table.sections.size());
  for (size_t i = 0; i < expected.size(); ++i) {
    EXPECT_EQ(Pairs(expected[i].begin(), expected[i].end()), PairsOf(table.sections[i])) << i;
  }
}

// Two long names that differ only in their last byte come before very many short names. The
// addition of the second long name compares the long names once. While the short names are added,
// the long names are unreadable, so a comparison of a long name would crash. No such comparison is
// allowed in the 2 * kLength bytes from the start of the second long name. All short names start in
// these bytes.
TEST(ManifestSection, LongNamesAreNotComparedAgainForEachShortName) {
  constexpr uint32_t kLength = 1 << 20;
  constexpr size_t kAll = 3 * kLength;
  void* const memory =
      mmap(nullptr, kAll, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
  ASSERT_NE(MAP_FAILED, memory);
  auto* const text = static_cast<uint8_t*>(memory);
  memset(text, 'B', kAll);
  text[kLength - 1] = 'A';
  const ManifestPiece value = {2 * kLength, 1};
  ManifestSections sections;
  sections.reset(text, 0);
  sections.add({{0, kLength}, value});
  sections.add({{kLength, kLength}, value});

  ASSERT_EQ(0, mprotect(text, 2 * kLength, PROT_NONE));
  for (uint32_t start = 2 * kLength; start < kAll; start += 4) sections.add({{start, 1}, value});
  ASSERT_EQ(0, mprotect(text, 2 * kLength, PROT_READ));
  sections.endSection();
  EXPECT_EQ(3u, sections[0].size());
  EXPECT_EQ("B", sections[0].find("B"));
  munmap(memory, kAll);
}

}  // namespace
