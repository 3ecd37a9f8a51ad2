// The fixture for tests of util/file.h: a directory for files, and replaceable system calls. A test
// can choose results that the kernel rarely returns for real files.
#pragma once

#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <functional>
#include <string>

#include "support/files.h"

// The functions that a test can replace. If a test does not set a function, the kernel is called.
struct Kernel {
  std::function<int(struct stat*)> fstat;
  std::function<off_t(int whence)> lseek;
  std::function<void*(size_t length)> mmap;
  std::function<ssize_t(int fd, void* buffer, size_t size)> read;
  std::function<ssize_t(char* buffer, size_t size)> readlink;
};
extern Kernel kernel;

// The C library's read.
extern "C" ssize_t __real_read(int fd, void* buffer, size_t size);

class FileFixture : public testing::Test {
 protected:
  void SetUp() override { alarm(60); }  // seconds; kills the test program if a test hangs
  void TearDown() override {
    kernel = Kernel();
    alarm(0);
  }

  std::string Path(const std::string& name) const { return directory_ / name; }

  std::string MakeFile(const std::string& content) const {
    return directory_.Write("file", ToBytes(content));
  }

  TempDir directory_;
};
