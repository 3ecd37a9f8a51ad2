// Finds the reason why a file was refused, was not looked at, or was taken for a JAR.
#include <algorithm>
#include <cerrno>

#include "crypto/rsa.h"
#include "simulator/verdict/parts.h"
#include "simulator/verdict/wording.h"
#include "util/text.h"

namespace simulator {

namespace {

using Lines = std::vector<LogLine>;

Reason WhyDexRefused(LogMeaning why);
Reason WhyNotOpened(const PackageFacts& facts, int64_t code);
Reason WhyNoBlock(const std::string& name, const JarSignatureFacts& jar);
Reason WhyNoKey(int64_t code, const JarSignatureFacts& jar);
Reason WhyCertificateRefused(int64_t code, const JarSignatureFacts& jar);
Reason WhySignatureRefused(const Lines& errors, int64_t code, const JarSignatureFacts& jar);
Reason WhyManifestRefused(const Lines& errors, const JarSignatureFacts& jar);
Reason WhySilentlyRefused(const PackageFacts& facts);
Reason OfOtherKey(const JarSignatureFacts& jar);
std::string FirstSignatureFile(const JarSignatureFacts& jar);

}  // namespace

// The first of these facts decides: an encrypted entry (WhyEncrypted), a refused classes.dex, the
// first log line that names a failed check. The log has the checks in the order in which the tool
// makes them. A log line with the meaning kTextMalformed does not name the malformed file. If no
// other line names a failed check, the malformed file is the signature file.
Reason WhyRefused(const RunRecord& run, const PackageFacts& facts) {
  const Lines& errors = run.opening_errors;
  const JarSignatureFacts& jar = facts.jar;
  Reason encrypted = WhyEncrypted(facts);
  if (encrypted.cause != nullptr) return encrypted;
  if (run.is_dex_refused) return WhyDexRefused(run.dex_why);
  for (const LogLine& line : errors) {
    const LogMeaning meaning = line.meaning;
    if (meaning == LogMeaning::kNoArchive) return WhyNotOpened(facts, line.number);
    if (meaning == LogMeaning::kNoBlock) return WhyNoBlock(line.text, jar);
    if (meaning == LogMeaning::kBlockMalformed) return OfOtherKey(jar);
    if (meaning == LogMeaning::kKeyRefused) return WhyNoKey(line.number, jar);
    if (meaning == LogMeaning::kCertificateRefused) return WhyCertificateRefused(line.number, jar);
    if (meaning == LogMeaning::kSignatureRefused) {
      return WhySignatureRefused(errors, line.number, jar);
    }
    if (meaning == LogMeaning::kManifestRefused) return WhyManifestRefused(errors, jar);
    if (meaning == LogMeaning::kManifestMalformed) return {&cause::kManifestMalformed, ""};
    if (meaning == LogMeaning::kAndroidManifestMalformed) return {&cause::kAndroidManifestText, ""};
  }
  if (FindLine(errors, LogMeaning::kTextMalformed) != nullptr) {
    return {&cause::kSignatureFileMalformed, FirstSignatureFile(jar)};
  }
  if (!errors.empty()) return {&cause::kToolError, errors[0].whole};
  return WhySilentlyRefused(facts);
}

Reason WhyNotLookedAt(const RunRecord& run, const PackageFacts& facts) {
  const int error = facts.error;
  if (run.has_no_packages) return {&cause::kNoPackages, ""};
  if (error == ENOENT) return {&cause::kFileMissing, ""};
  if (error == EACCES || error == EPERM) return {&cause::kFileNoPermission, ""};
  if (error == EWOULDBLOCK) return {&cause::kFileLeased, ""};
  if (error != 0) return {&cause::kFileNotOpened, DescribeErrno(error)};
  if (!run.has_standard_input) return {&cause::kStandardInputClosed, ""};
  if (facts.is_read_only) return {&cause::kReadOnlyFileSystem, ""};
  return {};
}

// classes.dex does not count as a part of a package, because JARs of the platform also have a
// classes.dex. These JARs have neither resources nor libraries.
Reason WhyTakenForAJar(const PackageFacts& facts) {
  std::string part;
  bool has_packages = false;
  for (const ListedEntry& each : facts.entries) {
    const std::string& name = each.entry.name;
    if (name == "BundleConfig.pb") return {&cause::kAppBundle, ""};
    has_packages = has_packages || EndsWith(name, ".apk");
    const bool is_part = name == "resources.arsc" || kLibraryNames.Has(name);
    if (is_part && part.empty()) part = name;
  }
  if (has_packages) return {&cause::kPackageSet, ""};
  if (!part.empty()) return {&cause::kPackageWithoutManifest, part};
  return {};
}

Reason WhyEncrypted(const PackageFacts& facts) {
  for (const ListedEntry& each : facts.entries) {
    const std::string& name = each.entry.name;
    const bool is_read = each.is_signature || name == kAndroidManifestName || name == "classes.dex";
    if (is_read && each.entry.is_encrypted) return {&cause::kEntryEncrypted, name};
  }
  return {};
}

namespace {

Reason WhyDexRefused(LogMeaning why) {
  if (why == LogMeaning::kNotListed) return {&cause::kDexNotListed, ""};
  if (why == LogMeaning::kDigestUnknown) return {&cause::kDexDigest, ""};
  return {&cause::kDexChanged, ""};
}

Reason WhyNotOpened(const PackageFacts& facts, int64_t code) {
  constexpr int64_t kNoEntries = -6;  // the zip library's header does not name this result
  constexpr const Cause* kCauses[] = {
      nullptr,           &cause::kFolder,     &cause::kSpecialFile, &cause::kEmptyFile,
      &cause::kTextFile, &cause::kCutArchive, &cause::kNoArchive,   nullptr};
  const Cause* const why = kCauses[static_cast<size_t>(facts.kind)];
  if (facts.packages > 0) {
    return {&cause::kPackageDirectory, Counted(facts.packages, "package", "packages")};
  }
  if (why != nullptr) return {why, ""};
  if (!facts.entry_twice.empty()) return {&cause::kEntryTwice, facts.entry_twice};
  return {code == kNoEntries ? &cause::kEmptyArchive : &cause::kDamagedArchive, ""};
}

Reason WhyNoBlock(const std::string& name, const JarSignatureFacts& jar) {
  if (!jar.has_block) return {&cause::kSignatureBlockMissing, name};
  if (EndsWith(jar.block_name, ".EC")) return {&cause::kEcKey, ""};
  if (EndsWith(jar.block_name, ".DSA")) return OfOtherKey(jar);
  return {&cause::kSignatureBlockUnreadable, name};
}

// The reason for a block with a key that is not an RSA key, or for a malformed block.
Reason OfOtherKey(const JarSignatureFacts& jar) {
  if (jar.certificate && jar.certificate->key.algorithm == "EC") return {&cause::kEcKey, ""};
  if (jar.certificate && jar.certificate->key.algorithm == "DSA") return {&cause::kDsaKey, ""};
  return {&cause::kSignatureBlockMalformed, jar.block_name};
}

Reason WhyNoKey(int64_t code, const JarSignatureFacts& jar) {
  if (code == (kRsaKeyFlag | kMpiNoMemory)) return {&cause::kNoMemory, ""};
  if (jar.key && jar.key->is_forgeable) {
    return {&cause::kExponentRefused, std::to_string(jar.key->exponent)};
  }
  return {&cause::kSignatureBlockMalformed, jar.block_name};
}

Reason WhyCertificateRefused(int64_t code, const JarSignatureFacts& jar) {
  if (code == (kRsaPublicFlag | kMpiNoMemory)) return {&cause::kNoMemory, ""};
  if (!jar.key) return {&cause::kSignatureBlockMalformed, jar.block_name};
  const std::string bits = std::to_string(jar.key->bits);
  if (jar.key->size > kRsaMaxModulusSize) return {&cause::kKeyTooLarge, bits};
  if (jar.key->size < kRsaMinModulusSize) return {&cause::kKeyTooSmall, bits};
  if (!jar.certificate) return {&cause::kCertificateChanged, ""};
  const CertificateFacts& certificate = *jar.certificate;
  if (!certificate.is_self_issued) return {&cause::kCertificateIssued, certificate.issuer};
  if (!certificate.has_known_digest) {
    return {&cause::kCertificateDigest, certificate.signature_algorithm};
  }
  return {&cause::kCertificateChanged, ""};
}

Reason WhySignatureRefused(const Lines& errors, int64_t code, const JarSignatureFacts& jar) {
  if (code == (kRsaPublicFlag | kMpiNoMemory)) return {&cause::kNoMemory, ""};
  if (jar.block.has_signed_attributes) return {&cause::kSignedAttributes, ""};
  if (jar.block.has_pss) return {&cause::kSignatureDigest, "RSASSA-PSS"};
  if (jar.block.is_whole && !jar.block.has_known_digest)
    return {&cause::kSignatureDigest, jar.block.digest};
  if (FindLine(errors, LogMeaning::kOtherDigest) != nullptr) {
    return {&cause::kSignatureFileChanged, FirstSignatureFile(jar)};
  }
  return {&cause::kSignatureWrong, jar.block_name};
}

Reason WhyManifestRefused(const Lines& errors, const JarSignatureFacts& jar) {
  const bool has_none =
      FindLine(errors, LogMeaning::kDigestUnknown) != nullptr || !jar.has_manifest_digest;
  return {has_none ? &cause::kManifestDigest : &cause::kManifestChanged, ""};
}

// The tool logs nothing if META-INF/MANIFEST.MF or the signature file is missing or cannot be
// extracted.
Reason WhySilentlyRefused(const PackageFacts& facts) {
  const JarSignatureFacts& jar = facts.jar;
  if (facts.archive_result != 0) return {&cause::kDamagedArchive, ""};
  if (jar.manifest == Archive::ReadResult::kMissing) {
    if (facts.newer.empty()) return {&cause::kUnsigned, ""};
    return {&cause::kNewerSchemeOnly, Joined(NewerSchemes(facts))};
  }
  if (jar.manifest == Archive::ReadResult::kDamaged) return {&cause::kManifestUnreadable, ""};
  for (const ListedEntry& each : facts.entries) {
    if (!each.entry.is_damaged || !kSignatureFileNames.Has(each.entry.name)) continue;
    return {&cause::kSignatureFileUnreadable, each.entry.name};
  }
  if (jar.signature_files.empty()) return {&cause::kSignatureFileMissing, ""};
  return {&cause::kSignatureFileUnreadable, FirstSignatureFile(jar)};
}

std::string FirstSignatureFile(const JarSignatureFacts& jar) {
  return jar.signature_files.empty() ? "META-INF/*.SF" : jar.signature_files[0];
}

}  // namespace

}  // namespace simulator
