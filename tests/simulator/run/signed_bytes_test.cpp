#include "simulator/run/signed_bytes.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include "simulator/phone/probe_run.h"
#include "support/der.h"

using namespace simulator;

namespace {

const Deadline kLater(1e6);
const Deadline kPassed(-1);

// printf abc | sha256sum (FIPS 180-2, B.1)
constexpr char kDigestOfAbc[] = "ba7816bf8f01cfea414140de5dae2223b00361a396177a9cb410ff61f20015ad";

}  // namespace

TEST(SignedBytes, AreTrustedUnderAnyNameWhileTheyStayTheSame) {
  const TempDir directory;
  const std::string file = directory.Write("file", ToBytes("abc"));
  const std::string copy = directory.Write("copy", ToBytes("abc"));
  SignedBytes bytes("", true);
  ASSERT_TRUE(bytes.Load());
  EXPECT_FALSE(bytes.Holds(file, kLater));
  EXPECT_TRUE(bytes.Add(file, kLater));
  EXPECT_TRUE(bytes.Holds(file, kLater));
  EXPECT_TRUE(bytes.Holds(copy, kLater));
  directory.Write("file", ToBytes("abd"));
  EXPECT_FALSE(bytes.Holds(file, kLater));
  directory.Write("file", ToBytes("abcd"));
  EXPECT_FALSE(bytes.Holds(file, kLater));
}

TEST(SignedBytes, AreTrustedWithoutReadingIfTheFileIsUnchanged) {
  const TempDir directory;
  const std::string file = directory.Write("file", ToBytes("abc"));
  SignedBytes bytes("", true);
  EXPECT_TRUE(bytes.Add(file, kLater));
  // The deadline has passed, so Holds must answer without reading the file.
  EXPECT_TRUE(bytes.Holds(file, kPassed));
  directory.Write("file", ToBytes("abd"));
  EXPECT_FALSE(bytes.Holds(file, kLater));
}

// The bytes change, but the size and the mtime stay the same. Only the ctime shows the change.
TEST(SignedBytes, AreNotTrustedIfChangedWithTheSameMtime) {
  const TempDir directory;
  const std::string file = directory.Write("file", ToBytes("abc"));
  struct stat before = {};
  ASSERT_EQ(stat(file.c_str(), &before), 0);
  SignedBytes bytes("", true);
  ASSERT_TRUE(bytes.Add(file, kLater));
  usleep(20000);  // the clock of file systems is coarse
  directory.Write("file", ToBytes("abd"));
  const timespec times[] = {before.st_atim, before.st_mtim};
  ASSERT_EQ(utimensat(AT_FDCWD, file.c_str(), times, 0), 0);
  EXPECT_FALSE(bytes.Holds(file, kLater));
}

TEST(SignedBytes, AreNotTrustedIfTheyCannotBeReadInTime) {
  const TempDir directory;
  const std::string file = directory.Write("file", ToBytes("abc"));
  const std::string copy = directory.Write("copy", ToBytes("abc"));
  SignedBytes bytes("", true);
  EXPECT_TRUE(bytes.Add(file, kLater));
  EXPECT_FALSE(bytes.Holds(copy, kPassed));
  SignedBytes kept(directory / "state", true);
  EXPECT_FALSE(kept.Add(file, kPassed));
}

// Reading the pipe would wait forever, and reading /dev/zero would never end.
TEST(SignedBytes, AreNotReadFromPipesAndDevices) {
  const TempDir directory;
  const std::string pipe = directory / "pipe";
  ASSERT_EQ(mkfifo(pipe.c_str(), 0600), 0);
  directory.Write("state/name", ToBytes("x"));
  SignedBytes bytes(directory / "state", true);
  ASSERT_TRUE(bytes.Load());
  EXPECT_FALSE(bytes.Holds(pipe, kLater));
  EXPECT_FALSE(bytes.Holds("/dev/zero", kLater));
}

TEST(SignedBytes, AreKeptByTheirDigest) {
  const TempDir directory;
  const std::string file = directory.Write("file", ToBytes("abc"));
  const std::string state = directory / "state/of/phone";
  SignedBytes first(state, true);
  ASSERT_TRUE(first.Load());
  EXPECT_TRUE(first.Add(file, kLater));
  EXPECT_EQ(ContentOf(state + "/" + kDigestOfAbc), file + "\n");
  SignedBytes second(state, true);
  ASSERT_TRUE(second.Load());
  EXPECT_TRUE(second.Holds(file, kLater));
}

TEST(SignedBytes, AreTrustedOnlyInLaterRunsIfNotShared) {
  const TempDir directory;
  const std::string file = directory.Write("file", ToBytes("abc"));
  SignedBytes none("", false);
  EXPECT_TRUE(none.Add(file, kLater));
  EXPECT_FALSE(none.Holds(file, kLater));
  SignedBytes kept(directory / "state", false);
  ASSERT_TRUE(kept.Load());
  EXPECT_TRUE(kept.Add(file, kLater));
  EXPECT_FALSE(kept.Holds(file, kLater));
  SignedBytes later(directory / "state", false);
  ASSERT_TRUE(later.Load());
  EXPECT_TRUE(later.Holds(file, kLater));
}

TEST(SignedBytes, AreNotTrustedIfTheFileCannotBeRead) {
  const TempDir directory;
  SignedBytes bytes(directory / "state", true);
  ASSERT_TRUE(bytes.Load());
  EXPECT_TRUE(bytes.Add(directory / "missing", kLater));
  EXPECT_FALSE(bytes.Holds(directory / "missing", kLater));
  EXPECT_TRUE(bytes.Add(directory.path(), kLater));  // a directory
  EXPECT_FALSE(bytes.Holds(directory.path(), kLater));
}

TEST(SignedBytes, NeedADirectoryThatCanBeUsed) {
  const TempDir directory;
  const std::string file = directory.Write("file", ToBytes("abc"));
  EXPECT_FALSE(SignedBytes(file, true).Load());
  SignedBytes bytes(directory / "state", true);
  ASSERT_TRUE(bytes.Load());
  ASSERT_EQ(rmdir((directory / "state").c_str()), 0);
  EXPECT_FALSE(bytes.Add(file, kLater));
}
