#include "simulator/run/installation.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/mman.h>
#include <sys/resource.h>
#include <unistd.h>

#include <algorithm>
#include <csignal>
#include <filesystem>

#include "simulator/cut_file.h"
#include "support/compiled_manifest.h"
#include "support/files.h"
#include "support/package.h"

using namespace simulator;

namespace {

namespace fs = std::filesystem;

const Deadline kLater(1e6);

// Lays out the package: puts it into a temporary directory, and extracts its libraries beside it.
// Returns "path content" of each extracted file.
std::vector<std::string> LaidOutOf(const PackageOptions& package, InstalledAbi abi,
                                   std::vector<std::string>* left_out = nullptr) {
  const TempDir directory;
  const std::string file = directory / "base.apk";
  MakePackage(package).WriteTo(file);
  Installation installation;
  EXPECT_EQ(installation.LayOut(file, InstallWhen::kAlways, abi, kLater), std::nullopt);
  if (left_out != nullptr) *left_out = installation.left_out();
  const fs::path place = fs::path(installation.path()).parent_path();
  std::vector<std::string> files;
  if (place == directory.path()) return files;
  EXPECT_EQ(ContentOf(installation.path()), ContentOf(file));
  for (const auto& entry : fs::recursive_directory_iterator(place)) {
    if (!entry.is_regular_file() || entry.path() == installation.path()) continue;
    files.push_back(fs::relative(entry.path(), place).string() + " " +
                    ContentOf(entry.path().string()));
  }
  std::sort(files.begin(), files.end());
  return files;
}

// Like LaidOutOf, for a package with the entries in `libraries`.
std::vector<std::string> LaidOut(const std::vector<ZipItem>& libraries, InstalledAbi abi,
                                 std::vector<std::string>* left_out = nullptr) {
  return LaidOutOf(WithLibraries(libraries), abi, left_out);
}

using Files = std::vector<std::string>;

const std::vector<ZipItem> kBoth = {{"lib/arm64-v8a/liba.so", ToBytes("64")},
                                    {"lib/armeabi-v7a/liba.so", ToBytes("32"), true},
                                    {"lib/armeabi/liba.so", ToBytes("old")},
                                    {"lib/x86/liba.so", ToBytes("x86")}};

}  // namespace

TEST(Installation, HasTheLibrariesOfThePreferredProcessor) {
  EXPECT_EQ(LaidOut(kBoth, InstalledAbi::kPreferred), Files({"lib/arm64/liba.so 64"}));
  EXPECT_EQ(LaidOut({kBoth[1], kBoth[3]}, InstalledAbi::kPreferred), Files({"lib/arm/liba.so 32"}));
}

TEST(Installation, HasTheLibrariesOfTheChosenProcessors) {
  EXPECT_EQ(LaidOut(kBoth, InstalledAbi::kAll),
            Files({"lib/arm/liba.so 32", "lib/arm64/liba.so 64"}));
  EXPECT_EQ(LaidOut(kBoth, InstalledAbi::kArm64), Files({"lib/arm64/liba.so 64"}));
  EXPECT_EQ(LaidOut(kBoth, InstalledAbi::kArm), Files({"lib/arm/liba.so 32"}));
  EXPECT_EQ(LaidOut({kBoth[2]}, InstalledAbi::kAll), Files({"lib/arm/liba.so old"}));
  // If a package has two ABIs for one processor, only the libraries of the preferred ABI, here
  // armeabi-v7a, are extracted. A library of armeabi is not extracted even if armeabi-v7a has no
  // library of this name.
  EXPECT_EQ(LaidOut({kBoth[1], {"lib/armeabi/libb.so", ToBytes("old")}}, InstalledAbi::kAll),
            Files({"lib/arm/liba.so 32"}));
}

TEST(Installation, PackageWithoutLibrariesForTheAbiStaysWhereItIs) {
  EXPECT_EQ(LaidOut({kBoth[3]}, InstalledAbi::kPreferred), Files());
  EXPECT_EQ(LaidOut({kBoth[0]}, InstalledAbi::kArm), Files());
  EXPECT_EQ(LaidOut({}, InstalledAbi::kAll), Files());
}

TEST(Installation, PackageThatKeepsItsLibrariesStaysWhereItIs) {
  PackageOptions package = WithLibraries(kBoth);
  const auto laid_out = [&package](bool extracts) {
    constexpr uint8_t kBoolean = 0x12;
    XmlAttribute attribute = IntAttribute("extractNativeLibs", extracts ? 0xffffffff : 0);
    attribute.type = kBoolean;
    CompiledXml xml;
    xml.Start("manifest").Element("application", {InAndroidNamespace(attribute)}).End("manifest");
    package.android_manifest = xml.Build();
    return LaidOutOf(package, InstalledAbi::kPreferred);
  };
  EXPECT_EQ(laid_out(true), Files({"lib/arm64/liba.so 64"}));
  EXPECT_EQ(laid_out(false), Files());
}

TEST(Installation, NamesDoNotLeadOutOfTheirDirectory) {
  Files left_out;
  EXPECT_EQ(LaidOut({{"lib/arm64-v8a/liba.so", ToBytes("good")},
                     {"lib/arm64-v8a/../../../outside.so", ToBytes("bad")},
                     {"lib/arm64-v8a/sub/libb.so", ToBytes("bad")},
                     {"lib/../libc.so", ToBytes("bad")},
                     {"lib/libd.so", ToBytes("bad")}},
                    InstalledAbi::kAll, &left_out),
            Files({"lib/arm64/liba.so good"}));
  std::sort(left_out.begin(), left_out.end());
  EXPECT_EQ(left_out, Files({"lib/arm64-v8a/../../../outside.so", "lib/arm64-v8a/sub/libb.so",
                             "lib/libd.so"}));
}

// A file name has at most 255 bytes.
TEST(Installation, NamesThatNoFileCanHaveAreLeftOut) {
  const std::string longest = std::string(252, 'l') + ".so";
  Files left_out;
  EXPECT_EQ(LaidOut({{"lib/arm64-v8a/" + longest, ToBytes("good")},
                     {"lib/arm64-v8a/l" + longest, ToBytes("bad")}},
                    InstalledAbi::kAll, &left_out),
            Files({"lib/arm64/" + longest + " good"}));
  EXPECT_EQ(left_out, Files({"lib/arm64-v8a/l" + longest}));
}

TEST(Installation, FailsIfTheFileShrinksDuringExtraction) {
  std::vector<ZipItem> libraries;
  for (int i = 0; i < 1000; ++i) {
    libraries.push_back({"lib/arm64-v8a/" + std::to_string(i) + ".so", {}});
  }
  const auto fails = [](const std::string& file) {
    Installation installation;
    return installation.LayOut(file, InstallWhen::kAlways, InstalledAbi::kAll, kLater) ==
           "it became shorter meanwhile";
  };
  EXPECT_TRUE(NoticesCut(MakePackage(WithLibraries(libraries)).Build(), fails));
}

TEST(Installation, NamesTheLibrariesThatCannotBeExtracted) {
  ZipItem undeflatable = {"lib/arm64-v8a/libdata.so", ToBytes("data")};
  undeflatable.deflated = true;
  undeflatable.raw = ToBytes("no deflate stream");
  ZipItem unknown = {"lib/arm64-v8a/libmethod.so", ToBytes("data")};
  unknown.method = 12;
  ZipItem crc = {"lib/arm64-v8a/libcrc.so", ToBytes("data")};
  crc.local.crc = 1;
  ZipItem size = {"lib/arm64-v8a/libsize.so", ToBytes("data")};
  size.local.length = 5;
  const TempDir directory;
  const std::string file = directory / "base.apk";
  const ZipItem good = {"lib/arm64-v8a/liba.so", ToBytes("good")};
  MakePackage(WithLibraries({undeflatable, good, unknown, crc, size})).WriteTo(file);
  Installation installation;
  EXPECT_EQ(installation.LayOut(file, InstallWhen::kAlways, InstalledAbi::kAll, kLater),
            std::nullopt);
  Files lost = installation.not_extracted();
  std::sort(lost.begin(), lost.end());
  EXPECT_EQ(lost, Files({crc.name, undeflatable.name, unknown.name, size.name}));
  EXPECT_EQ(installation.left_out(), Files());
  const fs::path place = fs::path(installation.path()).parent_path();
  EXPECT_TRUE(fs::exists(place / "lib/arm64/liba.so"));
  EXPECT_FALSE(fs::exists(place / "lib/arm64/libdata.so"));
}

// In the temporary directory, the package has the name base.apk, so it cannot collide with the
// directory lib beside it.
TEST(Installation, PackageNamedLibBecomesBaseApk) {
  const TempDir directory;
  const std::string file = directory / "lib";
  MakePackage().WriteTo(file);
  Installation installation;
  EXPECT_EQ(installation.LayOut(file, InstallWhen::kAlways, InstalledAbi::kAll, kLater),
            std::nullopt);
  const fs::path place = fs::path(installation.path()).parent_path();
  EXPECT_EQ(installation.path(), place / "base.apk");
  EXPECT_EQ(ContentOf(place / "lib/arm64/libfoo.so"), "\177ELF foo");
}

// A file size limit below the size of the library makes the write fail.
TEST(Installation, SaysWhenItCannotWrite) {
  const TempDir directory;
  const std::string file = directory / "base.apk";
  MakePackage(WithLibraries({{"lib/arm64-v8a/liba.so", Bytes(3000, 'a')}})).WriteTo(file);
  const auto problem_with = [&file](rlim_t most) {
    rlimit before = {};
    getrlimit(RLIMIT_FSIZE, &before);
    const rlimit limit = {most, before.rlim_max};
    signal(SIGXFSZ, SIG_IGN);
    setrlimit(RLIMIT_FSIZE, &limit);
    Installation installation;
    const auto problem =
        installation.LayOut(file, InstallWhen::kAlways, InstalledAbi::kAll, kLater);
    setrlimit(RLIMIT_FSIZE, &before);
    EXPECT_TRUE(installation.not_extracted().empty());
    return problem.value_or("");
  };
  const std::string problem = problem_with(2000);
  EXPECT_NE(problem.find("/lib/arm64/liba.so: File too large"), std::string::npos) << problem;
  EXPECT_EQ(problem_with(3000), "");
}

// A write lease (F_SETLEASE) delays every other open() of the file. With the flag O_NONBLOCK,
// open() fails at once instead. LayOut() opens the package with this flag. If open() fails, the
// package stays where it is. In a whole run, the tool then opens the package, and waits for the end
// of the lease.
TEST(Installation, DoesNotWaitForALease) {
  const TempDir directory;
  const std::string file = directory / "base.apk";
  MakePackage().WriteTo(file);
  signal(SIGIO, SIG_IGN);
  const int holder = open(file.c_str(), O_RDWR);
  ASSERT_EQ(fcntl(holder, F_SETLEASE, F_WRLCK), 0);
  Installation installation;
  EXPECT_EQ(installation.LayOut(file, InstallWhen::kAlways, InstalledAbi::kAll, kLater),
            std::nullopt);
  EXPECT_EQ(installation.path(), file);
  close(holder);
}

TEST(Installation, DisappearsWithItsOwner) {
  const TempDir directory;
  const std::string file = directory / "base.apk";
  MakePackage().WriteTo(file);
  std::string path;
  {
    Installation installation;
    ASSERT_EQ(installation.LayOut(file, InstallWhen::kAlways, InstalledAbi::kPreferred, kLater),
              std::nullopt);
    path = installation.path();
    ASSERT_NE(path, file);
    EXPECT_TRUE(fs::exists(path));
  }
  EXPECT_FALSE(fs::exists(fs::path(path).parent_path()));
  EXPECT_TRUE(fs::exists(file));
}

// A hard link to a file in memory (memfd) is impossible, like a hard link to a file on another file
// system. The package is therefore copied.
TEST(Installation, FileThatCannotBeLinkedIsCopiedBeforeTheDeadline) {
  const TempDir directory;
  MakePackage(WithLibraries({{"lib/arm64-v8a/liba.so", Bytes(3 << 20, 'a')}}))
      .WriteTo(directory / "base.apk");
  const std::string package = ContentOf(directory / "base.apk");
  const int memory = memfd_create("base.apk", MFD_CLOEXEC);
  ASSERT_EQ(write(memory, package.data(), package.size()), static_cast<ssize_t>(package.size()));
  const std::string file = "/proc/self/fd/" + std::to_string(memory);
  Installation copied;
  EXPECT_EQ(copied.LayOut(file, InstallWhen::kAlways, InstalledAbi::kPreferred, kLater),
            std::nullopt);
  EXPECT_NE(copied.path(), file);
  EXPECT_EQ(ContentOf(copied.path()), package);
  Installation late;
  const auto problem =
      late.LayOut(file, InstallWhen::kAlways, InstalledAbi::kPreferred, Deadline(0));
  close(memory);
  ASSERT_TRUE(problem.has_value());
  EXPECT_NE(problem->find("Connection timed out"), std::string::npos) << *problem;
}

TEST(Installation, LeavesOtherFilesWhereTheyAre) {
  const TempDir directory;
  for (const std::string& file :
       {directory.path(), directory / "none", directory.Write("note.txt", ToBytes("text")),
        std::string("/dev/zero")}) {
    Installation installation;
    EXPECT_EQ(installation.LayOut(file, InstallWhen::kAlways, InstalledAbi::kAll, kLater),
              std::nullopt);
    EXPECT_EQ(installation.path(), file);
  }
}

TEST(Installation, ReportsAMissingTemporaryDirectory) {
  const TempDir directory;
  const std::string file = directory / "base.apk";
  MakePackage().WriteTo(file);
  const char* const before = getenv("TMPDIR");
  const std::string kept = before == nullptr ? "/tmp" : before;
  ASSERT_EQ(setenv("TMPDIR", "/nowhere", 1), 0);
  Installation installation;
  const auto problem =
      installation.LayOut(file, InstallWhen::kAlways, InstalledAbi::kPreferred, kLater);
  setenv("TMPDIR", kept.c_str(), 1);
  EXPECT_EQ(problem.value_or("").substr(0, 8), "TMPDIR: ");
}

// After an interruption (here SIGTERM), the next write of LayOut() fails, even before the deadline.
TEST(Installation, FailsAfterAnInterruption) {
  const TempDir directory;
  const std::string file = directory / "base.apk";
  MakePackage(WithLibraries({kBoth[0]})).WriteTo(file);
  const auto lay_out = [&] {
    CatchInterruptions();
    raise(SIGTERM);
    const auto objection =
        Installation().LayOut(file, InstallWhen::kAlways, InstalledAbi::kAll, kLater);
    _exit(objection == std::nullopt ? 1 : 0);
  };
  EXPECT_EXIT(lay_out(), testing::ExitedWithCode(0), "");
}

// With kAlone, a package is laid out only if no libraries or library directories are beside it.
TEST(Installation, IsMadeForAPackageWithoutLibrariesBesideIt) {
  const TempDir directory;
  const std::string file = directory / "base.apk";
  // The tool looks for the libraries of lib/armeabiX in lib/armX.
  MakePackage(WithLibraries({kBoth[0], {"lib/armeabiX/libx.so", ToBytes("x")}})).WriteTo(file);
  const auto is_laid_out = [&file](InstallWhen when) {
    Installation installation;
    EXPECT_EQ(installation.LayOut(file, when, InstalledAbi::kPreferred, kLater), std::nullopt);
    EXPECT_EQ(installation.is_done(), installation.path() != file);
    return installation.is_done();
  };
  EXPECT_TRUE(is_laid_out(InstallWhen::kAlone));
  EXPECT_FALSE(is_laid_out(InstallWhen::kNever));
  for (const char* place : {"lib/arm64", "lib/arm", "lib/armX/libx.so"}) {
    fs::create_directories(directory / place);
    EXPECT_FALSE(is_laid_out(InstallWhen::kAlone)) << place;
    EXPECT_TRUE(is_laid_out(InstallWhen::kAlways)) << place;
    fs::remove_all(directory / "lib");
  }
  // A symbolic link to the package can be in another directory. The tool looks for libraries beside
  // the package, not beside the link.
  const TempDir links;
  fs::create_symlink(file, links / "base.apk");
  fs::create_directories(directory / "lib/arm64");
  Installation of_link;
  EXPECT_EQ(of_link.LayOut(links / "base.apk", InstallWhen::kAlone, InstalledAbi::kAll, kLater),
            std::nullopt);
  EXPECT_FALSE(of_link.is_done());
  fs::remove_all(directory / "lib");
  // If lib is a link to itself, lstat() of lib/arm64 fails. LayOut() then assumes that lib/arm64
  // exists.
  fs::create_symlink("lib", directory / "lib");
  EXPECT_FALSE(is_laid_out(InstallWhen::kAlone));
}

TEST(Installation, LeavesAJarWithLibrariesWhereItIs) {
  const TempDir directory;
  const std::string file = directory / "a.jar";
  Package package = MakePackage();
  package.items.erase(
      std::remove_if(package.items.begin(), package.items.end(),
                     [](const ZipItem& item) { return item.name == "AndroidManifest.xml"; }),
      package.items.end());
  package.WriteTo(file);
  Installation installation;
  EXPECT_EQ(installation.LayOut(file, InstallWhen::kAlways, InstalledAbi::kAll, kLater),
            std::nullopt);
  EXPECT_EQ(installation.path(), file);
}

TEST(Installation, NamesTheLibrariesOfAbisNotChosen) {
  const TempDir directory;
  const std::string file = directory / "base.apk";
  MakePackage(WithLibraries(kBoth)).WriteTo(file);
  const auto others = [&file](InstalledAbi abi) {
    Installation installation;
    EXPECT_EQ(installation.LayOut(file, InstallWhen::kAlways, abi, kLater), std::nullopt);
    return installation.of_other_abis();
  };
  EXPECT_EQ(others(InstalledAbi::kPreferred),
            std::set<std::string>({"lib/armeabi-v7a/liba.so", "lib/armeabi/liba.so"}));
  EXPECT_EQ(others(InstalledAbi::kArm),
            std::set<std::string>({"lib/arm64-v8a/liba.so", "lib/armeabi/liba.so"}));
  EXPECT_EQ(others(InstalledAbi::kAll), std::set<std::string>({"lib/armeabi/liba.so"}));
}

TEST(Installation, ItsPathsAreStable) {
  const TempDir directory;
  const std::string file = directory / "base.apk";
  MakePackage(WithLibraries({kBoth[0]})).WriteTo(file);
  Installation installation;
  EXPECT_EQ(installation.WithStablePaths("/x/base.apk"), "/x/base.apk");
  ASSERT_EQ(installation.LayOut(file, InstallWhen::kAlways, InstalledAbi::kPreferred, kLater),
            std::nullopt);
  const std::string place = fs::path(installation.path()).parent_path().string();
  EXPECT_EQ(installation.WithStablePaths("a " + place + "/lib/x.so b " + place + "/base.apk"),
            "a <install>/lib/x.so b <install>/base.apk");
  // The path of another directory is kept, even if it begins with the text of `place`.
  EXPECT_EQ(installation.WithStablePaths(place + "x/<install>/lib"), place + "x/<install>/lib");
}
