// Packages that other people's tools packed and signed (make_golden_packages).
#include <gtest/gtest.h>

#include <cctype>
#include <filesystem>
#include <fstream>

#include "support/expected_timeline.h"
#include "support/process.h"
#include "support/simulation.h"

namespace {

std::string Golden(const std::string& name) {
  return std::filesystem::canonical(GOLDEN_PACKAGES).string() + "/" + name;
}

Bytes ReadHex(const std::string& path) {
  std::ifstream file(path);
  std::string digits;
  file >> digits;
  Bytes bytes;
  for (size_t i = 0; i + 1 < digits.size(); i += 2) {
    bytes.push_back(static_cast<uint8_t>(std::stoul(digits.substr(i, 2), nullptr, 16)));
  }
  return bytes;
}

class GoldenPackage : public testing::TestWithParam<const char*> {};

std::string TestName(const testing::TestParamInfo<const char*>& package) {
  std::string name;
  bool capital = true;
  for (const char* c = package.param; *c != 0; ++c) {
    if (*c != '-') name += capital ? static_cast<char>(toupper(*c)) : *c;
    capital = *c == '-';
  }
  return name;
}

// The kernel and libzu get the values that openssl finds in the signer's certificate.
TEST_P(GoldenPackage, IsSignedWithItsLibrariesAndRegistered) {
  const std::string directory = Golden(GetParam());
  const std::string apk = directory + "/base.apk";
  const Bytes modulus = ReadHex(directory + "/modulus");
  Bytes payload = {32, 0};
  const Bytes digest = ReadHex(directory + "/digest");
  payload.insert(payload.end(), digest.begin(), digest.end());
  ASSERT_EQ(payload.size(), 34U);
  ASSERT_GE(modulus.size(), 256U);

  const Simulation run = Simulate(apk);

  std::string first = directory + "/lib/arm64/libvault.so";
  std::string second = directory + "/lib/arm/libvault.so";
  // The zip library chooses the order of the entries.
  if (run.timeline.find(second) < run.timeline.find(first)) std::swap(first, second);
  EXPECT_EQ(run.timeline,
            Timeline({LibraryStep({SignedLibrary(first, payload), SignedLibrary(second, payload)}),
                      PackageStep(apk, payload), Register(3, apk, "com.example.vault", modulus),
                      Log(4, "ZuAddCertificate: ZuNewCertificate return 0.\n"), Exit(0)}));
  EXPECT_EQ(run.status, 0);
}

INSTANTIATE_TEST_SUITE_P(By, GoldenPackage,
                         testing::Values("apksigner-sha256-2048", "apksigner-sha1-2048",
                                         "apksigner-sha256-4096", "apksigner-sha1-4096",
                                         "openssl-smime-sha256", "openssl-cms-sha1",
                                         "openssl-cms-md5", "openssl-cms-keyid"),
                         TestName);

// The output of a shell command, in which $0 is the directory of the package.
std::string Told(const std::string& name, const std::string& command) {
  const ProcessResult run = RunProcess({"sh", "-c", command, Golden(name)});
  EXPECT_EQ(run.status, 0) << run.errors;
  return run.output;
}

std::string Manifest(const std::string& name) {
  return Told(name, "unzip -p \"$0/base.apk\" META-INF/MANIFEST.MF");
}

// The structure of the signature block, as openssl prints it.
std::string BlockStructure(const std::string& name) {
  return Told(name, "unzip -p \"$0/base.apk\" META-INF/CERT.RSA | openssl asn1parse -inform DER");
}

bool Contains(const std::string& text, const std::string& part) {
  return text.find(part) != std::string::npos;
}

// Each package has the digest or the key size that its name states.
TEST(GoldenPackages, AreWhatTheirNamesSay) {
  for (const char* name : {"apksigner-sha1-2048", "apksigner-sha1-4096"}) {
    EXPECT_TRUE(Contains(Manifest(name), "\nSHA1-Digest: ")) << name;
    EXPECT_FALSE(Contains(Manifest(name), "SHA-256-Digest: ")) << name;
  }
  for (const char* name : {"apksigner-sha256-2048", "apksigner-sha256-4096"}) {
    EXPECT_TRUE(Contains(Manifest(name), "\nSHA-256-Digest: ")) << name;
    EXPECT_FALSE(Contains(Manifest(name), "SHA1-Digest: ")) << name;
  }
  EXPECT_EQ(ReadHex(Golden("apksigner-sha256-2048/modulus")).size(), 256U);
  EXPECT_EQ(ReadHex(Golden("apksigner-sha256-4096/modulus")).size(), 512U);
  EXPECT_TRUE(Contains(BlockStructure("openssl-cms-sha1"), ":sha1\n"));
  EXPECT_TRUE(Contains(BlockStructure("openssl-cms-md5"), ":md5\n"));
  EXPECT_TRUE(Contains(BlockStructure("openssl-cms-sha512"), ":sha512\n"));
}

void ExpectRefusalAfter(const std::string& name, std::initializer_list<std::string> reasons) {
  const std::string apk = Golden(name) + "/base.apk";
  const Simulation run = Simulate(apk);
  EXPECT_EQ(run.timeline, Timeline({Timeline(reasons), NothingSigned(apk), Exit(0)}));
  EXPECT_EQ(run.status, 1);
}

class BlockWithAttributes : public testing::TestWithParam<const char*> {};

// The signature blocks contain signed attributes. The tool reads the element after these, the
// signature algorithm, as the signature, and refuses its padding.
TEST_P(BlockWithAttributes, IsRefused) {
  ASSERT_TRUE(Contains(BlockStructure(GetParam()), ":messageDigest"));

  ExpectRefusalAfter(GetParam(), {Log(6, "RSA could not verify data: 7\n"),
                                  Log(6, "file not verified: META-INF/CERT.SF\n")});
}

INSTANTIATE_TEST_SUITE_P(By, BlockWithAttributes,
                         testing::Values("jarsigner-sha256", "jarsigner-sha1",
                                         "openssl-cms-attributes"),
                         TestName);

TEST(RefusedGoldenPackage, HasInvalidPaddingIfSignedOverSha512) {
  ExpectRefusalAfter("openssl-cms-sha512",
                     {Log(6, "Invalid padding in RSA"), Log(6, "RSA could not verify data: 7\n"),
                      Log(6, "file not verified: META-INF/CERT.SF\n")});
}

TEST(RefusedGoldenPackage, CertificateOfAnotherIssuerIsRefused) {
  ExpectRefusalAfter("openssl-cms-issued", {Log(6, "RSA could not verify certificate: 7\n"),
                                            Log(6, "file not verified: META-INF/CERT.SF\n")});
}

TEST(RefusedGoldenPackage, HasNoRsaBlockIfSignedWithAnEcKey) {
  ExpectRefusalAfter("apksigner-ec",
                     {Log(6, "Can't extract RSA certificate: META-INF/CERT.RSA\n")});
}

}  // namespace
