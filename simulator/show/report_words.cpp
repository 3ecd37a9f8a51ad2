#include "simulator/show/report_words.h"

#include <algorithm>

namespace simulator {

namespace {

// Such as "RSA-2048".
std::string KeyName(const PublicKey& key) {
  return key.bits == 0 ? key.algorithm : key.algorithm + "-" + std::to_string(key.bits);
}

}  // namespace

VerdictWords WordsOf(Verdict verdict) {
  switch (verdict) {
    case Verdict::kSigned:
      return {"SIGNED", "signed", "signed", Mood::kGood};
    case Verdict::kPartlySigned:
      return {"PARTLY SIGNED", "partly signed", "partly signed", Mood::kMixed};
    case Verdict::kRefused:
      return {"REFUSED", "refused", "refused", Mood::kBad};
    case Verdict::kTrustedJar:
      return {"TRUSTED JAR", "trusted JAR", "trusted JARs", Mood::kGood};
    case Verdict::kNotTrustedJar:
      return {"NOT TRUSTED JAR", "JAR not trusted", "JARs not trusted", Mood::kBad};
    case Verdict::kNotLookedAt:
      return {"NOT LOOKED AT", "not looked at", "not looked at", Mood::kBad};
    case Verdict::kNotSimulated:
      return {"NOT SIMULATED", "not simulated", "not simulated", Mood::kBad};
  }
  return {"", "", "", Mood::kBad};
}

std::string Summary(const std::vector<Verdict>& verdicts) {
  std::string text = Counted(verdicts.size(), "file", "files");
  const char* separator = ": ";
  for (const Verdict verdict :
       {Verdict::kSigned, Verdict::kTrustedJar, Verdict::kPartlySigned, Verdict::kRefused,
        Verdict::kNotTrustedJar, Verdict::kNotLookedAt, Verdict::kNotSimulated}) {
    const auto count = static_cast<size_t>(std::count(verdicts.begin(), verdicts.end(), verdict));
    if (count == 0) continue;
    const VerdictWords words = WordsOf(verdict);
    text += separator + Counted(count, words.one, words.many);
    separator = ", ";
  }
  return text;
}

Mark MarkOf(ItemState state) {
  switch (state) {
    case ItemState::kDone:
      return Mark::kGood;
    case ItemState::kRefused:
      return Mark::kBad;
    case ItemState::kAbsent:
    case ItemState::kNothing:
      break;
  }
  return Mark::kNeither;
}

Mark MarkOf(LinkState state) {
  switch (state) {
    case LinkState::kHolds:
      return Mark::kGood;
    case LinkState::kBroken:
      return Mark::kBad;
    case LinkState::kNotReached:
      break;
  }
  return Mark::kNeither;
}

const char* SymbolOf(Mark mark, bool has_utf8) {
  switch (mark) {
    case Mark::kGood:
      return has_utf8 ? "✓" : "+";
    case Mark::kBad:
      return has_utf8 ? "✗" : "x";
    case Mark::kNeither:
      break;
  }
  return has_utf8 ? "–" : "-";
}

std::string NameOf(const Item& item) { return item.kind == ItemKind::kKey ? "key" : item.name; }

std::string OutcomeOf(const Item& item, Verdict verdict) {
  std::string reason = item.reason.Text();
  if (item.state == ItemState::kDone) {
    if (item.kind == ItemKind::kPackage) return "signed with the payload of that key";
    if (item.kind == ItemKind::kJar) return "signed, without data";
    if (item.kind == ItemKind::kKey) return "registered for " + item.name;
    return "signed";
  }
  if (item.state != ItemState::kRefused) return "nothing to sign: " + reason;
  if (item.kind == ItemKind::kTool) return reason;
  if (item.kind == ItemKind::kKey) return "not registered: " + reason;
  return (verdict == Verdict::kNotLookedAt ? "not looked at: " : "not signed: ") + reason;
}

bool HasCure(const Item& item, const Item* next) {
  const Cause* const why = item.reason.cause;
  if (why == nullptr || item.state == ItemState::kNothing) return false;
  if (why == &cause::kPackageRefused || why == &cause::kNotReached) return false;
  return next == nullptr || next->reason.cause != why;
}

std::string TextOf(const Link& link) {
  return link.state == LinkState::kNotReached ? "not reached" : link.text;
}

std::string SignerText(const CertificateFacts& signer, const char* ellipsis) {
  std::string text = signer.subject + ", " + KeyName(signer.key);
  const std::string& digest = signer.key.modulus_sha256;
  if (digest.empty()) return text;
  return text + ", key " + digest.substr(0, 8) + ellipsis + digest.substr(digest.size() - 6);
}

std::vector<std::pair<std::string, std::string>> CertificateRows(
    const CertificateFacts& certificate, bool is_jar_signer) {
  const PublicKey& key = certificate.key;
  std::vector<std::pair<std::string, std::string>> rows = {
      {"certificate DN", certificate.subject},
      {"certificate SHA-256 digest", certificate.sha256},
      {"key algorithm", key.algorithm},
      {"key size (bits)", std::to_string(key.bits)},
      {"public key SHA-256 digest", key.sha256}};
  if (!key.modulus_sha256.empty()) {
    const char* const use = is_jar_signer ? ": what the kernel gets" : "";
    rows.emplace_back("modulus SHA-256 digest",
                      key.modulus_sha256 + " (of the modulus alone" + use + ")");
  }
  return rows;
}

}  // namespace simulator
