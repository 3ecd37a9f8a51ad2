#include "apk/manifest_mf.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>
#include <map>
#include <random>
#include <string>
#include <vector>

#include "support/files.h"
#include "support/log_capture.h"

namespace {

using Section = std::map<std::string, std::string>;
using Sections = std::vector<Section>;

// Copies the sections into maps. Checks that the attributes of each section are sorted by name,
// because a map would hide a wrong order.
Sections SectionsOf(const ManifestMf& manifest) {
  Sections sections;
  for (const ManifestMf::Section& section : manifest.getSections()) {
    EXPECT_TRUE(std::is_sorted(section.begin(), section.end()));
    sections.emplace_back(section.begin(), section.end());
    EXPECT_EQ(sections.back().size(), section.size());
  }
  return sections;
}

// The text of a string literal, NULs included.
template <size_t n>
std::string Text(const char (&literal)[n]) {
  return std::string(literal, n - 1);
}

// The sections of `text`, which must parse without a message.
Sections Parse(const std::string& text) {
  LogCapture log;
  ManifestMf manifest;
  EXPECT_TRUE(manifest.load(text));
  EXPECT_TRUE(static_cast<bool>(manifest));
  EXPECT_EQ(Records(), log.records());
  return SectionsOf(manifest);
}

// Expects that `text` does not parse, that `message` is logged, and that `sections` are the
// sections before the fault.
void ExpectFault(const std::string& text, const std::string& message,
                 const Sections& sections = {}) {
  LogCapture log;
  ManifestMf manifest;
  EXPECT_FALSE(manifest.load(text));
  EXPECT_FALSE(static_cast<bool>(manifest));
  EXPECT_EQ(Records({Error(message)}), log.records());
  EXPECT_EQ(sections, SectionsOf(manifest));
}

void ExpectNoColon(const std::string& text, const std::string& name,
                   const Sections& sections = {}) {
  ExpectFault(text,
              "Parse manifest: Error: P_KEY: unexpected end of file after key '" + name + "'\n",
              sections);
}

TEST(ManifestMf, FreshObjectIsInvalidAndEmpty) {
  const ManifestMf manifest;
  EXPECT_FALSE(static_cast<bool>(manifest));
  EXPECT_TRUE(SectionsOf(manifest).empty());
}

TEST(ManifestMf, LoadReplacesTheEarlierResult) {
  ManifestMf manifest;
  EXPECT_TRUE(manifest.load("A: 1\r\n\r\n"));
  EXPECT_TRUE(manifest.load("B: 2\r\n\r\n"));
  EXPECT_EQ(Sections({{{"B", "2"}}}), SectionsOf(manifest));
  EXPECT_FALSE(manifest.load("Key:x"));
  EXPECT_FALSE(static_cast<bool>(manifest));
  EXPECT_TRUE(SectionsOf(manifest).empty());
  EXPECT_TRUE(manifest.load("A: 1\r\n\r\n"));
  EXPECT_TRUE(static_cast<bool>(manifest));
  EXPECT_EQ(Sections({{{"A", "1"}}}), SectionsOf(manifest));
}

// For every pair of the texts below, loads both into one object, one after the other. Some texts do
// not parse. Leftovers of the first text would show in the result of the second.
TEST(ManifestMf, EarlierTextDoesNotAffectTheNext) {
  std::string many = "Longer-Name: longer value\r\n\r\n";
  for (int i = 0; i < 50; ++i) many += "B" + std::to_string(i) + ": 1\r\nC: 2\r\n\r\n";
  const std::string texts[] = {"",
                               "Key:\r\n\r\n",
                               "A: 1\r\n\r\n",
                               "BB: 22\r\nCCC: 333\r\n\r\nD: 4\r\n\r\n\r\n",
                               "Unfinished: 1\r\nSection: 2\r\n",
                               "A: 1\r\n\r\nB: 2\r\nKey:x",
                               many};
  LogCapture log;
  for (const std::string& first : texts) {
    for (const std::string& second : texts) {
      ManifestMf fresh, used;
      const bool parses = fresh.load(second);
      used.load(first);
      EXPECT_EQ(parses, used.load(second)) << second;
      EXPECT_EQ(parses, static_cast<bool>(used)) << second;
      EXPECT_EQ(SectionsOf(fresh), SectionsOf(used)) << first << " then " << second;
    }
  }
}

// The memory after the text contains bytes that would change the result if they were read.
TEST(ManifestMf, BytesAfterTheTextAreNotRead) {
  LogCapture log;
  const std::string whole = "Name: abcdefghijklm\r\n nopq\r\nKey: 1\r\n\r\nB:\r\n\r\n";
  for (size_t length = 0; length <= whole.size(); ++length) {
    ManifestMf expected;
    const bool parses = expected.load(whole.substr(0, length));
    for (const char behind : {'\0', '\n', '\r', ' ', ':', 'x'}) {
      Bytes text(length + 20, static_cast<uint8_t>(behind));
      std::copy_n(whole.begin(), length, text.begin());
      text.resize(length);
      ManifestMf manifest;
      EXPECT_EQ(parses, manifest.load(std::move(text))) << length << behind;
      EXPECT_EQ(SectionsOf(expected), SectionsOf(manifest)) << length << behind;
    }
  }
}

TEST(ManifestMf, EmptyTextHasNoSections) { EXPECT_EQ(Sections(), Parse("")); }

TEST(ManifestMf, LineBreaksAndSpacesAloneHaveNoSections) {
  EXPECT_EQ(Sections(), Parse("\r\n \n\r   \r\r\n\n "));
}

TEST(ManifestMf, EmptyLineEndsTheSection) {
  EXPECT_EQ(Sections({{{"Manifest-Version", "1.0"}}}), Parse("Manifest-Version: 1.0\r\n\r\n"));
}

TEST(ManifestMf, SectionWithoutTheFinalEmptyLineIsDropped) {
  EXPECT_EQ(Sections(), Parse("Manifest-Version: 1.0\r\n"));
  EXPECT_EQ(Sections(), Parse("Manifest-Version: 1.0"));
  EXPECT_EQ(Sections({{{"A", "1"}}}), Parse("A: 1\r\n\r\nName: x\r\nSHA1-Digest: y\r\n"));
}

TEST(ManifestMf, SectionsKeepTheOrderOfTheText) {
  EXPECT_EQ(Sections({{{"A", "1"}}, {{"Name", "z"}, {"B", "2"}}, {{"Name", "a"}}}),
            Parse("A: 1\r\n\r\nName: z\r\nB: 2\r\n\r\nName: a\r\n\r\n"));
}

TEST(ManifestMf, AttributesOfASectionAreInByteOrderOfTheirNames) {
  const Sections sections = Parse("b: 1\r\nab: 2\r\n\xC3\xA4: 3\r\na: 4\r\nB: 5\r\na-: 6\r\n\r\n");
  ASSERT_EQ(1U, sections.size());
  std::vector<std::string> names;
  for (const auto& [name, value] : sections[0]) names.push_back(name);
  EXPECT_EQ(std::vector<std::string>({"B", "a", "a-", "ab", "b", "\xC3\xA4"}), names);
}

TEST(ManifestMf, LaterOfTwoEqualNamesWins) {
  EXPECT_EQ(Sections({{{"A", "2"}}}), Parse("A: 1\r\nA: 2\r\n\r\n"));
}

TEST(ManifestMf, NamesThatDifferInCaseAreBothKept) {
  EXPECT_EQ(Sections({{{"A", "1"}, {"a", "2"}}}), Parse("A: 1\r\na: 2\r\n\r\n"));
}

TEST(ManifestMf, EqualNamesInTwoSectionsAreBothKept) {
  EXPECT_EQ(Sections({{{"A", "1"}}, {{"A", "2"}}}), Parse("A: 1\r\n\r\nA: 2\r\n\r\n"));
}

TEST(ManifestMf, LineThatBeginsWithASpaceContinuesTheValue) {
  EXPECT_EQ(Sections({{{"Name", "lib/x.soSHA1-Digest: q"}}}),
            Parse("Name: lib/x.so\r\n SHA1-Digest: q\r\n\r\n"));
}

TEST(ManifestMf, SeveralLinesContinueAValue) {
  EXPECT_EQ(Sections({{{"A", "onetwo three"}, {"B", "2"}}}),
            Parse("A: one\r\n two\r\n  three\r\n \r\nB: 2\r\n\r\n"));
}

// The joined value is one piece of the manifest's own text. It begins right after "A: ".
TEST(ManifestMf, ContinuationLinesMoveUpToTheirValue) {
  ManifestMf manifest;
  EXPECT_TRUE(manifest.load(std::string("A: 1\r\n 23\n 45\r\n\r\n")));
  ASSERT_EQ(1u, manifest.getSections().size());
  const auto [name, value] = *manifest.getSections()[0].begin();
  EXPECT_EQ("A", name);
  EXPECT_EQ("12345", value);
  EXPECT_EQ(name.data() + 3, value.data());
}

TEST(ManifestMf, ContinuationLineCanBeginTheValue) {
  EXPECT_EQ(Sections({{{"Key", "value"}}}), Parse("Key:\r\n value\r\n\r\n"));
}

TEST(ManifestMf, OnlyOneSpaceAfterTheColonIsDropped) {
  EXPECT_EQ(Sections({{{"Key", " two spaces"}}}), Parse("Key:  two spaces\r\n\r\n"));
}

TEST(ManifestMf, SpacesAtTheEndOfAValueStay) {
  EXPECT_EQ(Sections({{{"Key", "v  "}}}), Parse("Key: v  \r\n\r\n"));
}

TEST(ManifestMf, SpaceOrTabAfterANameStays) {
  EXPECT_EQ(Sections({{{"A ", "1"}, {"B\t", "2"}}}), Parse("A : 1\r\nB\t: 2\r\n\r\n"));
}

TEST(ManifestMf, ColonsInAValueBelongToIt) {
  EXPECT_EQ(Sections({{{"A", "1: 2:x"}}}), Parse("A: 1: 2:x\r\n\r\n"));
}

TEST(ManifestMf, LongNameAndLongValueAreReadWhole) {
  const std::string name(5000, 'n');
  const std::string value(70000, 'v');
  EXPECT_EQ(Sections({{{name, value}}}), Parse(name + ": " + value + "\r\n\r\n"));
}

TEST(ManifestMf, BytesAboveAsciiAreKept) {
  EXPECT_EQ(Sections({{{"\xFF\x80", "\xC3\xA4\x01"}}}), Parse("\xFF\x80: \xC3\xA4\x01\r\n\r\n"));
}

TEST(ManifestMf, LetterOrTabAfterAColonFails) {
  ExpectFault("Key:x", "Parse manifest: Error: P_COLON: unexpected 0x78 after colon: x\n");
  ExpectFault("Key:\tx\r\n\r\n",
              "Parse manifest: Error: P_COLON: unexpected 0x09 after colon: \t\n");
}

// The log record ends at the NUL that the message has in place of the missing byte.
TEST(ManifestMf, ColonAtTheEndOfTheTextFails) {
  ExpectFault("Key:", "Parse manifest: Error: P_COLON: unexpected 0x00 after colon: ");
}

TEST(ManifestMf, NulAfterAColonFails) {
  ExpectFault(Text("Key:\0 v\r\n\r\n"),
              "Parse manifest: Error: P_COLON: unexpected 0x00 after colon: ");
}

TEST(ManifestMf, ByteAfterAColonIsReportedAsUnsigned) {
  ExpectFault("Key:\xFF", "Parse manifest: Error: P_COLON: unexpected 0xff after colon: \xFF\n");
}

TEST(ManifestMf, NameThatRunsIntoTheEndOfTheTextFails) {
  ExpectNoColon("NoColonHere", "NoColonHere");
  ExpectNoColon("A: 1\r\nNoColonHere\r\n", "NoColonHere\r\n");
}

// A log record has room for 1023 bytes of text and a NUL. A longer message is cut after 1023 bytes.
// Without the name, the message takes 66 bytes.
TEST(ManifestMf, NameThatRunsIntoTheEndIsReportedInAtMost1023Bytes) {
  const std::string before = "Parse manifest: Error: P_KEY: unexpected end of file after key '";
  std::string name;
  for (int i = 0; name.size() < 5000; ++i) name += std::to_string(i) + " ";
  for (size_t length : {39, 40, 41, 255, 1023 - 67, 1023 - 66, 1023, 1024, 1025, 5000}) {
    const std::string key = name.substr(0, length);
    ExpectFault(key, (before + key + "'\n").substr(0, 1023));
  }
}

TEST(ManifestMf, NameThatRunsIntoANulFails) {
  ExpectNoColon(Text("Na\0me: v\r\n\r\n"), "Na");
  ExpectNoColon(Text("\0Name: v\r\n\r\n"), "");
  ExpectNoColon(Text("A: 1\r\n\0B: 2\r\n\r\n"), "");
}

TEST(ManifestMf, LineWithoutAColonIsTheFrontPartOfTheNextName) {
  EXPECT_EQ(Sections({{{"Bad line\r\nKey", "v"}}}), Parse("Bad line\r\nKey: v\r\n\r\n"));
}

TEST(ManifestMf, EmptyLineWithinANameDoesNotEndTheSection) {
  EXPECT_EQ(Sections({{{"A", "1"}, {"Bad\r\n\r\nName", "v"}}}),
            Parse("A: 1\r\nBad\r\n\r\nName: v\r\n\r\n"));
}

TEST(ManifestMf, SectionsBeforeAFaultStay) {
  ExpectFault("A: 1\r\n\r\nB: 2\r\nKey:x",
              "Parse manifest: Error: P_COLON: unexpected 0x78 after colon: x\n", {{{"A", "1"}}});
  ExpectNoColon("A: 1\r\n\r\nB", "B", {{{"A", "1"}}});
}

TEST(ManifestMf, PairWithoutAValueIsDropped) {
  EXPECT_EQ(Sections({{{"A", "1"}}}), Parse("Created-By:\r\nA: 1\r\n\r\n"));
  EXPECT_EQ(Sections({{{"A", "1"}}}), Parse("Created-By: \r\nA: 1\r\n\r\n"));
}

TEST(ManifestMf, PairWithoutANameIsDropped) {
  EXPECT_EQ(Sections({{{"A", "1"}}}), Parse(": v\r\nA: 1\r\n\r\n"));
}

TEST(ManifestMf, EmptyValueDoesNotReplaceAnEarlierOne) {
  EXPECT_EQ(Sections({{{"A", "1"}}}), Parse("A: 1\r\nA:\r\n\r\n"));
}

TEST(ManifestMf, SectionWhoseOnlyPairIsDroppedCounts) {
  EXPECT_EQ(Sections({{}}), Parse("Key:\r\n\r\n"));
  EXPECT_EQ(Sections({{}, {{"A", "1"}}}), Parse("Key:\r\n\r\nA: 1\r\n\r\n"));
}

TEST(ManifestMf, ExtraEmptyLinesAndSpacesBeforeSectionsAreSkipped) {
  EXPECT_EQ(Sections({{{"A", "1"}}, {{"B", "2"}}}),
            Parse("\r\n A: 1\r\n\r\n\r\n  \r\n \n\rB: 2\r\n\r\n"));
}

TEST(ManifestMf, LoneLineFeedAfterAColonLosesTheFirstByteOfTheNextName) {
  EXPECT_EQ(Sections({{{"ame", "x"}}}), Parse("A:\nName: x\n\n"));
}

TEST(ManifestMf, LoneCarriageReturnAfterAColonLosesTheFirstByteOfTheNextName) {
  EXPECT_EQ(Sections({{{"ame", "x"}}}), Parse("A:\rName: x\r\r"));
}

TEST(ManifestMf, LoneLineFeedAfterAValueLosesNothing) {
  EXPECT_EQ(Sections({{{"A", "1"}, {"Name", "x"}}}), Parse("A: 1\nName: x\n\n"));
}

// The second LF after "A:" counts as the line break, and "Name" follows in the same section.
TEST(ManifestMf, EmptyLineAfterAColonAndALoneLineFeedIsNotSeen) {
  EXPECT_EQ(Sections({{{"B", "1"}, {"Name", "x"}}}), Parse("B: 1\nA:\n\nName: x\n\n"));
}

// The space counts as the line break, and "value" begins a name.
TEST(ManifestMf, ContinuationAfterAColonAndALoneLineFeedIsAName) {
  EXPECT_EQ(Sections({{{"value\nName", "x"}}}), Parse("A:\n value\nName: x\n\n"));
}

// The next line begins with "N". This "N" and the LF after it count together as one line break.
TEST(ManifestMf, OneByteLineAfterAColonAndALoneLineFeedIsLostWithItsLineBreak) {
  EXPECT_EQ(Sections({{{"Name", "x"}}}), Parse("A:\nN\nName: x\n\n"));
}

TEST(ManifestMf, LineBreakOrSpaceAfterAFinalColonSucceeds) {
  EXPECT_EQ(Sections(), Parse("A:\n"));
  EXPECT_EQ(Sections(), Parse("A:\r"));
  EXPECT_EQ(Sections(), Parse("A: "));
}

TEST(ManifestMf, EveryKindOfLineBreakEndsLinesAndSections) {
  for (const std::string eol : {"\r\n", "\n\r", "\n", "\r"}) {
    EXPECT_EQ(Sections({{{"A", "1x"}, {"B", "2"}}, {{"C", "3"}}}),
              Parse("A: 1" + eol + " x" + eol + "B: 2" + eol + eol + "C: 3" + eol + eol))
        << testing::PrintToString(eol);
  }
}

// Tests every byte at every position of values of 1 to 24 bytes.
TEST(ManifestMf, OnlyCrOrLfOrNulEndsALine) {
  for (size_t length = 1; length <= 24; ++length) {
    for (size_t at = 0; at < length; ++at) {
      for (int byte = 0; byte < 256; ++byte) {
        std::string value(length, '\xFE');
        value[at] = static_cast<char>(byte);
        if (byte == '\0' || byte == '\r' || byte == '\n') value.insert(at + 1, 1, ' ');
        std::string joined(length, '\xFE');
        joined[at] = static_cast<char>(byte);
        if (value != joined) joined.erase(at, 1);
        const Sections expected = joined.empty() ? Sections({{}}) : Sections({{{"A", joined}}});
        ASSERT_EQ(expected, Parse("A: " + value + "\r\n\r\n"))
            << length << " " << at << " " << byte;
      }
    }
  }
}

TEST(ManifestMf, LineFeedAndCrLfAfterAValueAreALineBreakAndAnEmptyLine) {
  EXPECT_EQ(Sections({{{"A", "1"}}, {{"B", "2"}}}), Parse("A: 1\n\r\nB: 2\n\r\n"));
}

TEST(ManifestMf, CarriageReturnAndCrLfAfterAValueAreALineBreakAndAnEmptyLine) {
  EXPECT_EQ(Sections({{{"A", "1"}}, {{"B", "2"}}}), Parse("A: 1\r\r\nB: 2\r\r\n"));
}

TEST(ManifestMf, TabAfterAnEmptyLineStartsAName) {
  EXPECT_EQ(Sections({{{"A", "1"}}, {{"\tB", "2"}}}), Parse("A: 1\r\n\r\n\tB: 2\r\n\r\n"));
}

TEST(ManifestMf, TabAtTheStartOfALineStartsAName) {
  EXPECT_EQ(Sections({{{"A", "1"}, {"\tB", "2"}}}), Parse("A: 1\r\n\tB: 2\r\n\r\n"));
}

TEST(ManifestMf, NulInAValueIsALineBreak) {
  EXPECT_EQ(Sections({{{"A", "1"}, {"B", "2"}}}), Parse(Text("A: 1\0B: 2\r\n\r\n")));
  EXPECT_EQ(Sections({{{"A", "12"}}}), Parse(Text("A: 1\0 2\r\n\r\n")));
}

// A NUL and a CR or LF after it are one line break, like CR LF. The second of two NULs starts a
// name.
TEST(ManifestMf, NulAndTheCrOrLfAfterItAreOneLineBreak) {
  EXPECT_EQ(Sections({{{"A", "1"}, {"B", "2"}}}), Parse(Text("A: 1\0\nB: 2\r\n\r\n")));
  EXPECT_EQ(Sections({{{"A", "1"}}, {{"B", "2"}}}), Parse(Text("A: 1\0\r\nB: 2\r\n\r\n")));
  ExpectNoColon(Text("A: 1\0\0B: 2\r\n\r\n"), "");
}

TEST(ManifestMf, NulAtTheEndOfTheTextCanEndAValueButNotAName) {
  EXPECT_EQ(Sections({{{"A", "1"}}}), Parse(Text("A: 1\r\n\r\nB: 2\0")));
  ExpectNoColon(Text("A: 1\r\n\r\n\0"), "", {{{"A", "1"}}});
}

// For every prefix of the text, the parser ends, and finds only the first sections of the whole
// text.
TEST(ManifestMf, EveryPrefixGivesTheFirstSectionsOfTheWholeText) {
  LogCapture log;
  const std::string text = "A: 1\r\n 2\r\n\r\nB:\nC: 3\n\nD:\r\n v\r\r";
  const Sections whole = Parse(text);
  for (size_t length = 0; length < text.size(); ++length) {
    ManifestMf manifest;
    manifest.load(text.substr(0, length));
    const Sections sections = SectionsOf(manifest);
    ASSERT_LE(sections.size(), whole.size());
    EXPECT_TRUE(std::equal(sections.begin(), sections.end(), whole.begin())) << length;
  }
}

// The last test compares the parser with the JDK's parser, on random well-formed manifests.

// One attribute, in lines as the JAR File Specification defines them. A line has at most 72 bytes
// before its line break. A continuation line starts with a space.
std::string Line(const std::string& name, const std::string& value) {
  std::string line = name + ": " + value;
  std::string text;
  while (line.size() > 72) {
    text += line.substr(0, 72) + "\r\n";
    line = " " + line.substr(72);
  }
  return text + line + "\r\n";
}

class ManifestWriter {
 public:
  explicit ManifestWriter(uint32_t seed) : random_(seed) {}

  std::string Write() {
    std::string text = Line("Manifest-Version", "1.0") + Attributes() + "\r\n";
    const uint32_t sections = Pick(20);
    for (uint32_t i = 0; i < sections; ++i) {
      // A continuation line can split a character of two or three bytes.
      const std::string name = "assets/\xC3\xA4\xE2\x82\xAC" + std::to_string(i) + Value();
      text += Line("Name", name) + Attributes() + "\r\n";
    }
    return text;
  }

 private:
  uint32_t Pick(uint32_t below) { return static_cast<uint32_t>(random_() % below); }

  std::string Attributes() {
    std::string text;
    const uint32_t count = Pick(6);
    for (uint32_t i = 0; i < count; ++i) {
      text += Line("Attribute-" + std::to_string(i) + std::string(Pick(50), '_'), Value());
    }
    return text;
  }

  std::string Value() {
    const std::string pieces[] = {"a", " ", ":", "=", "Z9+/", "\xC3\xA4", ": ", "\t"};
    std::string value = "v";
    for (uint32_t i = Pick(4) == 0 ? Pick(200) : Pick(20); i > 0; --i) value += pieces[Pick(8)];
    return value;
  }

  std::mt19937 random_;
};

// The output of DumpManifest.java for `sections`.
std::string Dump(const Sections& sections) {
  std::vector<std::string> entries;
  for (const Section& section : sections) {
    const auto name = section.find("Name");
    std::string entry = "Section " + (name == section.end() ? "" : name->second) + "\n";
    for (const auto& [key, value] : section) {
      if (key != "Name") entry += key + ": " + value + "\n";
    }
    entries.push_back(entry);
  }
  std::sort(entries.begin(), entries.end());
  std::string text;
  for (const std::string& entry : entries) text += entry;
  return text;
}

TEST(ManifestMf, AgreesWithTheJdkOnWellFormedManifests) {
  constexpr uint32_t kCount = 200;
  const TempDir directory;
  const auto path = [&](uint32_t i) { return directory / (std::to_string(i) + ".mf"); };
  for (uint32_t i = 0; i < kCount; ++i) WriteFile(path(i), ToBytes(ManifestWriter(i).Write()));
  ASSERT_EQ(0, std::system(("java " DUMP_MANIFEST " " + directory.path()).c_str()));
  for (uint32_t i = 0; i < kCount; ++i) {
    const std::string expected = ContentOf(path(i) + ".dump");
    EXPECT_EQ(expected, Dump(Parse(ContentOf(path(i))))) << "manifest " << i;
    EXPECT_EQ(expected, Dump(Parse(ContentOf(path(i) + ".rewritten")))) << "rewritten " << i;
  }
}

}  // namespace
