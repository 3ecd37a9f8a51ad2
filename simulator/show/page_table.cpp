#include "simulator/show/page_table.h"

#include <algorithm>
#include <iterator>
#include <string_view>

#include "simulator/show/page_fields.h"
#include "simulator/show/words.h"

namespace simulator {

namespace {

using kainjow::mustache::data;
using kainjow::mustache::list;
using kainjow::mustache::object;

// All verdicts, from the worst to the best. The rows of the table are in this order.
constexpr Verdict kWorstFirst[] = {
    Verdict::kNotSimulated,  Verdict::kNotLookedAt,    Verdict::kRefused,
    Verdict::kNotTrustedJar, Verdict::kNotInstallable, Verdict::kNotAccepted,
    Verdict::kPartlySigned,  Verdict::kOtherSigner,    Verdict::kSigned,
    Verdict::kTrustedJar,
};
static_assert(std::size(kWorstFirst) == static_cast<size_t>(Verdict::kNotSimulated) + 1,
              "each verdict has a rank; kNotSimulated is the last in the enumeration");

size_t RankOf(Verdict verdict);
std::string ReasonText(const Report& report);
std::string SignerCell(const Report& report);
object Choice(const std::string& code, const std::string& word, size_t count);

}  // namespace

// Texts from a package can have any length, so each text is cut before it is joined with others. A
// cut of the joined text could remove the key that follows a signer's long name.
void PageTable::Add(const Report& report) {
  rows_.push_back({rows_.size() + 1, report.file, report.verdict, ReasonText(report),
                   report.warnings.size(), Short(report.package_name, kMostCellText),
                   SignerCell(report)});
}

void PageTable::Fill(data* page) const {
  std::vector<std::string> files;
  files.reserve(rows_.size());
  for (const Row& row : rows_) files.push_back(row.file);
  const std::string directory = CommonDirectory(files);
  list rows;
  for (const Row* row : WorstFirst()) {
    const VerdictWords& words = WordsOf(row->verdict);
    rows.push_back(
        object{{"number", Shown(std::to_string(row->number))},
               {"verdict", Shown(words.word)},
               {"code", Shown(words.code)},
               {"mood", Shown(MoodCode(words.mood))},
               {"is_warned", OneIf(row->warnings > 0)},
               {"file", Shown(Short(row->file.substr(directory.size())))},
               {"reason", Shown(row->reason)},
               {"warnings", row->warnings > 0 ? Shown(Grouped(row->warnings)) : Shown("")},
               {"package", Shown(row->package_name)},
               {"signer", Shown(row->signer)}});
  }
  const list choices = Choices();
  page->set("rows", rows);
  page->set("directory", directory.empty() ? list() : list{{"path", Shown(Short(directory))}});
  page->set("count", Shown(Grouped(rows_.size())));
  page->set("choices", choices);
  page->set("choice", OneIf(choices.size() > 1));
}

// Returns the choices that the page offers to its reader. A choice selects the rows that
// the page shows. Each verdict in the table is one choice, the worst first. If some files have
// warnings, the last choice selects the rows of these files.
list PageTable::Choices() const {
  const auto count = [this](const auto& is_chosen) {
    return static_cast<size_t>(std::count_if(rows_.begin(), rows_.end(), is_chosen));
  };
  list choices;
  for (const Verdict verdict : kWorstFirst) {
    const size_t has = count([verdict](const Row& row) { return row.verdict == verdict; });
    const VerdictWords& words = WordsOf(verdict);
    if (has > 0) choices.push_back(Choice(words.code, words.one, has));
  }
  const size_t warned = count([](const Row& row) { return row.warnings > 0; });
  if (warned > 0) choices.push_back(Choice("warned", "with warnings", warned));
  return choices;
}

std::vector<const PageTable::Row*> PageTable::WorstFirst() const {
  std::vector<const Row*> sorted;
  sorted.reserve(rows_.size());
  for (const Row& row : rows_) sorted.push_back(&row);
  std::stable_sort(sorted.begin(), sorted.end(), [](const Row* a, const Row* b) {
    if (a->verdict != b->verdict) return RankOf(a->verdict) < RankOf(b->verdict);
    return a->warnings > b->warnings;
  });
  return sorted;
}

std::string CommonDirectory(const std::vector<std::string>& files) {
  if (files.empty()) return {};
  std::string_view common = files[0];
  for (const std::string& file : files) {
    // At least one character of each path remains after the common directory is removed, even if
    // the path ends with "/".
    const size_t most = std::min(common.size(), file.empty() ? 0 : file.size() - 1);
    size_t size = 0;
    while (size < most && common[size] == file[size]) ++size;
    const size_t slash = common.substr(0, size).rfind('/');
    common = common.substr(0, slash == std::string_view::npos ? 0 : slash + 1);
  }
  return common == "/" ? std::string() : std::string(common);
}

namespace {

size_t RankOf(Verdict verdict) {
  return static_cast<size_t>(std::find(std::begin(kWorstFirst), std::end(kWorstFirst), verdict) -
                             std::begin(kWorstFirst));
}

// Starts with DecisiveReason, or with OtherOwnerText if DecisiveReason is empty. The texts of
// AlarmFacts follow.
std::string ReasonText(const Report& report) {
  std::vector<std::string> facts = {DecisiveReason(report)};
  if (facts[0].empty()) facts[0] = OtherOwnerText(report);
  for (const std::string& alarm : AlarmFacts(report)) facts.push_back(alarm);
  std::string text;
  for (const std::string& fact : facts) {
    if (!fact.empty()) text += (text.empty() ? "" : " · ") + Short(fact);
  }
  return text;
}

std::string SignerCell(const Report& report) {
  if (!report.signer && !report.key) return {};
  Report cut;
  cut.signer = report.signer;
  if (cut.signer) cut.signer->subject = Short(cut.signer->subject, kMostCellText);
  cut.key = report.key;
  return SignerText(cut, "…");
}

object Choice(const std::string& code, const std::string& word, size_t count) {
  return {{"code", Shown(code)}, {"word", Shown(word)}, {"count", Shown(Grouped(count))}};
}

}  // namespace

}  // namespace simulator
