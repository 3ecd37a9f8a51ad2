// Opening the archive, the flags that say how far it got, and walking its entries.
#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <random>

#include "support/compiled_manifest.h"
#include "support/jar.h"
#include "support/log_capture.h"
#include "support/open_package.h"

using ApkTools::Apk;

namespace {

constexpr int32_t kIterationEnd = -1, kInvalidHandle = -4, kInvalidEntryName = -10;

// The flags, and whether there is an open archive, in one comparable value.
struct State {
  bool good_zip, apk, good_apk, open;
};
bool operator==(const State& a, const State& b) {
  return a.good_zip == b.good_zip && a.apk == b.apk && a.good_apk == b.good_apk && a.open == b.open;
}
std::ostream& operator<<(std::ostream& out, const State& state) {
  return out << state.good_zip << state.apk << state.good_apk << state.open;
}

// The package must hold no "classes.dex" for IsGoodApk to be the verdict of Init alone.
State StateOf(Apk& apk) {
  void* cookie = nullptr;
  const int32_t result = apk.StartIteration(&cookie, "", "");
  if (result == 0) apk.EndIteration(cookie);
  EXPECT_TRUE(result == 0 || result == kInvalidHandle);
  return {apk.IsGoodZip(), apk.IsApk(), apk.IsGoodApk(), result == 0};
}

PackageOptions WithoutDex() {
  PackageOptions options;
  options.entries = {{"lib/arm64-v8a/libfoo.so", ToBytes("foo")}};
  return options;
}

// The same, whose manifest is this text.
PackageOptions WithoutDexListedBy(const std::string& text) {
  PackageOptions options = WithoutDex();
  options.edit_manifest = [=](const std::string&) { return text; };
  return options;
}

std::vector<std::string> NamesIn(Apk& apk, const std::string& prefix, const std::string& suffix) {
  std::vector<std::string> names;
  void* cookie;
  EXPECT_EQ(apk.StartIteration(&cookie, prefix, suffix), 0);
  ZipEntry entry;
  for (std::string name; apk.Next(cookie, &entry, name) == 0;) names.push_back(name);
  apk.EndIteration(cookie);
  std::sort(names.begin(), names.end());
  return names;
}

// ---- The flags after Init: one test for each row of how far it can get.

TEST(ApkInit, WithoutDescriptorAndPathAllFlagsAreFalse) {
  LogCapture log;
  Apk apk(-1);
  EXPECT_EQ(log.records(),
            Records({Error("Can't initialize Apk: need valid file descriptor or filename\n")}));
  EXPECT_EQ(StateOf(apk), (State{false, false, false, false}));
  EXPECT_EQ(apk.GetFd(), -1);
  EXPECT_EQ(apk.GetPath(), "");
}

TEST(ApkInit, AFileThatIsNotAZipLeavesANullHandle) {
  LogCapture log;
  OpenPackage no_zip(ToBytes("This is not a zip archive, but a text."));
  const std::string fd = std::to_string(no_zip.file.fd());
  EXPECT_EQ(log.records(), Records({Error("OpenArchiveFd(" + fd + ") [file: " +
                                          "/memfd:test (deleted)] returned: -3: Invalid file\n")}));
  EXPECT_EQ(StateOf(no_zip.apk), (State{false, false, false, false}));
}

TEST(ApkInit, AJarIsAGoodZipWhoseSignatureIsNotExamined) {
  Package jar = MakePackage(PlainJar());
  jar.Tamper("META-INF/CERT.SF");
  LogCapture log;
  OpenPackage open(jar);
  EXPECT_EQ(log.records(), Records({Error("Can't extract Android Manifest: Entry not found\n")}));
  EXPECT_EQ(StateOf(open.apk), (State{true, false, false, true}));
  EXPECT_TRUE(open.apk.GetManufacturerKey().empty());
}

TEST(ApkInit, APackageThatDoesNotVerifyIsAPackageThatIsNotGood) {
  Package package = MakePackage(WithoutDex());
  package.Tamper(kManifestName);
  LogCapture log;
  OpenPackage open(package);
  EXPECT_EQ(StateOf(open.apk), (State{true, true, false, true}));
}

TEST(ApkInit, AGoodPackageHasAllFlagsAndNoMessage) {
  LogCapture log;
  OpenPackage open(WithoutDex());
  EXPECT_EQ(log.records(), Records());
  EXPECT_EQ(StateOf(open.apk), (State{true, true, true, true}));
  EXPECT_EQ(open.apk.GetPackageName(), "com.example.app");
  EXPECT_EQ(open.apk.GetManufacturerKey(), ModulusOf("rsa-2048"));
  EXPECT_FALSE(open.apk.IsSsPermissionRequired());
}

// ---- Descriptor and path.

TEST(ApkInit, ThePathIsTheOneThatTheDescriptorResolvesTo) {
  OpenPackage open(WithoutDex());
  EXPECT_EQ(open.apk.GetPath(), open.file.path());
  EXPECT_EQ(open.apk.GetFd(), open.file.fd());
}

TEST(ApkInit, AGivenPathIsKeptBesideTheDescriptor) {
  LogCapture log;
  Apk apk(-1);
  MemoryFile file(MakePackage(WithoutDex()).Build());
  apk.Init(file.fd(), "/data/app/base.apk");
  EXPECT_EQ(apk.GetPath(), "/data/app/base.apk");
  EXPECT_EQ(apk.GetFd(), file.fd());
  EXPECT_EQ(StateOf(apk), (State{true, true, true, true}));
}

TEST(ApkInit, WithAPathAloneTheFileIsOpened) {
  LogCapture log;
  Apk apk(-1);
  log.Clear();
  DiskFile file(MakePackage(WithoutDex()).Build());
  apk.Init(-1, file.path().c_str());
  EXPECT_EQ(log.records(), Records());
  EXPECT_EQ(apk.GetPath(), file.path());
  EXPECT_GT(apk.GetFd(), 0);
  EXPECT_EQ(StateOf(apk), (State{true, true, true, true}));
}

TEST(ApkInit, APathThatCannotBeOpenedIsReported) {
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
  const int standard_input = dup(0);
  close(0);
  errno = 0;
  apk.Init(-1, file.path().c_str());
  dup2(standard_input, 0);
  close(standard_input);
  EXPECT_EQ(log.records(), Records({Error("open('" + file.path() + "') failed: Success\n")}));
  EXPECT_EQ(apk.GetFd(), 0);
  EXPECT_EQ(StateOf(apk), (State{false, false, false, false}));
}

TEST(ApkInit, AnyOtherNegativeDescriptorIsUsedUnchangedWhenThereIsAPath) {
  DiskFile file(MakePackage(WithoutDex()).Build());
  LogCapture log;
  Apk apk(-1);
  log.Clear();
  apk.Init(-2, file.path().c_str());
  EXPECT_EQ(log.records(), Records({Error("OpenArchiveFd(-2) [file: " + file.path() +
                                          "] returned: -3: Invalid file\n")}));
  EXPECT_EQ(apk.GetFd(), -2);
}

TEST(ApkInit, TheCallersDescriptorStaysOpen) {
  MemoryFile file(MakePackage(WithoutDex()).Build());
  { Apk apk(file.fd()); }
  EXPECT_NE(fcntl(file.fd(), F_GETFD), -1);
}

TEST(ApkInit, ASecondInitStartsFromClearedFlags) {
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

TEST(ApkInit, ASecondInitForgetsTheFirstOnesDigests) {
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

// The road of the second package ends where its manifest has been read already.
TEST(ApkInit, ASecondInitThatFailsKeepsTheFirstOnesDigests) {
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
  EXPECT_TRUE(open.apk.VerifyFileHash("lib/only.so", disk.path()));
}

// ---- The road of a package, step by step.

TEST(ApkInit, APackageWithoutManifestIsNotGoodAndSaysNothing) {
  Package package = MakePackage(WithoutDex());
  package.Remove(kManifestName);
  LogCapture log;
  OpenPackage open(package);
  EXPECT_EQ(log.records(), Records());
  EXPECT_EQ(StateOf(open.apk), (State{true, true, false, true}));
}

TEST(ApkInit, TheNameOfTheManifestIsReadThroughItsPointer) {
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

TEST(ApkInit, ATamperedManifestIsReportedTwice) {
  Package package = MakePackage(WithoutDex());
  package.Tamper(kManifestName);
  LogCapture log;
  OpenPackage open(package);
  EXPECT_EQ(log.records(),
            Records({Error("Can't validate manifest.\n"), Error("Can't validate manifest.\n")}));
  EXPECT_EQ(StateOf(open.apk), (State{true, true, false, true}));
}

TEST(ApkInit, AManifestThatCannotBeParsedIsReportedWithItsSize) {
  LogCapture log;
  OpenPackage open(WithoutDexListedBy("Key:x"));
  EXPECT_EQ(log.records(),
            Records({Error("Parse manifest: Error: P_COLON: unexpected 0x78 after colon: x\n"),
                     Error("Can't load manifest: size=5\n")}));
  EXPECT_EQ(StateOf(open.apk), (State{true, true, false, true}));
}

TEST(ApkInit, TheManifestTextHoldsItsNulBytes) {
  LogCapture log;
  OpenPackage open(WithoutDexListedBy(std::string("A: 1\r\n\r\nB\0C: 2\r\n\r\n", 19)));
  EXPECT_EQ(log.records(),
            Records({Error("Parse manifest: Error: P_KEY: unexpected end of file after key 'B'\n"),
                     Error("Can't load manifest: size=19\n")}));
}

TEST(ApkInit, AnAndroidManifestThatIsNotCompiledXmlIsReported) {
  PackageOptions options = WithoutDex();
  options.android_manifest = ToBytes("<manifest package='com.example.app'/>");
  LogCapture log;
  OpenPackage open(options);
  EXPECT_EQ(log.records().size(), 2u);
  EXPECT_EQ(log.records().back(), Error("Can't process Android Manifest.\n"));
  EXPECT_EQ(StateOf(open.apk), (State{true, true, false, true}));
}

TEST(ApkInit, AManifestWithoutSectionsMakesAGoodPackage) {
  OpenPackage open(WithoutDexListedBy(""));
  EXPECT_EQ(StateOf(open.apk), (State{true, true, true, true}));
}

// ---- The digests that the manifest records.

// The package whose manifest has this one section, or these two.
PackageOptions WithSections(const JarText& sections) {
  return WithoutDexListedBy(JarText::Manifest().EndSection().text() + sections.text());
}

bool IsListed(Apk& apk, const std::string& name) {
  LogCapture log;
  apk.VerifyFileHash(name, "/nowhere");
  return log.records() !=
         Records({Error("Can't find file in META-INF/MANIFEST.MF: " + name + "\n")});
}

TEST(ApkDigests, ASectionWithADigestIsRecorded) {
  OpenPackage open(WithSections(JarText().Section("a", {"SHA1-Digest"}, ToBytes("a"))));
  EXPECT_TRUE(IsListed(open.apk, "a"));
}

TEST(ApkDigests, ASectionWithoutADigestIsNotRecorded) {
  OpenPackage open(WithSections(JarText().Attribute("Name", "a").EndSection()));
  EXPECT_TRUE(open.apk.IsGoodApk());
  EXPECT_FALSE(IsListed(open.apk, "a"));
}

TEST(ApkDigests, ASectionWithAnEmptyDigestIsNotRecorded) {
  OpenPackage open(
      WithSections(JarText().Attribute("Name", "a").Attribute("SHA1-Digest", "").EndSection()));
  EXPECT_TRUE(open.apk.IsGoodApk());
  EXPECT_FALSE(IsListed(open.apk, "a"));
}

TEST(ApkDigests, NamesOfAttributesAreCaseSensitive) {
  OpenPackage open(WithSections(JarText()
                                    .Attribute("NAME", "a")
                                    .Attribute("SHA1-Digest", "AAAA")
                                    .EndSection()
                                    .Attribute("Name", "b")
                                    .Attribute("SHA1-DIGEST", "AAAA")
                                    .EndSection()
                                    .Attribute("Name", "c")
                                    .Attribute("-Digest", "AAAA")
                                    .EndSection()));
  EXPECT_FALSE(IsListed(open.apk, "a"));
  EXPECT_FALSE(IsListed(open.apk, "b"));
  EXPECT_TRUE(IsListed(open.apk, "c"));
}

// A section for "a" with the SHA-1 digest of one content and the SHA-256 digest of another.
JarText TwoDigests(const std::string& sha1_of, const std::string& sha256_of) {
  return JarText()
      .Attribute("Name", "a")
      .Digests({"SHA-256-Digest"}, ToBytes(sha256_of))
      .Digests({"SHA1-Digest"}, ToBytes(sha1_of))
      .EndSection();
}

TEST(ApkDigests, OfTwoDigestsInASectionSha1IsRecorded) {
  DiskFile disk(ToBytes("right"));
  OpenPackage open(WithSections(TwoDigests("right", "wrong")));
  EXPECT_TRUE(open.apk.VerifyFileHash("a", disk.path()));
}

TEST(ApkDigests, OfTwoDigestsInASectionSha256IsNotConsulted) {
  DiskFile disk(ToBytes("right"));
  OpenPackage open(WithSections(TwoDigests("wrong", "right")));
  EXPECT_FALSE(open.apk.VerifyFileHash("a", disk.path()));
}

TEST(ApkDigests, AnEntryInTwoSectionsKeepsTheSecondOnesDigest) {
  OpenPackage open(WithSections(JarText()
                                    .Section("a", {"SHA1-Digest"}, ToBytes("first"))
                                    .Section("a", {"SHA-256-Digest"}, ToBytes("second"))));
  DiskFile first(ToBytes("first"));
  EXPECT_FALSE(open.apk.VerifyFileHash("a", first.path()));
  DiskFile second(ToBytes("second"));
  EXPECT_TRUE(open.apk.VerifyFileHash("a", second.path()));
}

// ---- Walking the entries.

TEST(ApkIteration, TwoEmptyTextsIterateOverAllEntries) {
  OpenPackage open(WithoutDex());
  EXPECT_EQ(
      NamesIn(open.apk, "", ""),
      (std::vector<std::string>{"AndroidManifest.xml", "META-INF/CERT.RSA", "META-INF/CERT.SF",
                                "META-INF/MANIFEST.MF", "lib/arm64-v8a/libfoo.so"}));
}

TEST(ApkIteration, PrefixAndSuffixFilter) {
  OpenPackage open(WithoutDex());
  EXPECT_EQ(NamesIn(open.apk, "META-INF/", ".SF"), (std::vector<std::string>{"META-INF/CERT.SF"}));
  EXPECT_EQ(NamesIn(open.apk, "lib/", ""), (std::vector<std::string>{"lib/arm64-v8a/libfoo.so"}));
  EXPECT_EQ(NamesIn(open.apk, "", ".xml"), (std::vector<std::string>{"AndroidManifest.xml"}));
  EXPECT_EQ(NamesIn(open.apk, "meta-inf/", ""), (std::vector<std::string>{}));
}

TEST(ApkIteration, NextAtTheEndLeavesTheNameAsItWas) {
  LogCapture log;
  OpenPackage open(BuildZip({{"a", ToBytes("a")}}));
  void* cookie;
  ASSERT_EQ(open.apk.StartIteration(&cookie, "", ""), 0);
  ZipEntry entry;
  std::string name = "before";
  EXPECT_EQ(open.apk.Next(cookie, &entry, name), 0);
  EXPECT_EQ(name, "a");
  EXPECT_EQ(open.apk.Next(cookie, &entry, name), kIterationEnd);
  EXPECT_EQ(name, "a");
  open.apk.EndIteration(cookie);
}

TEST(ApkIteration, AFilterThatNoNameCanHaveIsAnInvalidName) {
  LogCapture log;
  OpenPackage open(BuildZip({{"a", ToBytes("a")}}));
  void* cookie;
  EXPECT_EQ(open.apk.StartIteration(&cookie, std::string(0x10000, 'a'), ""), kInvalidEntryName);
  EXPECT_EQ(open.apk.StartIteration(&cookie, "", std::string(0x10000, 'a')), kInvalidEntryName);
}

// ---- Entries that are not what they say.

// The package with its Android manifest as given.
std::string LogOfAndroidManifest(const ZipItem& item) {
  Package package = MakePackage(WithoutDex());
  package.Item(kAndroidManifestName) = item;
  LogCapture log;
  OpenPackage open(package);
  EXPECT_FALSE(open.apk.IsApk());
  return log.records().size() == 1 ? log.records()[0].text : "";
}

ZipItem AndroidManifestItem(bool deflated) {
  return {kAndroidManifestName, CompiledManifest("com.example.app"), deflated};
}

TEST(ApkEntries, ADeflatedAndroidManifestIsRead) {
  PackageOptions options = WithoutDex();
  Package package = MakePackage(options);
  package.Item(kAndroidManifestName).deflated = true;
  package.Item(kAndroidManifestName).data_descriptor = true;
  OpenPackage open(package);
  EXPECT_TRUE(open.apk.IsGoodApk());
  EXPECT_EQ(open.apk.GetPackageName(), "com.example.app");
}

TEST(ApkEntries, AStoredEntryOfAnotherLengthThanItsDataIsInconsistent) {
  const ZipItem item = AndroidManifestItem(false);
  for (const uint32_t length : {0u, 1u, static_cast<uint32_t>(item.data.size()) + 1}) {
    EXPECT_EQ(LogOfAndroidManifest(ClaimingLength(item, length)),
              "Can't extract Android Manifest: Inconsistent information\n");
  }
}

TEST(ApkEntries, ADeflatedEntryLongerThanDeflateCanMakeItIsInconsistent) {
  const ZipItem item = AndroidManifestItem(true);
  const auto compressed_length = static_cast<uint32_t>(Deflate(item.data).size());
  for (const uint32_t length : {1032 * compressed_length + 1, 0xfffffffeu}) {
    EXPECT_EQ(LogOfAndroidManifest(ClaimingLength(item, length)),
              "Can't extract Android Manifest: Inconsistent information\n");
  }
}

TEST(ApkEntries, ADeflatedEntryThatIsShorterThanItSaysIsInconsistent) {
  const ZipItem item = AndroidManifestItem(true);
  const auto length = static_cast<uint32_t>(item.data.size());
  EXPECT_EQ(LogOfAndroidManifest(ClaimingLength(item, length + 1)),
            "Can't extract Android Manifest: Inconsistent information\n");
}

TEST(ApkEntries, AnEntryWhoseHeadersDisagreeIsInconsistent) {
  ZipItem item = AndroidManifestItem(true);
  item.local.length = 5;
  EXPECT_EQ(LogOfAndroidManifest(item),
            "Can't extract Android Manifest: Inconsistent information\n");
}

TEST(ApkEntries, AnEntryWhoseDataDescriptorLiesIsInconsistent) {
  ZipItem item = AndroidManifestItem(true);
  item.data_descriptor = true;
  item.descriptor.length = 5;
  EXPECT_EQ(LogOfAndroidManifest(item),
            "Can't extract Android Manifest: Inconsistent information\n");
}

TEST(ApkEntries, AnArchiveWithTwoEntriesOfANameIsNotOpened) {
  Package package = MakePackage(WithoutDex());
  package.items.push_back(package.Item(kAndroidManifestName));
  LogCapture log;
  OpenPackage open(package);
  EXPECT_FALSE(open.apk.IsGoodZip());
}

// The most memory that the process has had, in kilobytes.
long PeakMemory() {
  std::ifstream status("/proc/self/status");
  for (std::string word; status >> word;) {
    if (long kilobytes; word == "VmHWM:" && status >> kilobytes) return kilobytes;
  }
  return -1;
}

// Opens the archive in a child process, and gives what the child's peak of memory grew by, in
// kilobytes; -1 when it died or took the archive for a package.
long GrowthOfOpening(const Bytes& archive) {
  int ends[2];
  EXPECT_EQ(pipe(ends), 0);
  const pid_t child = fork();
  if (child == 0) {
    LogCapture log;
    const long before = PeakMemory();
    OpenPackage open(archive);
    const long growth = open.apk.IsApk() ? -1 : PeakMemory() - before;
    _exit(write(ends[1], &growth, sizeof(growth)) == sizeof(growth) ? 0 : 1);
  }
  close(ends[1]);
  long growth = -1;
  EXPECT_EQ(read(ends[0], &growth, sizeof(growth)), static_cast<ssize_t>(sizeof(growth)));
  close(ends[0]);
  int status;
  EXPECT_EQ(waitpid(child, &status, 0), child);
  EXPECT_EQ(status, 0);
  return growth;
}

constexpr long kLittleMemory = 100 << 10;  // in kilobytes, where the lie is of 4,000,000

TEST(ApkEntries, GarbageThatDeclaresGigabytesTouchesLittleMemory) {
  ZipItem item{kAndroidManifestName, {}, true};
  std::mt19937 random(1);
  item.raw = Bytes(4200000);
  for (uint8_t& byte : *item.raw) byte = static_cast<uint8_t>(random());
  const long growth = GrowthOfOpening(BuildZip({ClaimingLength(item, 0xfffffffe)}));
  EXPECT_GE(growth, 0);
  EXPECT_LT(growth, kLittleMemory);
}

TEST(ApkEntries, AFewBytesThatDeclareGigabytesTouchLittleMemory) {
  const ZipItem item{kAndroidManifestName, Bytes(100, 0), true};
  const long growth = GrowthOfOpening(BuildZip({ClaimingLength(item, 0xfffffffe)}));
  EXPECT_GE(growth, 0);
  EXPECT_LT(growth, kLittleMemory);
}

}  // namespace
