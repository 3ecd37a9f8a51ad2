#include "simulator/show/page_judgements.h"

#include <algorithm>
#include <string>
#include <vector>

#include "simulator/show/page_fields.h"
#include "simulator/show/words.h"

namespace simulator {

namespace {

using kainjow::mustache::data;
using kainjow::mustache::list;
using kainjow::mustache::object;

// A row of the table. It shows the tool's judgement, or the judgement of phones with certain API
// levels, or that phones gave no judgement. Each text of `signers` and `why` becomes a line of its
// cell.
struct Said {
  std::string who;
  Mark mark;
  std::string outcome;
  std::string schemes;
  std::vector<std::string> signers;
  std::vector<std::string> why;
};

std::vector<Said> JudgementsOf(const Report& report);
Said ByTool(const Report& report);
Said ByInstaller(const RangeJudgement& range);
Said ByNobody(const Judgement& judgement);
std::string SignerOf(const InstallerSigner& signer);
list Lines(const std::vector<std::string>& texts);

}  // namespace

void AddJudgements(const Report& report, data* file) {
  const auto make = [](const Said& said) {
    return object{{"who", Shown(said.who)},
                  {"mark", Shown(SymbolOf(said.mark, true))},
                  {"state", Shown(MarkCode(said.mark))},
                  {"outcome", Shown(said.outcome)},
                  {"schemes", Shown(Short(said.schemes))},
                  {"signers", Lines(said.signers)},
                  {"why", Lines(said.why)}};
  };
  AddLines("judgements", JudgementsOf(report), "the journal has them all", make, file);
}

namespace {

std::vector<Said> JudgementsOf(const Report& report) {
  const Judgement& judgement = report.installer;
  const bool is_package = !report.chain.empty();
  if (!is_package && judgement.state == Judgement::State::kNotAsked) return {};
  std::vector<Said> all = {ByTool(report)};
  if (judgement.state != Judgement::State::kJudged) all.push_back(ByNobody(judgement));
  for (const RangeJudgement& range : judgement.ranges) all.push_back(ByInstaller(range));
  return all;
}

// Uses only the tool's own items. ByInstaller shows the installer's refusals.
Said ByTool(const Report& report) {
  std::vector<std::string> why;
  for (const Item& item : report.items) {
    if (item.state != ItemState::kRefused || !IsByTool(item)) continue;
    why.push_back(NameOf(item) + ": " + item.reason.Text());
  }
  const bool is_signed = std::any_of(report.items.begin(), report.items.end(), IsSigned);
  const char* const outcome = !is_signed    ? "signs nothing"
                              : why.empty() ? "signs it"
                                            : "signs only a part of it";
  Said said = {"apktoolkit", is_signed && why.empty() ? Mark::kGood : Mark::kBad, outcome, "", {},
               why};
  if (report.signer || report.key) {
    said.schemes = "v1";
    said.signers = {SignerText(report, "…")};
  }
  return said;
}

Said ByInstaller(const RangeJudgement& range) {
  Said said = {"phones of " + LevelText(range.levels),
               range.is_verified ? Mark::kGood : Mark::kBad,
               range.is_verified ? "install it" : "refuse it",
               Joined(range.schemes),
               {},
               {}};
  for (const InstallerSigner& signer : range.signers) {
    const std::string text = SignerOf(signer);
    if (said.signers.empty() || said.signers.back() != text) said.signers.push_back(text);
  }
  for (const InstallerIssue& issue : range.errors) said.why.push_back(issue.text);
  for (const InstallerIssue& issue : range.warnings) said.why.push_back("warning: " + issue.text);
  return said;
}

Said ByNobody(const Judgement& judgement) {
  const bool has_given_up = judgement.state == Judgement::State::kGaveUp;
  Said said = {"phones",
               has_given_up ? Mark::kBad : Mark::kNeither,
               has_given_up ? "the verifier gave up" : "were not asked",
               "",
               {},
               {}};
  if (!judgement.why.empty()) said.why = {judgement.why};
  return said;
}

// Returns the text of SignerText, such as "CN=Vault, RSA-2048, key 98302ce8…f64646".
std::string SignerOf(const InstallerSigner& signer) {
  Report of_signer;
  of_signer.signer = signer.certificate;
  const PublicKey& key = signer.certificate.key;
  if (!key.modulus_sha256.empty()) of_signer.key = {key.modulus_sha256, key.bits, false};
  of_signer.signer->subject = Short(of_signer.signer->subject);
  return SignerText(of_signer, "…");
}

list Lines(const std::vector<std::string>& texts) {
  list lines;
  for (const std::string& text : texts) {
    if (lines.size() == kMostPageLines) break;
    lines.push_back(object{{"line", Shown(Short(text))}});
  }
  if (texts.size() > lines.size()) {
    lines.push_back(object{{"line", Shown(Grouped(texts.size() - lines.size()) + " more")}});
  }
  return lines;
}

}  // namespace

}  // namespace simulator
