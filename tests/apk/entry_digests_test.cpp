#include "apk/entry_digests.h"

#include <gtest/gtest.h>

#include <string>
#include <utility>

#include "support/log_capture.h"

using ApkTools::EntryDigests;

namespace {

// A manifest, and what it records.
class Recorded {
 public:
  explicit Recorded(const std::string& sections) {
    const std::string text = "Manifest-Version: 1.0\r\n\r\n" + sections;
    loaded_ = digests_.Load({text.begin(), text.end()}, manifest_);
  }

  bool loaded() const { return loaded_; }

  // "ATTRIBUTE VALUE", or "none".
  std::string Of(const std::string& name) const {
    std::string digest_name, digest;
    if (digests_.Find(manifest_, name, digest_name, digest)) return digest_name + " " + digest;
    EXPECT_EQ("", digest_name + digest);
    return "none";
  }

  Recorded Moved() { return std::move(*this); }

 private:
  ManifestMf manifest_;
  EntryDigests digests_;
  bool loaded_;
};

std::string Section(const std::string& name, const std::string& digest) {
  return "Name: " + name + "\r\nSHA-256-Digest: " + digest + "\r\n\r\n";
}

TEST(EntryDigests, FreshObjectHasNone) {
  std::string digest_name, digest;
  EXPECT_FALSE(EntryDigests().Find(ManifestMf(), "a", digest_name, digest));
}

TEST(EntryDigests, EntriesInTheOrderOfTheirNamesAreFound) {
  const Recorded recorded(Section("a", "1") + Section("b", "2") + Section("c", "3"));
  EXPECT_TRUE(recorded.loaded());
  EXPECT_EQ("SHA-256-Digest 1", recorded.Of("a"));
  EXPECT_EQ("SHA-256-Digest 2", recorded.Of("b"));
  EXPECT_EQ("SHA-256-Digest 3", recorded.Of("c"));
}

TEST(EntryDigests, EntriesInAnyOtherOrderAreFound) {
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

TEST(EntryDigests, OfEqualNamesTheLaterSectionCountsInAnyOrder) {
  EXPECT_EQ("SHA-256-Digest 2", Recorded(Section("a", "1") + Section("a", "2")).Of("a"));
  const Recorded unordered(Section("b", "0") + Section("a", "1") + Section("b", "3") +
                           Section("a", "2") + Section("a", "4"));
  EXPECT_EQ("SHA-256-Digest 4", unordered.Of("a"));
  EXPECT_EQ("SHA-256-Digest 3", unordered.Of("b"));
}

TEST(EntryDigests, ALaterSectionWithoutADigestReplacesNothing) {
  EXPECT_EQ("SHA-256-Digest 1", Recorded(Section("a", "1") + "Name: a\r\nX: 2\r\n\r\n").Of("a"));
}

TEST(EntryDigests, OfSeveralDigestsTheLastInTheOrderOfNamesCounts) {
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

TEST(EntryDigests, AManifestAndItsDigestsMayBothBeMoved) {
  Recorded recorded("Name: b\r\n c\r\nSHA-256-Digest: 1\r\n 2\r\n\r\n" + Section("a", "3"));
  const Recorded moved = recorded.Moved();
  EXPECT_EQ("SHA-256-Digest 12", moved.Of("bc"));
  EXPECT_EQ("SHA-256-Digest 3", moved.Of("a"));
}

TEST(EntryDigests, AManifestThatDoesNotParseIsNotLoaded) {
  LogCapture log;
  EXPECT_FALSE(Recorded(Section("a", "1") + "Key:x").loaded());
}

}  // namespace
