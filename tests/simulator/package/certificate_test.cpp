#include "simulator/package/certificate.h"

#include <gtest/gtest.h>

#include <algorithm>

#include "support/certificate.h"
#include "support/files.h"
#include "support/process.h"

using namespace simulator;

namespace {

std::string_view View(const Bytes& bytes) {
  return {reinterpret_cast<const char*>(bytes.data()), bytes.size()};
}

// The output of the shell command, without line feeds at its end. In the command, $0 is a file with
// the certificate.
std::string Told(const Bytes& certificate, const std::string& command) {
  const DiskFile file(certificate);
  const ProcessResult run = RunProcess({"bash", "-o", "pipefail", "-c", command, file.path()});
  EXPECT_EQ(run.status, 0) << run.errors;
  std::string text = run.output;
  while (!text.empty() && text.back() == '\n') text.pop_back();
  return text;
}

Certificate Of(const std::string& key) {
  Certificate certificate;
  certificate.key = key;
  return certificate;
}

}  // namespace

// The expected digests are those that openssl and coreutils print.
TEST(CertificateFacts, MatchOpensslForAnRsaKey) {
  const Bytes der = Of("rsa-2048").Build();
  const auto facts = ParseCertificate(View(der));
  ASSERT_TRUE(facts.has_value());
  EXPECT_EQ(facts->sha256, Told(der, "sha256sum <\"$0\" | cut -d' ' -f1"));
  EXPECT_EQ(facts->sha1, Told(der, "sha1sum <\"$0\" | cut -d' ' -f1"));
  EXPECT_EQ(facts->key.algorithm, "RSA");
  EXPECT_EQ(facts->key.bits, 2048);
  EXPECT_EQ(facts->key.sha256,
            Told(der,
                 "openssl x509 -inform DER -in \"$0\" -noout -pubkey | openssl pkey -pubin "
                 "-outform DER | sha256sum | cut -d' ' -f1"));
  EXPECT_EQ(facts->key.modulus_sha256,
            Told(der,
                 "openssl x509 -inform DER -in \"$0\" -noout -modulus | sed s/.*=// | "
                 "basenc --base16 -d | sha256sum | cut -d' ' -f1"));
  EXPECT_TRUE(facts->has_known_digest);
  EXPECT_EQ(facts->signature_algorithm, "SHA256withRSA");
  EXPECT_EQ(facts->subject, "CN=Test");
  EXPECT_EQ(facts->issuer, "CN=Test");
  EXPECT_TRUE(facts->is_self_issued);
}

// The last second of the validity can be before 1970 or after 2049 (RFC 5280 §4.1.2.5). The
// expected values are those of openssl and date.
TEST(CertificateFacts, LastSecondMayBeBefore1970OrAfter2049) {
  const auto last = [](uint8_t tag, const std::string& end) {
    Certificate certificate = Of("rsa-2048");
    certificate.validity =
        der::Sequence({der::Element(der::kUtcTime, "500102030405Z"), der::Element(tag, end)});
    const Bytes made = certificate.Build();
    const auto facts = ParseCertificate(View(made));
    if (!facts) return std::string("none");  // newer versions of libcrypto do not parse "no time"
    const std::string told = facts->not_after ? std::to_string(*facts->not_after) : "none";
    const std::string command =
        "date +%s -d \"$(openssl x509 -inform DER -in \"$0\" -noout -enddate | sed s/.*=//)\"";
    if (facts->not_after) {
      EXPECT_EQ(told, Told(made, command)) << end;
    }
    return told;
  };
  constexpr uint8_t kGeneralizedTime = 0x18;
  EXPECT_EQ(last(der::kUtcTime, "700101000001Z"), "1");
  EXPECT_EQ(last(der::kUtcTime, "490102030405Z"), "2493169445");
  EXPECT_EQ(last(der::kUtcTime, "690101000000Z").substr(0, 1), "-");
  EXPECT_EQ(last(kGeneralizedTime, "99991231235959Z"), "253402300799");
  EXPECT_EQ(last(der::kUtcTime, "no time"), "none");
}

TEST(CertificateFacts, EcKeyHasBitsButNoModulus) {
  const Bytes der = Of("ec-p256").Build();
  const auto facts = ParseCertificate(View(der));
  ASSERT_TRUE(facts.has_value());
  EXPECT_EQ(facts->key.algorithm, "EC");
  EXPECT_EQ(facts->key.bits, 256);
  EXPECT_EQ(facts->key.modulus_sha256, "");
}

TEST(CertificateFacts, IssuedCertificateNamesItsIssuer) {
  Certificate certificate = Of("rsa-2048");
  certificate.issuer = Name({{"2.5.4.3", "Authority"}});
  certificate.digest = Digest::kSha1;
  const Bytes der = certificate.Build();
  const auto facts = ParseCertificate(View(der));
  ASSERT_TRUE(facts.has_value());
  EXPECT_EQ(facts->issuer, "CN=Authority");
  EXPECT_FALSE(facts->is_self_issued);
  EXPECT_EQ(facts->signature_algorithm, "SHA1withRSA");
}

TEST(CertificateFacts, KeyThatCannotBeParsedHasOnlyItsAlgorithm) {
  Certificate certificate = Of("rsa-2048");
  certificate.public_key_info = PublicKeyInfoAround(ToBytes("no key"));
  const Bytes der = certificate.Build();
  const auto facts = ParseCertificate(View(der));
  ASSERT_TRUE(facts.has_value());
  EXPECT_EQ(facts->key.algorithm, "RSA");
  EXPECT_EQ(facts->key.bits, 0);
  EXPECT_EQ(facts->key.modulus_sha256, "");
}

TEST(CertificateFacts, CutCertificateHasNoFacts) {
  const Bytes der = Of("rsa-2048").Build();
  for (size_t size = 0; size < der.size(); size += 7) {
    EXPECT_EQ(ParseCertificate(View(Bytes(der.begin(), der.begin() + static_cast<int>(size)))),
              std::nullopt)
        << size;
  }
}

// A certificate has two AlgorithmIdentifiers for its signature. ParseCertificate reads the one
// outside the signed part.
TEST(CertificateFacts, AlgorithmOutsideTheSignedPartCounts) {
  Certificate certificate = Of("rsa-2048");
  certificate.tbs_algorithm = AlgorithmIdentifier(RsaSignatureOid(Digest::kSha1));
  certificate.signature_algorithm = AlgorithmIdentifier("1.2.840.113549.1.1.12");
  const auto facts = ParseCertificate(View(certificate.Build()));
  ASSERT_TRUE(facts.has_value());
  EXPECT_EQ(facts->signature_algorithm, "SHA384withRSA");
  EXPECT_FALSE(facts->has_known_digest);
}

TEST(CertificateFacts, AlgorithmsHaveTheNamesThatKeytoolUses) {
  const auto name = [](const std::string& oid) {
    Certificate certificate = Of("rsa-2048");
    certificate.signature_algorithm = AlgorithmIdentifier(oid);
    const auto facts = ParseCertificate(View(certificate.Build()));
    return facts->signature_algorithm + (facts->has_known_digest ? " is known" : "");
  };
  EXPECT_EQ(name("1.2.840.113549.1.1.4"), "MD5withRSA is known");
  EXPECT_EQ(name("1.2.840.113549.1.1.5"), "SHA1withRSA is known");
  EXPECT_EQ(name("1.2.840.113549.1.1.13"), "SHA512withRSA");
  EXPECT_EQ(name("1.2.840.10045.4.3.2"), "SHA256withECDSA");
  EXPECT_EQ(name("2.16.840.1.101.3.4.3.2"), "SHA256withDSA");
  EXPECT_EQ(name("1.2.840.113549.1.1.10"), "RSASSA-PSS");
  EXPECT_EQ(name("1.2.3.4"), "1.2.3.4");
}

TEST(CertificateFacts, HaveTheTwoIdentifiersThatSignersUse) {
  Certificate certificate = Of("rsa-2048");
  certificate.issuer = Name({{"2.5.4.3", "Authority"}});
  auto facts = ParseCertificate(View(certificate.Build()));
  const Bytes id = Concat({certificate.issuer, certificate.serial});
  EXPECT_EQ(facts->issuer_and_serial, std::string(id.begin(), id.end()));
  EXPECT_EQ(facts->key_id, "");
  certificate.extensions = {Extension("2.5.29.14", der::OctetString(ToBytes("key id")))};
  EXPECT_EQ(ParseCertificate(View(certificate.Build()))->key_id, "key id");
}

TEST(CertificateFacts, AttributeThatIsNoTextIsShownAsDigits) {
  Certificate certificate = Of("rsa-2048");
  certificate.subject =
      der::Sequence({der::Set({der::Sequence({der::Oid("2.5.4.3"), der::BitString({0xab})})})});
  EXPECT_EQ(ParseCertificate(View(certificate.Build()))->subject, "CN=#030200AB");
}

TEST(CertificateFacts, NamesAreCutAfter256Attributes) {
  std::vector<std::pair<std::string, std::string>> attributes(300, {"2.5.4.3", "x"});
  Certificate certificate = Of("rsa-2048");
  certificate.subject = Name(attributes);
  const std::string subject = ParseCertificate(View(certificate.Build()))->subject;
  EXPECT_EQ(std::count(subject.begin(), subject.end(), '='), 256);
}

TEST(CertificateFacts, BytesAfterTheCertificateAreIgnored) {
  Bytes der = Of("rsa-2048").Build();
  const std::string digest = ParseCertificate(View(der))->sha256;
  der.push_back(0);
  EXPECT_EQ(ParseCertificate(View(der))->sha256, digest);
}

// ParseCertificate must write each name as keytool does. A class of the JDK writes the name that
// keytool prints after "Owner".
TEST(CertificateName, IsWhatTheJdkWrites) {
  const std::vector<Bytes> names = {
      Name({{"2.5.4.6", "AB"},
            {"2.5.4.8", "A State"},
            {"2.5.4.7", "Town"},
            {"2.5.4.10", "Example, Inc."},
            {"2.5.4.11", "A + B = \"C\" <D>; #\\"},
            {"2.5.4.3", " spaces  inside "},
            {"1.2.840.113549.1.9.1", "a@example.com"},
            {"0.9.2342.19200300.100.1.25", "example"},
            {"0.9.2342.19200300.100.1.1", "user"},
            {"2.5.4.5", "42"},
            {"2.5.4.4", "Sur"},
            {"2.5.4.42", "Given"},
            {"2.5.4.12", "Title"},
            {"2.5.4.9", "Street"},
            {"1.2.3.4", "own"}}),
      Name({{"2.5.4.3", "Gr\u00fc\u00dfe \u4e2d"}}),
      Name({{"2.5.4.3", "a\"b, c"}, {"2.5.4.10", ""}}),
      der::Sequence({der::Set({der::Sequence({der::Oid("2.5.4.3"), der::Element(0x0c, "one")}),
                               der::Sequence({der::Oid("2.5.4.10"), der::Element(0x0c, "two")})})}),
      der::Sequence({der::Set(
          {der::Sequence({der::Oid("2.5.4.3"), der::Element(0x1e, FromHex("004100e94e2d"))})})}),
      der::Sequence(
          {der::Set({der::Sequence({der::Oid("2.5.4.3"), der::Element(0x14, "caf\xe9")})})}),
  };
  const TempDir directory;
  std::string command =
      "cd \"$0\"; for i in *; do LC_ALL=C.UTF-8 keytool -J-Dfile.encoding=UTF-8 "
      "-J-Dstdout.encoding=UTF-8 -printcert -file $i | sed -n 's/^Owner: //p'; "
      "done";
  std::string found;
  for (size_t i = 0; i < names.size(); ++i) {
    Certificate certificate;
    certificate.subject = names[i];
    directory.Write(std::to_string(i), certificate.Build());
    const auto facts = ParseCertificate(View(certificate.Build()));
    ASSERT_TRUE(facts.has_value()) << i;
    found += facts->subject + "\n";
  }
  EXPECT_EQ(found, RunProcess({"bash", "-c", command, directory.path()}).output);
}
