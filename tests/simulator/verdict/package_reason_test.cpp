#include "simulator/verdict/parts.h"

#include <gtest/gtest.h>

#include "simulator/phone/probe_run.h"

using namespace simulator;

namespace {

// The record of a run with these errors. Each error gets a line end, unless the tool logs this
// error without a line end.
RunRecord After(const Lines& errors) {
  RunRecord run;
  for (const std::string& error : errors) {
    const LogLine whole = ReadLogLine(error);
    const bool is_known = whole.meaning != LogMeaning::kUnknown;
    run.opening_errors.push_back(is_known ? whole : ReadLogLine(error + "\n"));
  }
  return run;
}

std::string Code(const Reason& reason) {
  return reason.detail.empty() ? reason.cause->code
                               : std::string(reason.cause->code) + " " + reason.detail;
}

std::string Why(const Lines& errors, const PackageFacts& facts) {
  return Code(WhyRefused(After(errors), facts));
}

// A package with a signature that can be read.
PackageFacts Signed() {
  PackageFacts facts;
  facts.kind = FileKind::kArchive;
  facts.archive_result = 0;
  facts.jar.manifest = Archive::ReadResult::kRead;
  facts.jar.has_manifest_digest = facts.jar.has_block = true;
  facts.jar.signature_files = {"META-INF/CERT.SF"};
  facts.jar.block_name = "META-INF/CERT.RSA";
  facts.jar.block.is_whole = facts.jar.block.has_known_digest = true;
  facts.jar.block.digest = "SHA256";
  facts.jar.certificate.emplace();
  facts.jar.certificate->is_self_issued = true;
  facts.jar.certificate->signature_algorithm = "SHA256withRSA";
  facts.jar.certificate->has_known_digest = true;
  facts.jar.certificate->key.algorithm = "RSA";
  facts.jar.certificate->key.bits = 2048;
  facts.jar.key = ToolKey{"", 256, 2048, 65537, false};
  return facts;
}

}  // namespace

TEST(WhyRefused, ExplainsARefusedDexFileByTheLineBeforeIt) {
  RunRecord run;
  run.is_dex_refused = true;
  EXPECT_EQ(Code(WhyRefused(run, Signed())), "dex-changed");
  run.dex_why = LogMeaning::kNotListed;
  EXPECT_EQ(Code(WhyRefused(run, Signed())), "dex-not-listed");
  run.dex_why = LogMeaning::kDigestUnknown;
  EXPECT_EQ(Code(WhyRefused(run, Signed())), "dex-digest");
}

TEST(WhyRefused, ExplainsAnUnopenedArchiveByTheKindOfFile) {
  const auto why = [](FileKind kind) {
    PackageFacts facts;
    facts.kind = kind;
    return Why({"OpenArchiveFd(3) [file: a] returned: -3: Invalid file"}, facts);
  };
  EXPECT_EQ(why(FileKind::kDirectory), "folder");
  EXPECT_EQ(why(FileKind::kSpecial), "special-file");
  EXPECT_EQ(why(FileKind::kEmpty), "empty-file");
  EXPECT_EQ(why(FileKind::kText), "text-file");
  EXPECT_EQ(why(FileKind::kCutArchive), "cut-archive");
  EXPECT_EQ(why(FileKind::kNoArchive), "no-archive");
  EXPECT_EQ(why(FileKind::kArchive), "damaged-archive");
  EXPECT_EQ(Why({"OpenArchiveFd(3) [file: a] returned: -6: Empty archive"}, Signed()),
            "empty-archive");
}

TEST(WhyRefused, ExplainsAMissingRsaBlockByTheBlockFound) {
  const Lines errors = {"Can't extract RSA certificate: META-INF/CERT.RSA"};
  PackageFacts facts = Signed();
  EXPECT_EQ(Why(errors, facts), "signature-block-unreadable META-INF/CERT.RSA");
  facts.jar.has_block = false;
  EXPECT_EQ(Why(errors, facts), "signature-block-missing META-INF/CERT.RSA");
  facts.jar.has_block = true;
  facts.jar.block_name = "META-INF/CERT.EC";
  EXPECT_EQ(Why(errors, facts), "ec-key");
  facts.jar.block_name = "META-INF/CERT.DSA";
  facts.jar.certificate->key.algorithm = "DSA";
  EXPECT_EQ(Why(errors, facts), "dsa-key");
}

TEST(WhyRefused, BlockThatCannotBeParsedMayHaveAnotherKey) {
  const Lines errors = {"Unknown certificate type", "file not verified: META-INF/CERT.SF"};
  PackageFacts facts = Signed();
  EXPECT_EQ(Why(errors, facts), "signature-block-malformed META-INF/CERT.RSA");
  facts.jar.certificate->key.algorithm = "EC";
  EXPECT_EQ(Why(errors, facts), "ec-key");
}

TEST(WhyRefused, ExplainsAKeyThatCannotBeSet) {
  const Lines errors = {"RSA could not set key: 5", "file not verified: META-INF/CERT.SF"};
  const auto why = [&errors](int32_t exponent) {
    PackageFacts facts = Signed();
    facts.jar.key->exponent = exponent;
    facts.jar.key->is_forgeable = true;
    return Why(errors, facts);
  };
  EXPECT_EQ(why(1), "exponent-refused 1");
  EXPECT_EQ(why(-1), "exponent-refused -1");
  EXPECT_EQ(Why(errors, Signed()), "signature-block-malformed META-INF/CERT.RSA");
  EXPECT_EQ(Why({"RSA could not set key: 9"}, Signed()), "no-memory");
}

TEST(WhyRefused, ExplainsARefusedCertificate) {
  const Lines errors = {"RSA could not verify certificate: 7"};
  PackageFacts facts = Signed();
  EXPECT_EQ(Why(errors, facts), "certificate-changed");
  facts.jar.certificate->signature_algorithm = "SHA384withRSA";
  facts.jar.certificate->has_known_digest = false;
  EXPECT_EQ(Why(errors, facts), "certificate-digest SHA384withRSA");
  facts.jar.certificate->is_self_issued = false;
  facts.jar.certificate->issuer = "CN=Authority";
  EXPECT_EQ(Why(errors, facts), "certificate-issued CN=Authority");
  // A modulus of 16 to 512 bytes is not refused for its size.
  const auto of_size = [&](uint32_t size) {
    facts.jar.key->size = size;
    facts.jar.key->bits = static_cast<int>(size) * 8 - 1;
    return Why(errors, facts);
  };
  EXPECT_EQ(of_size(512), "certificate-issued CN=Authority");
  EXPECT_EQ(of_size(513), "key-too-large 4103");
  EXPECT_EQ(of_size(16), "certificate-issued CN=Authority");
  EXPECT_EQ(of_size(15), "key-too-small 119");
  EXPECT_EQ(Why({"RSA could not verify certificate: 11"}, facts), "no-memory");
}

TEST(WhyRefused, ExplainsARefusedSignature) {
  const Lines errors = {"RSA could not verify data: 7"};
  PackageFacts facts = Signed();
  EXPECT_EQ(Why(errors, facts), "signature-wrong META-INF/CERT.RSA");
  EXPECT_EQ(Why({"SHA256 hash does not match", "RSA could not verify data: 12"}, facts),
            "signature-file-changed META-INF/CERT.SF");
  EXPECT_EQ(Why({"SHA hash check unsuccessfull", "RSA could not verify data: 12"}, facts),
            "signature-file-changed META-INF/CERT.SF");
  facts.jar.block.digest = "SHA512";
  facts.jar.block.has_known_digest = false;
  EXPECT_EQ(Why(errors, facts), "signature-digest SHA512");
  // If the block cannot be read to its last signer, `has_known_digest` is ignored. `has_pss` and
  // `has_signed_attributes` still decide.
  facts.jar.block.is_whole = false;
  EXPECT_EQ(Why(errors, facts), "signature-wrong META-INF/CERT.RSA");
  facts.jar.block.has_pss = true;
  EXPECT_EQ(Why(errors, facts), "signature-digest RSASSA-PSS");
  facts.jar.block.has_signed_attributes = true;
  EXPECT_EQ(Why(errors, facts), "signed-attributes");
  EXPECT_EQ(Why({"RSA could not verify data: 11"}, facts), "no-memory");
}

TEST(WhyRefused, ExplainsARefusedManifest) {
  PackageFacts facts = Signed();
  EXPECT_EQ(Why({"Can't validate manifest.", "Can't validate manifest."}, facts),
            "manifest-changed");
  EXPECT_EQ(
      Why({"verifyData: Unsupported digest type: MD5-Digest", "Can't validate manifest."}, facts),
      "manifest-digest");
  facts.jar.has_manifest_digest = false;
  EXPECT_EQ(Why({"Can't validate manifest."}, facts), "manifest-digest");
  const std::string parse = "Parse manifest: Error: P_KEY: unexpected end of file after key 'x'";
  EXPECT_EQ(Why({parse, "Can't load manifest: size=3"}, facts), "manifest-malformed");
  EXPECT_EQ(Why({parse}, facts), "signature-file-malformed META-INF/CERT.SF");
  EXPECT_EQ(Why({"ParseAndroidManifest failed to init xml parser, error=0x80000000",
                 "Can't process Android Manifest."},
                facts),
            "android-manifest-text");
}

TEST(WhyRefused, ExplainsARefusalWithoutErrorsByThePackage) {
  PackageFacts facts = Signed();
  EXPECT_EQ(Why({}, facts), "signature-file-unreadable META-INF/CERT.SF");
  facts.jar.signature_files.clear();
  EXPECT_EQ(Why({}, facts), "signature-file-missing");
  facts.entries = {{{"META-INF/A.SF", 1, false}, false, true},
                   {{"a", 1, true}, false, false},
                   {{"META-INF/B.SF", 1, true}, false, true}};
  EXPECT_EQ(Why({}, facts), "signature-file-unreadable META-INF/B.SF");
  facts.jar.manifest = Archive::ReadResult::kDamaged;
  EXPECT_EQ(Why({}, facts), "manifest-unreadable");
  facts.jar.manifest = Archive::ReadResult::kMissing;
  EXPECT_EQ(Why({}, facts), "unsigned");
  facts.newer = {{"v2", {}}, {"v3", {}}};
  EXPECT_EQ(Why({}, facts), "newer-scheme-only v2, v3");
  EXPECT_EQ(Why({}, PackageFacts()), "damaged-archive");
}

TEST(WhyRefused, ErrorThatIsNotKnownIsQuoted) {
  EXPECT_EQ(Why({"something new"}, Signed()), "tool-error something new");
}

TEST(WhyRefused, CertificateThatCannotBeReadIsReportedAsChanged) {
  PackageFacts facts = Signed();
  facts.jar.certificate.reset();
  EXPECT_EQ(Why({"RSA could not verify certificate: 7"}, facts), "certificate-changed");
  facts.jar.key.reset();
  EXPECT_EQ(Why({"RSA could not verify certificate: 7"}, facts),
            "signature-block-malformed META-INF/CERT.RSA");
}
