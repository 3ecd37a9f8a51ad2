// Runs the tool on good packages. Tests which files are signed with which payloads, which key is
// registered, and the order of these events.
#include <gtest/gtest.h>

#include <filesystem>

#include "support/expected_timeline.h"
#include "support/files.h"
#include "support/package.h"
#include "support/simulation.h"

namespace {

const Bytes kLibrary = ToBytes("\177ELF foo");

// The options of a good package with classes.dex and one native library, the entry `entry_name`.
PackageOptions WithLibrary(const std::string& entry_name) {
  PackageOptions options;
  options.entries = {{"classes.dex", ToBytes("dex\n035")}, {entry_name, kLibrary}};
  return options;
}

TEST(GoodPackage, LibraryIsSignedThenThePackageThenItsKeyIsRegistered) {
  const TempDir directory;
  const std::string apk = directory / "base.apk";
  const std::string library = directory.Write("lib/arm64/libfoo.so", kLibrary);
  PackageOptions options = WithLibrary("lib/arm64-v8a/libfoo.so");
  options.secure_storage = true;
  MakePackage(options).WriteTo(apk);

  const Simulation run = Simulate(apk);

  EXPECT_EQ(run.timeline, Timeline({
                              Log(4, "VeltSignJni starts: 3.\n"),
                              Log(4, "VeltSignOat: Apk case.\n"),
                              Integrity("1f"),
                              Sign(4, library, PackagePayload()),
                              Log(4, "VeltSignJni finished: 0.\n"),
                              Log(4, "VeltSign starts: zip_fd = 3, fd = 3.\n"),
                              Log(4, "VeltSignOat: Apk case.\n"),
                              Integrity("1f"),
                              Sign(3, apk, PackagePayload()),
                              Log(4, "VeltSign finished: 0.\n"),
                              Register(3, apk, "com.example.app", ModulusOf("rsa-2048")),
                              Log(4, "ZuAddCertificate: ZuNewCertificate return 0.\n"),
                              Exit(0),
                          }));
  EXPECT_EQ(run.status, 0);
}

TEST(GoodPackage, IsNotRegisteredWithoutThePermission) {
  const TempDir directory;
  const std::string apk = directory / "base.apk";
  const std::string library = directory.Write("lib/arm64/libfoo.so", kLibrary);
  MakePackage(WithLibrary("lib/arm64-v8a/libfoo.so")).WriteTo(apk);

  const Simulation run = Simulate(apk);

  EXPECT_EQ(run.timeline,
            Timeline({LibraryStep({SignedLibrary(library)}), PackageStep(apk), Exit(0)}));
  EXPECT_EQ(run.status, 0);
}

TEST(GoodPackage, IsSignedAloneIfItHasNoLibraries) {
  const TempDir directory;
  const std::string apk = directory / "base.apk";
  PackageOptions options;
  options.entries = {{"classes.dex", ToBytes("dex\n035")}};
  MakePackage(options).WriteTo(apk);

  const Simulation run = Simulate(apk);

  EXPECT_EQ(run.timeline, Timeline({LibraryStep(), PackageStep(apk), Exit(0)}));
  EXPECT_EQ(run.status, 0);
}

TEST(GoodPackage, IsSignedEvenWithoutADexFile) {
  const TempDir directory;
  const std::string apk = directory / "base.apk";
  PackageOptions options;
  options.entries = {};
  MakePackage(options).WriteTo(apk);

  const Simulation run = Simulate(apk);

  EXPECT_EQ(run.timeline, Timeline({LibraryStep(), PackageStep(apk), Exit(0)}));
  EXPECT_EQ(run.status, 0);
}

struct Row {
  const char* description;
  const char* entry_name;
  const char* installed;
};

void PrintTo(const Row& row, std::ostream* out) { *out << row.entry_name; }

class LibraryDirectory : public testing::TestWithParam<Row> {};

TEST_P(LibraryDirectory, ContainsTheSignedLibrary) {
  const TempDir directory;
  const std::string apk = directory / "base.apk";
  const std::string library = directory.Write(GetParam().installed, kLibrary);
  MakePackage(WithLibrary(GetParam().entry_name)).WriteTo(apk);

  const Simulation run = Simulate(apk);

  EXPECT_EQ(run.timeline,
            Timeline({LibraryStep({SignedLibrary(library)}), PackageStep(apk), Exit(0)}));
  EXPECT_EQ(run.status, 0);
}

INSTANTIATE_TEST_SUITE_P(
    Rows, LibraryDirectory,
    testing::Values(Row{"ArmeabiV7a", "lib/armeabi-v7a/libfoo.so", "lib/arm/libfoo.so"},
                    Row{"ArmeabiV8a", "lib/armeabi-v8a/libfoo.so", "lib/arm64/libfoo.so"},
                    Row{"Arm64V8a", "lib/arm64-v8a/libfoo.so", "lib/arm64/libfoo.so"},
                    Row{"Armeabi", "lib/armeabi/libfoo.so", "lib/arm/libfoo.so"},
                    Row{"NoSeparatorAfterThePrefix", "lib/armeabiX/libfoo.so",
                        "lib/armX/libfoo.so"}),
    [](const auto& row) { return row.param.description; });

class EntryThatIsNotALibrary : public testing::TestWithParam<Row> {};

TEST_P(EntryThatIsNotALibrary, IsSkippedSilently) {
  const TempDir directory;
  const std::string apk = directory / "base.apk";
  directory.Write(GetParam().installed, kLibrary);
  MakePackage(WithLibrary(GetParam().entry_name)).WriteTo(apk);

  const Simulation run = Simulate(apk);

  EXPECT_EQ(run.timeline, Timeline({LibraryStep(), PackageStep(apk), Exit(0)}));
  EXPECT_EQ(run.status, 0);
}

INSTANTIATE_TEST_SUITE_P(
    Rows, EntryThatIsNotALibrary,
    testing::Values(Row{"OtherProcessor", "lib/x86/libfoo.so", "lib/x86/libfoo.so"},
                    Row{"OtherSuffix", "lib/arm64-v8a/libfoo.so.1", "lib/arm64/libfoo.so.1"},
                    Row{"OtherDirectory", "assets/lib/arm64-v8a/libfoo.so", "lib/arm64/libfoo.so"}),
    [](const auto& row) { return row.param.description; });

TEST(GoodPackage, IsFoundThroughItsDescriptorIfNamedWithoutADirectory) {
  const TempDir directory;
  const std::string apk = directory / "base.apk";
  const std::string library = directory.Write("lib/arm64/libfoo.so", kLibrary);
  MakePackage(WithLibrary("lib/arm64-v8a/libfoo.so")).WriteTo(apk);

  const Simulation run = Simulate("base.apk", {}, {{}, directory.path()});

  EXPECT_EQ(run.timeline,
            Timeline({LibraryStep({SignedLibrary(library)}), PackageStep(apk), Exit(0)}));
  EXPECT_EQ(run.status, 0);
}

TEST(GoodPackage, LinkLeadsToTheLibrariesBesideItsTarget) {
  const TempDir directory;
  const std::string apk = directory / "base.apk";
  const std::string library = directory.Write("lib/arm64/libfoo.so", kLibrary);
  MakePackage(WithLibrary("lib/arm64-v8a/libfoo.so")).WriteTo(apk);
  const TempDir elsewhere;
  std::filesystem::create_symlink(apk, elsewhere / "link.apk");

  const Simulation run = Simulate(elsewhere / "link.apk");

  EXPECT_EQ(run.timeline,
            Timeline({LibraryStep({SignedLibrary(library)}), PackageStep(apk), Exit(0)}));
  EXPECT_EQ(run.status, 0);
}

}  // namespace
