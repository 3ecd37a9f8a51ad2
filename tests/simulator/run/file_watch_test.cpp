#include "simulator/run/file_watch.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <filesystem>
#include <functional>

#include "support/files.h"

using namespace simulator;

namespace {

// The digest of "abc" (FIPS 180-2, appendix B.1).
const std::string kSha256 = "ba7816bf8f01cfea414140de5dae2223b00361a396177a9cb410ff61f20015ad";

// True if FileWatch gives the run the failure kChanged after `change`. `sha256` is the file's
// digest in the facts of the run.
bool IsNoticed(const std::function<void(const std::string& file)>& change,
               const std::string& sha256 = kSha256) {
  const TempDir directory;
  const std::string file = directory.Write("file", ToBytes("abc"));
  const FileWatch watch(file);
  change(file);
  FileRun run;
  run.facts.sha256 = sha256;
  watch.Check(&run);
  return run.record.failure.kind == Failure::Kind::kChanged;
}

void SetBytes(const std::string& file, const char* bytes) {
  const int fd = open(file.c_str(), O_WRONLY);
  EXPECT_EQ(pwrite(fd, bytes, 3, 0), 3);
  close(fd);
}

// Writes `bytes` and restores the mtime. In the file's state, only the ctime then differs. A
// program can hide a change of the bytes in this way. But a new ctime alone does not prove such a
// change: chmod also sets the ctime.
void ChangeTheInodeAlone(const std::string& file, const char* bytes) {
  struct stat before = {};
  ASSERT_EQ(stat(file.c_str(), &before), 0);
  SetBytes(file, bytes);
  const timespec times[] = {before.st_atim, before.st_mtim};
  struct stat after = before;
  for (int i = 0; i < 1000 && after.st_ctim.tv_nsec == before.st_ctim.tv_nsec; ++i) {
    usleep(1000);
    ASSERT_EQ(utimensat(AT_FDCWD, file.c_str(), times, 0), 0);
    ASSERT_EQ(stat(file.c_str(), &after), 0);
  }
}

}  // namespace

TEST(FileWatch, FileThatIsOnlyReadIsUnchanged) {
  EXPECT_FALSE(IsNoticed([](const std::string& file) { ContentOf(file); }));
  EXPECT_FALSE(IsNoticed([](const std::string&) {}, ""));
}

TEST(FileWatch, NoticesEachKindOfChange) {
  EXPECT_TRUE(IsNoticed([](const std::string& file) { EXPECT_EQ(truncate(file.c_str(), 2), 0); }));
  EXPECT_TRUE(IsNoticed([](const std::string& file) {
    const timespec past[] = {{1, 0}, {1, 0}};
    utimensat(AT_FDCWD, file.c_str(), past, 0);
  }));
  EXPECT_TRUE(IsNoticed([](const std::string& file) { unlink(file.c_str()); }));
  EXPECT_TRUE(IsNoticed([](const std::string& file) {
    std::filesystem::copy(file, file + ".new");
    std::filesystem::rename(file + ".new", file);
  }));
}

// If only the ctime differs, the digest decides. Without a digest, the file counts as changed.
TEST(FileWatch, ChangeOfTheInodeAloneCountsIfTheBytesDiffer) {
  EXPECT_FALSE(IsNoticed([](const std::string& file) { ChangeTheInodeAlone(file, "abc"); }));
  EXPECT_TRUE(IsNoticed([](const std::string& file) { ChangeTheInodeAlone(file, "abd"); }));
  EXPECT_TRUE(IsNoticed([](const std::string& file) { ChangeTheInodeAlone(file, "abc"); }, ""));
}

TEST(FileWatch, DoesNotChangeARunWithoutResultOrFile) {
  const TempDir directory;
  const std::string file = directory.Write("file", ToBytes("abc"));
  FileRun run;
  const FileWatch of_the_directory(directory.path()), of_nothing(directory / "none"), watch(file);
  unlink(file.c_str());
  of_the_directory.Check(&run);
  of_nothing.Check(&run);
  EXPECT_EQ(run.record.failure.kind, Failure::Kind::kNone);
  run.record.failure.kind = Failure::Kind::kInterrupted;
  watch.Check(&run);
  EXPECT_EQ(run.record.failure.kind, Failure::Kind::kInterrupted);
}
