// GetFilenameByFd with real files, and with long paths that real files rarely have.
#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <string>
#include <vector>

#include "util/file.h"

#include "support/log_capture.h"
#include "util/file_fixture.h"

namespace {

using GetFilenameByFdTest = FileFixture;

TEST_F(GetFilenameByFdTest, OpenFileHasItsPath) {
  const int fd = open(MakeFile("").c_str(), O_RDONLY | O_CLOEXEC);
  EXPECT_EQ(Path("file"), GetFilenameByFd(fd));
  close(fd);
}

TEST_F(GetFilenameByFdTest, RemovedFileIsMarkedAsTheKernelMarksIt) {
  const int fd = open(MakeFile("").c_str(), O_RDONLY | O_CLOEXEC);
  ASSERT_EQ(0, unlink(Path("file").c_str()));
  EXPECT_EQ(Path("file") + " (deleted)", GetFilenameByFd(fd));
  close(fd);
}

TEST_F(GetFilenameByFdTest, ClosedDescriptorHasNoPath) {
  LogCapture log;
  const int fd = open("/dev/null", O_RDONLY | O_CLOEXEC);
  close(fd);
  EXPECT_EQ("", GetFilenameByFd(fd));
  EXPECT_EQ("", GetFilenameByFd(-1));
  EXPECT_EQ(Records(), log.records());
}

// Nested directories below `top`. The path of the innermost directory has `path_length` bytes. Each
// directory is made and opened relative to its parent, because the full path may be longer than the
// kernel accepts. The destructor removes the nested directories, but not `top`.
class DeepDirectory {
 public:
  DeepDirectory(const std::string& top, size_t path_length) {
    fds_.push_back(open(top.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    for (size_t length = top.size(); length < path_length;) {
      // Each step adds a slash and a name. One remaining byte would be enough only for the slash.
      size_t step = std::min<size_t>(path_length - length, 200);
      if (path_length - length - step == 1) --step;
      names_.push_back(std::string(step - 1, 'd'));
      mkdirat(fds_.back(), names_.back().c_str(), 0700);
      fds_.push_back(openat(fds_.back(), names_.back().c_str(), O_RDONLY | O_CLOEXEC));
      path_ += "/" + names_.back();
      length += step;
    }
    path_ = top + path_;
  }
  ~DeepDirectory() {
    for (size_t i = names_.size(); i-- > 0;) {
      close(fds_[i + 1]);
      unlinkat(fds_[i], names_[i].c_str(), AT_REMOVEDIR);
    }
    close(fds_[0]);
  }
  int fd() const { return fds_.back(); }
  const std::string& path() const { return path_; }

 private:
  std::vector<int> fds_;
  std::vector<std::string> names_;
  std::string path_;
};

TEST_F(GetFilenameByFdTest, TargetPathOf4094BytesIsWhole) {
  const DeepDirectory deep(directory_.path(), 4094);
  ASSERT_NE(-1, deep.fd());
  EXPECT_EQ(deep.path(), GetFilenameByFd(deep.fd()));
}

TEST_F(GetFilenameByFdTest, TargetPathOf4095BytesIsWhole) {
  const DeepDirectory deep(directory_.path(), 4095);
  ASSERT_NE(-1, deep.fd());
  EXPECT_EQ(4095U, GetFilenameByFd(deep.fd()).size());
  EXPECT_EQ(deep.path(), GetFilenameByFd(deep.fd()));
}

// Linux returns no part of a path of more than 4095 bytes: readlink fails with ENAMETOOLONG.
TEST_F(GetFilenameByFdTest, TargetPathOf4096BytesGivesAnEmptyName) {
  const DeepDirectory deep(directory_.path(), 4096);
  ASSERT_NE(-1, deep.fd());
  EXPECT_EQ("", GetFilenameByFd(deep.fd()));
}

TEST_F(GetFilenameByFdTest, LongerTargetPathIsCutTo4095Bytes) {
  std::string target(5000, 'a');
  target[4094] = 'y';
  target[4095] = 'z';
  kernel.readlink = [&](char* buffer, size_t size) {
    return static_cast<ssize_t>(target.copy(buffer, size));
  };
  EXPECT_EQ(target.substr(0, 4095), GetFilenameByFd(0));
}

TEST_F(GetFilenameByFdTest, TargetPathEndsAtItsFirstNul) {
  kernel.readlink = [](char* buffer, size_t size) {
    return static_cast<ssize_t>(std::string("/a\0b", 4).copy(buffer, size));
  };
  EXPECT_EQ("/a", GetFilenameByFd(0));
}

}  // namespace
