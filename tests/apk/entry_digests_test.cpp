#include "apk/entry_digests.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "support/log_capture.h"

using ApkTools::EntryDigests;

namespace {

// The digest of the entry `name` as "ATTRIBUTE VALUE", or "none".
std::string Found(const EntryDigests& digests, const std::string& name) {
  std::string digest_name, digest;
  if (digests.Find(name, digest_name, digest)) return digest_name + " " + digest;
  EXPECT_EQ("", digest_name + digest);
  return "none";
}

// The digests of a manifest with these sections.
class Recorded {
 public:
  explicit Recorded(const std::string& sections) {
    const std::string text = "Manifest-Version: 1.0\r\n\r\n" + sections;
    EXPECT_TRUE(digests_.Load({text.begin(), text.end()}));
    digests_.List();
  }

  std::string Of(const std::string& name) const { return Found(digests_, name); }

 private:
  EntryDigests digests_;
};

std::string Section(const std::string& name, const std::string& digest) {
  return "Name: " + name + "\r\nSHA-256-Digest: " + digest + "\r\n\r\n";
}

TEST(EntryDigests, FreshObjectHasNoDigest) {
  std::string digest_name, digest;
  EXPECT_FALSE(EntryDigests().Find("a", digest_name, digest));
}

TEST(EntryDigests, SortedEntriesAreFound) {
  const Recorded recorded(Section("a", "1") + Section("b", "2") + Section("c", "3"));
  EXPECT_EQ("SHA-256-Digest 1", recorded.Of("a"));
  EXPECT_EQ("SHA-256-Digest 2", recorded.Of("b"));
  EXPECT_EQ("SHA-256-Digest 3", recorded.Of("c"));
}

TEST(EntryDigests, UnsortedEntriesAreFound) {
  const Recorded recorded(Section("b", "2") + Section("a/b", "4") + Section("c", "3") +
                          Section("\xFF", "5") + Section("a", "1"));
  EXPECT_EQ("SHA-256-Digest 1", recorded.Of("a"));
  EXPECT_EQ("SHA-256-Digest 2", recorded.Of("b"));
  EXPECT_EQ("SHA-256-Digest 3", recorded.Of("c"));
  EXPECT_EQ("SHA-256-Digest 4", recorded.Of("a/b"));
  EXPECT_EQ("SHA-256-Digest 5", recorded.Of("\xFF"));
}

TEST(EntryDigests, NamesAreComparedWhole) {
  const Recorded recorded(Section("b/c", "1"));
  for (const char* name : {"", "a", "b", "b/", "b/cd", "B/c", "c", "Manifest-Version"}) {
    EXPECT_EQ("none", recorded.Of(name)) << name;
  }
}

TEST(EntryDigests, LastSectionWithTheNameCounts) {
  EXPECT_EQ("SHA-256-Digest 2", Recorded(Section("a", "1") + Section("a", "2")).Of("a"));
  const Recorded unordered(Section("b", "0") + Section("a", "1") + Section("b", "3") +
                           Section("a", "2") + Section("a", "4"));
  EXPECT_EQ("SHA-256-Digest 4", unordered.Of("a"));
  EXPECT_EQ("SHA-256-Digest 3", unordered.Of("b"));
}

// By chance, an unstable sort can keep a few sections with equal names in order. With 50 sections
// of the same name, this is very unlikely.
TEST(EntryDigests, LastOf50SectionsWithTheNameCounts) {
  std::string sections = Section("z", "0");
  for (int i = 1; i <= 100; ++i) sections += Section(i % 2 == 0 ? "a" : "b", std::to_string(i));
  const Recorded recorded(sections);
  EXPECT_EQ("SHA-256-Digest 100", recorded.Of("a"));
  EXPECT_EQ("SHA-256-Digest 99", recorded.Of("b"));
  EXPECT_EQ("SHA-256-Digest 0", recorded.Of("z"));
}

// A name of these letters, each followed by 63 slashes.
//
// EntryDigests rotates the hash of a name by 9 bits before it combines the hash with the next byte.
// 64 rotations are 576 bits, 9 full turns of the 64-bit hash. Bytes at a distance of 64 are
// therefore combined with the same bits of the hash, and their order does not change the hash.
std::string With64Between(const std::string& letters) {
  std::string name;
  for (const char letter : letters) name += letter + std::string(63, '/');
  return name;
}

// In the first family, all names have the same hash. In the second, the three long names have the
// same hash. In the third, the two names of 8 characters share one hash, and the two long names
// share another hash. In the names of 8 characters, seven rotations follow the first character.
// These rotations move the first character by 63 bits to the left, which equals one bit to the
// right. "b" (0x62) becomes 0x31, and "d" (0x64) becomes 0x32. The result is then combined with the
// eighth character by XOR: 0x31 ^ "q" (0x71) and 0x32 ^ "r" (0x72) are both 0x40. The six
// characters between are the same in the two names.
TEST(EntryDigests, NamesWithEqualHashesAreDistinguished) {
  const std::vector<std::string> families[] = {
      {With64Between("abc"), With64Between("acb"), With64Between("bac"), With64Between("bca"),
       With64Between("cab")},
      {With64Between("abc"), "abc", With64Between("bac"), "bac", With64Between("cba")},
      {"b123456q", "d123456r", "e", With64Between("xy"), With64Between("yx")}};
  const std::string order = "bdacbaecdab";
  for (const std::vector<std::string>& names : families) {
    std::string sections;
    const auto name_of = [&](char letter) { return names[static_cast<size_t>(letter - 'a')]; };
    for (size_t i = 0; i < order.size(); ++i)
      sections += Section(name_of(order[i]), std::to_string(i));
    const Recorded recorded(sections);
    for (const char letter : std::string("abcde")) {
      EXPECT_EQ("SHA-256-Digest " + std::to_string(order.rfind(letter)),
                recorded.Of(name_of(letter)));
    }
  }
}

TEST(EntryDigests, NameThatOnlySharesAHashHasNoDigest) {
  const Recorded recorded(Section("d", "1") + Section("d123456r", "2") +
                          Section(With64Between("cba"), "3") + Section(With64Between("abc"), "4"));
  for (const std::string& name :
       {std::string("b123456q"), With64Between("acb"), With64Between("bac"), With64Between("cab"),
        With64Between("bca")}) {
    EXPECT_EQ("none", recorded.Of(name)) << name;
  }
}

TEST(EntryDigests, LaterSectionWithoutADigestReplacesNothing) {
  EXPECT_EQ("SHA-256-Digest 1", Recorded(Section("a", "1") + "Name: a\r\nX: 2\r\n\r\n").Of("a"));
}

TEST(EntryDigests, LastDigestInTheOrderOfNamesCounts) {
  const std::string both = "Name: a\r\nSHA1-Digest: 1\r\nSHA-256-Digest: 2\r\n\r\n";
  EXPECT_EQ("SHA1-Digest 1", Recorded(both).Of("a"));
}

TEST(EntryDigests, NamesAndDigestsOnSeveralLinesAreJoined) {
  const Recorded recorded(
      "Name: res/\r\n drawable\r\n /a\r\nSHA-256-Digest: 1\r\n 2\r\n\r\n" + Section("a", "3") +
      "Name: res/\r\n drawable\r\n /b\r\nSHA-256-Digest: 4\r\n 5\r\n 6\r\n\r\n");
  EXPECT_EQ("SHA-256-Digest 12", recorded.Of("res/drawable/a"));
  EXPECT_EQ("SHA-256-Digest 3", recorded.Of("a"));
  EXPECT_EQ("SHA-256-Digest 456", recorded.Of("res/drawable/b"));
}

TEST(EntryDigests, SectionWithoutNameOrDigestOrValueIsNotListed) {
  const Recorded recorded(
      "Name: a\r\n\r\nName: b\r\nSHA1-Digest: \r\n\r\nName: \r\nSHA1-Digest: 1\r\n\r\n");
  for (const char* name : {"a", "b", ""}) EXPECT_EQ("none", recorded.Of(name)) << name;
}

TEST(EntryDigests, NamesOfAttributesAreCaseSensitive) {
  const Recorded recorded(
      "NAME: a\r\nSHA1-Digest: 1\r\n\r\nName: b\r\nSHA1-DIGEST: 1\r\n\r\n"
      "Name: c\r\n-Digest: 1\r\n\r\nName: d\r\nDigest: 1\r\n\r\n");
  EXPECT_EQ("none", recorded.Of("a"));
  EXPECT_EQ("none", recorded.Of("b"));
  EXPECT_EQ("-Digest 1", recorded.Of("c"));
  EXPECT_EQ("none", recorded.Of("d"));
}

TEST(EntryDigests, EntriesAreFoundOnlyAfterListIsCalled) {
  const std::string text = Section("a", "1");
  EntryDigests digests;
  EXPECT_TRUE(digests.Load({text.begin(), text.end()}));
  std::string digest_name, digest;
  EXPECT_FALSE(digests.Find("a", digest_name, digest));
  digests.List();
  EXPECT_TRUE(digests.Find("a", digest_name, digest));
}

// The names are in byte order, and then not.
TEST(EntryDigests, SecondCallOfListChangesNothing) {
  const std::string a = Section("a", "1"), b = Section("b", "2"), c = Section("c", "3");
  for (const std::string& text : {a + b + c, c + a + b}) {
    EntryDigests digests;
    ASSERT_TRUE(digests.Load({text.begin(), text.end()}));
    digests.List();
    digests.List();
    EXPECT_EQ("SHA-256-Digest 1", Found(digests, "a"));
    EXPECT_EQ("SHA-256-Digest 2", Found(digests, "b"));
    EXPECT_EQ("SHA-256-Digest 3", Found(digests, "c"));
  }
}

// Nothing is left of the first manifest, even if the second one does not parse.
TEST(EntryDigests, LoadingAnotherManifestForgetsTheFirst) {
  LogCapture log;
  for (const std::string& other : {Section("b", "2"), std::string("Key:x")}) {
    const std::string text = Section("a", "1");
    EntryDigests digests;
    EXPECT_TRUE(digests.Load({text.begin(), text.end()}));
    digests.List();
    EXPECT_EQ(other != "Key:x", digests.Load({other.begin(), other.end()}));
    std::string digest_name, digest;
    EXPECT_FALSE(digests.Find("a", digest_name, digest));
    digests.List();
    EXPECT_FALSE(digests.Find("a", digest_name, digest));
    EXPECT_EQ(other != "Key:x", digests.Find("b", digest_name, digest));
  }
}

// For every pair of these manifests, loads the first and then the second. Some manifests have
// sorted names, some have unsorted names, and the last manifest does not parse.
TEST(EntryDigests, EarlierManifestDoesNotAffectTheNext) {
  const std::string manifests[] = {
      "",
      Section("a", "1"),
      Section("b", "2") + Section("c", "3") + Section("a", "4"),
      Section("a", "5") + Section("b", "6") + Section("c", "7") + Section("longer", "8"),
      Section("c", "9") + Section("longer", "10") + Section("c", "11") + Section("b", "12") +
          Section("dd", "13"),
      "Main: section\r\n\r\n" + Section("dd", "14") + Section("c", "15") + "Key:x"};
  LogCapture log;
  for (const std::string& first : manifests) {
    for (const std::string& second : manifests) {
      EntryDigests fresh, used;
      used.Load({first.begin(), first.end()});
      used.List();
      for (EntryDigests* digests : {&fresh, &used}) {
        digests->Load({second.begin(), second.end()});
        digests->List();
      }
      for (const char* name : {"a", "b", "c", "dd", "longer"}) {
        EXPECT_EQ(Found(fresh, name), Found(used, name)) << first << "then\n" << second;
      }
    }
  }
}

// After the second Load, the third section of `whole` is still in memory at two places: beyond the
// end of the new text, and in the memory that the table of ManifestSections keeps. This section
// must not be listed.
TEST(EntryDigests, SectionAfterTheEndOfTheTextIsNotListed) {
  const std::string two = Section("a", "1") + Section("b", "2");
  const std::string whole = two + Section("c", "3");
  EntryDigests digests;
  ASSERT_TRUE(digests.Load({whole.begin(), whole.end()}));
  std::vector<uint8_t> text(whole.begin(), whole.end());
  text.resize(two.size());
  ASSERT_TRUE(digests.Load(std::move(text)));
  digests.List();
  EXPECT_EQ("SHA-256-Digest 2", Found(digests, "b"));
  EXPECT_EQ("none", Found(digests, "c"));
}

TEST(EntryDigests, FindChangesBothTextsOnlyIfItSucceeds) {
  const std::string text = Section("a", "1");
  EntryDigests digests;
  ASSERT_TRUE(digests.Load({text.begin(), text.end()}));
  digests.List();
  std::string digest_name = "SHA1-Digest", digest = "longer than the digest";
  EXPECT_FALSE(digests.Find("b", digest_name, digest));
  EXPECT_EQ("SHA1-Digest", digest_name);
  EXPECT_EQ("longer than the digest", digest);
  EXPECT_TRUE(digests.Find("a", digest_name, digest));
  EXPECT_EQ("SHA-256-Digest", digest_name);
  EXPECT_EQ("1", digest);
}

TEST(EntryDigests, ManifestThatCannotBeParsedIsNotLoaded) {
  LogCapture log;
  const std::string text = Section("a", "1") + "Key:x";
  EXPECT_FALSE(EntryDigests().Load({text.begin(), text.end()}));
}

}  // namespace
