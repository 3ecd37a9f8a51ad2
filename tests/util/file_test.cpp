// ReadFile and GetFilenameByFd with real files, and with kernel answers that real files give only
// by chance.
#include "util/file.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/mman.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <functional>
#include <numeric>
#include <string>
#include <vector>

#include "support/files.h"
#include "support/lease.h"
#include "support/log_capture.h"

// The answers that a test sets. The kernel itself answers if a test sets none.
namespace {

struct Kernel {
  std::function<int(struct stat*)> fstat;
  std::function<off_t(int whence)> lseek;
  std::function<void*(size_t length)> mmap;
  std::function<ssize_t(int fd, void* buffer, size_t size)> read;
  std::function<ssize_t(char* buffer, size_t size)> readlink;
};
Kernel kernel;

}  // namespace

extern "C" {
int __real_fstat(int fd, struct stat* status);
off_t __real_lseek(int fd, off_t offset, int whence);
void* __real_mmap(void* address, size_t length, int protection, int flags, int fd, off_t offset);
ssize_t __real_read(int fd, void* buffer, size_t size);
ssize_t __real_readlink(const char* path, char* buffer, size_t size);

int __wrap_fstat(int fd, struct stat* status) {
  return kernel.fstat ? kernel.fstat(status) : __real_fstat(fd, status);
}
off_t __wrap_lseek(int fd, off_t offset, int whence) {
  return kernel.lseek ? kernel.lseek(whence) : __real_lseek(fd, offset, whence);
}
void* __wrap_mmap(void* address, size_t length, int protection, int flags, int fd, off_t offset) {
  return kernel.mmap ? kernel.mmap(length)
                     : __real_mmap(address, length, protection, flags, fd, offset);
}
ssize_t __wrap_read(int fd, void* buffer, size_t size) {
  return kernel.read ? kernel.read(fd, buffer, size) : __real_read(fd, buffer, size);
}
ssize_t __wrap_readlink(const char* path, char* buffer, size_t size) {
  return kernel.readlink ? kernel.readlink(buffer, size) : __real_readlink(path, buffer, size);
}

// The names of read and readlink in a build with _FORTIFY_SOURCE, as in every platform tree.
ssize_t __wrap___read_chk(int fd, void* buffer, size_t size, size_t /*room*/) {
  return __wrap_read(fd, buffer, size);
}
ssize_t __wrap___readlink_chk(const char* path, char* buffer, size_t size, size_t /*room*/) {
  return __wrap_readlink(path, buffer, size);
}
}

namespace {

class FileTest : public testing::Test {
 protected:
  void SetUp() override { alarm(60); }  // ends a test that waits for a FIFO
  void TearDown() override {
    kernel = Kernel();
    alarm(0);
  }

  std::string Path(const std::string& name) const { return directory_ / name; }

  std::string MakeFile(const std::string& content) const {
    return directory_.Write("file", ToBytes(content));
  }

  // `path` cannot be read; only `message` is logged, and `out` is unchanged.
  static void ExpectRefused(const std::string& path, const std::string& message) {
    LogCapture log;
    Bytes out = {1, 2, 3};
    EXPECT_FALSE(ReadFile(path, out));
    EXPECT_EQ(Bytes({1, 2, 3}), out);
    EXPECT_EQ(Records({Error(message)}), log.records());
  }
  static void ExpectNoSize(const std::string& path) {
    ExpectRefused(path, "Can't read file: " + path + " (streamoff=-1)\n");
  }

  TempDir directory_;
};
using ReadFileTest = FileTest;
using OpenForReadingTest = FileTest;
using GetFilenameByFdTest = FileTest;

// The number that the next descriptor gets.
int NextDescriptor() {
  const int fd = open("/dev/null", O_RDONLY | O_CLOEXEC);
  close(fd);
  return fd;
}

TEST_F(ReadFileTest, EveryByteIsReadAsItIs) {
  std::string content(256, '\0');
  std::iota(content.begin(), content.end(), '\0');
  content += "\r\n \t\n\x1a rest";
  LogCapture log;
  Bytes out;
  EXPECT_TRUE(ReadFile(MakeFile(content), out));
  EXPECT_EQ(ToBytes(content), out);
  EXPECT_EQ(Records(), log.records());
}

TEST_F(ReadFileTest, EmptyFileIsTrueAndEmpty) {
  Bytes out;
  EXPECT_TRUE(ReadFile(MakeFile(""), out));
  EXPECT_TRUE(out.empty());
}

TEST_F(ReadFileTest, VectorThatHeldMoreEndsWithExactlyTheSizeOfTheFile) {
  Bytes out(1000, 0xEE);
  EXPECT_TRUE(ReadFile(MakeFile("abc"), out));
  EXPECT_EQ(ToBytes("abc"), out);
}

TEST_F(ReadFileTest, VectorThatHeldMoreIsEmptyAfterAnEmptyFile) {
  Bytes out(1000, 0xEE);
  EXPECT_TRUE(ReadFile(MakeFile(""), out));
  EXPECT_TRUE(out.empty());
}

TEST_F(ReadFileTest, SymbolicLinksAreFollowed) {
  ASSERT_EQ(0, symlink(MakeFile("abc").c_str(), Path("link").c_str()));
  Bytes out;
  EXPECT_TRUE(ReadFile(Path("link"), out));
  EXPECT_EQ(ToBytes("abc"), out);
}

TEST_F(ReadFileTest, PathThatDoesNotExistCannotBeOpened) {
  ExpectRefused(Path("missing"), "Can't open file: " + Path("missing") + "\n");
}

TEST_F(ReadFileTest, SocketCannotBeOpened) {
  const int fd = socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
  sockaddr_un address = {};
  address.sun_family = AF_UNIX;
  ASSERT_LT(Path("socket").size(), sizeof(address.sun_path));
  strcpy(address.sun_path, Path("socket").c_str());
  ASSERT_EQ(0, bind(fd, reinterpret_cast<sockaddr*>(&address), sizeof(address)));
  ExpectRefused(Path("socket"), "Can't open file: " + Path("socket") + "\n");
  close(fd);
}

TEST_F(ReadFileTest, DirectoryHasNoSize) { ExpectNoSize(directory_.path()); }

TEST_F(ReadFileTest, DeviceHasNoSize) { ExpectNoSize("/dev/zero"); }

TEST_F(ReadFileTest, FifoWithoutWriterHasNoSizeAndDoesNotBlock) {
  ASSERT_EQ(0, mkfifo(Path("fifo").c_str(), 0600));
  ExpectNoSize(Path("fifo"));
}

TEST_F(ReadFileTest, FifoWithSilentWriterHasNoSizeAndDoesNotBlock) {
  ASSERT_EQ(0, mkfifo(Path("fifo").c_str(), 0600));
  const int writer = open(Path("fifo").c_str(), O_RDWR | O_CLOEXEC);
  ASSERT_NE(-1, writer);
  ExpectNoSize(Path("fifo"));
  close(writer);
}

TEST_F(ReadFileTest, SparseFileOfTerabytesHasNoSize) {
  const std::string path = MakeFile("");
  ASSERT_EQ(0, truncate(path.c_str(), off_t{1} << 43));
  ExpectNoSize(path);
}

TEST_F(ReadFileTest, MoreThanTheMachinesMemoryIsNotEvenTried) {
  const std::string path = MakeFile("");
  ASSERT_EQ(0, truncate(path.c_str(), sysconf(_SC_PHYS_PAGES) * sysconf(_SC_PAGESIZE)));
  kernel.mmap = [](size_t) -> void* {
    ADD_FAILURE() << "a kernel that promises any memory would be believed";
    return MAP_FAILED;
  };
  ExpectNoSize(path);
}

TEST_F(ReadFileTest, FileThatTheAddressSpaceHasNoRoomForHasNoSize) {
  size_t tried = 0;
  kernel.mmap = [&](size_t length) {
    tried = length;
    return MAP_FAILED;
  };
  ExpectNoSize(MakeFile("abc"));
  EXPECT_EQ(3U, tried);
}

TEST_F(ReadFileTest, FileOfUnknownKindHasNoSize) {
  kernel.fstat = [](struct stat*) { return -1; };
  ExpectNoSize(MakeFile("abc"));
}

TEST_F(ReadFileTest, FileWithoutAnEndToSeekHasNoSize) {
  kernel.lseek = [](int) { return off_t{-1}; };
  ExpectNoSize(MakeFile("abc"));
}

TEST_F(ReadFileTest, FileThatCannotBeRewoundHasNoSize) {
  kernel.lseek = [](int whence) { return whence == SEEK_END ? off_t{3} : off_t{-1}; };
  ExpectNoSize(MakeFile("abc"));
}

// Like a file that grows or shrinks between the two calls.
TEST_F(ReadFileTest, SizeIsTheFilesEndAndNotTheStatesSize) {
  for (const off_t end : {off_t{2}, off_t{5}}) {
    kernel.lseek = [end](int whence) { return whence == SEEK_END ? end : off_t{0}; };
    Bytes out;
    EXPECT_TRUE(ReadFile(MakeFile("abc"), out));
    EXPECT_EQ(end == 2 ? ToBytes("ab") : Bytes({'a', 'b', 'c', 0, 0}), out);
  }
}

TEST_F(ReadFileTest, FileThatShrinksMeanwhileIsTrueAndEndsInZeros) {
  const std::string path = MakeFile("abcdef");
  kernel.read = [&](int fd, void* buffer, size_t size) {
    EXPECT_EQ(0, truncate(path.c_str(), 2));
    return __real_read(fd, buffer, size);
  };
  LogCapture log;
  Bytes out;
  EXPECT_TRUE(ReadFile(path, out));
  EXPECT_EQ(Bytes({'a', 'b', 0, 0, 0, 0}), out);
  EXPECT_EQ(Records(), log.records());
}

TEST_F(ReadFileTest, FileThatShrinksMeanwhileLeavesTheVectorsOldBytes) {
  const std::string path = MakeFile("abcdef");
  kernel.read = [&](int fd, void* buffer, size_t size) {
    EXPECT_EQ(0, truncate(path.c_str(), 2));
    return __real_read(fd, buffer, size);
  };
  Bytes out = {9, 8, 7, 6};
  EXPECT_TRUE(ReadFile(path, out));
  EXPECT_EQ(Bytes({'a', 'b', 7, 6, 0, 0}), out);
}

TEST_F(ReadFileTest, FileThatGrowsMeanwhileIsReadToItsFirstSize) {
  const std::string path = MakeFile("abc");
  kernel.read = [&](int fd, void* buffer, size_t size) {
    std::ofstream(path, std::ios::app) << "more";
    return __real_read(fd, buffer, size);
  };
  Bytes out;
  EXPECT_TRUE(ReadFile(path, out));
  EXPECT_EQ(ToBytes("abc"), out);
  EXPECT_EQ("abcmore", ContentOf(path));
}

TEST_F(ReadFileTest, FileThatCannotBeReadIsTrueAndZeros) {
  kernel.read = [](int, void*, size_t) {
    errno = EIO;
    return ssize_t{-1};
  };
  Bytes out;
  EXPECT_TRUE(ReadFile(MakeFile("abc"), out));
  EXPECT_EQ(Bytes(3), out);
}

TEST_F(ReadFileTest, PiecewiseAndInterruptedReadsAreJoined) {
  std::vector<size_t> asked;
  kernel.read = [&](int fd, void* buffer, size_t size) -> ssize_t {
    asked.push_back(size);
    if (asked.size() % 2 == 1) {
      errno = EINTR;
      return -1;
    }
    return __real_read(fd, buffer, std::min<size_t>(size, 2));
  };
  Bytes out;
  EXPECT_TRUE(ReadFile(MakeFile("abcdefg"), out));
  EXPECT_EQ(ToBytes("abcdefg"), out);
  // No read asks for more bytes than there is room for.
  EXPECT_EQ(std::vector<size_t>({7, 7, 5, 5, 3, 3, 1, 1}), asked);
}

TEST_F(ReadFileTest, NoDescriptorStaysOpen) {
  const int before = NextDescriptor();
  Bytes out;
  EXPECT_TRUE(ReadFile(MakeFile("abc"), out));
  ExpectNoSize(directory_.path());
  EXPECT_EQ(before, NextDescriptor());
}

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

// Nested directories, each made and opened from the one above, because the path of the last is
// longer than a path may be. They are removed at the end.
class DeepDirectory {
 public:
  DeepDirectory(const std::string& top, size_t path_length) {
    fds_.push_back(open(top.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    for (size_t length = top.size(); length < path_length;) {
      // A remainder of one byte would only have room for a slash.
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

// ---- Through a descriptor.

TEST_F(ReadFileTest, DescriptorIsReadFromItsStartIfThePathLeadsElsewhere) {
  const int fd = open(MakeFile("abc").c_str(), O_RDONLY | O_CLOEXEC);
  EXPECT_EQ(2, lseek(fd, 2, SEEK_SET));
  ASSERT_EQ(0, unlink(Path("file").c_str()));
  MakeFile("another");
  Bytes out;
  struct stat read, state;
  EXPECT_TRUE(ReadFile(Path("file"), out, &read, fd));
  EXPECT_EQ(ToBytes("abc"), out);
  EXPECT_EQ(0, fstat(fd, &state));
  EXPECT_TRUE(IsSameFile(state, read));
  close(fd);
}

TEST_F(ReadFileTest, DescriptorOfADirectoryHasNoSizeAndStaysOpen) {
  const int fd = open(directory_.path().c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
  LogCapture log;
  Bytes out;
  EXPECT_FALSE(ReadFile("its name", out, nullptr, fd));
  EXPECT_EQ(Records({Error("Can't read file: its name (streamoff=-1)\n")}), log.records());
  EXPECT_EQ(0, close(fd));
}

// ---- Its memory.

// tests/apk/memory_test.cpp checks that the former memory is freed first.
TEST_F(ReadFileTest, EmptyVectorGetsNoMoreMemoryThanTheFileNeeds) {
  Bytes out(1000);
  out.clear();
  ASSERT_TRUE(ReadFile(MakeFile(std::string(1001, 'x')), out));
  EXPECT_EQ(1001u, out.capacity());
  EXPECT_EQ(Bytes(1001, 'x'), out);
}

TEST_F(ReadFileTest, EmptyVectorWithMemoryEnoughKeepsIt) {
  Bytes out(1000);
  const uint8_t* const memory = out.data();
  out.clear();
  ASSERT_TRUE(ReadFile(MakeFile(std::string(1000, 'x')), out));
  EXPECT_EQ(memory, out.data());
  EXPECT_EQ(Bytes(1000, 'x'), out);
}

// ---- Without waiting for a writer, but with waiting for the holder of a lease.

TEST_F(OpenForReadingTest, FifoNeverWouldBlockForReading) {
  ASSERT_EQ(0, mkfifo(Path("fifo").c_str(), 0600));
  for (const bool has_writer : {false, true}) {
    const int writer = has_writer ? open(Path("fifo").c_str(), O_RDWR | O_CLOEXEC) : -1;
    const int fd = OpenForReading(Path("fifo").c_str(), O_CLOEXEC);
    EXPECT_GE(fd, 0) << strerror(errno);
    close(fd);
    if (has_writer) close(writer);
  }
}

TEST_F(OpenForReadingTest, LeasedFileIsOpenedOnceItsHolderGivesItUp) {
  const std::string path = MakeFile("abc");
  const Lease lease(path);
  if (!lease.IsHeld()) GTEST_SKIP() << "the file system of " << path << " knows no leases";
  ASSERT_EQ(-1, open(path.c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC));
  ASSERT_EQ(EWOULDBLOCK, errno);
  const int fd = OpenForReading(path.c_str(), O_CLOEXEC);
  EXPECT_GE(fd, 0) << strerror(errno);
  EXPECT_TRUE(lease.WasGivenUp());
  EXPECT_EQ(path, GetFilenameByFd(fd));
  EXPECT_EQ(O_RDONLY, fcntl(fd, F_GETFL) & (O_ACCMODE | O_NONBLOCK | O_PATH));
  EXPECT_EQ(FD_CLOEXEC, fcntl(fd, F_GETFD));
  close(fd);
}

TEST_F(ReadFileTest, LeasedFileIsReadOnceItsHolderGivesItUp) {
  const int before = NextDescriptor();
  const std::string path = MakeFile("abc");
  {
    const Lease lease(path);
    if (!lease.IsHeld()) GTEST_SKIP() << "the file system of " << path << " knows no leases";
    Bytes out;
    EXPECT_TRUE(ReadFile(path, out));
    EXPECT_EQ(ToBytes("abc"), out);
    EXPECT_TRUE(lease.WasGivenUp());
  }
  EXPECT_EQ(before, NextDescriptor());
}

TEST_F(OpenForReadingTest, SetsErrnoIfTheFileIsNotOpened) {
  EXPECT_EQ(-1, OpenForReading(Path("missing").c_str(), 0));
  EXPECT_EQ(ENOENT, errno);
}

// ---- The identity of the file.

TEST_F(ReadFileTest, TellsTheFilesStateBeforeAByteWasRead) {
  const std::string path = MakeFile("abc");
  struct stat before, after, read;
  ASSERT_EQ(stat(path.c_str(), &before), 0);
  kernel.read = [&](int fd, void* buffer, size_t size) {
    usleep(20000);  // the clock of file systems is coarse
    std::ofstream(path, std::ios::app) << "more";
    return __real_read(fd, buffer, size);
  };
  Bytes out;
  ASSERT_TRUE(ReadFile(path, out, &read));
  ASSERT_EQ(stat(path.c_str(), &after), 0);
  EXPECT_TRUE(IsSameFile(before, read));
  EXPECT_FALSE(IsSameFile(after, read));
}

TEST_F(ReadFileTest, LeavesTheStateAloneWhenItFails) {
  LogCapture log;
  Bytes out;
  struct stat read = {};
  read.st_ino = 7;
  EXPECT_FALSE(ReadFile(directory_.path(), out, &read));
  EXPECT_FALSE(ReadFile("/nowhere/file", out, &read));
  EXPECT_EQ(read.st_ino, 7u);
}

TEST(IsSameFile, EachPartOfTheStateCounts) {
  struct stat state = {};
  state.st_mode = S_IFREG | 0600;
  state.st_dev = 1;
  state.st_ino = 2;
  state.st_size = 3;
  state.st_mtim = {4, 5};
  state.st_ctim = {6, 7};
  EXPECT_TRUE(IsSameFile(state, state));
  const std::vector<std::function<void(struct stat&)>> changes = {
      [](struct stat& s) { s.st_dev = 9; },          [](struct stat& s) { s.st_ino = 9; },
      [](struct stat& s) { s.st_size = 9; },         [](struct stat& s) { s.st_mtim.tv_sec = 9; },
      [](struct stat& s) { s.st_mtim.tv_nsec = 9; }, [](struct stat& s) { s.st_ctim.tv_sec = 9; },
      [](struct stat& s) { s.st_ctim.tv_nsec = 9; }, [](struct stat& s) { s.st_mode = S_IFIFO; }};
  for (size_t i = 0; i < changes.size(); ++i) {
    struct stat other = state;
    changes[i](other);
    EXPECT_FALSE(IsSameFile(state, other)) << i;
    EXPECT_FALSE(IsSameFile(other, state)) << i;
  }
}

// Both states are equal, but not those of a regular file.
TEST(IsSameFile, FilesThatAreNotRegularAreNotTheSame) {
  struct stat state = {};
  EXPECT_FALSE(IsSameFile(state, state));
  state.st_mode = S_IFDIR | 0700;
  EXPECT_FALSE(IsSameFile(state, state));
}

TEST_F(GetFilenameByFdTest, TargetPathOf4094BytesIsWhole) {
  const DeepDirectory deep(directory_.path(), 4094);
  ASSERT_NE(-1, deep.fd());
  EXPECT_EQ(deep.path(), GetFilenameByFd(deep.fd()));
}

TEST_F(GetFilenameByFdTest, TargetPathOf4095BytesIsItsFirst4095Bytes) {
  const DeepDirectory deep(directory_.path(), 4095);
  ASSERT_NE(-1, deep.fd());
  EXPECT_EQ(4095U, GetFilenameByFd(deep.fd()).size());
  EXPECT_EQ(deep.path(), GetFilenameByFd(deep.fd()));
}

// Linux does not return a longer path at all: readlink fails with ENAMETOOLONG.
TEST_F(GetFilenameByFdTest, TargetPathOf4096BytesIsNotToldByTheKernel) {
  const DeepDirectory deep(directory_.path(), 4096);
  ASSERT_NE(-1, deep.fd());
  EXPECT_EQ("", GetFilenameByFd(deep.fd()));
}

TEST_F(GetFilenameByFdTest, ALongerTargetPathIsItsFirst4095Bytes) {
  std::string target(5000, 'a');
  target[4094] = 'y';
  target[4095] = 'z';
  kernel.readlink = [&](char* buffer, size_t size) {
    return static_cast<ssize_t>(target.copy(buffer, size));
  };
  EXPECT_EQ(target.substr(0, 4095), GetFilenameByFd(0));
}

TEST_F(GetFilenameByFdTest, TheTextEndsAtItsFirstNul) {
  kernel.readlink = [](char* buffer, size_t size) {
    return static_cast<ssize_t>(std::string("/a\0b", 4).copy(buffer, size));
  };
  EXPECT_EQ("/a", GetFilenameByFd(0));
}

TEST(StringToVector, BytesAreInOrderWithoutATerminator) {
  EXPECT_EQ(Bytes({'a', 0, 0xFF, 'b'}), StringToVector(std::string("a\0\xFF"
                                                                   "b",
                                                                   4)));
}

TEST(StringToVector, EmptyStringGivesAnEmptyVector) { EXPECT_TRUE(StringToVector("").empty()); }

}  // namespace
