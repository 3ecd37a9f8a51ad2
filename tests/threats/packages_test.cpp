// Tests attacks with packages that aapt and apksigner made. Since Android 7, the installer does not
// check the JAR signature of a package that has an APK signing block. Only this tool checks it
// (docs/threat-model.md).
#include <gtest/gtest.h>

#include <filesystem>

#include "support/certificate.h"
#include "support/expected_timeline.h"
#include "support/files.h"
#include "support/package.h"
#include "support/process.h"
#include "support/signing_block.h"
#include "support/simulation.h"

namespace {

std::string Made(const std::string& name) {
  return std::filesystem::canonical(THREAT_PACKAGES).string() + "/" + name + "/base.apk";
}

// The events of a run that signs both libraries and the package with the payload of the signer's
// key `key`, and registers this key under `name`.
std::string AllSignedAndRegistered(const std::string& apk, const std::string& key,
                                   const std::string& name) {
  const std::string directory = std::filesystem::path(apk).parent_path();
  const Bytes payload = PackagePayload(key);
  return Timeline({LibraryStep({SignedLibrary(directory + "/lib/arm64/libvault.so", payload),
                                SignedLibrary(directory + "/lib/arm/libvault.so", payload)}),
                   PackageStep(apk, payload), Register(3, apk, name, ModulusOf(key)),
                   Log(4, "ZuAddCertificate: ZuNewCertificate return 0.\n"), Exit(0)});
}

// ---- Packages signed by apksigner with each kind of RSA key.

class ApksignerKey : public testing::TestWithParam<const char*> {};

TEST_P(ApksignerKey, VerifiesAndIsRegistered) {
  const std::string apk = Made(std::string("keys/") + GetParam());
  EXPECT_EQ(Simulate(apk).timeline, AllSignedAndRegistered(apk, GetParam(), "com.example.vault"));
}

std::string NameOf(const testing::TestParamInfo<const char*>& info) {
  std::string name = info.param;
  for (size_t dash; (dash = name.find('-')) != std::string::npos;) name[dash] = '_';
  return name;
}

INSTANTIATE_TEST_SUITE_P(Rsa, ApksignerKey,
                         testing::Values("rsa-1024", "rsa-1536", "rsa-2048", "rsa-2048-e3",
                                         "rsa-2048-e17", "rsa-2048-other", "rsa-3072", "rsa-4096"),
                         NameOf);

// ---- Packages with the victim's META-INF. The Android manifest and the APK signing block are the
// attacker's.

class ForeignMetaInf : public testing::TestWithParam<const char*> {
 protected:
  // Writes the package again, with the attacker's APK signing block. Copies the package's libraries
  // beside the new file.
  ForeignMetaInf() : apk_(directory_ / "base.apk") {
    std::filesystem::copy(std::filesystem::path(Made(GetParam())).parent_path() / "lib",
                          directory_ / "lib", std::filesystem::copy_options::recursive);
    WriteFile(apk_, AddSigningBlock(ToBytes(ContentOf(Made(GetParam()))), "rsa-2048-other"));
  }

  TempDir directory_;
  const std::string apk_;
};

TEST_P(ForeignMetaInf, PassesApksignerWithTheAttackersKeyFromAndroid7On) {
  const ProcessResult verdict = RunProcess(
      {"apksigner", "verify", "--verbose", "--print-certs", "--min-sdk-version", "24", apk_});
  EXPECT_EQ(verdict.status, 0) << verdict.output << verdict.errors;
  EXPECT_NE(verdict.output.find("Verified using v2 scheme (APK Signature Scheme v2): true"),
            std::string::npos)
      << verdict.output;
  EXPECT_NE(verdict.output.find("Signer #1 public key SHA-256 digest: " +
                                Hex(DigestOf(Digest::kSha256, PublicKeyInfo("rsa-2048-other")))),
            std::string::npos)
      << verdict.output;
}

TEST_P(ForeignMetaInf, GetsTheVictimsPayloadAndTheVictimsKeyUnderTheAttackersName) {
  EXPECT_EQ(Simulate(apk_).timeline, AllSignedAndRegistered(apk_, "rsa-2048", "com.evil.reader"));
}

INSTANTIATE_TEST_SUITE_P(Around, ForeignMetaInf, testing::Values("foreign", "no-dex"), NameOf);

// The counterpart: a package with the attacker's own META-INF gets nothing that belongs to the
// victim.
TEST(OwnMetaInf, GetsItsOwnPayload) {
  const std::string apk = Made("keys/rsa-2048-other");
  TempDir directory;
  const std::string signed_again = directory / "base.apk";
  std::filesystem::copy(std::filesystem::path(apk).parent_path() / "lib", directory / "lib",
                        std::filesystem::copy_options::recursive);
  WriteFile(signed_again, AddSigningBlock(ToBytes(ContentOf(apk)), "rsa-2048-other"));
  EXPECT_EQ(Simulate(signed_again).timeline,
            AllSignedAndRegistered(signed_again, "rsa-2048-other", "com.example.vault"));
}

// ---- The tool compares only the local names of attributes.

// The tool reads the package's name from the attribute "x:package". The installer reads the name
// from the attribute "package". The Android manifest only declares the permission (<permission>).
// The tool registers the key although no <uses-permission> requests the permission.
TEST(AttributeInAnotherNamespace, NamesAnotherPackageThanTheInstallerReads) {
  const std::string apk = Made("attribute");
  const ProcessResult installer = RunProcess({"aapt", "dump", "permissions", apk});
  EXPECT_EQ(installer.output,
            "package: com.evil.reader\npermission: com.qix.android.SECURE_STORAGE\n");
  const std::string timeline = Simulate(apk).timeline;
  EXPECT_NE(timeline.find(Register(3, apk, "com.victim.bank", ModulusOf("rsa-2048-other"))),
            std::string::npos)
      << timeline;
}

}  // namespace
