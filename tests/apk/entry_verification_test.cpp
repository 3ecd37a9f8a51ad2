// Tests how single entries and files are compared with the digests that the manifest lists.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <functional>

#include "apk/zip_library.h"
#include "support/jar.h"
#include "support/log_capture.h"
#include "support/open_package.h"

using ApkTools::Apk;

// The linker redirects the tool's calls of read to the functions below, also in a build with
// _FORTIFY_SOURCE.
static std::function<void()> before_read;

extern "C" ssize_t __real_read(int fd, void* buffer, size_t size);

extern "C" ssize_t __wrap_read(int fd, void* buffer, size_t size) {
  if (before_read) before_read();
  return __real_read(fd, buffer, size);
}

extern "C" ssize_t __wrap___read_chk(int fd, void* buffer, size_t size, size_t /*room*/) {
  return __wrap_read(fd, buffer, size);
}

namespace {

constexpr char kDexFailed[] = "Integrity not confirmed: classes.dex\n";

PackageOptions WithDigests(const std::vector<std::string>& digests) {
  PackageOptions options;
  options.digests = digests;
  return options;
}

// ---- The package's verdict.

TEST(IsGoodApk, DexThatTheManifestListsIsGood) {
  LogCapture log;
  OpenPackage open{PackageOptions()};
  EXPECT_TRUE(open.apk.IsGoodApk());
  EXPECT_TRUE(open.apk.IsGoodApk());
  EXPECT_EQ(log.records(), Records());
}

TEST(IsGoodApk, PackageWithoutDexIsGood) {
  PackageOptions options;
  options.entries.clear();
  LogCapture log;
  OpenPackage open(options);
  EXPECT_TRUE(open.apk.IsGoodApk());
  EXPECT_EQ(log.records(), Records());
}

TEST(IsGoodApk, DexThatTheManifestDoesNotListIsReportedOnce) {
  LogCapture log;
  OpenPackage open(WithManifest(""));
  EXPECT_EQ(log.records(), Records());
  EXPECT_FALSE(open.apk.IsGoodApk());
  EXPECT_EQ(log.records(), Records({Error("Can't find file in META-INF/MANIFEST.MF: classes.dex\n"),
                                    Error(kDexFailed)}));
  log.Clear();
  EXPECT_FALSE(open.apk.IsGoodApk());
  EXPECT_FALSE(open.apk.IsGoodApk());
  EXPECT_EQ(log.records(), Records());
}

TEST(IsGoodApk, TamperedDexIsBadAndStaysBad) {
  Package package = MakePackage();
  package.Tamper("classes.dex");
  LogCapture log;
  OpenPackage open(package);
  EXPECT_FALSE(open.apk.IsGoodApk());
  EXPECT_EQ(log.records(), Records({Error(kDexFailed)}));
  EXPECT_FALSE(open.apk.IsGoodApk());
  EXPECT_EQ(log.records(), Records({Error(kDexFailed)}));
}

TEST(IsGoodApk, OtherEntriesAreNotExamined) {
  Package package = MakePackage();
  package.Tamper("lib/arm64-v8a/libfoo.so");
  OpenPackage open(package);
  EXPECT_TRUE(open.apk.IsGoodApk());
}

// Changes the data of "classes.dex" in the file of an open package.
void ChangeDex(OpenPackage& open, const Bytes& archive) {
  const Bytes dex = ToBytes("dex\n035");
  const auto found = std::search(archive.begin(), archive.end(), dex.begin(), dex.end());
  ASSERT_NE(found, archive.end());
  ASSERT_EQ(pwrite(open.file.fd(), "X", 1, found - archive.begin()), 1);
}

TEST(IsGoodApk, ArchiveIsNotReadAgainAfterOneSuccess) {
  const Bytes archive = MakePackage().Build();
  OpenPackage open(archive);
  EXPECT_TRUE(open.apk.IsGoodApk());
  ChangeDex(open, archive);
  EXPECT_TRUE(open.apk.IsGoodApk());
}

TEST(IsGoodApk, DexIsReadByTheFirstCallNotByInit) {
  const Bytes archive = MakePackage().Build();
  LogCapture log;
  OpenPackage open(archive);
  ChangeDex(open, archive);
  EXPECT_FALSE(open.apk.IsGoodApk());
}

TEST(IsGoodApk, PackageThatInitJudgedBadIsNotExamined) {
  Package package = MakePackage();
  package.Remove(kManifestName);
  LogCapture log;
  OpenPackage open(package);
  EXPECT_FALSE(open.apk.IsGoodApk());
  EXPECT_EQ(log.records(), Records());
}

TEST(IsGoodApk, DexWhoseHeadersDisagreeOnItsNameIsBad) {
  Package package = MakePackage();
  package.Item("classes.dex").local_name = "Classes.dex";  // only in the local header
  LogCapture log;
  OpenPackage open(package);
  EXPECT_FALSE(open.apk.IsGoodApk());
  EXPECT_EQ(log.records(), Records({Error(kDexFailed)}));
}

// `package` must be good. It must become bad if its "classes.dex" declares an impossible length.
void ExpectImpossibleLengthToBeBad(Package package) {
  ASSERT_TRUE(OpenPackage(package).apk.IsGoodApk());
  ZipItem& dex = package.Item("classes.dex");
  dex.deflated = true;
  dex = ClaimingLength(dex, 0xfffffffe);
  LogCapture log;
  OpenPackage open(package);
  EXPECT_FALSE(open.apk.IsGoodApk());
  EXPECT_EQ(log.records(), Records({Error(kDexFailed)}));
}

TEST(IsGoodApk, DexOfAnImpossibleLengthIsBad) { ExpectImpossibleLengthToBeBad(MakePackage()); }

// An entry that cannot be extracted does not match, even if the manifest lists it as empty.
TEST(IsGoodApk, DexOfAnImpossibleLengthIsBadEvenIfListedAsEmpty) {
  PackageOptions options;
  options.entries = {{"classes.dex", {}}};
  ExpectImpossibleLengthToBeBad(MakePackage(options));
}

TEST(IsGoodApk, OtherDexFilesAreNotExamined) {
  PackageOptions options;
  options.entries.push_back({"classes2.dex", ToBytes("dex\n035 2")});
  Package package = MakePackage(options);
  package.Tamper("classes2.dex");
  OpenPackage open(package);
  EXPECT_TRUE(open.apk.IsGoodApk());
}

// ---- One entry.

// Calls VerifyEntryHash for the archive's entry of this name.
bool VerifyEntry(OpenPackage& open, const std::string& name) {
  void* cookie;
  EXPECT_EQ(open.apk.StartIteration(&cookie, name, name), 0);
  ZipEntry entry;
  std::string found;
  EXPECT_EQ(open.apk.Next(cookie, &entry, found), 0);
  open.apk.EndIteration(cookie);
  EXPECT_EQ(found, name);
  return open.apk.VerifyEntryHash(name, entry);
}

TEST(VerifyEntryHash, EntryListedWithSha256AloneIsVerified) {
  OpenPackage open(WithDigests({"SHA-256-Digest"}));
  EXPECT_TRUE(VerifyEntry(open, "classes.dex"));
}

TEST(VerifyEntryHash, EntryListedWithSha1AloneIsVerified) {
  OpenPackage open(WithDigests({"SHA1-Digest"}));
  EXPECT_TRUE(VerifyEntry(open, "classes.dex"));
}

// Options for a package whose manifest lists "classes.dex" with the digests of these contents.
PackageOptions WithDexDigests(const std::string& sha1_of, const std::string& sha256_of) {
  return WithManifest(JarText::Manifest()
                          .EndSection()
                          .Attribute("Name", "classes.dex")
                          .Digests({"SHA1-Digest"}, ToBytes(sha1_of))
                          .Digests({"SHA-256-Digest"}, ToBytes(sha256_of))
                          .EndSection()
                          .text());
}

TEST(VerifyEntryHash, EntryListedWithBothIsVerifiedWithSha1) {
  OpenPackage open(WithDexDigests("dex\n035", "other"));
  EXPECT_TRUE(VerifyEntry(open, "classes.dex"));
}

TEST(VerifyEntryHash, EntryListedWithBothIsNotVerifiedWithSha256) {
  OpenPackage open(WithDexDigests("other", "dex\n035"));
  EXPECT_FALSE(VerifyEntry(open, "classes.dex"));
}

TEST(VerifyEntryHash, MismatchIsNotReported) {
  Package package = MakePackage();
  package.Tamper("classes.dex");
  LogCapture log;
  OpenPackage open(package);
  EXPECT_FALSE(VerifyEntry(open, "classes.dex"));
  EXPECT_EQ(log.records(), Records());
}

TEST(VerifyEntryHash, EntryListedWithMd5AloneIsUnsupported) {
  LogCapture log;
  OpenPackage open(WithDigests({"MD5-Digest"}));
  EXPECT_FALSE(VerifyEntry(open, "classes.dex"));
  EXPECT_EQ(log.records(), Records({Error("verifyData: Unsupported digest type: MD5-Digest\n")}));
}

TEST(VerifyEntryHash, DigestThatCannotBeDecodedDoesNotMatch) {
  LogCapture log;
  OpenPackage open(WithManifest(JarText::Manifest()
                                    .EndSection()
                                    .Attribute("Name", "classes.dex")
                                    .Attribute("SHA1-Digest", "not base64!")
                                    .EndSection()
                                    .text()));
  EXPECT_FALSE(VerifyEntry(open, "classes.dex"));
  EXPECT_EQ(log.records(), Records());
}

TEST(VerifyEntryHash, EntryThatCannotBeExtractedIsNotReported) {
  Package package = MakePackage();
  ZipItem& dex = package.Item("classes.dex");
  dex = ClaimingLength(dex, 3);
  LogCapture log;
  OpenPackage open(package);
  EXPECT_FALSE(VerifyEntry(open, "classes.dex"));
  EXPECT_EQ(log.records(), Records());
}

TEST(VerifyEntryHash, EntryThatTheManifestDoesNotListIsReported) {
  Package package = MakePackage();
  package.items.push_back({"added.so", ToBytes("added")});
  LogCapture log;
  OpenPackage open(package);
  EXPECT_FALSE(VerifyEntry(open, "added.so"));
  EXPECT_EQ(log.records(), Records({Error("Can't find file in META-INF/MANIFEST.MF: added.so\n")}));
}

TEST(VerifyEntryHash, SignatureFileNeedsNoDigest) {
  LogCapture log;
  OpenPackage open{PackageOptions()};
  EXPECT_TRUE(VerifyEntry(open, "META-INF/CERT.SF"));
  EXPECT_EQ(log.records(), Records());
}

TEST(VerifyEntryHash, EmptyEntryIsVerified) {
  PackageOptions options;
  options.entries = {{"empty", {}}, {"deflated", {}, true}};
  OpenPackage open(options);
  EXPECT_TRUE(VerifyEntry(open, "empty"));
  EXPECT_TRUE(VerifyEntry(open, "deflated"));
}

// ---- One file.

constexpr char kLibrary[] = "lib/arm64-v8a/libfoo.so";

TEST(VerifyFileHash, NameSelectsTheDigestAndPathSelectsTheBytes) {
  OpenPackage open{PackageOptions()};
  DiskFile library(ToBytes("\177ELF foo"));
  EXPECT_TRUE(open.apk.VerifyFileHash(kLibrary, library.path()));
  EXPECT_FALSE(open.apk.VerifyFileHash("classes.dex", library.path()));
}

TEST(VerifyFileHash, MismatchIsNotReported) {
  OpenPackage open{PackageOptions()};
  DiskFile library(ToBytes("\177ELF fop"));
  LogCapture log;
  EXPECT_FALSE(open.apk.VerifyFileHash(kLibrary, library.path()));
  EXPECT_EQ(log.records(), Records());
}

TEST(VerifyFileHash, FileThatCannotBeOpenedIsReported) {
  OpenPackage open{PackageOptions()};
  LogCapture log;
  EXPECT_FALSE(open.apk.VerifyFileHash(kLibrary, "/nowhere/libfoo.so"));
  EXPECT_EQ(log.records(), Records({Error("Can't open file: /nowhere/libfoo.so\n")}));
}

// The digest is decoded first. The file is read even if the digest cannot be decoded or is too
// short.
TEST(VerifyFileHash, FileIsReadEvenIfItsListedDigestIsBad) {
  for (const char* digest : {"not base64!", "====", "AAAA"}) {
    OpenPackage open(WithManifest(JarText::Manifest()
                                      .EndSection()
                                      .Attribute("Name", kLibrary)
                                      .Attribute("SHA-256-Digest", digest)
                                      .EndSection()
                                      .text()));
    LogCapture log;
    struct stat read = {};
    EXPECT_FALSE(open.apk.VerifyFileHash(kLibrary, "/nowhere/libfoo.so", &read));
    EXPECT_EQ(log.records(), Records({Error("Can't open file: /nowhere/libfoo.so\n")}));
    const DiskFile library(ToBytes("\177ELF foo"));
    EXPECT_FALSE(open.apk.VerifyFileHash(kLibrary, library.path(), &read));
    EXPECT_NE(read.st_ino, 0u);
  }
}

// The missing bytes count as zeros, even if an earlier read left other bytes in the buffer.
TEST(VerifyFileHash, FileThatShrinksDuringTheReadEndsInZeros) {
  PackageOptions options;
  options.entries = {{"first", ToBytes("the first file")},
                     {"second", ToBytes("A second file")},
                     {"zeros", ToBytes(std::string("A") + std::string(12, '\0'))}};
  OpenPackage open(options);
  DiskFile file(ToBytes("A second file"));
  ASSERT_TRUE(open.apk.VerifyFileHash("second", file.path()));
  EXPECT_FALSE(open.apk.VerifyFileHash("zeros", file.path()));

  before_read = [&] { EXPECT_EQ(0, truncate(file.path().c_str(), 1)); };
  EXPECT_FALSE(open.apk.VerifyFileHash("second", file.path()));
  WriteFile(file.path(), ToBytes("A second file"));
  EXPECT_TRUE(open.apk.VerifyFileHash("zeros", file.path()));
  before_read = nullptr;
}

TEST(VerifyFileHash, SetsTheStateOfTheFileThatItRead) {
  OpenPackage open{PackageOptions()};
  DiskFile good(ToBytes("\177ELF foo")), bad(ToBytes("\177ELF bar"));
  for (const DiskFile* file : {&good, &bad}) {
    struct stat status;
    ASSERT_EQ(stat(file->path().c_str(), &status), 0);
    struct stat read = {};
    EXPECT_EQ(open.apk.VerifyFileHash(kLibrary, file->path(), &read), file == &good);
    EXPECT_TRUE(IsSameFile(status, read));
  }
}

TEST(VerifyFileHash, LeavesTheStateUnchangedIfNoFileIsRead) {
  OpenPackage open{PackageOptions()};
  struct stat read = {};
  LogCapture log;
  EXPECT_FALSE(open.apk.VerifyFileHash(kLibrary, "/nowhere/libfoo.so", &read));
  EXPECT_TRUE(open.apk.VerifyFileHash("META-INF/CERT.SF", "/nowhere/libfoo.so", &read));
  EXPECT_EQ(read.st_ino, 0u);
}

TEST(VerifyFileHash, FileListedWithMd5AloneIsUnsupported) {
  OpenPackage open(WithDigests({"MD5-Digest"}));
  DiskFile library(ToBytes("\177ELF foo"));
  LogCapture log;
  EXPECT_FALSE(open.apk.VerifyFileHash(kLibrary, library.path()));
  EXPECT_EQ(log.records(), Records({Error("verifyData: Unsupported digest type: MD5-Digest\n")}));
}

TEST(VerifyFileHash, SignatureFileIsGoodWithoutBeingRead) {
  OpenPackage open{PackageOptions()};
  LogCapture log;
  EXPECT_TRUE(open.apk.VerifyFileHash("META-INF/CERT.SF", "/nowhere"));
  EXPECT_EQ(log.records(), Records());
}

TEST(VerifyFileHash, ListedSignatureFileIsRead) {
  OpenPackage open(
      WithManifest(JarText().Section("META-INF/CERT.SF", {"SHA1-Digest"}, ToBytes("x")).text()));
  LogCapture log;
  EXPECT_FALSE(open.apk.VerifyFileHash("META-INF/CERT.SF", "/nowhere"));
  EXPECT_EQ(log.records(), Records({Error("Can't open file: /nowhere\n")}));
}

TEST(VerifyFileHash, SignatureFileInLowerCaseNeedsADigest) {
  OpenPackage open{PackageOptions()};
  LogCapture log;
  EXPECT_FALSE(open.apk.VerifyFileHash("META-INF/cert.sf", "/nowhere"));
  EXPECT_EQ(log.records(),
            Records({Error("Can't find file in META-INF/MANIFEST.MF: META-INF/cert.sf\n")}));
}

TEST(VerifyFileHash, FailedCheckLeavesTheRecordedDigestsUnchanged) {
  LogCapture log;
  OpenPackage open{PackageOptions()};
  EXPECT_FALSE(open.apk.VerifyFileHash(kLibrary, "/nowhere"));
  EXPECT_FALSE(open.apk.VerifyFileHash("added.so", "/nowhere"));
  DiskFile library(ToBytes("\177ELF foo"));
  EXPECT_TRUE(open.apk.VerifyFileHash(kLibrary, library.path()));
}

// ---- The names that need no digest.

TEST(CanSkipValidation, IsTrueForTheSevenNames) {
  LogCapture log;
  Apk apk(-1);
  for (const char* name :
       {"META-INF/CERT.RSA", "META-INF/ANDROIDD.RSA", "META-INF/SECUREST.RSA", "META-INF/CERT.SF",
        "META-INF/ANDROIDD.SF", "META-INF/SECUREST.SF", "META-INF/MANIFEST.MF"}) {
    EXPECT_TRUE(apk.CanSkipValidation(name)) << name;
  }
}

TEST(CanSkipValidation, IsFalseForOtherNames) {
  LogCapture log;
  Apk apk(-1);
  for (const char* name : {"", "META-INF/", "META-INF/cert.rsa", "META-INF/CERT.DSA", "CERT.RSA",
                           "META-INF/CERT.RSA ", "META-INF/KEY.SF", "classes.dex"}) {
    EXPECT_FALSE(apk.CanSkipValidation(name)) << name;
  }
  EXPECT_FALSE(apk.CanSkipValidation(std::string("META-INF/CERT.SF\0", 17)));
}

}  // namespace
