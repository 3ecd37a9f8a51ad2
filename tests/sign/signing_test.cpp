// Tests which files the tool asks the kernel to sign, their payloads, and the log. PackageOnPhone
// writes a package to disk, and its function Install writes a library beside the package. A Phone
// replaces the kernel's integrity feature.
#include "sign/signing.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <cerrno>

#include "sign/integrity.h"
#include "sign/package_on_phone.h"

namespace {

Package BadPackage() {
  Package package = MakePackage();
  package.Tamper(kManifestName);
  return package;
}

// The library that comes first in the iteration over the package.
std::string FirstOf(ApkTools::Apk& apk) {
  void* cookie = nullptr;
  EXPECT_EQ(apk.StartIteration(&cookie, "lib/", ".so"), 0);
  ZipEntry entry;
  std::string name;
  EXPECT_EQ(apk.Next(cookie, &entry, name), 0);
  apk.EndIteration(cookie);
  return name;
}

LogRecord SignStarts(int fd) {
  const std::string text = std::to_string(fd);
  return Info("VeltSign starts: zip_fd = " + text + ", fd = " + text + ".\n");
}

// --- VeltSign -----------------------------------------------------------------------------------

TEST(VeltSign, GoodPackageIsSignedWithTheDigestOfItsSignersKey) {
  PackageOnPhone file(MakePackage());
  EXPECT_EQ(file.Sign(), 0U);
  EXPECT_EQ(file.phone.events, Events({kSelf, SignEvent(file.fd())}));
  EXPECT_EQ(file.log.records(), Records({SignStarts(file.fd()), Info("VeltSignOat: Apk case.\n"),
                                         Info("VeltSign finished: 0.\n")}));
}

TEST(VeltSign, PayloadOfAPackageIs34BytesThatStartWith32And0) {
  PackageOnPhone file(MakePackage());
  file.Sign();
  ASSERT_EQ(file.phone.events.size(), 2U);
  const std::string& event = file.phone.events[1];
  const std::string payload = event.substr(event.rfind(' ') + 1);
  EXPECT_EQ(payload.size(), 2 * 34U);
  EXPECT_EQ(payload.substr(0, 4), "2000");
}

TEST(VeltSign, SignsTheSecondDescriptorAndOnlyLogsTheFirst) {
  PackageOnPhone file(MakePackage());
  EXPECT_EQ(VeltSign(file.apk(), 77, file.fd()), 0U);
  EXPECT_EQ(file.phone.events, Events({kSelf, SignEvent(file.fd())}));
  EXPECT_EQ(file.log.records()[0],
            Info("VeltSign starts: zip_fd = 77, fd = " + std::to_string(file.fd()) + ".\n"));
}

TEST(VeltSign, BadPackageIsNotSignedAndNoReasonIsLogged) {
  PackageOnPhone file(BadPackage());
  EXPECT_EQ(file.Sign(), kVeltFailure);
  EXPECT_EQ(file.phone.events, Events());
  EXPECT_EQ(file.log.records(), Records({SignStarts(file.fd()), Info("VeltSignOat: Apk case.\n"),
                                         Info("VeltSign finished: 65536.\n")}));
}

TEST(VeltSign, FileThatIsNotAZipArchiveIsRefused) {
  LogCapture log;
  Phone phone;
  MemoryFile file(ToBytes("no archive"));
  ApkTools::Apk apk(file.fd());
  log.Clear();
  EXPECT_EQ(VeltSign(apk, 77, file.fd()), kVeltFailure);
  EXPECT_EQ(phone.events, Events());
  EXPECT_EQ(
      log.records(),
      Records({Info("VeltSign starts: zip_fd = 77, fd = " + std::to_string(file.fd()) + ".\n"),
               Error("Zip archive is not valid for fd=77\n")}));
}

TEST(VeltSign, RefusalByTheKernelIsReportedWithItsErrno) {
  PackageOnPhone file(MakePackage());
  file.phone.sign_errno = EPERM;
  EXPECT_EQ(file.Sign(), kVeltFailure);
  EXPECT_EQ(file.phone.events, Events({kSelf, SignEvent(file.fd())}));
  EXPECT_EQ(file.log.records(),
            Records({SignStarts(file.fd()), Info("VeltSignOat: Apk case.\n"),
                     Error("VELT can't sign a file (result=10000, errno 1: Operation not "
                           "permitted).\n"),
                     Info("VeltSign finished: 65536.\n")}));
}

TEST(VeltSign, TrustedJarIsSignedWithAnEmptyPayload) {
  PackageOnPhone file(MakePackage(PlainJar()));
  EXPECT_EQ(file.Sign(), 0U);
  const std::string fd = std::to_string(file.fd());
  EXPECT_EQ(file.phone.events, Events({"verify " + fd, kSelf, "sign " + fd + " 0000"}));
  EXPECT_EQ(file.log.records(),
            Records({SignStarts(file.fd()), Info("VeltSignOat: non-Apk (Jar) case\n"),
                     Info("VeltSign finished: 0.\n")}));
}

TEST(VeltSign, JarIsVerifiedByItsOwnDescriptorAndSignedByTheSecond) {
  PackageOnPhone file(MakePackage(PlainJar()));
  EXPECT_EQ(VeltSign(file.apk(), file.fd(), 77), 0U);
  EXPECT_EQ(file.phone.events,
            Events({"verify " + std::to_string(file.fd()), kSelf, "sign 77 0000"}));
}

TEST(VeltSign, UntrustedJarIsReportedAtInfoLevelAndNotSigned) {
  PackageOnPhone file(MakePackage(PlainJar()));
  file.phone.verify_errno = ENOKEY;
  EXPECT_EQ(file.Sign(), kVeltFailure);
  EXPECT_EQ(file.phone.events, Events({"verify " + std::to_string(file.fd())}));
  EXPECT_EQ(file.log.records(),
            Records({SignStarts(file.fd()), Info("VeltSignOat: non-Apk (Jar) case\n"),
                     Info("VELT can't verify a file 126: /Required key not available.\n"),
                     Info("VeltSign finished: 65536.\n")}));
}

TEST(VeltSign, TrustedJarThatTheKernelDoesNotSignIsReported) {
  PackageOnPhone file(MakePackage(PlainJar()));
  file.phone.sign_errno = EROFS;
  EXPECT_EQ(file.Sign(), kVeltFailure);
  EXPECT_EQ(file.log.records(),
            Records({SignStarts(file.fd()), Info("VeltSignOat: non-Apk (Jar) case\n"),
                     Error("VELT can't sign a non-APK file (result=10000, errno 30: Read-only file "
                           "system).\n"),
                     Info("VeltSign finished: 65536.\n")}));
}

// --- VeltSignJni --------------------------------------------------------------------------------

TEST(VeltSignJni, LibraryIsSignedByItsOwnDescriptorWithThePackagesPayload) {
  const ZipItem library = Library("lib/arm64-v8a/libfoo.so");
  PackageOnPhone file(MakePackage(WithLibraries({library})));
  file.Install("lib/arm64/libfoo.so", library);
  EXPECT_EQ(file.SignJni(), 0U);
  // The library gets the lowest free descriptor: the package's descriptor plus 1.
  EXPECT_EQ(file.phone.events, Events({kSelf, SignEvent(file.fd() + 1)}));
  EXPECT_EQ(file.log.records(),
            Records({Starts(file.fd()), Info("VeltSignOat: Apk case.\n"), Finished()}));
}

TEST(VeltSignJni, DescriptorOfALibraryIsClosed) {
  const ZipItem library = Library("lib/arm64-v8a/libfoo.so");
  PackageOnPhone file(MakePackage(WithLibraries({library})));
  file.Install("lib/arm64/libfoo.so", library);
  file.SignJni();
  EXPECT_EQ(fcntl(file.fd() + 1, F_GETFD), -1);
}

// A library gets descriptor 0 if standard input was closed after the package was opened.
TEST(VeltSignJni, LibraryMayHaveDescriptor0) {
  const ZipItem library = Library("lib/arm64-v8a/libfoo.so");
  PackageOnPhone file(MakePackage(WithLibraries({library})));
  file.Install("lib/arm64/libfoo.so", library);
  {
    const FreeDescriptor zero(0);
    EXPECT_EQ(file.SignJni(), 0U);
    EXPECT_EQ(fcntl(0, F_GETFD), -1);
  }
  EXPECT_EQ(file.phone.events, Events({kSelf, SignEvent(0)}));
}

TEST(VeltSignJni, LibraryIsOpenedWithoutWaiting) {
  const ZipItem library = Library("lib/arm64-v8a/libfoo.so");
  PackageOnPhone file(MakePackage(WithLibraries({library})));
  file.Install("lib/arm64/libfoo.so", library);
  std::vector<int> flags;
  file.phone.before_open = [&](const char*, int given) { flags.push_back(given); };
  file.SignJni();
  EXPECT_EQ(flags, std::vector<int>({O_RDONLY | O_NONBLOCK | O_CLOEXEC, O_RDONLY | O_NONBLOCK}));
}

// A file whose name does not end in ".so" is not signed, even if it is in a directory of libraries
// and the manifest lists it.
TEST(VeltSignJni, EntryWithAnotherEndingIsNotALibrary) {
  const std::vector<ZipItem> others = {Library("lib/arm64-v8a/libfoo.so.txt"),
                                       Library("lib/arm64-v8a/libfoo.SO"),
                                       Library("lib/arm64-v8a/so")};
  PackageOnPhone file(MakePackage(WithLibraries(others)));
  for (const ZipItem& other : others) {
    file.Install("lib/arm64/" + other.name.substr(other.name.rfind('/') + 1), other);
  }
  EXPECT_EQ(file.SignJni(), 0U);
  EXPECT_EQ(file.phone.events, Events());
  EXPECT_EQ(file.log.records(), Records({Starts(file.fd()), Finished()}));
}

TEST(VeltSignJni, SignsNothingForAPackageWithoutLibraries) {
  PackageOnPhone file(MakePackage(WithLibraries({})));
  EXPECT_EQ(file.SignJni(), 0U);
  EXPECT_EQ(file.phone.events, Events());
  EXPECT_EQ(file.log.records(), Records({Starts(file.fd()), Finished()}));
}

TEST(VeltSignJni, EntryOfAnUnknownAbiIsSkippedSilently) {
  const ZipItem library = Library("lib/x86/libfoo.so");
  PackageOnPhone file(MakePackage(WithLibraries({library})));
  file.Install("lib/x86/libfoo.so", library);
  EXPECT_EQ(file.SignJni(), 0U);
  EXPECT_EQ(file.phone.events, Events());
  EXPECT_EQ(file.log.records(), Records({Starts(file.fd()), Finished()}));
}

// The order of the two entries in the iteration depends on their names. The loop tries names until
// each entry has come first.
TEST(VeltSignJni, LibraryOfAnotherAbiDoesNotEndTheIteration) {
  const ZipItem library = Library("lib/arm64-v8a/libfoo.so");
  int first = 0, last = 0;  // how often the other library came first or last
  for (int i = 0; i < 100 && (first == 0 || last == 0); ++i) {
    const ZipItem other = Library("lib/x86/lib" + std::to_string(i) + ".so");
    PackageOnPhone file(MakePackage(WithLibraries({library, other})));
    file.Install("lib/arm64/libfoo.so", library);
    ++(FirstOf(file.apk()) == other.name ? first : last);
    EXPECT_EQ(file.SignJni(), 0U);
    EXPECT_EQ(file.phone.events, Events({kSelf, SignEvent(file.fd() + 1)}));
    EXPECT_EQ(file.log.records(),
              Records({Starts(file.fd()), Info("VeltSignOat: Apk case.\n"), Finished()}));
  }
  EXPECT_GT(first, 0);
  EXPECT_GT(last, 0);
}

// Signs the libraries of a package that has one library, the entry `entry`. The library's file is
// at `installed`. True if the kernel received a request to sign that file.
bool IsFoundAt(const std::string& entry, const std::string& installed) {
  const ZipItem library = Library(entry);
  PackageOnPhone file(MakePackage(WithLibraries({library})));
  file.Install(installed, library);
  file.SignJni();
  return file.phone.events == Events({kSelf, SignEvent(file.fd() + 1)});
}

TEST(VeltSignJni, LibraryOfEachAbiIsFoundOnlyInItsDirectory) {
  EXPECT_TRUE(IsFoundAt("lib/armeabi-v7a/libfoo.so", "lib/arm/libfoo.so"));
  EXPECT_TRUE(IsFoundAt("lib/armeabi-v8a/libfoo.so", "lib/arm64/libfoo.so"));
  EXPECT_TRUE(IsFoundAt("lib/arm64-v8a/libfoo.so", "lib/arm64/libfoo.so"));
  EXPECT_TRUE(IsFoundAt("lib/armeabi/libfoo.so", "lib/arm/libfoo.so"));
  EXPECT_FALSE(IsFoundAt("lib/armeabi-v7a/libfoo.so", "lib/arm64/libfoo.so"));
  EXPECT_FALSE(IsFoundAt("lib/armeabi-v8a/libfoo.so", "lib/arm/libfoo.so"));
  EXPECT_FALSE(IsFoundAt("lib/arm64-v8a/libfoo.so", "lib/arm/libfoo.so"));
  EXPECT_FALSE(IsFoundAt("lib/armeabi/libfoo.so", "lib/armeabi/libfoo.so"));
}

TEST(VeltSignJni, AbiDirectoriesAreComparedAsPlainPrefixes) {
  EXPECT_TRUE(IsFoundAt("lib/armeabi-v7aX/libfoo.so", "lib/armX/libfoo.so"));
  EXPECT_TRUE(IsFoundAt("lib/armeabi-v9a/libfoo.so", "lib/arm-v9a/libfoo.so"));
  EXPECT_TRUE(IsFoundAt("lib/arm64-v8a.so", "lib/arm64.so"));
  EXPECT_FALSE(IsFoundAt("lib/arm64-v8/libfoo.so", "lib/arm64/libfoo.so"));
}

TEST(VeltSignJni, LibrariesOfTwoAbisInOneDirectoryAreBothSigned) {
  const ZipItem first = Library("lib/armeabi-v7a/libfoo.so");
  const ZipItem second = Library("lib/armeabi/libbar.so");
  PackageOnPhone file(MakePackage(WithLibraries({first, second})));
  file.Install("lib/arm/libfoo.so", first);
  file.Install("lib/arm/libbar.so", second);
  file.SignJni();
  const std::string event = SignEvent(file.fd() + 1);
  EXPECT_EQ(file.phone.events, Events({kSelf, event, kSelf, event}));
}

TEST(VeltSignJni, PackagePathWithoutASlashMeansTheWorkingDirectory) {
  const ZipItem library = Library("lib/armeabi-v7a/libfoo.so");
  TempDir temp;
  const MemoryFile archive(MakePackage(WithLibraries({library})).Build());
  WriteFile(temp.File("lib/arm/libfoo.so"), library.data);
  ASSERT_EQ(chdir(temp.path().c_str()), 0);
  LogCapture log;
  Phone phone;
  ApkTools::Apk apk(-1);
  apk.Init(archive.fd(), "base.apk");
  log.Clear();
  EXPECT_EQ(VeltSignJni(apk, archive.fd(), "base.apk"), 0U);
  EXPECT_EQ(phone.events, Events({kSelf, SignEvent(archive.fd() + 1)}));
  ASSERT_EQ(chdir("/"), 0);
  EXPECT_EQ(VeltSignJni(apk, archive.fd(), "base.apk"), 0U);
  EXPECT_EQ(log.records()[log.records().size() - 2],
            Error("VeltSignJni: File not verified: lib/arm/libfoo.so\n"));
}

TEST(VeltSignJni, SignsNoLibraryOfABadPackage) {
  PackageOnPhone file(BadPackage());
  file.Install("lib/arm64/libfoo.so", {"", ToBytes("\177ELF foo")});
  EXPECT_EQ(file.SignJni(), kVeltFailure);
  EXPECT_EQ(file.phone.events, Events());
  EXPECT_EQ(
      file.log.records(),
      Records({Starts(file.fd()), Error("VeltSignJni: malformed apk: " + file.path() + "\n")}));
}

TEST(VeltSignJni, ChangedLibraryIsNotSignedButTheOtherIs) {
  const ZipItem good = Library("lib/arm64-v8a/liba.so");
  const ZipItem bad = Library("lib/arm64-v8a/libb.so");
  PackageOnPhone file(MakePackage(WithLibraries({good, bad})));
  file.Install("lib/arm64/liba.so", good);
  file.Install("lib/arm64/libb.so", {"", ToBytes("\177ELF other bytes")});
  EXPECT_EQ(file.SignJni(), 0U);
  EXPECT_EQ(file.phone.events, Events({kSelf, SignEvent(file.fd() + 1)}));
  // Either entry may come first in the zip library's iteration.
  const LogRecord refused =
      Error("VeltSignJni: File not verified: " + file.Path("lib/arm64/libb.so") + "\n");
  const LogRecord signs = Info("VeltSignOat: Apk case.\n");
  const Records& records = file.log.records();
  EXPECT_TRUE(records == Records({Starts(file.fd()), signs, refused, Finished()}) ||
              records == Records({Starts(file.fd()), refused, signs, Finished()}));
}

TEST(VeltSignJni, LibraryThatIsNotOnDiskIsReportedTwice) {
  PackageOnPhone file(MakePackage(WithLibraries({Library("lib/arm64-v8a/libfoo.so")})));
  EXPECT_EQ(file.SignJni(), 0U);
  const std::string target = file.Path("lib/arm64/libfoo.so");
  EXPECT_EQ(file.phone.events, Events());
  EXPECT_EQ(file.log.records(),
            Records({Starts(file.fd()), Error("Can't open file: " + target + "\n"),
                     Error("VeltSignJni: File not verified: " + target + "\n"), Finished()}));
}

TEST(VeltSignJni, LibraryThatTheManifestDoesNotListIsNotSigned) {
  Package package = MakePackage(WithLibraries({}));
  const ZipItem library = Library("lib/arm64-v8a/libfoo.so");
  package.items.push_back(library);
  PackageOnPhone file(package);
  file.Install("lib/arm64/libfoo.so", library);
  EXPECT_EQ(file.SignJni(), 0U);
  EXPECT_EQ(file.phone.events, Events());
  EXPECT_EQ(
      file.log.records(),
      Records({Starts(file.fd()),
               Error("Can't find file in META-INF/MANIFEST.MF: lib/arm64-v8a/libfoo.so\n"),
               Error("VeltSignJni: File not verified: " + file.Path("lib/arm64/libfoo.so") + "\n"),
               Finished()}));
}

TEST(VeltSignJni, RefusalByTheKernelDoesNotChangeTheResult) {
  const ZipItem library = Library("lib/arm64-v8a/libfoo.so");
  PackageOnPhone file(MakePackage(WithLibraries({library})));
  file.Install("lib/arm64/libfoo.so", library);
  file.phone.sign_errno = EACCES;
  EXPECT_EQ(file.SignJni(), 0U);
  EXPECT_EQ(file.log.records(),
            Records({Starts(file.fd()), Info("VeltSignOat: Apk case.\n"),
                     Error("VELT can't sign a file (result=10000, errno 13: Permission denied).\n"),
                     Finished()}));
}

// The library vanishes after its check: the open for the check succeeds, and the open for the
// signing fails.
TEST(VeltSignJni, LibraryThatVanishesAfterItsCheckIsReportedWithItsErrno) {
  const ZipItem library = Library("lib/arm64-v8a/libfoo.so");
  PackageOnPhone file(MakePackage(WithLibraries({library})));
  file.Install("lib/arm64/libfoo.so", library);
  int opens = 0;
  file.phone.open_error = [&](const char*, int) { return ++opens < 2 ? 0 : ENOENT; };
  EXPECT_EQ(file.SignJni(), 0U);
  EXPECT_EQ(file.phone.events, Events());
  EXPECT_EQ(file.log.records(),
            Records({Starts(file.fd()),
                     Error("File " + file.Path("lib/arm64/libfoo.so") + " is not opened"),
                     Error("Error 2: No such file or directory.\n"), Finished()}));
}

}  // namespace
