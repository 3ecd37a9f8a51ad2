// The warnings: facts that the user should look at.
#include <algorithm>
#include <ctime>

#include "simulator/verdict/parts.h"
#include "simulator/verdict/wording.h"

namespace simulator {

namespace {

using Reasons = std::vector<Reason>;

void WarnOfTwoFaces(const PackageFacts& facts, const Report& report, Reasons* warnings);
void WarnOfSigners(const PackageFacts& facts, const Report& report, Reasons* warnings);
void WarnOfWeakDigests(const PackageFacts& facts, Reasons* warnings);
void WarnOfExpiry(const PackageFacts& facts, int64_t now, Reasons* warnings);
std::vector<const CertificateFacts*> Certificates(const PackageFacts& facts);
void WarnOfOtherKeys(const PackageFacts& facts, const Report& report, Reasons* warnings);
void WarnOfStrippedSchemes(const PackageFacts& facts, Reasons* warnings);
void WarnOfEntries(const PackageFacts& facts, const Report& report, Reasons* warnings);
bool IsSaid(const std::string& entry, const Report& report);

}  // namespace

std::vector<Reason> FindWarnings(const RunRecord& run, const PackageFacts& facts,
                                 const Report& report, int64_t now) {
  Reasons warnings;
  const bool is_package = report.items[0].kind == ItemKind::kPackage;
  if (is_package) {
    WarnOfTwoFaces(facts, report, &warnings);
    WarnOfSigners(facts, report, &warnings);
    WarnOfWeakDigests(facts, &warnings);
    WarnOfExpiry(facts, now, &warnings);
    WarnOfOtherKeys(facts, report, &warnings);
    WarnOfStrippedSchemes(facts, &warnings);
  }
  if (facts.has_damaged_signing_block) warnings.push_back({&cause::kSigningBlockDamaged, ""});
  for (const std::string& what : facts.too_long) {
    warnings.push_back({&cause::kNotLookedInto, what});
  }
  if (is_package) WarnOfEntries(facts, report, &warnings);
  if (!run.not_laid_out.empty()) {
    warnings.push_back({&cause::kNotLaidOut, CountedNames(run.not_laid_out)});
  }
  return warnings;
}

bool IsJarSigner(const PublicKey& key, const Report& report) {
  if (report.key && key.modulus_sha256 != report.key->sha256) return false;
  return !report.signer || key.sha256 == report.signer->key.sha256;
}

namespace {

// Warns if other programs can find another signer, or another package name, than the tool finds.
void WarnOfTwoFaces(const PackageFacts& facts, const Report& report, Reasons* warnings) {
  const JarSignatureFacts& jar = facts.jar;
  if (report.key && jar.certificate) {
    const std::string& shown = jar.certificate->key.modulus_sha256;
    const std::string detail =
        shown.empty() ? "no key" : "a modulus with the SHA-256 digest " + shown;
    if (shown != report.key->sha256) warnings->push_back({&cause::kCertificateOtherKey, detail});
  }
  if (jar.key && (!jar.certificate || !jar.block.is_whole)) {
    warnings->push_back({&cause::kBlockAmbiguous, "it is not strict DER"});
  } else if (jar.names_other_certificate) {
    warnings->push_back(
        {&cause::kBlockAmbiguous, "it names a certificate other than its first one"});
  }
  const AndroidManifest& manifest = facts.manifest;
  if (manifest.package_name && *manifest.package_name != manifest.installer_name) {
    warnings->push_back({&cause::kOtherPackageName, "\"" + manifest.installer_name + "\""});
  }
}

void WarnOfSigners(const PackageFacts& facts, const Report& report, Reasons* warnings) {
  const JarSignatureFacts& jar = facts.jar;
  const bool is_said = report.items[0].reason.cause == &cause::kExponentRefused;
  if (!is_said && jar.key && jar.key->is_forgeable) {
    warnings->push_back({&cause::kForgeableKey, std::to_string(jar.key->exponent)});
  }
  constexpr int kSafeBits = 2048;
  if (jar.key && jar.key->bits < kSafeBits) {
    warnings->push_back({&cause::kWeakKey, std::to_string(jar.key->bits)});
  }
  const std::vector<const CertificateFacts*> certificates = Certificates(facts);
  const auto is_debug = [](const CertificateFacts* certificate) {
    const std::string subject = ", " + certificate->subject + ",";
    return subject.find(", CN=Android Debug,") != std::string::npos;
  };
  if (std::any_of(certificates.begin(), certificates.end(), is_debug)) {
    warnings->push_back({&cause::kDebugKey, ""});
  }
  if (jar.signature_files.size() > 1 || jar.block.signer_count > 1) {
    warnings->push_back({&cause::kSeveralSigners, jar.signature_files[0]});
  }
}

// Gives at most one warning, which lists the uses of SHA-1 and MD5 in the JAR signature and in the
// certificates of all schemes. Collisions of these digests are known. MD5 digests in the manifest
// and in the signature file are not listed, because the tool accepts no MD5 digests there.
void WarnOfWeakDigests(const PackageFacts& facts, Reasons* warnings) {
  const auto is_weak = [](const std::string& name) {
    return name.compare(0, 4, "SHA1") == 0 || name.compare(0, 3, "MD5") == 0;
  };
  const JarSignatureFacts& jar = facts.jar;
  std::vector<std::string> uses;
  for (const CertificateFacts* const certificate : Certificates(facts)) {
    if (!is_weak(certificate->signature_algorithm)) continue;
    uses.push_back("the certificate is signed with " + certificate->signature_algorithm);
  }
  if (is_weak(jar.block.digest))
    uses.push_back("the signature block is made with " + jar.block.digest);
  if (jar.has_sha1_of_manifest)
    uses.emplace_back("the signature file has the manifest's SHA-1 digest");
  const auto count = std::count_if(facts.entries.begin(), facts.entries.end(),
                                   [](const ListedEntry& each) { return each.has_sha1; });
  if (count > 0) {
    const std::string entries = Counted(static_cast<uint64_t>(count), "entry", "entries");
    uses.push_back("the manifest has SHA-1 digests of " + entries);
  }
  if (!uses.empty()) warnings->push_back({&cause::kWeakDigest, Joined(uses)});
}

void WarnOfExpiry(const PackageFacts& facts, int64_t now, Reasons* warnings) {
  for (const CertificateFacts* const certificate : Certificates(facts)) {
    if (!certificate->not_after || *certificate->not_after >= now) continue;
    const time_t end = *certificate->not_after;
    struct tm parts = {};
    char text[80] = "";
    if (gmtime_r(&end, &parts) != nullptr) strftime(text, sizeof(text), "%F %T UTC", &parts);
    warnings->push_back({&cause::kCertificateExpired, text});
  }
}

// The signers' certificates of all schemes, each once.
std::vector<const CertificateFacts*> Certificates(const PackageFacts& facts) {
  std::vector<const CertificateFacts*> certificates;
  const auto add = [&certificates](const CertificateFacts& certificate) {
    const bool is_known = std::any_of(
        certificates.begin(), certificates.end(),
        [&certificate](const auto* known) { return known->sha256 == certificate.sha256; });
    if (!is_known) certificates.push_back(&certificate);
  };
  if (facts.jar.certificate) add(*facts.jar.certificate);
  for (const NewerSignerFacts& signer : facts.newer) add(signer.certificate);
  return certificates;
}

// One warning for each newer scheme (v2 or later) that has a signer whose key is not the JAR
// signer's key.
void WarnOfOtherKeys(const PackageFacts& facts, const Report& report, Reasons* warnings) {
  if (!report.key && !report.signer) return;
  for (const std::string& scheme : NewerSchemes(facts)) {
    const auto other =
        std::find_if(facts.newer.begin(), facts.newer.end(), [&](const NewerSignerFacts& signer) {
          return signer.scheme == scheme && !IsJarSigner(signer.certificate.key, report);
        });
    if (other == facts.newer.end()) continue;
    warnings->push_back(
        {&cause::kOtherKey, "the " + scheme + " signature (" + other->certificate.subject +
                                ", public key SHA-256 digest: " + other->certificate.key.sha256 +
                                ")"});
  }
}

// The signature file can list the numbers of the package's newer schemes: "2, 3". Warns if v2 or v3
// is in this list, but the package has no signature of that scheme.
void WarnOfStrippedSchemes(const PackageFacts& facts, Reasons* warnings) {
  const std::vector<std::string> present = NewerSchemes(facts);
  std::vector<std::string> missing;
  for (const std::string scheme : {"v2", "v3"}) {
    const bool is_claimed = facts.jar.claimed_schemes.find(scheme[1]) != std::string::npos;
    const bool is_there = std::find(present.begin(), present.end(), scheme) != present.end();
    if (is_claimed && !is_there) missing.push_back(scheme);
  }
  if (!missing.empty()) warnings->push_back({&cause::kSchemesStripped, Joined(missing)});
}

void WarnOfEntries(const PackageFacts& facts, const Report& report, Reasons* warnings) {
  const bool has_list = facts.jar.manifest == Archive::ReadResult::kRead;
  uint64_t unlisted = 0;
  uint64_t bytes = 0;
  std::vector<std::string> damaged, encrypted, changed, uncompared;
  for (const ListedEntry& each : facts.entries) {
    if (each.entry.is_encrypted) {
      encrypted.push_back(each.entry.name);
    } else if (each.entry.is_damaged) {
      damaged.push_back(each.entry.name);
    }
    const bool is_lost = each.digest == EntryDigest::kNotCompared && !each.entry.is_damaged &&
                         !each.entry.is_encrypted;
    if (is_lost) uncompared.push_back(each.entry.name);
    if (each.digest == EntryDigest::kDiffers && !IsSaid(each.entry.name, report)) {
      changed.push_back(each.entry.name);
    }
    if (!has_list || each.is_listed || each.is_signature) continue;
    ++unlisted;
    bytes += each.entry.size;
  }
  if (!encrypted.empty()) warnings->push_back({&cause::kEntriesEncrypted, CountedNames(encrypted)});
  if (!damaged.empty()) warnings->push_back({&cause::kEntriesDamaged, CountedNames(damaged)});
  if (!changed.empty()) warnings->push_back({&cause::kEntriesChanged, CountedNames(changed)});
  if (!facts.missing.empty()) {
    warnings->push_back({&cause::kEntriesMissing, CountedNames(facts.missing)});
  }
  if (!uncompared.empty()) {
    warnings->push_back({&cause::kEntriesNotCompared, CountedNames(uncompared)});
  }
  if (unlisted == 0) return;
  warnings->push_back({&cause::kUnlistedEntries, Counted(unlisted, "entry", "entries") + " (" +
                                                     Counted(bytes, "byte", "bytes") + ")"});
}

// True if an item already reports that the entry was changed after signing.
bool IsSaid(const std::string& entry, const Report& report) {
  return std::any_of(report.items.begin(), report.items.end(), [&](const Item& item) {
    const Cause* const why = item.reason.cause;
    return (why == &cause::kDexChanged && entry == "classes.dex") ||
           (why == &cause::kLibraryChangedInside && item.entry == entry);
  });
}

}  // namespace

}  // namespace simulator
