// Tests a library that is touched, exchanged or written to while the tool works on it. Each change
// happens at an exact moment: before or after an open, before or after a read, or before the kernel
// signs.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <algorithm>
#include <cstdio>
#include <functional>

#include "sign/package_on_phone.h"

namespace {

using Change = std::function<void()>;

class ChangedLibrary : public testing::Test {
 protected:
  ChangedLibrary() {
    file_.Install("lib/arm64/libfoo.so", kGood);
    file_.Install("good", kGood);
    file_.Install("evil", kEvil);
    file_.phone.before_open = [this](const char* path, int) {
      if (path == target_ && ++opens_ == 2) Make(before_second_open_);
    };
    file_.phone.after_open = [this](const char* path, int) {
      if (path == target_ && opens_ == 2) Make(after_second_open_);
    };
    file_.phone.before_read = [this](int) { Make(before_digest_[++digests_]); };
    file_.phone.after_read = [this](int) { Make(after_digest_[digests_]); };
    file_.phone.before_integrity = [this] { Make(before_signing_); };
    file_.phone.witness = [this](int fd, const std::string&) { signed_.push_back(ReadAll(fd)); };
  }
  void SetUp() override { alarm(60); }  // ends a test that waits for a FIFO
  void TearDown() override { alarm(0); }

  // Expects that the library is signed after its digest was computed `digests` times, and that no
  // refusal is logged.
  void ExpectSigned(int digests) {
    EXPECT_EQ(file_.SignJni(), 0U);
    EXPECT_EQ(signed_, std::vector<Bytes>({kGood.data}));
    EXPECT_EQ(digests_, digests);
    EXPECT_EQ(file_.log.records(),
              Records({Starts(file_.fd()), Info("VeltSignOat: Apk case.\n"), Finished()}));
  }
  void ExpectRefused(int digests) {
    const int next = dup(0);
    close(next);
    EXPECT_EQ(file_.SignJni(), 0U);
    EXPECT_EQ(file_.phone.events, Events());
    EXPECT_EQ(digests_, digests);
    EXPECT_EQ(file_.log.records(),
              Records({Starts(file_.fd()),
                       Error("VeltSignJni: File not verified: " + target_ + "\n"), Finished()}));
    EXPECT_EQ(dup(0), next) << "the library was left open";
    close(next);
  }

  // Moves the file of this name to the library's path.
  void Rename(const std::string& name) const {
    EXPECT_EQ(rename(file_.Path(name).c_str(), target_.c_str()), 0);
  }
  // Makes the library's path a symbolic link to the file of this name. The state of that file does
  // not change.
  void Link(const std::string& name) const {
    unlink(target_.c_str());
    EXPECT_EQ(symlink(file_.Path(name).c_str(), target_.c_str()), 0);
  }
  // Overwrites the library in place with other bytes of the same length.
  void WriteInPlace() const {
    UntilNoticed([this] {
      FILE* const file = fopen(target_.c_str(), "r+");
      EXPECT_EQ(fwrite(kEvil.data.data(), 1, kEvil.data.size(), file), kEvil.data.size());
      fclose(file);
    });
  }

  // Repeats the change until the library's ctime is different. The clock of a file system is
  // coarse, so a single change may leave the ctime equal.
  void UntilNoticed(const Change& change) const {
    const struct stat before = State();
    do {
      change();
    } while (State().st_ctim.tv_sec == before.st_ctim.tv_sec &&
             State().st_ctim.tv_nsec == before.st_ctim.tv_nsec);
  }
  struct stat State() const {
    struct stat state;
    EXPECT_EQ(stat(target_.c_str(), &state), 0);
    return state;
  }

  // The number of open descriptors of this process for the library.
  int DescriptorsOfLibrary() const {
    const struct stat library = State();
    int count = 0;
    for (int fd = 0; fd < 200; ++fd) {
      struct stat state;
      count += fstat(fd, &state) == 0 && state.st_dev == library.st_dev &&
               state.st_ino == library.st_ino;
    }
    return count;
  }

  // After this number of digests, each fstat of the descriptor that is to be signed fails.
  void FailStateAfter(int digests) {
    file_.phone.fstat_error = [this, digests](int) { return digests_ == digests ? EIO : 0; };
  }

  static void Make(const Change& change) {
    if (change) change();
  }
  static Bytes ReadAll(int fd) {
    Bytes bytes(100);
    bytes.resize(static_cast<size_t>(std::max<ssize_t>(0, pread(fd, bytes.data(), 100, 0))));
    return bytes;
  }

  const ZipItem kGood = Library("lib/arm64-v8a/libfoo.so");
  const ZipItem kEvil = Library("LIB/arm64-v8a/libfoo.so");
  PackageOnPhone file_{MakePackage(WithLibraries({kGood}))};
  const std::string target_ = file_.Path("lib/arm64/libfoo.so");
  Change before_second_open_, after_second_open_, before_signing_;
  Change before_digest_[9], after_digest_[9];  // by the digest's number, from 1
  int opens_ = 0;
  int digests_ = 0;
  std::vector<Bytes> signed_;  // the bytes behind each signed descriptor
};

TEST_F(ChangedLibrary, UnchangedLibraryIsSignedAfterOneDigest) { ExpectSigned(1); }

// --- Touched: the library's ctime changes, but not its bytes. Each test runs four times: with
// chmod, chown, link and utimensat. An installer may call these functions after it wrote the
// library.

class TouchedLibrary : public ChangedLibrary, public testing::WithParamInterface<const char*> {
 protected:
  void Touch() const {
    UntilNoticed([this] {
      const struct stat now = State();
      const std::string way = GetParam(), other = file_.Path("other-name");
      if (way == "chmod") {
        EXPECT_EQ(chmod(target_.c_str(), now.st_mode & 07777), 0);
      } else if (way == "chown") {
        EXPECT_EQ(chown(target_.c_str(), now.st_uid, now.st_gid), 0);
      } else if (way == "link") {
        EXPECT_EQ(link(target_.c_str(), other.c_str()), 0);
        EXPECT_EQ(unlink(other.c_str()), 0);
      } else {
        const timespec times[] = {now.st_atim, now.st_mtim};
        EXPECT_EQ(utimensat(AT_FDCWD, target_.c_str(), times, 0), 0);
      }
    });
  }
};
INSTANTIATE_TEST_SUITE_P(By, TouchedLibrary, testing::Values("chmod", "chown", "link", "utimensat"),
                         [](const auto& info) { return std::string(info.param); });

TEST_P(TouchedLibrary, IsSignedAfter2DigestsIfTouchedBeforeTheFirstRead) {
  before_digest_[1] = [this] { Touch(); };
  ExpectSigned(2);
}

TEST_P(TouchedLibrary, IsSignedAfter2DigestsIfTouchedBeforeTheSecondOpening) {
  before_second_open_ = [this] { Touch(); };
  ExpectSigned(2);
}

TEST_P(TouchedLibrary, IsSignedAfter3DigestsIfTouchedTwice) {
  before_digest_[1] = after_digest_[2] = [this] { Touch(); };
  ExpectSigned(3);
}

TEST_P(TouchedLibrary, IsRefusedAfter3DigestsIfTouchedBeforeEachRead) {
  for (Change& change : before_digest_) change = [this] { Touch(); };
  ExpectRefused(3);
}

TEST_P(TouchedLibrary, IsRefusedAfter3DigestsIfTouchedAfterEachRead) {
  for (Change& change : after_digest_) change = [this] { Touch(); };
  ExpectRefused(3);
}

// --- Exchanged: by a rename, or behind a symbolic link.

TEST_F(ChangedLibrary, IsRefusedIfExchangedForOtherBytesBeforeSecondOpening) {
  before_second_open_ = [this] { Rename("evil"); };
  ExpectRefused(2);
}

TEST_F(ChangedLibrary, IsSignedIfExchangedForTheSameBytesBeforeSecondOpening) {
  before_second_open_ = [this] { Rename("good"); };
  ExpectSigned(2);
}

TEST_F(ChangedLibrary, IsSignedAsOpenedIfExchangedAfterItsSecondOpening) {
  before_second_open_ = [this] { Rename("good"); };
  after_second_open_ = [this] { Rename("evil"); };
  ExpectSigned(2);
}

// The rename removes the name of the file that was read. The removal changes the ctime of this
// file, so the tool digests it a third time.
TEST_F(ChangedLibrary, IsSignedAsReadIfExchangedAfterItsLastByte) {
  before_second_open_ = [this] { Rename("good"); };
  after_digest_[2] = [this] { Rename("evil"); };
  ExpectSigned(3);
}

TEST_F(ChangedLibrary, IsSignedAsReadIfExchangedBeforeTheKernelSigns) {
  before_signing_ = [this] { Rename("evil"); };
  ExpectSigned(1);
}

// After the second opening, the path again leads to the file that was read, and the state of that
// file is unchanged. Only the new descriptor refers to the other file.
TEST_F(ChangedLibrary, IsRefusedIfExchangedOnlyDuringItsSecondOpening) {
  Link("good");
  before_second_open_ = [this] { Link("evil"); };
  after_second_open_ = [this] { Link("good"); };
  ExpectRefused(2);
}

TEST_F(ChangedLibrary, IsRefusedIfExchangedFromSecondOpeningToSecondDigest) {
  Link("good");
  before_second_open_ = [this] { Link("evil"); };
  before_digest_[2] = [this] { Link("good"); };
  ExpectRefused(2);
}

// --- No longer a regular file: refused at once.

TEST_F(ChangedLibrary, IsRefusedAtOnceIfExchangedForAFifo) {
  before_second_open_ = [this] {
    EXPECT_EQ(mkfifo(file_.Path("fifo").c_str(), 0600), 0);
    Rename("fifo");
  };
  ExpectRefused(1);
}

TEST_F(ChangedLibrary, IsRefusedAtOnceIfExchangedForADirectory) {
  before_second_open_ = [this] { Link("lib"); };
  ExpectRefused(1);
}

// --- The descriptor of the library's first opening: kept open, or missing.

// A file system may give a removed file's inode number to a new file. If the new file has the same
// size and the same times, it looks like the file that was read. The tool therefore keeps the first
// descriptor open: the inode number then cannot be used again.
TEST_F(ChangedLibrary, StaysOpenUntilItIsOpenedAgain) {
  after_digest_[1] = [this] { EXPECT_EQ(DescriptorsOfLibrary(), 1); };
  before_second_open_ = [this] { EXPECT_EQ(DescriptorsOfLibrary(), 1); };
  after_second_open_ = [this] { EXPECT_EQ(DescriptorsOfLibrary(), 2); };
  ExpectSigned(1);
}

TEST_F(ChangedLibrary, IsRefusedIfItAppearsAfterItsFirstOpeningFailed) {
  int asked = 0;
  file_.phone.open_error = [&](const char* path, int) {
    return path == target_ && ++asked == 1 ? ENOENT : 0;
  };
  ExpectRefused(1);
  EXPECT_EQ(asked, 2);
}

// --- Written to in place. The file's times show the change.

TEST_F(ChangedLibrary, IsRefusedIfWrittenToBeforeItsSecondOpening) {
  before_second_open_ = [this] { WriteInPlace(); };
  ExpectRefused(2);
}

TEST_F(ChangedLibrary, IsRefusedIfWrittenToAfterItsSecondOpening) {
  after_second_open_ = [this] { WriteInPlace(); };
  ExpectRefused(2);
}

TEST_F(ChangedLibrary, IsRefusedIfWrittenToAfterItsSecondDigest) {
  before_second_open_ = [this] { Rename("good"); };
  after_digest_[2] = [this] { WriteInPlace(); };
  ExpectRefused(3);
}

TEST_F(ChangedLibrary, IsRefusedIfWrittenToAfterItsThirdDigest) {
  before_second_open_ = [this] { Rename("good"); };
  after_digest_[2] = [this] {
    UntilNoticed([this] { EXPECT_EQ(chmod(target_.c_str(), 0600), 0); });
  };
  after_digest_[3] = [this] { WriteInPlace(); };
  ExpectRefused(3);
}

// --- The state of the file to sign cannot be read.

TEST_F(ChangedLibrary, IsRefusedIfItsStateCannotBeReadAfterItsSecondOpening) {
  FailStateAfter(1);
  ExpectRefused(1);
}

// The state that was read before the second digest must not count as the state after it.
TEST_F(ChangedLibrary, IsRefusedIfItsStateCannotBeReadAfterItsSecondDigest) {
  before_second_open_ = [this] { Rename("good"); };
  after_digest_[2] = [this] { WriteInPlace(); };
  FailStateAfter(2);
  ExpectRefused(2);
}

// --- Under a lease. The tool's second open of the library fails with EWOULDBLOCK, as it does if
// another process has a lease on the library.

TEST_F(ChangedLibrary, IsSignedIfLeasedAtItsSecondOpening) {
  int asked = 0;
  file_.phone.open_error = [&](const char* path, int) {
    return path == target_ && ++asked == 2 ? EWOULDBLOCK : 0;
  };
  ExpectSigned(1);
  EXPECT_EQ(asked, 3);  // the third open has O_PATH; the fourth, of a path in /proc, is not counted
}

// The holder of the lease could put a FIFO at the library's path before the tool opens this path
// again.
TEST_F(ChangedLibrary, FifoThatReplacesALeasedLibraryIsNotWaitedFor) {
  int asked = 0;
  file_.phone.open_error = [&](const char* path, int) {
    if (path != target_ || ++asked != 2) return 0;
    EXPECT_EQ(mkfifo(file_.Path("fifo").c_str(), 0600), 0);
    Rename("fifo");
    return EWOULDBLOCK;
  };
  EXPECT_EQ(file_.SignJni(), 0U);
  EXPECT_EQ(file_.phone.events, Events());
  EXPECT_EQ(file_.log.records(),
            Records({Starts(file_.fd()), Error("File " + target_ + " is not opened"),
                     Error("Error 11: Resource temporarily unavailable.\n"), Finished()}));
}

TEST_F(ChangedLibrary, IsNotOpenedIfRemovedDuringTheLease) {
  int asked = 0;
  file_.phone.open_error = [&](const char* path, int) {
    if (path != target_ || ++asked != 2) return 0;
    EXPECT_EQ(unlink(target_.c_str()), 0);
    return EWOULDBLOCK;
  };
  EXPECT_EQ(file_.SignJni(), 0U);
  EXPECT_EQ(file_.phone.events, Events());
  EXPECT_EQ(file_.log.records(),
            Records({Starts(file_.fd()), Error("File " + target_ + " is not opened"),
                     Error("Error 2: No such file or directory.\n"), Finished()}));
}

}  // namespace
