// Tests what the simulator prints about the signature: the signer in the words of apksigner, the
// schemes, the digest of the modulus, and the warnings.
#include <gtest/gtest.h>

#include <algorithm>
#include <sstream>

#include "support/process.h"
#include "support/simulation.h"

namespace {

using Lines = std::vector<std::string>;

std::string Golden(const std::string& name) { return std::string(GOLDEN_PACKAGES) + "/" + name; }

// The lines of `output` that have one of the labels, without the text before the label.
Lines Labelled(const std::string& output) {
  const Lines labels = {"certificate DN: ", "certificate SHA-256 digest: ", "key algorithm: ",
                        "key size (bits): ", "public key SHA-256 digest: "};
  Lines lines;
  std::istringstream text(output);
  for (std::string line; std::getline(text, line);) {
    for (const std::string& label : labels) {
      const size_t at = line.find(label);
      if (at != std::string::npos) lines.push_back(line.substr(at));
    }
  }
  return lines;
}

class Signer : public testing::TestWithParam<const char*> {};

TEST_P(Signer, IsPrintedAsApksignerPrintsIt) {
  const std::string apk = Golden(GetParam()) + "/base.apk";
  const ProcessResult judge =
      RunProcess({"env", "LC_ALL=C.UTF-8", "apksigner", "verify", "--print-certs", "-v", apk});
  ASSERT_EQ(judge.status, 0) << judge.errors;
  const ProcessResult told =
      RunProcess({"env", "LC_ALL=C.UTF-8", SimulatorPath(), "--installer=off", apk});

  const Lines expected = Labelled(judge.output);
  ASSERT_EQ(expected.size(), 5U) << judge.output;
  EXPECT_EQ(Labelled(told.output), expected);
}

INSTANTIATE_TEST_SUITE_P(Of, Signer,
                         testing::Values("apksigner-sha256-2048", "apksigner-sha256-4096",
                                         "apksigner-ec", "keytool-sha256"),
                         [](const auto& info) {
                           std::string name = info.param;
                           name.erase(std::remove(name.begin(), name.end(), '-'), name.end());
                           return name;
                         });

std::string Told(const std::string& name, const Lines& options = {}) {
  Lines command = {"env", "LC_ALL=C.UTF-8", SimulatorPath(), "--installer=off"};
  command.insert(command.end(), options.begin(), options.end());
  command.push_back(Golden(name) + "/base.apk");
  return RunProcess(command).output;
}

// RFC 5652 §5.3: a block names its signer by issuer and serial number, or by the subject key
// identifier of the certificate.
TEST(SignerIdentifier, MayBeTheCertificatesKeyIdentifier) {
  for (const char* name : {"openssl-cms-keyid", "openssl-cms-sha1"}) {
    const std::string text = Told(name);
    EXPECT_EQ(text.rfind("SIGNED", 0), 0U) << text;
    EXPECT_EQ(text.find("other programs may find a different signer"), std::string::npos) << text;
  }
}

// The first line that has `part`; empty if no line has it.
std::string LineWith(const std::string& text, const std::string& part) {
  std::istringstream lines(text);
  for (std::string line; std::getline(lines, line);) {
    if (line.find(part) != std::string::npos) return line;
  }
  return "";
}

TEST(Schemes, AreThoseThatTheFileCarries) {
  EXPECT_EQ(LineWith(Told("apksigner-sha256-2048"), "schemes:"), "    schemes: v1, v2, v3");
  EXPECT_EQ(LineWith(Told("jarsigner-sha256"), "schemes:"), "    schemes: v1");
}

// The kernel gets the digest of the modulus alone. apksigner prints the digest of the whole public
// key.
TEST(KernelsDigest, IsThatOfTheModulusAlone) {
  const ProcessResult modulus = RunProcess({"cat", Golden("apksigner-sha256-2048/digest")});
  EXPECT_EQ(LineWith(Told("apksigner-sha256-2048"), "modulus SHA-256") + "\n",
            "    modulus SHA-256 digest: " + modulus.output.substr(0, 64) +
                " (of the modulus alone; the kernel got this digest)\n");
  EXPECT_EQ(
      LineWith(Told("apksigner-newer-only", {"--verbose"}), "modulus SHA-256") + "\n",
      "    modulus SHA-256 digest: " + modulus.output.substr(0, 64) + " (of the modulus alone)\n");
}

TEST(SignerWarnings, GoodPackageHasNoWarning) {
  EXPECT_EQ(LineWith(Told("apksigner-sha256-2048"), "  ! "), "");
}

TEST(SignerWarnings, SeveralSignersGiveAWarning) {
  const std::string told = Told("two-signers");
  EXPECT_EQ(LineWith(told, "SIGNED").substr(0, 6), "SIGNED");
  EXPECT_EQ(LineWith(told, "  ! "),
            "  ! it has more than one signer; the kernel gets the key of META-INF/CERT.SF alone");
}

// The signer of the package "rotated-key" replaced an old key by a new key. The tool uses the old
// key, which made the JAR signature. Phones that know the package's newest scheme use the new key.
// apksigner signs with the new key in the newest scheme that apksigner knows: v3, or v3.1 from
// version 32 of apksigner on.
TEST(SignerWarnings, RotatedKeyGivesAWarning) {
  const std::string told = Told("rotated-key");
  const std::string schemes = LineWith(told, "schemes: ");
  const std::string newest = schemes.find("v3.1") != std::string::npos ? "v3.1" : "v3";
  const std::string beginning = "  ! the " + newest + " signature (CN=rsa-2048-other, O=Example, ";
  EXPECT_EQ(LineWith(told, "  ! ").substr(0, beginning.size()), beginning);
  EXPECT_NE(LineWith(told, "  ! ").find("is made with another key than the JAR signature"),
            std::string::npos);
}

TEST(SignerWarnings, EntryAddedAfterSigningGivesAWarning) {
  const std::string told = Told("added-entry", {"--verbose"});
  EXPECT_EQ(LineWith(told, "does not protect"),
            "  ! the signature does not protect 1 entry (6 bytes): no digest in the manifest");
  EXPECT_EQ(LineWith(told, "not listed: "), "      not listed: assets/note.txt");
  EXPECT_EQ(LineWith(Told("added-entry"), "not listed: "), "");
}

TEST(SignerWarnings, StrippedSchemesGiveAWarning) {
  EXPECT_EQ(LineWith(Told("added-entry"), "also signed"),
            "  ! the signature file says that the package is also signed with v2, v3, but it is "
            "not: phones do not install the package");
}

}  // namespace
