// ReadFile, OpenForReading, IsSameFile and StringToVector. Most tests use real files. Some simulate
// results that the kernel rarely returns for real files.
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

#include "support/lease.h"
#include "support/log_capture.h"
#include "util/file_fixture.h"

namespace {

class FileTest : public FileFixture {
 protected:
  // Expects that `path` cannot be read, that only `message` is logged, and that `out` is unchanged.
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
};
using ReadFileTest = FileTest;
using OpenForReadingTest = FileTest;

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

TEST_F(ReadFileTest, EmptyFileGivesAnEmptyVector) {
  Bytes out;
  EXPECT_TRUE(ReadFile(MakeFile(""), out));
  EXPECT_TRUE(out.empty());
}

TEST_F(ReadFileTest, LongerVectorIsCutToTheSizeOfTheFile) {
  Bytes out(1000, 0xEE);
  EXPECT_TRUE(ReadFile(MakeFile("abc"), out));
  EXPECT_EQ(ToBytes("abc"), out);
}

TEST_F(ReadFileTest, LongerVectorIsEmptyAfterAnEmptyFile) {
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

TEST_F(ReadFileTest, FileAsLargeAsTheMachinesMemoryIsNotTried) {
  const std::string path = MakeFile("");
  ASSERT_EQ(0, truncate(path.c_str(), sysconf(_SC_PHYS_PAGES) * sysconf(_SC_PAGESIZE)));
  kernel.mmap = [](size_t) -> void* {
    ADD_FAILURE() << "the size is not compared with the memory of the machine";
    return MAP_FAILED;
  };
  ExpectNoSize(path);
}

TEST_F(ReadFileTest, FileTooLargeForTheAddressSpaceHasNoSize) {
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

// Simulates a file that shrinks or grows between fstat and lseek.
TEST_F(ReadFileTest, SizeComesFromLseekAndNotFromFstat) {
  for (const off_t end : {off_t{2}, off_t{5}}) {
    kernel.lseek = [end](int whence) { return whence == SEEK_END ? end : off_t{0}; };
    Bytes out;
    EXPECT_TRUE(ReadFile(MakeFile("abc"), out));
    EXPECT_EQ(end == 2 ? ToBytes("ab") : Bytes({'a', 'b', 'c', 0, 0}), out);
  }
}

TEST_F(ReadFileTest, FileThatShrinksMeanwhileIsReadAndEndsInZeros) {
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

TEST_F(ReadFileTest, ReadErrorGivesZerosAndNoFailure) {
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
  // Each call of read requests at most the number of bytes that are left in the buffer.
  EXPECT_EQ(std::vector<size_t>({7, 7, 5, 5, 3, 3, 1, 1}), asked);
}

TEST_F(ReadFileTest, LeavesNoDescriptorOpen) {
  const int before = NextDescriptor();
  Bytes out;
  EXPECT_TRUE(ReadFile(MakeFile("abc"), out));
  ExpectNoSize(directory_.path());
  EXPECT_EQ(before, NextDescriptor());
}

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

// ---- The memory of the vector.

// tests/apk/memory_test.cpp checks that ReadFile frees the vector's old memory before it allocates
// new memory.
TEST_F(ReadFileTest, EmptyVectorGetsNoMoreMemoryThanTheFileNeeds) {
  Bytes out(1000);
  out.clear();
  ASSERT_TRUE(ReadFile(MakeFile(std::string(1001, 'x')), out));
  EXPECT_EQ(1001u, out.capacity());
  EXPECT_EQ(Bytes(1001, 'x'), out);
}

TEST_F(ReadFileTest, EmptyVectorWithEnoughMemoryIsNotReallocated) {
  Bytes out(1000);
  const uint8_t* const memory = out.data();
  out.clear();
  ASSERT_TRUE(ReadFile(MakeFile(std::string(1000, 'x')), out));
  EXPECT_EQ(memory, out.data());
  EXPECT_EQ(Bytes(1000, 'x'), out);
}

// ---- Opening waits for the holder of a lease, but not for a writer of a FIFO.

TEST_F(OpenForReadingTest, FifoIsOpenedWithoutWaiting) {
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
  if (!lease.IsHeld()) GTEST_SKIP() << "the file system of " << path << " does not support leases";
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
    if (!lease.IsHeld())
      GTEST_SKIP() << "the file system of " << path << " does not support leases";
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

TEST_F(ReadFileTest, ReturnsTheStateBeforeTheFirstByteIsRead) {
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

// The test compares two states, each with itself. IsSameFile returns false for both, because
// neither is the state of a regular file.
TEST(IsSameFile, FilesThatAreNotRegularAreNotTheSame) {
  struct stat state = {};
  EXPECT_FALSE(IsSameFile(state, state));
  state.st_mode = S_IFDIR | 0700;
  EXPECT_FALSE(IsSameFile(state, state));
}

TEST(StringToVector, BytesAreInOrderWithoutATerminator) {
  EXPECT_EQ(Bytes({'a', 0, 0xFF, 'b'}), StringToVector(std::string("a\0\xFF"
                                                                   "b",
                                                                   4)));
}

TEST(StringToVector, EmptyStringGivesAnEmptyVector) { EXPECT_TRUE(StringToVector("").empty()); }

}  // namespace
