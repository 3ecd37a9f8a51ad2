// Runs the tool on packages with a changed, missing or wrongly signed part. Tests what the tool
// refuses, and for which reasons.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <filesystem>

#include "support/expected_timeline.h"
#include "support/files.h"
#include "support/namespaces.h"
#include "support/package.h"
#include "support/simulation.h"

namespace {

const Bytes kLibrary = ToBytes("\177ELF foo");

// A package that requests the secure-storage permission, and its library on disk. Each test changes
// the package or the library.
class RefusedPackage : public testing::Test {
 protected:
  explicit RefusedPackage(const PackageOptions& options = Options())
      : package_(MakePackage(options)) {}

  static PackageOptions Options() {
    PackageOptions options;
    options.secure_storage = true;
    return options;
  }

  Simulation Run() const {
    package_.WriteTo(apk_);
    return Simulate(apk_);
  }

  // The tool refuses the package before VeltSignJni, the first step. The events `reasons` come
  // first, and nothing is signed.
  void ExpectRefusalAfter(std::initializer_list<std::string> reasons) const {
    const Simulation run = Run();
    EXPECT_EQ(run.timeline, Timeline({Timeline(reasons), NothingSigned(apk_), Exit(0)}));
    EXPECT_EQ(run.status, 1);
  }

  // VeltSignJni, the first step, refuses the dex file and logs `reasons`. The tool has already read
  // that the package asks for the permission. The last step therefore tries to register the key. It
  // also logs an error, because the package was refused.
  void ExpectDexFileRefusedAfter(std::initializer_list<std::string> reasons) const {
    const Simulation run = Run();
    EXPECT_EQ(
        run.timeline,
        Timeline({Log(4, "VeltSignJni starts: 3.\n"), Timeline(reasons),
                  Log(6, "Integrity not confirmed: classes.dex\n"),
                  Log(6, "VeltSignJni: malformed apk: " + apk_ + "\n"),
                  Log(4, "VeltSign starts: zip_fd = 3, fd = 3.\n"),
                  Log(4, "VeltSignOat: Apk case.\n"), Log(4, "VeltSign finished: 65536.\n"),
                  Log(6, "Apk archive is not valid for fd=3, path=" + apk_ + "\n"), Exit(0)}));
    EXPECT_EQ(run.status, 1);
  }

  // The library is missing, but a missing library is not refused. The package is signed, and its
  // key is registered.
  void ExpectLibraryAbsentAfter(std::initializer_list<std::string> reasons) const {
    ExpectGoodPackageWith(Timeline(reasons), 0);
  }

  // The tool refuses the library and logs `reasons`. The package is signed, and its key is
  // registered.
  void ExpectLibraryRefusedAfter(std::initializer_list<std::string> reasons) const {
    ExpectGoodPackageWith(Timeline(reasons), 1);
  }

  // Nothing is refused: the library and the package are signed, and the key is registered.
  void ExpectAllSigned() const { ExpectGoodPackageWith(SignedLibrary(library_), 0); }

  // `library` has the events of the library. After these events, the package is signed, and its key
  // is registered.
  void ExpectGoodPackageWith(const std::string& library, int status) const {
    const Simulation run = Run();
    EXPECT_EQ(run.timeline,
              Timeline({LibraryStep({library}), PackageStep(apk_),
                        Register(3, apk_, "com.example.app", ModulusOf("rsa-2048")),
                        Log(4, "ZuAddCertificate: ZuNewCertificate return 0.\n"), Exit(0)}));
    EXPECT_EQ(run.status, status);
  }

  const TempDir directory_;
  const std::string apk_ = directory_ / "base.apk";
  const std::string library_ = directory_.Write("lib/arm64/libfoo.so", kLibrary);
  Package package_;
};

using TamperedPackage = RefusedPackage;

TEST_F(TamperedPackage, ChangedLibraryOnDiskIsNotSigned) {
  Bytes changed = kLibrary;
  changed.back() ^= 1;
  WriteFile(library_, changed);

  ExpectLibraryRefusedAfter({Log(6, "VeltSignJni: File not verified: " + library_ + "\n")});
}

TEST_F(TamperedPackage, LibraryOnDiskIsSignedIfOnlyTheOneInThePackageChanged) {
  package_.Tamper("lib/arm64-v8a/libfoo.so");
  ExpectAllSigned();
}

TEST_F(TamperedPackage, ManifestIsRefused) {
  package_.Tamper("META-INF/MANIFEST.MF");

  ExpectRefusalAfter({Log(6, "Can't validate manifest.\n"), Log(6, "Can't validate manifest.\n")});
}

TEST_F(TamperedPackage, SignatureFileIsRefused) {
  package_.Item("META-INF/CERT.SF").data[0] ^= 1;  // the "S" of "Signature-Version"

  ExpectRefusalAfter({Log(6, "SHA256 hash does not match"),
                      Log(6, "RSA could not verify data: 12\n"),
                      Log(6, "file not verified: META-INF/CERT.SF\n")});
}

// The signature is at the end of the block. The changed signature has no valid padding.
TEST_F(TamperedPackage, SignatureInTheBlockIsRefused) {
  package_.Item("META-INF/CERT.RSA").data.back() ^= 1;

  ExpectRefusalAfter(
      {Log(6, "RSA could not verify data: 7\n"), Log(6, "file not verified: META-INF/CERT.SF\n")});
}

TEST_F(TamperedPackage, BlockThatIsCutShortIsRefused) {
  package_.Item("META-INF/CERT.RSA").data.resize(100);

  ExpectRefusalAfter({StandardOutput("CERT_PARCER [ERROR]: CANT PROCESS CERTIFICATE TAG\n"),
                      StandardOutput("CERT_PARCER [ERROR]: processPKCS7Header() error\n"),
                      Log(6, "Unknown certificate type"),
                      Log(6, "file not verified: META-INF/CERT.SF\n")});
}

TEST_F(TamperedPackage, DexFileIsRefusedAndTheKeyNotRegistered) {
  package_.Tamper("classes.dex");

  ExpectDexFileRefusedAfter({});
}

TEST_F(TamperedPackage, DexFileThatClaimsGigabytesIsRefused) {
  ZipItem& dex = package_.Item("classes.dex");
  dex = ClaimingLength(dex, 0xFFFFFFF0);

  ExpectDexFileRefusedAfter({});
}

TEST_F(TamperedPackage, AddedDexFileThatTheManifestDoesNotNameIsRefused) {
  package_ = MakePackage([] {
    PackageOptions options = Options();
    options.entries = {};
    return options;
  }());
  package_.items.push_back({"classes.dex", ToBytes("dex\n035")});

  ExpectDexFileRefusedAfter({Log(6, "Can't find file in META-INF/MANIFEST.MF: classes.dex\n")});
}

// Deliberate: the tool compares only one dex file, classes.dex, with the manifest.
TEST_F(TamperedPackage, SecondDexFileIsNotLookedAt) {
  package_ = MakePackage([] {
    PackageOptions options;
    options.entries = {{"classes.dex", ToBytes("dex\n035")}, {"classes2.dex", ToBytes("dex\n035")}};
    return options;
  }());
  package_.Tamper("classes2.dex");

  const Simulation run = Run();

  EXPECT_EQ(run.timeline, Timeline({LibraryStep(), PackageStep(apk_), Exit(0)}));
  EXPECT_EQ(run.status, 0);
}

TEST_F(TamperedPackage, CertificateOfAnotherIssuerIsRefused) {
  package_ = MakePackage([] {
    PackageOptions options = Options();
    // The tool checks the certificate's signature with the subject's key, although the issuer's key
    // made it. The issuer's modulus is smaller than the subject's modulus, so the signature is a
    // number below the subject's modulus. The tool then refuses the padding and logs 7. If the
    // signature were not below the subject's modulus, the tool would log 5.
    options.block.key = "rsa-2048-other";
    options.block.issuer_key = "rsa-2048";
    return options;
  }());

  ExpectRefusalAfter({Log(6, "RSA could not verify certificate: 7\n"),
                      Log(6, "file not verified: META-INF/CERT.SF\n")});
}

using IncompletePackage = RefusedPackage;

TEST_F(IncompletePackage, IsRefusedWithoutALoggedReasonIfManifestIsMissing) {
  package_.Remove("META-INF/MANIFEST.MF");
  ExpectRefusalAfter({});
}

TEST_F(IncompletePackage, IsRefusedWithoutALoggedReasonIfSignatureFileIsMissing) {
  package_.Remove("META-INF/CERT.SF");
  ExpectRefusalAfter({});
}

TEST_F(IncompletePackage, IsRefusedWithoutALoggedReasonIfSignatureFileIsLowerCase) {
  package_.Item("META-INF/CERT.SF").name = "META-INF/cert.sf";
  ExpectRefusalAfter({});
}

TEST_F(IncompletePackage, IsRefusedIfTheSignatureBlockIsMissing) {
  package_.Remove("META-INF/CERT.RSA");
  ExpectRefusalAfter({Log(6, "Can't extract RSA certificate: META-INF/CERT.RSA\n")});
}

TEST_F(IncompletePackage, IsSignedEvenWithoutItsDexFile) {
  package_.Remove("classes.dex");
  ExpectAllSigned();
}

TEST_F(IncompletePackage, LibraryThatIsNotOnDiskIsNotSigned) {
  std::filesystem::remove(library_);
  ExpectLibraryAbsentAfter({Log(6, "Can't open file: " + library_ + "\n"),
                            Log(6, "VeltSignJni: File not verified: " + library_ + "\n")});
}

TEST_F(IncompletePackage, LibraryThatIsADirectoryOnDiskIsRefused) {
  std::filesystem::remove(library_);
  std::filesystem::create_directory(library_);
  ExpectLibraryRefusedAfter({Log(6, "Can't read file: " + library_ + " (streamoff=-1)\n"),
                             Log(6, "VeltSignJni: File not verified: " + library_ + "\n")});
}

// Reading the pipe would wait for a writer.
TEST_F(IncompletePackage, LibraryThatIsAPipeOnDiskIsRefused) {
  std::filesystem::remove(library_);
  ASSERT_EQ(mkfifo(library_.c_str(), 0600), 0);
  ExpectLibraryRefusedAfter({Log(6, "Can't read file: " + library_ + " (streamoff=-1)\n"),
                             Log(6, "VeltSignJni: File not verified: " + library_ + "\n")});
}

// Root can read any file. In a user namespace of its own, the tool does not have this right.
TEST_F(IncompletePackage, LibraryThatMayNotBeReadIsRefused) {
  if (!CanMakeNamespaces()) GTEST_SKIP() << kNoNamespaces;
  std::filesystem::permissions(library_, std::filesystem::perms::none);
  package_.WriteTo(apk_);

  const Simulation run = Simulate(apk_, {}, {{"unshare", "-U"}, {}});

  EXPECT_EQ(
      run.timeline,
      Timeline({LibraryStep({Log(6, "Can't open file: " + library_ + "\n"),
                             Log(6, "VeltSignJni: File not verified: " + library_ + "\n")}),
                PackageStep(apk_), Register(3, apk_, "com.example.app", ModulusOf("rsa-2048")),
                Log(4, "ZuAddCertificate: ZuNewCertificate return 0.\n"), Exit(0)}));
  EXPECT_EQ(run.status, 1);
}

TEST_F(IncompletePackage, LibraryWithoutADigestIsRefused) {
  package_ = MakePackage([] {
    PackageOptions options = Options();
    options.entries = {{"classes.dex", ToBytes("dex\n035")}};
    return options;
  }());
  package_.items.push_back({"lib/arm64-v8a/libfoo.so", kLibrary});

  ExpectLibraryRefusedAfter(
      {Log(6, "Can't find file in META-INF/MANIFEST.MF: lib/arm64-v8a/libfoo.so\n"),
       Log(6, "VeltSignJni: File not verified: " + library_ + "\n")});
}

TEST_F(IncompletePackage, MissingLibraryDoesNotStopTheOther) {
  package_ = MakePackage([] {
    PackageOptions options;
    options.entries = {{"lib/arm64-v8a/libfoo.so", kLibrary}, {"lib/armeabi/libbar.so", kLibrary}};
    return options;
  }());
  const std::string missing = directory_ / "lib/arm/libbar.so";

  const Simulation run = Run();

  const std::string refused = Log(6, "Can't open file: " + missing + "\n") +
                              Log(6, "VeltSignJni: File not verified: " + missing + "\n");
  const std::string signed_one = SignedLibrary(library_);
  // The zip library chooses the order of the entries.
  const bool refused_first = run.timeline.find(missing) < run.timeline.find(library_);
  EXPECT_EQ(run.timeline, Timeline({LibraryStep({refused_first ? refused : signed_one,
                                                 refused_first ? signed_one : refused}),
                                    PackageStep(apk_), Exit(0)}));
  EXPECT_EQ(run.status, 0);  // a missing library is not refused
}

}  // namespace
