#include "simulator/show/output_file.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include <cerrno>

#include "support/files.h"

using namespace simulator;

namespace {

const OutputKind kList = {"--list", "list", "list:"};

std::optional<std::string> Objection(const std::string& path,
                                     const std::vector<std::string>& inputs = {}) {
  return OutputFile(kList, path).Objection(inputs);
}

bool AreSame(const std::string& one, const std::string& other) {
  return OutputFile(kList, one).IsSameAs(OutputFile(kList, other));
}

}  // namespace

TEST(OutputFile, ReplacesAnEarlierOne) {
  const TempDir directory;
  const std::string path = directory.Write("list", ToBytes("list: 1, 2, 3"));
  EXPECT_EQ(Objection(path), std::nullopt);
  OutputFile file(kList, path);
  ASSERT_TRUE(file.Open());
  EXPECT_TRUE(file.Append("a\n"));
  EXPECT_TRUE(file.Append("b\n"));
  EXPECT_EQ(ContentOf(path), "a\nb\n");
}

TEST(OutputFile, AcceptsAnEmptyOrMissingFileOrADevice) {
  const TempDir directory;
  EXPECT_EQ(Objection(directory.Write("empty", {})), std::nullopt);
  EXPECT_EQ(Objection(directory / "none"), std::nullopt);
  EXPECT_EQ(Objection("/dev/null"), std::nullopt);
}

TEST(OutputFile, RefusesToReplaceAFileOfAnotherKind) {
  const TempDir directory;
  for (const char* content : {"PK\3\4 and more than a list begins with", "list", " list:"}) {
    const std::string path = directory.Write("base.apk", ToBytes(content));
    EXPECT_EQ(Objection(path), "--list " + path +
                                   " exists and is not a list of apktoolkit-sim; it was not "
                                   "changed");
  }
}

TEST(OutputFile, RefusesToReplaceAnInputUnderAnyName) {
  const TempDir directory;
  const std::string path = directory.Write("list", ToBytes("list:"));
  const std::string link = directory / "link";
  ASSERT_EQ(symlink("list", link.c_str()), 0);
  EXPECT_EQ(Objection(path, {"/nowhere", link}),
            "--list " + path + " is an input of this run; it was not changed");
}

TEST(OutputFile, IsTheSameUnderTwoNames) {
  const TempDir directory;
  const std::string path = directory.Write("list", {});
  const std::string link = directory / "link";
  const std::string twin = directory / "twin";
  ASSERT_EQ(symlink("list", link.c_str()), 0);
  ASSERT_EQ(::link(path.c_str(), twin.c_str()), 0);
  EXPECT_TRUE(AreSame(path, path));
  EXPECT_TRUE(AreSame(path, link));
  EXPECT_TRUE(AreSame(path, twin));
  EXPECT_TRUE(AreSame(directory / "none", directory / "./none"));
  const std::string dangling = directory / "dangling", other = directory / "other";
  ASSERT_EQ(symlink("none", dangling.c_str()), 0);
  ASSERT_EQ(symlink("dangling", other.c_str()), 0);
  EXPECT_TRUE(AreSame(dangling, directory / "none"));
  EXPECT_TRUE(AreSame(other, dangling));
  EXPECT_FALSE(AreSame(path, directory / "none"));
  EXPECT_FALSE(AreSame(path, ""));
  EXPECT_FALSE(AreSame("", ""));
  EXPECT_FALSE(AreSame("/dev/null", "/dev/null"));
}

TEST(OutputFile, SaysThatItCannotBeWritten) {
  OutputFile file(kList, "/nowhere/list");
  EXPECT_FALSE(file.Open());
  EXPECT_EQ(file.ErrorText(), "cannot write the list /nowhere/list: No such file or directory");
  OutputFile full(kList, "/dev/full");
  ASSERT_TRUE(full.Open());
  EXPECT_FALSE(full.Append("a\n"));
  EXPECT_EQ(errno, ENOSPC);
}

TEST(OutputFile, IsNotWantedWithoutAName) {
  OutputFile file(kList, "");
  EXPECT_FALSE(file.IsWanted());
  EXPECT_EQ(file.Objection({""}), std::nullopt);
  EXPECT_TRUE(file.Open());
  EXPECT_TRUE(file.Append("a\n"));
}
