#include "simulator/program/state.h"

#include <gtest/gtest.h>

#include "simulator/phone/probe_run.h"
#include "support/der.h"

namespace {

// printf abc | sha256sum (FIPS 180-2, B.1)
constexpr char kDigestOfAbc[] = "ba7816bf8f01cfea414140de5dae2223b00361a396177a9cb410ff61f20015ad";

}  // namespace

TEST(SignedBytes, AreTrustedUnderAnyNameWhileTheyStayTheSame) {
  const TempDir folder;
  const std::string file = folder.Write("file", ToBytes("abc"));
  const std::string copy = folder.Write("copy", ToBytes("abc"));
  SignedBytes bytes("");
  ASSERT_TRUE(bytes.Load());
  EXPECT_FALSE(bytes.Holds(file));
  EXPECT_TRUE(bytes.Add(file));
  EXPECT_TRUE(bytes.Holds(file));
  EXPECT_TRUE(bytes.Holds(copy));
  folder.Write("file", ToBytes("abd"));
  EXPECT_FALSE(bytes.Holds(file));
}

TEST(SignedBytes, AreKeptByTheirDigest) {
  const TempDir folder;
  const std::string file = folder.Write("file", ToBytes("abc"));
  const std::string directory = folder / "state/of/phone";
  SignedBytes first(directory);
  ASSERT_TRUE(first.Load());
  EXPECT_TRUE(first.Add(file));
  EXPECT_EQ(ContentOf(directory + "/" + kDigestOfAbc), file + "\n");
  SignedBytes second(directory);
  ASSERT_TRUE(second.Load());
  EXPECT_TRUE(second.Holds(file));
}

TEST(SignedBytes, OfAFileThatCannotBeReadAreNeverTrusted) {
  const TempDir folder;
  SignedBytes bytes(folder / "state");
  ASSERT_TRUE(bytes.Load());
  EXPECT_TRUE(bytes.Add(folder / "missing"));
  EXPECT_FALSE(bytes.Holds(folder / "missing"));
  EXPECT_TRUE(bytes.Add(folder.path()));  // a directory
  EXPECT_FALSE(bytes.Holds(folder.path()));
}

TEST(SignedBytes, NeedADirectoryThatCanBeUsed) {
  const TempDir folder;
  const std::string file = folder.Write("file", ToBytes("abc"));
  EXPECT_FALSE(SignedBytes(file).Load());
  SignedBytes bytes(folder / "state");
  ASSERT_TRUE(bytes.Load());
  ASSERT_EQ(rmdir((folder / "state").c_str()), 0);
  EXPECT_FALSE(bytes.Add(file));
}
