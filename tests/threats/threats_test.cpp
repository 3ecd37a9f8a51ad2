// What a hostile file can reach by rules that are lenient or trusting on purpose, and where that
// ends. docs/threat-model.md says why each is as it is.
#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <functional>

#include "apk/apk.h"
#include "sign/registration.h"
#include "sign/signing.h"
#include "support/compiled_manifest.h"
#include "support/files.h"
#include "support/log_capture.h"
#include "support/package.h"
#include "support/phone.h"
#include "support/process.h"
#include "support/signature_block.h"

namespace {

using Strings = std::vector<std::string>;

const Bytes kLibrary = ToBytes("\177ELF foo");

// The whole tool over a file, on a healthy phone.
class Device {
 public:
  explicit Device(const Bytes& archive) : path_(temp_.Write("app/base.apk", archive)) {}
  explicit Device(const Package& package) : Device(package.Build()) {}

  // Puts the bytes on disk, at a path from the package's folder on.
  Device& Install(const std::string& path, const Bytes& content) {
    temp_.Write("app/" + path, content);
    return *this;
  }
  // The same path, of the file system.
  std::string Path(const std::string& path) const { return temp_ / ("app/" + path); }

  // The names, from the folder above the package's on, of the files that were signed with the key
  // of `signer`, in their order.
  Strings FilesSignedFor(const std::string& signer) {
    const std::string payload = "2000" + Hex(DigestOf(Digest::kSha256, ModulusOf(signer)));
    return FilesSignedWith(payload);
  }

  // Of all that begin so, in hexadecimal digits.
  Strings FilesSignedWith(const std::string& payload) {
    Strings files;
    phone.witness = [&](int fd, const std::string& event) {
      const std::string sign = "sign " + std::to_string(fd) + " ";
      if (event.rfind(sign + payload, 0) != 0) return;
      char path[4096] = {};
      const std::string link = "/proc/self/fd/" + std::to_string(fd);
      if (readlink(link.c_str(), path, sizeof(path) - 1) < 0) return;
      files.push_back(std::string(path).substr(temp_.path().size() + 1));
    };
    RunSteps();
    return files;
  }

  // What libzu was asked to register: name and data.
  Strings Registered() {
    RunSteps();
    Strings registered;
    for (const std::string& event : phone.events) {
      if (event.rfind("register ", 0) != 0) continue;
      registered.push_back(event.substr(event.find(' ', 9) + 1));
    }
    return registered;
  }

  LogCapture log;
  Phone phone;

 private:
  void RunSteps() {
    const int fd = open(path_.c_str(), O_RDONLY);
    ASSERT_GE(fd, 0);
    ApkTools::Apk apk(fd);
    VeltSignJni(apk, fd, path_.c_str());
    VeltSign(apk, fd, fd);
    ZuSign(apk, fd, fd);
    close(fd);
  }

  TempDir temp_;
  const std::string path_;
};

PackageOptions WithLibrariesNamed(const Strings& names) {
  PackageOptions options;
  options.entries.clear();
  for (const std::string& name : names) options.entries.push_back({name, kLibrary});
  return options;
}

// What aapt and apksigner made.
Bytes Made(const std::string& name) {
  return ToBytes(ContentOf(THREAT_PACKAGES "/" + name + "/base.apk"));
}

// ---- An exponent of 1: anyone can write down signatures for any key.

// The made package of the victim, its signature block exchanged for a forged one.
Bytes WithForgedBlock(const Bytes& exponent) {
  const TempDir folder;
  const std::string apk = folder.Write("base.apk", Made("victim"));
  const std::string entry = "META-INF/CERT.SF";
  EXPECT_EQ(RunProcess({"unzip", "-q", apk, entry, "-d", folder.path()}).status, 0);
  const Bytes signature_file = ToBytes(ContentOf(folder / entry));
  folder.Write("META-INF/CERT.RSA", ForgedBlock(signature_file, "rsa-2048", exponent));
  EXPECT_EQ(RunProcess({"aapt", "remove", apk, "META-INF/CERT.RSA"}).status, 0);
  EXPECT_EQ(RunProcess({"aapt", "add", apk, "META-INF/CERT.RSA"}, folder.path()).status, 0);
  return ToBytes(ContentOf(apk));
}

// However 1 and -1 are written so that the record reads them: with any tail that leaves the length
// of the modulus as it is, which is 256, 00 01 00 00 in the order of the host.
TEST(Threat, AnExponentOfOneIsRefusedHoweverItIsWritten) {
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

// They reach the signature's check, and fail there.
TEST(Threat, AnyOtherExponentAsksForThePrivateKey) {
  for (const char* exponent : {"00", "02", "03", "11", "7F", "01 00 01", "01 01", "00 01", "02 00",
                               "FE FF FF FF", "FF FF FF 7F", "FF FF FF", "FF", "00 00 00 01"}) {
    Device device(WithForgedBlock(FromHex(exponent)));
    EXPECT_EQ(device.FilesSignedWith(""), Strings()) << exponent;
    EXPECT_EQ(device.log.records()[0].text.rfind("RSA could not verify certificate: ", 0), 0u)
        << exponent << ": " << device.log.records()[0];
  }
}

// ---- The file that is signed is the file that was read.

class ExchangedLibrary : public testing::Test {
 protected:
  ExchangedLibrary() : device_(Made("dots")), target_(device_.Path("../mine/libx.so")) {
    device_.Install("lib/arm64/x", {}).Install("../mine/libx.so", kMine);
    device_.Install("../system/program", ToBytes("\177ELF system"));
  }

  // What is signed when `exchange` is made between the check and the signing: the package, and the
  // library or not.
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
    alarm(60);  // whoever waits for a FIFO is ended
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

TEST_F(ExchangedLibrary, ThatStaysAsItWasIsSigned) {
  EXPECT_EQ(FilesSigned([] {}), Strings({"mine/libx.so", "app/base.apk"}));
}

TEST_F(ExchangedLibrary, ForASymbolicLinkToAnotherFileIsRefused) {
  ExpectRefused([this] {
    Remove();
    EXPECT_EQ(symlink(device_.Path("../system/program").c_str(), target_.c_str()), 0);
  });
}

TEST_F(ExchangedLibrary, ForAFifoIsRefusedWithoutWaiting) {
  ExpectRefused([this] {
    Remove();
    EXPECT_EQ(mkfifo(target_.c_str(), 0600), 0);
  });
}

TEST_F(ExchangedLibrary, ForAFolderIsRefused) {
  ExpectRefused([this] {
    Remove();
    EXPECT_EQ(mkdir(target_.c_str(), 0700), 0);
  });
}

TEST_F(ExchangedLibrary, ForAnotherFileWithTheSameBytesIsRefused) {
  ExpectRefused([this] {
    device_.Install("../mine/other", kMine);
    EXPECT_EQ(rename(device_.Path("../mine/other").c_str(), target_.c_str()), 0);
  });
}

TEST_F(ExchangedLibrary, WrittenToIsRefused) {
  ExpectRefused([this] {
    usleep(20000);  // the clock of file systems is coarse
    WriteFile(target_, ToBytes("\177ELF evil"));
  });
}

// Times can be set, but not the one of the last change of state.
TEST_F(ExchangedLibrary, WrittenToWithItsTimeSetBackIsRefused) {
  ExpectRefused([this] {
    struct stat before;
    EXPECT_EQ(stat(target_.c_str(), &before), 0);
    usleep(20000);
    WriteFile(target_, ToBytes("\177ELF evil"));
    const timespec times[] = {before.st_atim, before.st_mtim};
    EXPECT_EQ(utimensat(AT_FDCWD, target_.c_str(), times, 0), 0);
  });
}

TEST_F(ExchangedLibrary, LongerIsRefused) {
  ExpectRefused([this] { WriteFile(target_, ToBytes("\177ELF mine and more")); });
}

TEST_F(ExchangedLibrary, LeavesNoDescriptorBehind) {
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

// ---- What is left.

TEST(Threat, DotsInAnEntryNameReachAFileOutsideWhoseBytesTheManifestLists) {
  Device device(MakePackage(WithLibrariesNamed({"lib/arm64-v8a/../../../other/libfoo.so"})));
  device.Install("lib/arm64/x", {}).Install("../other/libfoo.so", kLibrary);
  EXPECT_EQ(device.FilesSignedFor("rsa-2048"), Strings({"other/libfoo.so", "app/base.apk"}));
}

TEST(Threat, DotsInAnEntryNameSignNoFileOutsideWithOtherBytes) {
  Device device(MakePackage(WithLibrariesNamed({"lib/arm64-v8a/../../../other/libfoo.so"})));
  device.Install("lib/arm64/x", {}).Install("../other/libfoo.so", ToBytes("another's"));
  EXPECT_EQ(device.FilesSignedFor("rsa-2048"), Strings({"app/base.apk"}));
}

TEST(Threat, FileIsReadAndSignedForEachEntryThatNamesIt) {
  Device device(MakePackage(WithLibrariesNamed({"lib/arm64-v8a/a.so", "lib/arm64-v8a/./a.so"})));
  device.Install("lib/arm64/a.so", kLibrary);
  EXPECT_EQ(device.FilesSignedFor("rsa-2048"),
            Strings({"app/lib/arm64/a.so", "app/lib/arm64/a.so", "app/base.apk"}));
}

TEST(Threat, ReplacedAndroidManifestNamesWhatTheSignersKeyIsRegisteredFor) {
  Package package = MakePackage();
  package.Item(kAndroidManifestName).data = CompiledManifest("com.example.other", true);
  EXPECT_EQ(Device(package).Registered(),
            Strings({"com.example.other " + Hex(ModulusOf("rsa-2048"))}));
}

TEST(Threat, PackageNameIsRegisteredUpToItsFirstNul) {
  PackageOptions options;
  options.package_name = std::string("com.example.app\0.other", 22);
  options.secure_storage = true;
  EXPECT_EQ(Device(MakePackage(options)).Registered(),
            Strings({"com.example.app " + Hex(ModulusOf("rsa-2048"))}));
}

TEST(Threat, PackageWhoseAndroidManifestCannotBeExtractedIsAJarThatTheKernelMustTrust) {
  Package package = MakePackage();
  ZipItem& manifest = package.Item(kAndroidManifestName);
  manifest = ClaimingLength(manifest, static_cast<uint32_t>(manifest.data.size() + 1));
  EXPECT_EQ(Device(package).FilesSignedWith("0000"), Strings({"app/base.apk"}));
  Device other(package);
  other.phone.verify_errno = ENOKEY;
  EXPECT_EQ(other.FilesSignedWith("0000"), Strings());
}

}  // namespace
