#include "simulator/show/words.h"

#include <algorithm>

namespace simulator {

namespace {

// In the order of the values of Verdict, which are the indices of this table.
constexpr VerdictWords kVerdicts[] = {
    {"signed", "SIGNED", "signed", "signed", Mood::kGood},
    {"other-signer", "SIGNED, OTHER SIGNER", "signed but with another signer",
     "signed but with another signer", Mood::kMixed},
    {"trusted-jar", "TRUSTED JAR", "trusted JAR", "trusted JARs", Mood::kGood},
    {"partly-signed", "PARTLY SIGNED", "partly signed", "partly signed", Mood::kMixed},
    {"not-installable", "NOT INSTALLABLE", "not installable", "not installable", Mood::kBad},
    {"not-accepted", "NOT ACCEPTED", "not accepted", "not accepted", Mood::kBad},
    {"refused", "REFUSED", "refused", "refused", Mood::kBad},
    {"not-trusted-jar", "NOT TRUSTED JAR", "JAR not trusted", "JARs not trusted", Mood::kBad},
    {"not-looked-at", "NOT LOOKED AT", "not looked at", "not looked at", Mood::kBad},
    {"not-simulated", "NOT SIMULATED", "not simulated", "not simulated", Mood::kBad},
};

}  // namespace

const VerdictWords& WordsOf(Verdict verdict) { return kVerdicts[static_cast<size_t>(verdict)]; }

const char* MoodCode(Mood mood) {
  constexpr const char* kCodes[] = {"good", "mixed", "bad"};
  return kCodes[static_cast<size_t>(mood)];
}

std::string Summary(const std::vector<Verdict>& verdicts, std::optional<size_t> unseen) {
  std::string text = Counted(verdicts.size(), "file", "files");
  const char* separator = ": ";
  for (const VerdictWords& words : kVerdicts) {
    const auto count = std::count_if(verdicts.begin(), verdicts.end(),
                                     [&](Verdict verdict) { return &WordsOf(verdict) == &words; });
    if (count == 0) continue;
    text += separator + Counted(static_cast<uint64_t>(count), words.one, words.many);
    separator = ", ";
  }
  if (unseen) text += "; interrupted";
  if (unseen.value_or(0) > 0) text += " before " + Counted(*unseen, "more file", "more files");
  return text;
}

std::vector<std::string> HeadFacts(const Report& report, const char* ellipsis) {
  const std::string reason = DecisiveReason(report);
  std::vector<std::string> facts = {reason};
  if (reason.empty()) facts = OwnerFacts(report, ellipsis);
  for (const Item& item : report.items) {
    const bool is_told = &item == DecisiveItem(report);
    const bool counts = item.kind == ItemKind::kSigner && item.state == ItemState::kRefused &&
                        item.reason.cause->severity == Severity::kRefused;
    if (counts && !is_told) facts.push_back(item.reason.Text());
  }
  for (const std::string& alarm : AlarmFacts(report)) facts.push_back(alarm);
  const size_t warnings = report.warnings.size();
  if (warnings > 0) facts.push_back(Counted(warnings, "warning", "warnings"));
  return facts;
}

std::string MissingInstaller(const Report& report) {
  const bool is_missing = report.installer.state == Judgement::State::kMissing;
  return is_missing ? "no phone's installer was asked: " + report.installer.why : "";
}

std::string DecisiveReason(const Report& report) {
  const Item* const item = DecisiveItem(report);
  if (item == nullptr) return {};
  return (item->kind == ItemKind::kLibrary ? item->name + ": " : "") + item->reason.Text();
}

std::vector<std::string> OwnerFacts(const Report& report, const char* ellipsis) {
  std::vector<std::string> facts;
  if (!report.package_name.empty()) facts.push_back(report.package_name);
  if (report.signer || report.key) facts.push_back("signer " + SignerText(report, ellipsis));
  if (std::string other = OtherOwnerText(report); !other.empty()) facts.push_back(other);
  return facts;
}

std::string SignerText(const Report& report, const char* ellipsis) {
  std::string text = report.signer ? report.signer->subject : "unknown";
  if (const std::string key = KeyName(report); !key.empty()) text += ", " + key;
  if (!report.key) return text;
  const std::string& digest = report.key->sha256;
  if (digest.size() < 16) return text + ", key " + digest;
  return text + ", key " + digest.substr(0, 8) + ellipsis + digest.substr(digest.size() - 6);
}

std::string OtherOwnerText(const Report& report) {
  if (report.verdict != Verdict::kOtherSigner) return {};
  const CertificateFacts* const other = OtherSigner(report.installer, report);
  return other == nullptr ? "" : "phones install it as signed by " + other->subject;
}

std::vector<std::string> AlarmFacts(const Report& report) {
  std::vector<std::string> facts;
  for (const Reason& warning : report.warnings) {
    if (warning.cause->severity == Severity::kAlarm) facts.push_back("! " + warning.Text());
  }
  return facts;
}

Mark MarkOf(ItemState state) {
  if (state == ItemState::kDone) return Mark::kGood;
  return state == ItemState::kRefused ? Mark::kBad : Mark::kNeither;
}

Mark MarkOf(LinkState state) {
  if (state == LinkState::kHolds) return Mark::kGood;
  return state == LinkState::kBroken ? Mark::kBad : Mark::kNeither;
}

const char* MarkCode(Mark mark) {
  constexpr const char* kCodes[] = {"good", "bad", "neither"};
  return kCodes[static_cast<size_t>(mark)];
}

const char* SymbolOf(Mark mark, bool has_utf8) {
  constexpr const char* kSymbols[][2] = {{"+", "✓"}, {"x", "✗"}, {"-", "–"}};
  return kSymbols[static_cast<size_t>(mark)][has_utf8 ? 1 : 0];
}

std::string NameOf(const Item& item) { return item.kind == ItemKind::kKey ? "key" : item.name; }

std::string OutcomeOf(const Item& item, Verdict verdict) {
  std::string reason = item.reason.Text();
  if (item.state == ItemState::kDone) {
    if (item.kind == ItemKind::kPackage) return "signed with the payload of the signer's key";
    if (item.kind == ItemKind::kJar) return "signed, with an empty payload";
    if (item.kind == ItemKind::kKey) return "registered for " + item.name;
    return "signed";
  }
  if (item.state != ItemState::kRefused) return "nothing to sign: " + reason;
  if (item.kind == ItemKind::kTool || item.kind == ItemKind::kEntries || !IsByTool(item)) {
    return reason;
  }
  if (item.kind == ItemKind::kKey) return "not registered: " + reason;
  return (verdict == Verdict::kNotLookedAt ? "not looked at: " : "not signed: ") + reason;
}

bool HasCure(const Item& item, const Item* next) {
  const Cause* const why = item.reason.cause;
  if (why == nullptr) return false;
  if (why->severity == Severity::kNothing || why->severity == Severity::kFollows) return false;
  return next == nullptr || next->reason.cause != why;
}

std::string TextOf(const Link& link) {
  return link.state == LinkState::kNotReached ? "not reached" : link.text;
}

Rows CertificateRows(const CertificateFacts& certificate) {
  const PublicKey& key = certificate.key;
  Rows rows = {{"certificate DN", certificate.subject},
               {"certificate SHA-256 digest", certificate.sha256},
               {"key algorithm", key.algorithm}};
  if (key.bits != 0) rows.emplace_back("key size (bits)", std::to_string(key.bits));
  rows.emplace_back("public key SHA-256 digest", key.sha256);
  if (!key.modulus_sha256.empty()) {
    rows.emplace_back("modulus SHA-256 digest", key.modulus_sha256 + " (of the modulus alone)");
  }
  return rows;
}

Rows SignerRows(const Report& report) {
  Rows rows;
  if (report.signer) rows = CertificateRows(*report.signer);
  if (!report.key) return rows;
  if (!rows.empty() && !report.signer->key.modulus_sha256.empty()) rows.pop_back();
  const char* const use =
      report.key->was_got ? "; the kernel got this digest)" : ", as the tool reads it)";
  rows.emplace_back("modulus SHA-256 digest", report.key->sha256 + " (of the modulus alone" + use);
  return rows;
}

}  // namespace simulator
