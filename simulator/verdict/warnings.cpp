#include "simulator/verdict/warnings.h"

#include <algorithm>

#include "simulator/verdict/package_reason.h"
#include "simulator/verdict/wording.h"

namespace simulator {

namespace {

void WarnOfOtherKeys(const PackageFacts& facts, std::vector<Reason>* warnings);
void WarnOfStrippedSchemes(const PackageFacts& facts, std::vector<Reason>* warnings);
void WarnOfUnlistedEntries(const PackageFacts& facts, std::vector<Reason>* warnings);

}  // namespace

std::vector<Reason> FindWarnings(const PackageFacts& facts, const Item& own,
                                 const std::vector<std::string>& not_laid_out) {
  std::vector<Reason> warnings;
  const JarSignatureFacts& jar = facts.jar;
  if (own.kind == ItemKind::kPackage && jar.certificate) {
    const bool is_said = own.reason.cause == &cause::kExponentRefused;
    if (!is_said && IsForgeable(jar.certificate->key)) {
      warnings.push_back({&cause::kForgeableKey, ExponentText(jar.certificate->key)});
    }
    if (jar.signature_files.size() > 1 || jar.signer_count > 1) {
      warnings.push_back({&cause::kSeveralSigners, jar.signature_files[0]});
    }
    WarnOfOtherKeys(facts, &warnings);
    WarnOfStrippedSchemes(facts, &warnings);
  }
  if (facts.has_damaged_signing_block) warnings.push_back({&cause::kSigningBlockDamaged, ""});
  if (own.kind == ItemKind::kPackage && jar.has_manifest) {
    WarnOfUnlistedEntries(facts, &warnings);
  }
  if (!not_laid_out.empty()) {
    warnings.push_back({&cause::kNotLaidOut, Counted(not_laid_out.size(), "entry", "entries") +
                                                 ": " + not_laid_out[0] +
                                                 (not_laid_out.size() > 1 ? ", ..." : "")});
  }
  return warnings;
}

namespace {

// One warning for a scheme that the JAR signer has no part in.
void WarnOfOtherKeys(const PackageFacts& facts, std::vector<Reason>* warnings) {
  const std::string& key = facts.jar.certificate->key.sha256;
  for (const std::string& scheme : NewerSchemes(facts)) {
    std::vector<CertificateFacts> signers;
    for (const NewerSignerFacts& signer : facts.newer) {
      if (signer.scheme == scheme) signers.push_back(signer.certificate);
    }
    const bool has_key = std::any_of(signers.begin(), signers.end(), [&key](const auto& signer) {
      return signer.key.sha256 == key;
    });
    if (has_key || signers.empty()) continue;
    warnings->push_back(
        {&cause::kOtherKey, "the " + scheme + " signature (" + signers[0].subject +
                                ", public key SHA-256 digest: " + signers[0].key.sha256 + ")"});
  }
}

// The signature file names the schemes by their numbers: "2, 3".
void WarnOfStrippedSchemes(const PackageFacts& facts, std::vector<Reason>* warnings) {
  std::string missing;
  for (const char number : facts.jar.claimed_schemes) {
    if (number != '2' && number != '3') continue;
    const std::string scheme = std::string("v") + number;
    bool is_there = false;
    for (const std::string& present : NewerSchemes(facts)) {
      is_there = is_there || present == scheme;
    }
    const bool is_new = missing.find(scheme) == std::string::npos;
    if (!is_there && is_new) missing += (missing.empty() ? "" : ", ") + scheme;
  }
  if (!missing.empty()) warnings->push_back({&cause::kSchemesStripped, missing});
}

void WarnOfUnlistedEntries(const PackageFacts& facts, std::vector<Reason>* warnings) {
  size_t count = 0;
  uint64_t bytes = 0;
  for (const ListedEntry& entry : facts.entries) {
    if (entry.is_listed || entry.is_signature) continue;
    ++count;
    bytes += entry.entry.size;
  }
  if (count == 0) return;
  warnings->push_back({&cause::kUnlistedEntries, Counted(count, "entry", "entries") + " (" +
                                                     Counted(bytes, "byte", "bytes") + ")"});
}

}  // namespace

}  // namespace simulator
