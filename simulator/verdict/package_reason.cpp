#include "simulator/verdict/package_reason.h"

#include <algorithm>
#include <cerrno>

#include "simulator/verdict/wording.h"

namespace simulator {

namespace {

using Lines = std::vector<std::string>;

constexpr char kNoMemory[] = "11";  // 17 in hexadecimal

std::optional<std::string> Find(const Lines& lines, const std::string& before);
Reason WhyDexRefused(const Lines& errors);
Reason WhyNotOpened(const PackageFacts& facts, const std::string& error);
Reason WhyNoBlock(const std::string& name, const JarSignatureFacts& jar);
Reason WhyNoKey(const std::string& code, const JarSignatureFacts& jar);
Reason WhyCertificateRefused(const std::string& code, const JarSignatureFacts& jar);
Reason WhySignatureRefused(const Lines& errors, const std::string& code,
                           const JarSignatureFacts& jar);
Reason WhyManifestRefused(const Lines& errors, const JarSignatureFacts& jar);
Reason WhySilentlyRefused(const PackageFacts& facts);
Reason OfOtherKey(const JarSignatureFacts& jar);
bool IsKnownDigest(const std::string& algorithm);
std::string FirstSignatureFile(const JarSignatureFacts& jar);

}  // namespace

// In the order in which the tool checks.
Reason WhyRefused(const RunRecord& run, const PackageFacts& facts) {
  const Lines& errors = run.opening_errors;
  const JarSignatureFacts& jar = facts.jar;
  if (run.is_dex_refused) return WhyDexRefused(run.dex_errors);
  if (const auto error = Find(errors, "OpenArchiveFd(")) return WhyNotOpened(facts, *error);
  if (const auto name = Find(errors, "Can't extract RSA certificate: ")) {
    return WhyNoBlock(*name, jar);
  }
  if (Find(errors, "Unknown certificate type")) return OfOtherKey(jar);
  if (const auto code = Find(errors, "RSA could not set key: ")) return WhyNoKey(*code, jar);
  if (const auto code = Find(errors, "RSA could not verify certificate: ")) {
    return WhyCertificateRefused(*code, jar);
  }
  if (const auto code = Find(errors, "RSA could not verify data: ")) {
    return WhySignatureRefused(errors, *code, jar);
  }
  if (Find(errors, "Can't validate manifest")) return WhyManifestRefused(errors, jar);
  if (Find(errors, "Can't load manifest: ")) return {&cause::kManifestMalformed, ""};
  if (Find(errors, "Can't process Android Manifest")) return {&cause::kAndroidManifestText, ""};
  if (Find(errors, "Parse manifest: ")) {
    return {&cause::kSignatureFileMalformed, FirstSignatureFile(jar)};
  }
  if (!errors.empty()) return {&cause::kToolError, errors[0]};
  return WhySilentlyRefused(facts);
}

Reason WhyNotLookedAt(const PackageFacts& facts, bool has_standard_input) {
  switch (facts.error) {
    case 0:
      break;
    case ENOENT:
      return {&cause::kFileMissing, ""};
    case EACCES:
    case EPERM:
      return {&cause::kFileNoPermission, ""};
    default:
      return {&cause::kFileNotOpened, DescribeErrno(facts.error)};
  }
  if (!has_standard_input) return {&cause::kStandardInputClosed, ""};
  if (facts.is_read_only) return {&cause::kReadOnlyFileSystem, ""};
  return {};
}

// The exponent's first four bytes, whatever is missing being zero, are taken for a number with the
// lowest byte first.
bool IsForgeable(const PublicKey& key) {
  if (key.algorithm != "RSA" || key.exponent.empty()) return false;
  const std::string read = (key.exponent + std::string(4, '\0')).substr(0, 4);
  return read == std::string("\1\0\0\0", 4) || read == "\xff\xff\xff\xff";
}

std::string ExponentText(const PublicKey& key) {
  constexpr size_t kMost = 16;
  if (key.exponent == "\1") return "1";
  const bool is_long = key.exponent.size() > kMost;
  return "0x" + HexText(key.exponent.substr(0, kMost)) + (is_long ? "..." : "") +
         ", which is read as 1";
}

namespace {

// The rest of the first line that begins so.
std::optional<std::string> Find(const Lines& lines, const std::string& before) {
  for (const std::string& line : lines) {
    if (auto rest = Between(line, before, "")) return rest;
  }
  return {};
}

Reason WhyDexRefused(const Lines& errors) {
  if (Find(errors, "Can't find file in ")) return {&cause::kDexNotListed, ""};
  if (Find(errors, "verifyData: ")) return {&cause::kDexDigest, ""};
  return {&cause::kDexChanged, ""};
}

Reason WhyNotOpened(const PackageFacts& facts, const std::string& error) {
  switch (facts.kind) {
    case FileKind::kFolder:
      return {&cause::kFolder, ""};
    case FileKind::kSpecial:
      return {&cause::kSpecialFile, ""};
    case FileKind::kEmpty:
      return {&cause::kEmptyFile, ""};
    case FileKind::kText:
      return {&cause::kTextFile, ""};
    case FileKind::kCutArchive:
      return {&cause::kCutArchive, ""};
    case FileKind::kNoArchive:
      return {&cause::kNoArchive, ""};
    case FileKind::kArchive:
    case FileKind::kUnreadable:
      break;
  }
  const bool is_without_entries = error.find("returned: -6:") != std::string::npos;
  return {is_without_entries ? &cause::kEmptyArchive : &cause::kDamagedArchive, ""};
}

Reason WhyNoBlock(const std::string& name, const JarSignatureFacts& jar) {
  const auto ends_with = [&jar](const std::string& end) {
    return jar.block_name.size() >= end.size() &&
           jar.block_name.compare(jar.block_name.size() - end.size(), end.size(), end) == 0;
  };
  if (ends_with(".EC")) return {&cause::kEcKey, ""};
  if (ends_with(".DSA")) return OfOtherKey(jar);
  const bool is_there = jar.block_name == name;
  return {is_there ? &cause::kSignatureBlockUnreadable : &cause::kSignatureBlockMissing, name};
}

// A block of a key that is not RSA's, or one that does not parse.
Reason OfOtherKey(const JarSignatureFacts& jar) {
  if (jar.certificate && jar.certificate->key.algorithm == "EC") return {&cause::kEcKey, ""};
  if (jar.certificate && jar.certificate->key.algorithm == "DSA") return {&cause::kDsaKey, ""};
  return {&cause::kSignatureBlockMalformed, jar.block_name};
}

Reason WhyNoKey(const std::string& code, const JarSignatureFacts& jar) {
  if (code == "9") return {&cause::kNoMemory, ""};
  if (jar.certificate && IsForgeable(jar.certificate->key)) {
    return {&cause::kExponentRefused, ExponentText(jar.certificate->key)};
  }
  return {&cause::kSignatureBlockMalformed, jar.block_name};
}

Reason WhyCertificateRefused(const std::string& code, const JarSignatureFacts& jar) {
  constexpr int kLeastBits = 128;
  constexpr int kMostBits = 4096;
  if (code == kNoMemory) return {&cause::kNoMemory, ""};
  if (!jar.certificate) return {&cause::kSignatureBlockMalformed, jar.block_name};
  const CertificateFacts& certificate = *jar.certificate;
  const int bits = certificate.key.bits;
  if (bits > kMostBits) return {&cause::kKeyTooLarge, std::to_string(bits)};
  if (bits < kLeastBits) return {&cause::kKeyTooSmall, std::to_string(bits)};
  if (!certificate.is_self_issued) return {&cause::kCertificateIssued, certificate.issuer};
  if (!IsKnownDigest(certificate.signature_algorithm)) {
    return {&cause::kCertificateDigest, certificate.signature_algorithm};
  }
  return {&cause::kCertificateChanged, ""};
}

Reason WhySignatureRefused(const Lines& errors, const std::string& code,
                           const JarSignatureFacts& jar) {
  if (code == kNoMemory) return {&cause::kNoMemory, ""};
  if (jar.has_signed_attributes) return {&cause::kSignedAttributes, ""};
  const bool is_pss = jar.signature_algorithm == "RSASSA-PSS";
  if (is_pss || (jar.block_is_whole && !IsKnownDigest(jar.digest))) {
    return {&cause::kSignatureDigest, is_pss ? jar.signature_algorithm : jar.digest};
  }
  const bool is_of_other_data = std::any_of(errors.begin(), errors.end(), [](const auto& line) {
    return line.find("hash does not match") != std::string::npos ||
           line == "SHA hash check unsuccessfull";
  });
  if (is_of_other_data) return {&cause::kSignatureFileChanged, FirstSignatureFile(jar)};
  return {&cause::kSignatureWrong, jar.block_name};
}

Reason WhyManifestRefused(const Lines& errors, const JarSignatureFacts& jar) {
  const bool has_none = Find(errors, "verifyData: ").has_value() || !jar.has_manifest_digest;
  return {has_none ? &cause::kManifestDigest : &cause::kManifestChanged, ""};
}

// What is missing or cannot be extracted, the tool does not mention.
Reason WhySilentlyRefused(const PackageFacts& facts) {
  const JarSignatureFacts& jar = facts.jar;
  if (facts.archive_result != 0) return {&cause::kDamagedArchive, ""};
  if (!jar.has_manifest) {
    if (facts.newer.empty()) return {&cause::kUnsigned, ""};
    return {&cause::kNewerSchemeOnly, Joined(NewerSchemes(facts))};
  }
  if (!jar.can_read_manifest) return {&cause::kManifestUnreadable, ""};
  if (jar.signature_files.empty()) return {&cause::kSignatureFileMissing, ""};
  return {&cause::kSignatureFileUnreadable, FirstSignatureFile(jar)};
}

// MD5, SHA-1 or SHA-256, by themselves or with RSA.
bool IsKnownDigest(const std::string& algorithm) {
  constexpr const char* kKnown[] = {"MD5",        "SHA-1",       "SHA-256",
                                    "MD5withRSA", "SHA1withRSA", "SHA256withRSA"};
  return std::any_of(std::begin(kKnown), std::end(kKnown),
                     [&algorithm](const char* known) { return algorithm == known; });
}

std::string FirstSignatureFile(const JarSignatureFacts& jar) {
  return jar.signature_files.empty() ? "META-INF/*.SF" : jar.signature_files[0];
}

}  // namespace

}  // namespace simulator
