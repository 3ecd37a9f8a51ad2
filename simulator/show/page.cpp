#include "simulator/show/page.h"

#include <algorithm>
#include <cstdio>
#include <regex>
#include <utility>

#include "simulator/show/page_judgements.h"
#include "simulator/show/protection_bar.h"
#include "simulator/show/timeline.h"
#include "simulator/show/words.h"

namespace simulator {

namespace {

using kainjow::mustache::data;
using kainjow::mustache::list;
using kainjow::mustache::object;

// These functions make the fields for the sections of the page's template (page.mustache). Every
// text goes through Shown (page_fields.h), and the template escapes the text.
data FileFields(const Report& report, size_t number, const PageRun& run);
list HeadLines(const Report& report);
void AddItems(const Report& report, data* file);
void AddPicture(const Report& report, data* file);
void AddSigners(const Report& report, data* file);

list Pieces(std::string_view text);
list FactRows(const Report& report, const PageRun& run);
std::string ToolText(const PageRun& run);
std::string TimeText(std::time_t time, const char* format);
std::string Decimal(double number);

}  // namespace

void Page::Add(const Report& report) {
  verdicts_.push_back(report.verdict);
  table_.Add(report);
  files_.push_back(FileFields(report, verdicts_.size(), run_));
}

std::string Page::Html(std::optional<size_t> unseen) const {
  const bool has_several = files_.size() > 1;
  const std::string missed = Counted(unseen.value_or(0), "file", "files") + " of " +
                             std::to_string(files_.size() + unseen.value_or(0));
  data fields;
  fields.set("version", Shown(APKTOOLKIT_VERSION));
  fields.set("date", Shown(TimeText(run_.begun, "%Y-%m-%dT%H:%M:%SZ")));
  fields.set("time", Shown(TimeText(run_.begun, "%Y-%m-%d %H:%M:%S UTC")));
  fields.set("tool", Shown(ToolText(run_)));
  fields.set("summary", Shown(Summary(verdicts_, unseen)));
  fields.set("interrupted", OneIf(unseen.has_value()));
  fields.set("unseen", unseen.value_or(0) > 0 ? list{{"missed", Shown(missed)}} : list());
  fields.set("several", data(OneIf(has_several)));
  fields.set("alone", data(OneIf(!has_several)));
  fields.set("files", data(files_));
  table_.Fill(&fields);
  return std::string(kPageStart) + kainjow::mustache::mustache(kPageTemplate).render(fields);
}

namespace {

data FileFields(const Report& report, size_t number, const PageRun& run) {
  const VerdictWords& words = WordsOf(report.verdict);
  data file = object{{"number", Shown(std::to_string(number))},
                     {"file", Shown(Short(report.file))},
                     {"verdict", Shown(words.word)},
                     {"code", Shown(words.code)},
                     {"mood", Shown(MoodCode(words.mood))},
                     {"is_warned", OneIf(!report.warnings.empty())},
                     {"about", HeadLines(report)},
                     {"facts", FactRows(report, run)}};
  AddItems(report, &file);
  const auto warn = [](const Reason& warning) {
    return object{{"warning", Shown(Short(warning).Text())},
                  {"remedy", Pieces(warning.cause->cure)}};
  };
  AddLines("warnings", report.warnings, "", warn, &file);
  AddJudgements(report, &file);
  AddPicture(report, &file);
  const auto chain = [](const Link& link) {
    const Mark mark = MarkOf(link.state);
    return object{{"mark", Shown(SymbolOf(mark, true))},
                  {"state", Shown(MarkCode(mark))},
                  {"link", Shown(link.name)},
                  {"at", Shown(Short(TextOf(link)))},
                  {"is_broken", data(link.state == LinkState::kBroken)}};
  };
  AddLines("chain", report.chain, "", chain, &file);
  AddSigners(report, &file);
  const auto tell = [](const TimelineLine& line) {
    const bool has_detail = !line.detail.empty();
    return object{{"what", Shown(line.what)},
                  {"text", Shown(Short(line.text))},
                  {"details", has_detail ? list{{"detail", Shown(Short(line.detail))}} : list()},
                  {"is_failure", data(line.is_failure)}};
  };
  AddLines("events", MakeTimeline(report.events, PathForTool(report)), "the journal has them all",
           tell, &file);
  return file;
}

// Each long part is cut before the parts are joined. If the joined text were cut, the signer's key
// could be lost, because it stands after the signer's name, which can be long.
list HeadLines(const Report& report) {
  Report head;
  head.package_name = Short(report.package_name);
  head.signer = report.signer;
  if (head.signer) head.signer->subject = Short(head.signer->subject);
  head.key = report.key;
  for (const Reason& warning : report.warnings) head.warnings.push_back(Short(warning));
  list lines;
  for (const std::string& fact : OwnerFacts(head, "…")) lines.push_back({"fact", Shown(fact)});
  for (const std::string& fact : AlarmFacts(head)) lines.push_back({"fact", Shown(fact)});
  if (!report.installed.empty()) lines.push_back({"fact", Shown(kLaidOutText)});
  return lines;
}

void AddItems(const Report& report, data* file) {
  const auto is_refused = [](const Item& item) { return item.state == ItemState::kRefused; };
  std::vector<Item> items = report.items;
  if (items.size() > kMostPageLines) {
    std::stable_partition(items.begin(), items.end(), is_refused);
  }
  const Item* const end = items.data() + std::min(items.size(), kMostPageLines);
  const auto make = [&](const Item& item) {
    const Mark mark = MarkOf(item.state);
    const Item shown = Short(item);
    const bool has_cure = HasCure(item, &item + 1 == end ? nullptr : &item + 1);
    return object{{"mark", Shown(SymbolOf(mark, true))},
                  {"state", Shown(MarkCode(mark))},
                  {"name", Shown(NameOf(shown))},
                  {"outcome", Shown(OutcomeOf(shown, report.verdict))},
                  {"cures", has_cure ? list{{"cure", Pieces(item.reason.cause->cure)}} : list()}};
  };
  const auto refused = static_cast<uint64_t>(std::count_if(items.begin(), items.end(), is_refused));
  AddLines(
      "items", items,
      Counted(refused, "item of the whole list is refused", "items of the whole list are refused"),
      make, file);
}

void AddPicture(const Report& report, data* file) {
  const std::vector<DrawnPart> bar = DrawBar(report.protection, report.file_size);
  list parts;
  std::string description;
  for (const DrawnPart& part : bar) {
    parts.push_back(
        object{{"part", Shown(part.code)},
               {"label", Shown(part.name)},
               {"meaning", Shown(part.meaning)},
               {"count", Shown(part.has_entries ? Grouped(part.share.entries) : "–")},
               {"bytes", Shown(Grouped(part.share.bytes))},
               {"percent", Shown(Decimal(part.percent))},
               {"drawn", part.width > 0 ? list{{"width", Shown(Decimal(part.width))}} : list()},
               {"start", Shown(Decimal(part.start))}});
    description += (description.empty() ? "" : ", ") + std::string(part.name) + " " +
                   Decimal(part.percent) + " %";
  }
  file->set("picture", OneIf(!bar.empty()));
  file->set("description", Shown(description));
  file->set("parts", parts);
  const auto name = [](const std::string& entry) { return object{{"entry", Shown(Short(entry))}}; };
  AddLines("differing", report.protection.differing_names, "", name, file);
  AddLines("missing", report.protection.missing_names, "", name, file);
  AddLines("unlisted", report.protection.unlisted_names, "", name, file);
}

// Schemes with the same certificate are shown together.
void AddSigners(const Report& report, data* file) {
  struct Signer {
    std::vector<std::string> schemes;
    std::string certificate;  // the certificate's SHA-256 digest; may be empty
    Rows rows;
  };
  std::vector<Signer> signers;
  if (report.signer || report.key) {
    signers.push_back({{"v1"}, report.signer ? report.signer->sha256 : "", SignerRows(report)});
  }
  for (const auto& [scheme, certificate] : report.newer) {
    const auto same = std::find_if(
        signers.begin(), signers.end(),
        [&digest = certificate.sha256](const Signer& s) { return s.certificate == digest; });
    if (same == signers.end()) {
      signers.push_back({{scheme}, certificate.sha256, CertificateRows(certificate)});
    } else if (same->schemes.back() != scheme) {
      same->schemes.push_back(scheme);
    }
  }
  const auto make = [](const Signer& signer) {
    list rows;
    for (const auto& [label, value] : signer.rows) {
      rows.push_back(object{{"term", Shown(label)}, {"value", Shown(Short(value))}});
    }
    return object{{"schemes", Shown(Joined(signer.schemes))}, {"rows", rows}};
  };
  AddLines("signers", signers, "", make, file);
}

// Separates options, such as --install=all, from the rest of `text`. The page must not break a line
// inside an option.
list Pieces(std::string_view text) {
  static const std::regex kOption("--[a-z][a-z0-9-]*(=[A-Za-z]+)?");
  list pieces;
  const auto add = [&pieces](const char* name, const std::string& piece) {
    if (!piece.empty()) pieces.push_back(object{{name, list{{"words", Shown(piece)}}}});
  };
  std::string rest(text);
  for (std::smatch match; std::regex_search(rest, match, kOption); rest = match.suffix()) {
    add("plain", match.prefix());
    add("option", match.str());
  }
  add("plain", rest);
  return pieces;
}

// The facts of the file and of the run, for a reader who gets only this part of the page.
list FactRows(const Report& report, const PageRun& run) {
  Rows rows = {{"path", report.path}};
  if (!report.file_sha256.empty()) {
    rows.emplace_back("size (bytes)", Grouped(report.file_size));
    rows.emplace_back("SHA-256 digest", report.file_sha256);
  }
  rows.emplace_back("time of the run", TimeText(run.begun, "%Y-%m-%d %H:%M:%S UTC"));
  rows.emplace_back("tool", ToolText(run));
  rows.emplace_back("simulator", "apktoolkit-sim " APKTOOLKIT_VERSION);
  list shown;
  for (const auto& [label, value] : rows) {
    if (!value.empty())
      shown.push_back(object{{"term", Shown(label)}, {"value", Shown(Short(value))}});
  }
  return shown;
}

// The tool does not report its version. Without --tool, the simulator runs the tool of its own
// build, which has the simulator's version.
std::string ToolText(const PageRun& run) {
  if (run.tool.empty()) return "apktoolkit " APKTOOLKIT_VERSION;
  return Short(run.tool) + " (--tool; its version is not known)";
}

std::string TimeText(std::time_t time, const char* format) {
  std::tm parts = {};
  char text[64];
  if (gmtime_r(&time, &parts) == nullptr) return "unknown";
  return {text, strftime(text, sizeof(text), format, &parts)};
}

std::string Decimal(double number) {
  char text[32];
  snprintf(text, sizeof(text), "%.1f", number);
  return text;
}

}  // namespace

}  // namespace simulator
