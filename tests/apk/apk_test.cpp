// Tests Init: the flags that it sets, and the steps that verify a package. Also tests which digest
// counts if a section of META-INF/MANIFEST.MF has two digests.
#include "apk/apk.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdio>

#include "support/compiled_manifest.h"
#include "support/files.h"
#include "support/jar.h"
#include "support/log_capture.h"
#include "support/open_package.h"

using ApkTools::Apk;

namespace {

constexpr int32_t kInvalidHandle = -4;

// The flags, and whether an archive is open, in one value that can be compared.
struct State {
  bool good_zip, apk, good_apk, open;
};
bool operator==(const State& a, const State& b) {
  return a.good_zip == b.good_zip && a.apk == b.apk && a.good_apk == b.good_apk && a.open == b.open;
}
std::ostream& operator<<(std::ostream& out, const State& state) {
  return out << state.good_zip << state.apk << state.good_apk << state.open;
}

// The package must not have "classes.dex", because IsGoodApk would also check this entry. The flag
// `good_apk` must be the verdict of Init alone.
State StateOf(Apk& apk) {
  void* cookie = nullptr;
  const int32_t result = apk.StartIteration(&cookie, "", "");
  if (result == 0) apk.EndIteration(cookie);
  EXPECT_TRUE(result == 0 || result == kInvalidHandle);
  return {apk.IsGoodZip(), apk.IsApk(), apk.IsGoodApk(), result == 0};
}

// A package without a dex file, with this text as its META-INF/MANIFEST.MF.
PackageOptions WithoutDexListedBy(const std::string& text) {
  PackageOptions options = WithoutDex();
  options.edit_manifest = [=](const std::string&) { return text; };
  return options;
}

// ---- The flags after Init. They depend on the step at which Init ends.

TEST(ApkInit, AllFlagsAreFalseWithoutDescriptorAndPath) {
  LogCapture log;
  Apk apk(-1);
  EXPECT_EQ(log.records(),
            Records({Error("Can't initialize Apk: need valid file descriptor or filename\n")}));
  EXPECT_EQ(StateOf(apk), (State{false, false, false, false}));
  EXPECT_EQ(apk.GetFd(), -1);
  EXPECT_EQ(apk.GetPath(), "");
}

// A number below -1 does not name a descriptor either.
TEST(ApkInit, DescriptorBelowMinusOneWithoutPathIsRefused) {
  LogCapture log;
  Apk apk(-1);
  log.Clear();
  apk.Init(-2, nullptr);
  EXPECT_EQ(log.records(),
            Records({Error("Can't initialize Apk: need valid file descriptor or filename\n")}));
  EXPECT_EQ(apk.GetFd(), -2);
  EXPECT_EQ(StateOf(apk), (State{false, false, false, false}));
}

TEST(ApkInit, FileThatIsNotAZipIsReported) {
  LogCapture log;
  OpenPackage no_zip(ToBytes("This is not a zip archive, but a text."));
  const std::string fd = std::to_string(no_zip.file.fd());
  EXPECT_EQ(log.records(), Records({Error("OpenArchiveFd(" + fd + ") [file: " +
                                          "/memfd:test (deleted)] returned: -3: Invalid file\n")}));
  EXPECT_EQ(StateOf(no_zip.apk), (State{false, false, false, false}));
}

TEST(ApkInit, JarIsAGoodZipAndItsSignatureIsNotExamined) {
  Package jar = MakePackage(PlainJar());
  jar.Tamper("META-INF/CERT.SF");
  LogCapture log;
  OpenPackage open(jar);
  EXPECT_EQ(log.records(), Records({Error("Can't extract Android Manifest: Entry not found\n")}));
  EXPECT_EQ(StateOf(open.apk), (State{true, false, false, true}));
  EXPECT_TRUE(open.apk.GetManufacturerKey().empty());
}

TEST(ApkInit, TamperedPackageIsAnApkButNotGood) {
  Package package = MakePackage(WithoutDex());
  package.Tamper(kManifestName);
  LogCapture log;
  OpenPackage open(package);
  EXPECT_EQ(StateOf(open.apk), (State{true, true, false, true}));
}

TEST(ApkInit, GoodPackageHasAllFlagsAndLogsNothing) {
  LogCapture log;
  OpenPackage open(WithoutDex());
  EXPECT_EQ(log.records(), Records());
  EXPECT_EQ(StateOf(open.apk), (State{true, true, true, true}));
  EXPECT_EQ(open.apk.GetPackageName(), "com.example.app");
  EXPECT_EQ(open.apk.GetManufacturerKey(), ModulusOf("rsa-2048"));
  EXPECT_FALSE(open.apk.IsSsPermissionRequired());
}

// ---- Descriptor and path.

TEST(ApkInit, PathIsResolvedFromTheDescriptor) {
  OpenPackage open(WithoutDex());
  EXPECT_EQ(open.apk.GetPath(), open.file.path());
  EXPECT_EQ(open.apk.GetFd(), open.file.fd());
}

TEST(ApkInit, GivenPathAndDescriptorAreBothKept) {
  LogCapture log;
  Apk apk(-1);
  MemoryFile file(MakePackage(WithoutDex()).Build());
  apk.Init(file.fd(), "/data/app/base.apk");
  EXPECT_EQ(apk.GetPath(), "/data/app/base.apk");
  EXPECT_EQ(apk.GetFd(), file.fd());
  EXPECT_EQ(StateOf(apk), (State{true, true, true, true}));
}

TEST(ApkInit, PathWithoutDescriptorIsOpened) {
  LogCapture log;
  Apk apk(-1);
  log.Clear();
  DiskFile file(MakePackage(WithoutDex()).Build());
  apk.Init(-1, file.path().c_str());
  EXPECT_EQ(log.records(), Records());
  EXPECT_EQ(apk.GetPath(), file.path());
  EXPECT_GT(apk.GetFd(), 0);
  EXPECT_EQ(fcntl(apk.GetFd(), F_GETFD), FD_CLOEXEC);
  EXPECT_EQ(fcntl(apk.GetFd(), F_GETFL) & O_ACCMODE, O_RDONLY);
  EXPECT_EQ(StateOf(apk), (State{true, true, true, true}));
}

TEST(ApkInit, PathThatCannotBeOpenedIsReported) {
  LogCapture log;
  Apk apk(-1);
  log.Clear();
  apk.Init(-1, "/nowhere/base.apk");
  EXPECT_EQ(log.records(),
            Records({Error("open('/nowhere/base.apk') failed: No such file or directory\n")}));
  EXPECT_EQ(apk.GetFd(), -1);
  EXPECT_EQ(StateOf(apk), (State{false, false, false, false}));
}

TEST(ApkInit, DescriptorZeroFromItsOwnOpenCountsAsAFailure) {
  DiskFile file(MakePackage(WithoutDex()).Build());
  LogCapture log;
  Apk apk(-1);
  log.Clear();
  {
    const FreeDescriptor zero(0);
    errno = 0;
    apk.Init(-1, file.path().c_str());
  }
  EXPECT_EQ(log.records(), Records({Error("open('" + file.path() + "') failed: Success\n")}));
  EXPECT_EQ(apk.GetFd(), 0);
  EXPECT_EQ(StateOf(apk), (State{false, false, false, false}));
}

TEST(ApkInit, DescriptorOneFromItsOwnOpenIsUsed) {
  DiskFile file(MakePackage(WithoutDex()).Build());
  LogCapture log;
  Apk apk(-1);
  log.Clear();
  {
    const FreeDescriptor one(1);
    apk.Init(-1, file.path().c_str());
  }
  EXPECT_EQ(log.records(), Records());
  EXPECT_EQ(apk.GetFd(), 1);
  EXPECT_TRUE(apk.IsGoodZip());
}

// Descriptor 0 counts as a failure only if Init opened the file itself.
TEST(ApkInit, DescriptorZeroThatWasGivenIsUsed) {
  DiskFile file(MakePackage(WithoutDex()).Build());
  LogCapture log;
  Apk apk(-1);
  log.Clear();
  {
    const FreeDescriptor zero(0);
    ASSERT_EQ(open(file.path().c_str(), O_RDONLY), 0);
    apk.Init(0, nullptr);
  }
  EXPECT_EQ(log.records(), Records());
  EXPECT_EQ(apk.GetPath(), file.path());
  EXPECT_TRUE(apk.IsGoodZip());
}

TEST(ApkInit, DescriptorBelowMinusOneWithPathIsUsedUnchanged) {
  DiskFile file(MakePackage(WithoutDex()).Build());
  LogCapture log;
  Apk apk(-1);
  log.Clear();
  apk.Init(-2, file.path().c_str());
  EXPECT_EQ(log.records(), Records({Error("OpenArchiveFd(-2) [file: " + file.path() +
                                          "] returned: -3: Invalid file\n")}));
  EXPECT_EQ(apk.GetFd(), -2);
}

TEST(ApkInit, CallersDescriptorStaysOpen) {
  MemoryFile file(MakePackage(WithoutDex()).Build());
  static_cast<void>(Apk(file.fd()));  // constructed and destroyed
  EXPECT_NE(fcntl(file.fd(), F_GETFD), -1);
}

// ---- A second call of Init.

TEST(ApkInit, SecondInitClearsTheFlags) {
  PackageOptions options = WithoutDex();
  options.secure_storage = true;
  OpenPackage open(options);
  ASSERT_EQ(StateOf(open.apk), (State{true, true, true, true}));
  ASSERT_TRUE(open.apk.IsSsPermissionRequired());

  LogCapture log;
  MemoryFile no_zip(ToBytes("no zip"));
  open.apk.Init(no_zip.fd(), nullptr);
  EXPECT_EQ(StateOf(open.apk), (State{false, false, false, false}));
  EXPECT_FALSE(open.apk.IsSsPermissionRequired());
}

TEST(ApkInit, SecondInitWithoutAFileHasNoArchive) {
  OpenPackage open(WithoutDex());
  LogCapture log;
  open.apk.Init(-1, nullptr);
  EXPECT_EQ(StateOf(open.apk), (State{false, false, false, false}));
}

TEST(ApkInit, SecondInitForgetsThatTheFirstDexWasGood) {
  OpenPackage open{PackageOptions()};
  ASSERT_TRUE(open.apk.IsGoodApk());
  Package bad = MakePackage();
  bad.Tamper("classes.dex");
  MemoryFile second(bad.Build());
  LogCapture log;
  open.apk.Init(second.fd(), nullptr);
  EXPECT_FALSE(open.apk.IsGoodApk());
  EXPECT_EQ(log.records(), Records({Error("Integrity not confirmed: classes.dex\n")}));
}

TEST(ApkInit, SecondInitForgetsTheFirstDigests) {
  PackageOptions first = WithoutDex();
  first.entries.push_back({"lib/only.so", ToBytes("only")});
  OpenPackage open(first);
  DiskFile disk(ToBytes("only"));
  ASSERT_TRUE(open.apk.VerifyFileHash("lib/only.so", disk.path()));

  MemoryFile second(MakePackage(WithoutDex()).Build());
  open.apk.Init(second.fd(), nullptr);
  ASSERT_TRUE(open.apk.IsGoodApk());
  LogCapture log;
  EXPECT_FALSE(open.apk.VerifyFileHash("lib/only.so", disk.path()));
}

// The verification of the second package fails after its META-INF/MANIFEST.MF was loaded.
TEST(ApkInit, SecondInitThatFailsAfterLoadingItsManifestHasNoDigests) {
  PackageOptions first = WithoutDex();
  first.entries.push_back({"lib/only.so", ToBytes("only")});
  OpenPackage open(first);
  DiskFile disk(ToBytes("only"));

  PackageOptions bad = WithoutDex();
  bad.android_manifest = ToBytes("no compiled manifest");
  MemoryFile second(MakePackage(bad).Build());
  LogCapture log;
  open.apk.Init(second.fd(), nullptr);
  ASSERT_EQ(log.records().back(), Error("Can't process Android Manifest.\n"));
  for (const char* name : {"lib/only.so", "lib/arm64-v8a/libfoo.so"}) {
    log.Clear();
    EXPECT_FALSE(open.apk.VerifyFileHash(name, disk.path()));
    EXPECT_EQ(
        log.records(),
        Records({Error(std::string("Can't find file in META-INF/MANIFEST.MF: ") + name + "\n")}));
  }
}

// ---- The verification of a package, step by step.

TEST(ApkInit, PackageWithoutManifestIsNotGoodAndLogsNothing) {
  Package package = MakePackage(WithoutDex());
  package.Remove(kManifestName);
  LogCapture log;
  OpenPackage open(package);
  EXPECT_EQ(log.records(), Records());
  EXPECT_EQ(StateOf(open.apk), (State{true, true, false, true}));
}

// The tool extracts META-INF/MANIFEST.MF before the signature file and the signature block. If
// META-INF/MANIFEST.MF is missing, the tool does not look for the other two entries.
TEST(ApkInit, PackageWithoutManifestAndBlockLogsNothing) {
  Package package = MakePackage(WithoutDex());
  package.Remove(kManifestName);
  package.Remove("META-INF/CERT.RSA");
  LogCapture log;
  OpenPackage open(package);
  EXPECT_EQ(log.records(), Records());
  EXPECT_EQ(StateOf(open.apk), (State{true, true, false, true}));
}

TEST(ApkInit, ManifestNameIsReadThroughItsPointer) {
  Package package = MakePackage(WithoutDex());
  package.Item(kManifestName).name = "META-INF/OTHER.MF";
  const char* const usual = Apk::kMANIFEST_MF;
  Apk::kMANIFEST_MF = "META-INF/OTHER.MF";
  OpenPackage renamed(package);
  Apk::kMANIFEST_MF = usual;
  EXPECT_TRUE(renamed.apk.IsGoodApk());

  OpenPackage usually(package);
  EXPECT_FALSE(usually.apk.IsGoodApk());
}

TEST(ApkInit, TamperedManifestIsReportedTwice) {
  Package package = MakePackage(WithoutDex());
  package.Tamper(kManifestName);
  LogCapture log;
  OpenPackage open(package);
  EXPECT_EQ(log.records(),
            Records({Error("Can't validate manifest.\n"), Error("Can't validate manifest.\n")}));
  EXPECT_EQ(StateOf(open.apk), (State{true, true, false, true}));
}

TEST(ApkInit, ManifestThatCannotBeParsedIsReportedWithItsSize) {
  LogCapture log;
  OpenPackage open(WithoutDexListedBy("Key:x"));
  EXPECT_EQ(log.records(),
            Records({Error("Parse manifest: Error: P_COLON: unexpected 0x78 after colon: x\n"),
                     Error("Can't load manifest: size=5\n")}));
  EXPECT_EQ(StateOf(open.apk), (State{true, true, false, true}));
}

TEST(ApkInit, ManifestTextKeepsItsNulBytes) {
  LogCapture log;
  OpenPackage open(WithoutDexListedBy(std::string("A: 1\r\n\r\nB\0C: 2\r\n\r\n", 19)));
  EXPECT_EQ(log.records(),
            Records({Error("Parse manifest: Error: P_KEY: unexpected end of file after key 'B'\n"),
                     Error("Can't load manifest: size=19\n")}));
}

TEST(ApkInit, AndroidManifestThatIsNotCompiledXmlIsReported) {
  PackageOptions options = WithoutDex();
  options.android_manifest = ToBytes("<manifest package='com.example.app'/>");
  LogCapture log;
  OpenPackage open(options);
  EXPECT_EQ(log.records().size(), 2u);
  EXPECT_EQ(log.records().back(), Error("Can't process Android Manifest.\n"));
  EXPECT_EQ(StateOf(open.apk), (State{true, true, false, true}));
}

// AndroidManifest.xml is parsed only after META-INF/MANIFEST.MF was loaded.
TEST(ApkInit, AndroidManifestIsNotReadIfTheManifestCannotBeParsed) {
  PackageOptions options = WithoutDexListedBy("Key:x");
  options.secure_storage = true;
  LogCapture log;
  OpenPackage open(options);
  EXPECT_EQ(log.records().back(), Error("Can't load manifest: size=5\n"));
  EXPECT_EQ(open.apk.GetPackageName(), "");
  EXPECT_FALSE(open.apk.IsSsPermissionRequired());
}

TEST(ApkInit, PackageWithoutANameIsGood) {
  PackageOptions options = WithoutDex();
  options.package_name = "";
  LogCapture log;
  OpenPackage open(options);
  EXPECT_EQ(StateOf(open.apk), (State{true, true, true, true}));
  EXPECT_EQ(open.apk.GetPackageName(), "");
}

TEST(ApkInit, PackageWhoseManifestHasNoSectionsIsGood) {
  OpenPackage open(WithoutDexListedBy(""));
  EXPECT_EQ(StateOf(open.apk), (State{true, true, true, true}));
}

// ---- The digests that the manifest records.

// A package whose manifest has these sections after its main section.
PackageOptions WithSections(const JarText& sections) {
  return WithoutDexListedBy(JarText::Manifest().EndSection().text() + sections.text());
}

// A section for "a" with the SHA-1 digest of one content and the SHA-256 digest of another.
JarText TwoDigests(const std::string& sha1_of, const std::string& sha256_of) {
  return JarText()
      .Attribute("Name", "a")
      .Digests({"SHA-256-Digest"}, ToBytes(sha256_of))
      .Digests({"SHA1-Digest"}, ToBytes(sha1_of))
      .EndSection();
}

TEST(ApkDigests, Sha1IsUsedIfASectionAlsoHasSha256) {
  DiskFile disk(ToBytes("right"));
  OpenPackage open(WithSections(TwoDigests("right", "wrong")));
  EXPECT_TRUE(open.apk.VerifyFileHash("a", disk.path()));
}

TEST(ApkDigests, Sha256IsIgnoredIfASectionAlsoHasSha1) {
  DiskFile disk(ToBytes("right"));
  OpenPackage open(WithSections(TwoDigests("wrong", "right")));
  EXPECT_FALSE(open.apk.VerifyFileHash("a", disk.path()));
}

}  // namespace
