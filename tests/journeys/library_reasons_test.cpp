// Tests the lines of the simulator's report for native libraries that the tool does not sign.
#include "journeys/reason.h"

#include "support/package.h"

namespace {

constexpr char kLaidOut[] =
    "  its libraries were extracted beside it, as an installer does; --install=no turns this off";

TEST_F(Reason, TamperedLibraryIsReported) {
  Take("apksigner-sha256-2048");
  Do("echo >>lib/arm64/libvault.so");
  EXPECT_EQ(Told(7),
            Lines({"PARTLY SIGNED  base.apk", kSigned,
                   "  ✗ lib/arm64/libvault.so  not signed: its bytes are not those that the "
                   "manifest lists",
                   "      The file beside the package was changed after it was installed. Install",
                   "      the package again.", "  ✓ lib/arm/libvault.so    signed",
                   "  ✓ key                    registered for com.example.vault", "-> 1"}));
}

TEST_F(Reason, EncryptedLibraryIsReported) {
  Take("apksigner-sha256-2048");
  Do("rm -r lib; unzip -q base.apk 'lib/*'; zip -q -P word base.apk lib/arm64-v8a/*; rm -r lib");
  EXPECT_EQ(Told(4, {"--install"}),
            Lines({"PARTLY SIGNED  base.apk", kSigned,
                   "  ✗ lib/arm64/libvault.so  not signed: lib/arm64-v8a/libvault.so is encrypted, "
                   "and no phone decrypts it",
                   "      Build the package again without a password.", "-> 1"}));
}

TEST_F(Reason, LibraryInASubdirectoryOfItsAbiIsReported) {
  MakePackage(WithLibraries({{"lib/arm64-v8a/sub/libx.so", ToBytes("x")}}))
      .WriteTo(directory_ / "base.apk");
  EXPECT_EQ(Told(5)[2],
            "  – lib/arm64/sub/libx.so  nothing to sign: it is in a subdirectory of its ABI: "
            "installers do not extract it to lib/arm64/sub/libx.so, where the tool looks");
}

// A phone's installer extracts the libraries of only one ABI. With --install or --install=arm, the
// simulator does the same. The libraries of the other ABI do not count as refused, even with
// --strict.
TEST_F(Reason, LibrariesOfAnotherProcessorAreNotLaidOut) {
  Take("apksigner-sha256-2048");
  Do("rm -r lib");
  const std::string other =
      "nothing to sign: its ABI was not chosen (--install=all chooses one for 32-bit and one "
      "for 64-bit Arm)";
  EXPECT_EQ(
      Told(6, {"--install", "--strict"}),
      Lines({"SIGNED  base.apk" + ByRsa2048(), kSigned, "  ✓ lib/arm64/libvault.so  signed",
             "  – lib/arm/libvault.so    " + other,
             "  ✓ key                    registered for com.example.vault", kLaidOut, "-> 0"}));
  EXPECT_EQ(Told(4, {"--install=arm", "--strict"}),
            Lines({"SIGNED  base.apk" + ByRsa2048(), kSigned, "  – lib/arm64/libvault.so  " + other,
                   "  ✓ lib/arm/libvault.so    signed", "-> 0"}));
  EXPECT_EQ(Told(4, {"--install=all", "--strict"}).back(), "-> 0");
}

// Installers do not extract a library from a subdirectory of its ABI. With --strict, a library in
// a subdirectory counts as refused.
TEST_F(Reason, StrictRefusesALibraryThatNoInstallerExtracts) {
  MakePackage(WithLibraries({{"lib/arm64-v8a/libx.so", ToBytes("x")},
                             {"lib/arm64-v8a/sub/liby.so", ToBytes("y")}}))
      .WriteTo(directory_ / "base.apk");
  EXPECT_EQ(Told(1, {"--install", "--strict"}).back(), "-> 1");
  EXPECT_EQ(Told(1, {"--install"}).back(), "-> 0");
}

// A store delivers a package without libraries beside it. The function Told passes --install=no to
// the simulator before the options of the test. An --install option of the test overrides
// --install=no.
TEST_F(Reason, LibrariesMissingBesideThePackageAreReported) {
  Take("apksigner-sha256-2048");
  Do("rm -r lib");
  const std::string absent = "nothing to sign: no libraries for its ABI are beside the package";
  EXPECT_EQ(Told(7),
            Lines({"SIGNED  base.apk" + ByRsa2048(), kSigned,
                   "  – lib/arm64/libvault.so  " + absent, "  – lib/arm/libvault.so    " + absent,
                   "      If the phone does not use this ABI, there is nothing to do. To extract",
                   "      libraries for 32-bit and 64-bit Arm, use --install=all.",
                   "  ✓ key                    registered for com.example.vault", "-> 0"}));
  EXPECT_EQ(Told(1, {"--strict"}), Lines({"PARTLY SIGNED  base.apk", "-> 1"}));
  EXPECT_EQ(Told(5, {"--install=all"}),
            Lines({"SIGNED  base.apk" + ByRsa2048(), kSigned, "  ✓ lib/arm64/libvault.so  signed",
                   "  ✓ lib/arm/libvault.so    signed",
                   "  ✓ key                    registered for com.example.vault", "-> 0"}));
  EXPECT_EQ(Told(4, {"--install"})[2], "  ✓ lib/arm64/libvault.so  signed");
}

// Without an --install option, the simulator looks for lib/arm64 and lib/arm beside this package.
// If neither exists, the simulator lays out a copy of the package: it extracts the libraries beside
// the copy, as an installer does.
TEST_F(Reason, PackageWithoutLibrariesBesideItIsLaidOut) {
  Take("apksigner-sha256-2048");
  Do("rm -r lib");
  const auto run = [this] {
    return RunProcess({"env", "LC_ALL=C.UTF-8", SimulatorPath(), "--installer=off", "base.apk"},
                      directory_.path());
  };
  const ProcessResult alone = run();
  EXPECT_EQ(alone.status, 0);
  EXPECT_NE(alone.output.find("  ✓ lib/arm64/libvault.so  signed\n"), std::string::npos);
  EXPECT_NE(alone.output.find(std::string("\n") + kLaidOut + "\n"), std::string::npos);
  // If lib/arm64 or lib/arm exists, the package counts as installed, and nothing is laid out.
  for (const std::string place : {"lib/arm64", "lib/arm"}) {
    Do("rm -rf lib; mkdir -p " + place);
    const ProcessResult installed = run();
    EXPECT_NE(installed.output.find("  – lib/arm64/libvault.so  nothing to sign: "),
              std::string::npos)
        << installed.output;
    EXPECT_EQ(installed.output.find("extracted beside"), std::string::npos);
  }
  // With an empty directory lib, the package does not count as installed.
  Do("rm -rf lib; mkdir lib");
  EXPECT_EQ(run().output, alone.output);
}

TEST_F(Reason, MissingLibraryOfOneAbiIsReported) {
  Take("apksigner-sha256-2048");
  Do("rm -r lib/arm");
  EXPECT_EQ(Told(4)[2], "  ✓ lib/arm64/libvault.so  signed");
  EXPECT_EQ(Told(4)[3],
            "  – lib/arm/libvault.so    nothing to sign: no libraries for its ABI are beside the "
            "package");
}

TEST_F(Reason, LibrariesKeptInsideThePackageAreReported) {
  Take("kept-libraries");
  Do("rm -r lib");
  const std::string kept =
      "nothing to sign: it stays inside the package (extractNativeLibs=\"false\")";
  EXPECT_EQ(Told(6),
            Lines({"SIGNED  base.apk" + ByRsa2048(),
                   "  ✓ package                 signed with the payload of the signer's key",
                   "  – lib/arm64/libvault.so   " + kept, "  – lib/arm/libvault.so     " + kept,
                   "      Nothing to do: it is loaded from the package.",
                   "  – lib/x86_64/libvault.so  nothing to sign: the tool knows no directory "
                   "for its ABI",
                   "-> 0"}));
  EXPECT_EQ(Told(3, {"--install=all"})[2], "  – lib/arm64/libvault.so   " + kept);
}

}  // namespace
