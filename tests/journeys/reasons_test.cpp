// The reasons and warnings that the simulator gives for files. Most of the packages are real:
// developers' tools made them.
#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>

#include "journeys/reason.h"
#include "support/files.h"
#include "support/namespaces.h"
#include "support/package.h"
#include "support/signature_block.h"

namespace {

TEST_F(Reason, UnsignedPackageIsReported) {
  Take("unsigned.apk");
  EXPECT_EQ(Told(3), Lines({"REFUSED  base.apk",
                            "  ✗ package                not signed: it is unsigned: "
                            "META-INF/MANIFEST.MF is missing",
                            "      Sign it: apksigner sign --v1-signing-enabled true.", "-> 1"}));
}

TEST_F(Reason, PackageSignedOnlyWithNewerSchemesIsReported) {
  Take("apksigner-newer-only");
  EXPECT_EQ(
      Told(4),
      Lines({"REFUSED  base.apk",
             "  ✗ package                not signed: it is signed only with v2, v3, but "
             "this tool reads only JAR signatures (v1): META-INF/MANIFEST.MF is missing",
             "      Sign it with v1 as well: enableV1Signing true for the Gradle plugin, or",
             "      apksigner sign --v1-signing-enabled true --min-sdk-version 23.", "-> 1"}));
}

TEST_F(Reason, JarsignerSignatureIsReported) {
  for (const char* name : {"jarsigner-sha256", "jarsigner-sha1"}) {
    const std::string directory = std::string(GOLDEN_PACKAGES) + "/" + name;
    const Lines told = WithoutReason(3, FirstLines(kAll, {"base.apk"}, {{}, directory}));
    EXPECT_EQ(told, Lines({"REFUSED  base.apk",
                           "  ✗ package                not signed: its signature covers signed "
                           "attributes, which new jarsigner versions write and this tool refuses",
                           "      Sign it with apksigner; no option of jarsigner helps.", "-> 1"}));
  }
}

TEST_F(Reason, CertificateOfAnotherIssuerIsReported) {
  Take("openssl-cms-issued");
  EXPECT_EQ(
      Told(4),
      Lines({"REFUSED  base.apk",
             "  ✗ package                not signed: its certificate was issued by another "
             "subject (CN=rsa-2048, O=Example), and this tool accepts only self-signed "
             "certificates",
             "      Sign it with a self-signed certificate: keytool -genkeypair -keyalg RSA",
             "      -sigalg SHA256withRSA. This changes the signer, so phones cannot update a",
             "-> 1"}));
}

TEST_F(Reason, EcKeyIsReported) {
  Take("apksigner-ec");
  EXPECT_EQ(
      Told(3),
      Lines({"REFUSED  base.apk",
             "  ✗ package                not signed: its key is an EC key, and this tool "
             "supports only RSA",
             "      Sign it with an RSA key of 2048 to 4096 bits. This changes the signer, so",
             "-> 1"}));
}

TEST_F(Reason, KeyOfMoreThan4096BitsIsReported) {
  Take("apksigner-5120");
  EXPECT_EQ(
      Told(3),
      Lines({"REFUSED  base.apk",
             "  ✗ package                not signed: its RSA key has 5120 bits, and this "
             "tool accepts at most 4096",
             "      Sign it with an RSA key of 2048 to 4096 bits. This changes the signer, so",
             "-> 1"}));
}

TEST_F(Reason, DsaKeyIsReported) {
  Do("LC_ALL=C.UTF-8 keytool -genkeypair -keyalg DSA -keysize 2048 -sigalg SHA256withDSA "
     "-validity 10000 -alias cert -dname CN=Own -keystore key.p12 -storepass android "
     "2>keytool.log;"
     "apksigner sign --ks key.p12 --ks-pass pass:android --v1-signer-name CERT "
     "--min-sdk-version 21 --in " +
     std::string(GOLDEN_PACKAGES) + "/unsigned.apk --out base.apk");
  EXPECT_EQ(Told(3), Lines({"REFUSED  base.apk",
                            "  ✗ package                not signed: its key is a DSA key, and "
                            "this tool supports only RSA",
                            "      Sign it with an RSA key of 2048 to 4096 bits. This changes the "
                            "signer, so",
                            "-> 1"}));
}

// The cure is the advice below the reason. This cure states its own disadvantage: the signer
// changes.
TEST_F(Reason, CureByAnotherKeyStatesItsDisadvantage) {
  for (const char* name : {"apksigner-ec", "apksigner-5120"}) {
    Do("rm -rf -- *");
    Take(name);
    const Lines told = Told(kAll);
    ASSERT_GT(told.size(), 5U);
    EXPECT_EQ(told[2] + told[3] + told[4],
              "      Sign it with an RSA key of 2048 to 4096 bits. This changes the signer, so"
              "      phones cannot update a published app with this package. Key rotation does"
              "      not help: the JAR signature is still made with the first key.")
        << name;
  }
}

// By default, keytool signs the certificate of an RSA key of 3584 bits with SHA-384. The package
// keytool-sha384 has such a certificate. The package keytool-sha256 has the same key, with the
// certificate that the command in the cure makes.
TEST_F(Reason, CertificateSignedWithSha384IsReported) {
  Take("keytool-sha384");
  const Lines told = Told(5);
  EXPECT_EQ(
      Lines(told.begin() + 1, told.end()),
      Lines({"  ✗ package                not signed: its certificate is signed with "
             "SHA384withRSA, not RSA PKCS#1 v1.5 with MD5, SHA-1 or SHA-256",
             "      Certify the same key with SHA-256, and sign again: keytool -selfcert",
             "      -alias ALIAS -sigalg SHA256withRSA -validity 10000 -keystore KEYSTORE.",
             "      This changes the signer, so phones cannot update a published app with this",
             "-> 1"}));
  EXPECT_EQ(FirstLines(0, {"base.apk"}, {{}, std::string(GOLDEN_PACKAGES) + "/keytool-sha256"}),
            Lines({"-> 0"}));
}

TEST_F(Reason, SignatureOverSha512IsReported) {
  Take("openssl-cms-sha512");
  EXPECT_EQ(Told(2)[1],
            "  ✗ package                not signed: its signature uses SHA512, not RSA PKCS#1 "
            "v1.5 with MD5, SHA-1 or SHA-256");
}

// Developers' tools make no key with the public exponent 1 or -1. The test therefore writes the
// signature block itself. The block has the modulus of rsa-2048, but the private key is not needed.
TEST_F(Reason, ExponentOf1OrMinus1IsReported) {
  Take("apksigner-sha256-2048");
  Do("unzip -q base.apk META-INF/CERT.SF");
  const Bytes signature_file = ToBytes(ContentOf(directory_ / "META-INF/CERT.SF"));
  const auto refusal = [&](const Bytes& exponent) {
    directory_.Write("META-INF/CERT.RSA", ForgedBlock(signature_file, "rsa-2048", exponent));
    Do("zip -q base.apk META-INF/CERT.RSA");
    return Told(3);
  };
  const Lines told = refusal({1});
  EXPECT_EQ(told[1],
            "  ✗ package                not signed: its RSA key has the public exponent 1, with "
            "which anyone can make its signatures");
  EXPECT_EQ(told[2], "      Do not trust this package. Normal keys have the exponent 65537.");
  EXPECT_EQ(refusal({0xff, 0xff, 0xff, 0xff})[1],
            "  ✗ package                not signed: its RSA key has the public exponent -1, "
            "with which anyone can make its signatures");
}

TEST_F(Reason, DirectoryIsReported) {
  EXPECT_EQ(Told(3, {}, "."),
            Lines({"REFUSED  .", "  ✗ file  not signed: it is a directory",
                   "      Name the package inside it, or give --recursive.", "-> 1"}));
}

TEST_F(Reason, EmptyFileIsReported) {
  directory_.Write("base.apk", {});
  EXPECT_EQ(Told(2), Lines({"REFUSED  base.apk",
                            "  ✗ file  not signed: it is empty, a file of 0 bytes", "-> 1"}));
}

TEST_F(Reason, TruncatedFileIsReported) {
  Take("apksigner-sha256-2048");
  Do("truncate -s 5000 base.apk");
  EXPECT_EQ(Told(2), Lines({"REFUSED  base.apk",
                            "  ✗ file  not signed: it begins like an archive, but its end is "
                            "missing: it was cut off",
                            "-> 1"}));
  // The zip library's own message is part of the timeline.
  EXPECT_EQ(Told(4)[3], "   1  log        [ziparchive] Zip: EOCD not found, " +
                            (directory_ / "base.apk") + " is not zip");
}

TEST_F(Reason, TextFileIsReported) {
  directory_.Write("base.apk", ToBytes("<html>404 Not Found</html>\n"));
  EXPECT_EQ(Told(2), Lines({"REFUSED  base.apk",
                            "  ✗ file  not signed: it is a text and not an archive", "-> 1"}));
}

TEST_F(Reason, DamagedArchiveIsReported) {
  Take("apksigner-sha256-2048");
  // This changes the central directory's offset in the end-of-central-directory record.
  Do("printf '\\xff' | dd of=base.apk bs=1 conv=notrunc status=none "
     "seek=$(($(stat -c %s base.apk) - 3))");
  EXPECT_EQ(Told(2)[1],
            "  ✗ file  not signed: it is a damaged archive, which the zip library does not open");
}

TEST_F(Reason, IntegrityValueOf0IsReported) {
  Take("apksigner-sha256-2048");
  EXPECT_EQ(
      Told(8, {"--integrity", "0"}),
      Lines({"REFUSED  base.apk",
             "  ✗ package                not signed: the kernel set the tool's own integrity "
             "value to 0, so the tool is not allowed to sign",
             "  ✗ lib/arm64/libvault.so  not signed: the kernel set the tool's own integrity "
             "value to 0, so the tool is not allowed to sign",
             "  ✗ lib/arm/libvault.so    not signed: the kernel set the tool's own integrity "
             "value to 0, so the tool is not allowed to sign",
             "      The file was good. Check the domain that starts the tool: the tool's value",
             "      must be neither 0 nor ffffffff.",
             "  ✓ key                    registered for com.example.vault", "  signer", "-> 1"}));
}

TEST_F(Reason, RefusalByTheKernelIsReported) {
  Take("apksigner-sha256-2048");
  EXPECT_EQ(Told(2, {"--sign-errno", "EPERM"})[1],
            "  ✗ package                not signed: the kernel refused (EPERM: Operation not "
            "permitted)");
}

TEST_F(Reason, MissingFileIsReported) {
  EXPECT_EQ(Told(2), Lines({"NOT LOOKED AT  base.apk",
                            "  ✗ file  not looked at: there is no such file", "-> 4"}));
}

TEST_F(Reason, MissingReadPermissionIsReported) {
  if (!CanMakeNamespaces()) GTEST_SKIP() << kNoNamespaces;
  Take("apksigner-sha256-2048");
  std::filesystem::permissions(directory_ / "base.apk", std::filesystem::perms::none);
  EXPECT_EQ(Told(2, {}, "base.apk", {"unshare", "-U"}),
            Lines({"NOT LOOKED AT  base.apk",
                   "  ✗ file  not looked at: there is no permission to read it", "-> 4"}));
}

TEST_F(Reason, ReadOnlyFileSystemIsReported) {
  if (!CanMakeNamespaces()) GTEST_SKIP() << kNoNamespaces;
  Take("apksigner-sha256-2048");
  const TempDir mount_point;
  const std::string apk = mount_point / "base.apk";
  const Lines before = OnItsOwnFileSystem(directory_ / "base.apk", mount_point.path(), "ro");
  EXPECT_EQ(Told(2, {}, apk, before),
            Lines({"NOT LOOKED AT  " + apk,
                   "  ✗ file  not looked at: it is on a read-only file system, where the tool "
                   "signs nothing",
                   "-> 4"}));
}

TEST_F(Reason, ClosedStandardInputIsReported) {
  Take("apksigner-sha256-2048");
  EXPECT_EQ(Told(2, {}, "base.apk", {"bash", "-c", "exec \"$0\" \"$@\" <&-"}),
            Lines({"NOT LOOKED AT  base.apk",
                   "  ✗ file  not looked at: standard input is closed, so the file got "
                   "descriptor 0, which the tool treats as a failure",
                   "-> 4"}));
}

TEST_F(Reason, TamperedDexFileIsReported) {
  Take("changed-dex");
  EXPECT_EQ(Told(7),
            Lines({"REFUSED  base.apk",
                   "  ✗ package                not signed: classes.dex is not the one that was "
                   "signed",
                   "      Sign the package again, as the last step that changes it. If you did not",
                   "      change it yourself, do not trust it.",
                   "  ✗ lib/arm64/libvault.so  not signed: the package is refused",
                   "  ✗ lib/arm/libvault.so    not signed: the package is refused",
                   "  ✗ key                    not registered: the package is refused", "-> 1"}));
}

TEST_F(Reason, TamperedManifestIsReported) {
  Take("apksigner-sha256-2048");
  Do("unzip -q base.apk META-INF/MANIFEST.MF; echo >>META-INF/MANIFEST.MF;"
     " zip -q base.apk META-INF/MANIFEST.MF");
  EXPECT_EQ(Told(3),
            Lines({"REFUSED  base.apk",
                   "  ✗ package                not signed: META-INF/MANIFEST.MF was changed after "
                   "it was signed",
                   "      Sign the package again, as the last step that changes it.", "-> 1"}));
}

TEST_F(Reason, TamperedSignatureFileIsReported) {
  Take("apksigner-sha256-2048");
  Do("unzip -q base.apk META-INF/CERT.SF; echo >>META-INF/CERT.SF;"
     " zip -q base.apk META-INF/CERT.SF");
  EXPECT_EQ(
      Told(2)[1],
      "  ✗ package                not signed: its signature file META-INF/CERT.SF was changed "
      "after it was signed");
}

TEST_F(Reason, RemovedSignatureIsReported) {
  Take("apksigner-sha256-2048");
  Do("zip -q -d base.apk META-INF/CERT.RSA");
  EXPECT_EQ(Told(2)[1],
            "  ✗ package                not signed: the block META-INF/CERT.RSA, which belongs to "
            "its signature file, is missing");
  Do("zip -q -d base.apk META-INF/CERT.SF");
  EXPECT_EQ(Told(2)[1],
            "  ✗ package                not signed: there is no signature file "
            "META-INF/*.SF (in capital letters)");
}

TEST_F(Reason, DuplicateEntryIsReported) {
  Take("apksigner-sha256-2048");
  Do("python3 -W ignore -c \"import zipfile; zipfile.ZipFile('base.apk', 'a').writestr("
     "'classes.dex', 'x')\"");
  EXPECT_EQ(Told(2)[1],
            "  ✗ file  not signed: classes.dex is in it more than once, and the zip library "
            "does not open such an archive");
}

TEST_F(Reason, EncryptedEntryGivesAWarning) {
  Take("apksigner-sha256-2048");
  Do("echo x >secret; zip -q -P word base.apk secret");
  const Lines told = Told(kAll);
  EXPECT_NE(std::find(told.begin(), told.end(),
                      "  ! 1 entry: secret: encrypted, and no phone decrypts it"),
            told.end());
}

TEST_F(Reason, EncryptedEntryThatTheToolReadsIsReported) {
  for (const std::string entry : {"AndroidManifest.xml", "META-INF/MANIFEST.MF", "META-INF/CERT.SF",
                                  "META-INF/CERT.RSA", "classes.dex"}) {
    Do("rm -rf -- *");
    Take("apksigner-sha256-2048");
    Do("unzip -q base.apk " + entry + "; zip -q -P word base.apk " + entry);
    EXPECT_EQ(Told(2)[1].substr(Told(2)[1].find("not signed")),
              "not signed: " + entry + " is encrypted, and no phone decrypts it");
  }
}

TEST_F(Reason, ArchivesThatAreNotPackagesAreReported) {
  Take("apksigner-sha256-2048");
  Do("touch BundleConfig.pb; zip -q app.aab BundleConfig.pb; zip -q set.apks base.apk;"
     "echo '{}' >manifest.json; zip -q set.xapk manifest.json base.apk;"
     "zip -q -d base.apk AndroidManifest.xml");
  EXPECT_EQ(
      Told(3, {}, "app.aab"),
      Lines({"REFUSED  app.aab",
             "  ✗ JAR  not signed: it is an app bundle (.aab), which no phone installs",
             "      Make packages of it with bundletool build-apks, and name those.", "-> 1"}));
  EXPECT_EQ(
      Told(3, {}, "set.apks"),
      Lines({"REFUSED  set.apks",
             "  ✗ JAR  not signed: it is an archive of packages (.apks, .xapk), and not "
             "a package",
             "      Unpack it, and name the packages in it, the base and its splits.", "-> 1"}));
  EXPECT_EQ(Told(2, {}, "set.xapk"),
            Lines({"REFUSED  set.xapk",
                   "  ✗ JAR  not signed: it is an archive of packages (.apks, .xapk), and not "
                   "a package",
                   "-> 1"}));
  EXPECT_EQ(Told(2)[1].substr(0, 50), "  ✗ JAR  not signed: it has parts of a package (");
}

TEST_F(Reason, PackageWithAKeyOf512BitsIsSignedWithAWarning) {
  PackageOptions options;
  options.block.key = "rsa-512";
  MakePackage(options).WriteTo(directory_ / "base.apk");
  const Lines told = Told(kAll);
  EXPECT_EQ(told[0].rfind("SIGNED  base.apk   com.example.app   signer CN=Test, RSA-512, key ", 0),
            0U);
  EXPECT_EQ(told[0].substr(told[0].size() - 12), "   1 warning");
  EXPECT_NE(std::find(told.begin(), told.end(),
                      "  ! its RSA key has 512 bits; fewer than 2048 bits are not safe"),
            told.end());
}

// The command in the cure makes another certificate for the same key. The tool accepts this
// certificate.
TEST_F(Reason, CertificateWithSha384IsCuredByTheShownCommand) {
  Take("keytool-sha384");
  const Lines told = Told(10);
  std::string cure;
  for (size_t i = 2; told[i].rfind("      ", 0) == 0; ++i) cure += told[i].substr(5);
  const size_t start = cure.find("keytool -selfcert ");
  ASSERT_NE(start, std::string::npos) << cure;
  std::string command = cure.substr(start, cure.find(". ", start) - start);
  command.replace(command.find("ALIAS"), 5, "cert");
  command.replace(command.find("KEYSTORE"), 8, "key.p12");
  const std::string golden = std::string(GOLDEN_PACKAGES);
  Do("LC_ALL=C.UTF-8 keytool -genkeypair -keyalg RSA -keysize 3584 -alias cert -dname CN=Own "
     "-sigalg SHA384withRSA -keystore key.p12 -storepass android 2>keytool.log;" +
     command + " -storepass android 2>keytool.log;" +
     "apksigner sign --ks key.p12 --ks-pass pass:android --v1-signer-name CERT "
     "--min-sdk-version 18 --in " +
     golden +
     "/unsigned.apk --out base.apk;"
     "keytool -list -v -keystore key.p12 -storepass android >listed");
  EXPECT_EQ(Told(1)[0].substr(0, 16), "SIGNED  base.apk");
  EXPECT_NE(ContentOf(directory_ / "listed").find("SHA256withRSA"), std::string::npos);
}

TEST_F(Reason, PlainJarIsSignedOnlyIfTrusted) {
  Do("echo text >a.txt; jar --create --file library.jar a.txt");
  EXPECT_EQ(Told(2, {}, "library.jar"),
            Lines({"NOT TRUSTED JAR  library.jar",
                   "  ✗ JAR  not signed: it is a plain JAR, which is signed only if the kernel "
                   "already trusts it; the kernel answered ENOKEY: Required key not "
                   "available",
                   "-> 1"}));
  EXPECT_EQ(Told(2, {"--trust", "library.jar"}, "library.jar"),
            Lines({"TRUSTED JAR  library.jar", "  ✓ JAR  signed, with an empty payload", "-> 0"}));
}

}  // namespace
