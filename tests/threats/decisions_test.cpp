// Tests two refusals: the refusal of an exponent of 1 or -1, and the refusal of a library that no
// longer has the bytes that were read. The tests start from packages that aapt and apksigner made.
// Most tests then forge the signature block, or change or replace a library.
#include <sys/stat.h>

#include <algorithm>
#include <functional>

#include "support/process.h"
#include "support/signature_block.h"
#include "threats/device.h"

namespace {

// ---- With an exponent of 1 or -1, anyone can forge signatures for any RSA modulus.

// The victim's package with a forged signature block.
Bytes WithForgedBlock(const Bytes& exponent) {
  const TempDir directory;
  const std::string apk = directory.Write("base.apk", Made("victim"));
  const std::string entry = "META-INF/CERT.SF";
  EXPECT_EQ(RunProcess({"unzip", "-q", apk, entry, "-d", directory.path()}).status, 0);
  const Bytes signature_file = ToBytes(ContentOf(directory / entry));
  directory.Write("META-INF/CERT.RSA", ForgedBlock(signature_file, "rsa-2048", exponent));
  EXPECT_EQ(RunProcess({"aapt", "remove", apk, "META-INF/CERT.RSA"}).status, 0);
  EXPECT_EQ(RunProcess({"aapt", "add", apk, "META-INF/CERT.RSA"}, directory.path()).status, 0);
  return ToBytes(ContentOf(apk));
}

// The tool reads an exponent's first four bytes in host byte order. For each exponent in this test,
// the result is 1 or -1. If an exponent is shorter, the tool reads the missing bytes as 0. The
// fifth byte of a longer exponent overwrites the first byte of the modulus length, the sixth byte
// overwrites the second byte, and so on up to the eighth byte. The length is 256, which is stored
// as the bytes 00 01 00 00. The exponents of this test overwrite each of these bytes with the same
// value, so that the length does not change.
TEST(Threat, ExponentReadAsOneOrMinusOneIsRefused) {
  for (const char* exponent :
       {"01", "01 00", "01 00 00", "01 00 00 00", "FF FF FF FF", "01 00 00 00 00 01",
        "01 00 00 00 00 01 00", "01 00 00 00 00 01 00 00", "01 00 00 00 00 01 00 00 AA BB",
        "01 00 00 00 00", "FF FF FF FF 00 01", "FF FF FF FF 00 01 00 00"}) {
    Device device(WithForgedBlock(FromHex(exponent)));
    EXPECT_EQ(device.FilesSignedWith(""), Strings()) << exponent;
    EXPECT_EQ(device.log.records()[0], Error("RSA could not set key: 5\n")) << exponent;
    EXPECT_EQ(device.log.records()[1], Error("file not verified: META-INF/CERT.SF\n")) << exponent;
  }
}

// The tool does not refuse these exponents. It then checks the certificate's signature, and this
// check fails.
TEST(Threat, OtherExponentsReachTheCheckOfTheCertificate) {
  for (const char* exponent : {"00", "02", "03", "11", "7F", "01 00 01", "01 01", "00 01", "02 00",
                               "FE FF FF FF", "FF FF FF 7F", "FF FF FF", "FF", "00 00 00 01"}) {
    Device device(WithForgedBlock(FromHex(exponent)));
    EXPECT_EQ(device.FilesSignedWith(""), Strings()) << exponent;
    EXPECT_EQ(device.log.records()[0].text.rfind("RSA could not verify certificate: ", 0), 0u)
        << exponent << ": " << device.log.records()[0];
  }
}

// ---- A library is signed only if it still has the bytes that were read.

class LibraryAfterItsCheck : public testing::Test {
 protected:
  LibraryAfterItsCheck() : device_(Made("dots")), target_(device_.Path("../mine/libx.so")) {
    device_.Install("lib/arm64/x", {}).Install("../mine/libx.so", kMine);
    device_.Install("../system/program", ToBytes("\177ELF system"));
  }

  // Runs the tool's steps, and calls `exchange` just before the tool opens the library the second
  // time. Returns the files that are signed: the package, and perhaps the library.
  Strings FilesSigned(const std::function<void()>& exchange) {
    device_.phone.before_open = [=](const char* path, int) {
      seen_ += std::string(path).find("/mine/libx.so") != std::string::npos;
      if (seen_ != 2) return;
      exchange();
      device_.phone.before_open = nullptr;
    };
    const Strings files = device_.FilesSignedFor("rsa-2048-other");
    EXPECT_EQ(seen_, 2) << "the library was not opened a second time";
    return files;
  }
  void ExpectRefused(const std::function<void()>& exchange) {
    alarm(60);  // ends a test that waits for a FIFO
    EXPECT_EQ(FilesSigned(exchange), Strings({"app/base.apk"}));
    alarm(0);
    const std::string path = device_.Path("lib/arm64/../../../mine/libx.so");
    const Records& records = device_.log.records();
    EXPECT_EQ(std::count(records.begin(), records.end(),
                         Error("VeltSignJni: File not verified: " + path + "\n")),
              1);
  }
  void Remove() { EXPECT_EQ(unlink(target_.c_str()), 0); }

  static constexpr char kMineText[] = "\177ELF mine";
  const Bytes kMine = ToBytes(kMineText);
  Device device_;
  const std::string target_;
  int seen_ = 0;
};

TEST_F(LibraryAfterItsCheck, IsSignedIfItStaysTheSame) {
  EXPECT_EQ(FilesSigned([] {}), Strings({"mine/libx.so", "app/base.apk"}));
}

TEST_F(LibraryAfterItsCheck, IsRefusedIfItIsASymbolicLinkToAnotherFile) {
  ExpectRefused([this] {
    Remove();
    EXPECT_EQ(symlink(device_.Path("../system/program").c_str(), target_.c_str()), 0);
  });
}

TEST_F(LibraryAfterItsCheck, IsRefusedWithoutWaitingIfItIsAFifo) {
  ExpectRefused([this] {
    Remove();
    EXPECT_EQ(mkfifo(target_.c_str(), 0600), 0);
  });
}

TEST_F(LibraryAfterItsCheck, IsRefusedIfItIsADirectory) {
  ExpectRefused([this] {
    Remove();
    EXPECT_EQ(mkdir(target_.c_str(), 0700), 0);
  });
}

TEST_F(LibraryAfterItsCheck, IsSignedIfItIsAnotherFileWithTheSameBytes) {
  const Strings files = FilesSigned([this] {
    device_.Install("../mine/other", kMine);
    EXPECT_EQ(rename(device_.Path("../mine/other").c_str(), target_.c_str()), 0);
  });
  EXPECT_EQ(files, Strings({"mine/libx.so", "app/base.apk"}));
}

TEST_F(LibraryAfterItsCheck, IsRefusedIfItWasWrittenTo) {
  ExpectRefused([this] {
    usleep(20000);  // the clock of file systems is coarse
    WriteFile(target_, ToBytes("\177ELF evil"));
  });
}

// A program can set a file's atime and mtime, but not its ctime.
TEST_F(LibraryAfterItsCheck, IsRefusedIfItWasWrittenToAndItsTimeSetBack) {
  ExpectRefused([this] {
    struct stat before;
    EXPECT_EQ(stat(target_.c_str(), &before), 0);
    usleep(20000);
    WriteFile(target_, ToBytes("\177ELF evil"));
    const timespec times[] = {before.st_atim, before.st_mtim};
    EXPECT_EQ(utimensat(AT_FDCWD, target_.c_str(), times, 0), 0);
  });
}

TEST_F(LibraryAfterItsCheck, IsRefusedIfItIsLonger) {
  ExpectRefused([this] { WriteFile(target_, ToBytes("\177ELF mine and more")); });
}

TEST_F(LibraryAfterItsCheck, LeavesNoDescriptorOpen) {
  const int next = dup(0);
  close(next);
  ExpectRefused([this] {
    Remove();
    EXPECT_EQ(mkfifo(target_.c_str(), 0600), 0);
  });
  const int now = dup(0);
  close(now);
  EXPECT_EQ(now, next);
}

}  // namespace
