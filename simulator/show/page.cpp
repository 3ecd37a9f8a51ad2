#include "simulator/show/page.h"

#include <algorithm>
#include <cstdio>
#include <utility>

#include "simulator/show/protection_bar.h"
#include "simulator/show/terminal.h"
#include "simulator/show/timeline.h"
#include "simulator/show/words.h"

namespace simulator {

namespace {

using kainjow::mustache::data;
using kainjow::mustache::list;
using kainjow::mustache::object;

// The fields of the template's sections. Every text goes through Shown, and the template escapes
// it.
data FileFields(const Report& report, size_t number);
std::string HeadText(const Report& report);
list HeadLines(const Report& report);
void AddItems(const Report& report, data* file);
void AddPicture(const Report& report, data* file);
void AddSigners(const Report& report, data* file);

// Sets the section "NAME_shown" with the section `name` in it: what `make` makes of the first
// lines, and how many there are beyond them.
template <typename Lines, typename Make>
void AddLines(const char* name, const Lines& lines, const std::string& remark, Make make,
              data* file);

data Shown(std::string_view bytes);
std::string Short(std::string_view bytes);
Reason Short(Reason reason);
Item Short(Item item);
list OneIf(bool condition);
const char* StateOf(Mark mark);
std::string Grouped(uint64_t number);
std::string Decimal(double number);

}  // namespace

void Page::Add(const Report& report) {
  verdicts_.push_back(report.verdict);
  files_.push_back(FileFields(report, verdicts_.size()));
}

std::string Page::Html() const {
  const bool has_several = files_.size() > 1;
  data fields;
  fields.set("version", Shown(APKTOOLKIT_VERSION));
  fields.set("summary", Shown(Summary(verdicts_)));
  fields.set("several", data(OneIf(has_several)));
  fields.set("alone", data(OneIf(!has_several)));
  fields.set("files", data(files_));
  return std::string(kPageStart) + kainjow::mustache::mustache(kPageTemplate).render(fields);
}

namespace {

data FileFields(const Report& report, size_t number) {
  constexpr const char* kMoods[] = {"good", "mixed", "bad"};
  const VerdictWords& words = WordsOf(report.verdict);
  data file = object{{"number", Shown(std::to_string(number))},
                     {"file", Shown(Short(report.file))},
                     {"verdict", Shown(words.word)},
                     {"mood", Shown(kMoods[static_cast<size_t>(words.mood)])},
                     {"why", Shown(HeadText(report))},
                     {"about", HeadLines(report)}};
  AddItems(report, &file);
  const auto warn = [](const Reason& warning) {
    return object{{"warning", Shown(Short(warning).Text())},
                  {"remedy", Shown(warning.cause->cure)}};
  };
  AddLines("warnings", report.warnings, "", warn, &file);
  AddPicture(report, &file);
  const auto chain = [](const Link& link) {
    const Mark mark = MarkOf(link.state);
    return object{{"mark", Shown(SymbolOf(mark, true))},
                  {"state", Shown(StateOf(mark))},
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

// For the table of files: what stands in the line of the verdict.
std::string HeadText(const Report& report) {
  std::string text;
  for (const std::string& fact : HeadFacts(report, "…")) {
    text += (text.empty() ? "" : " · ") + Short(fact);
  }
  return text;
}

// Each long part is cut before the parts are put together. The key stands behind a name of any
// length.
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
                  {"state", Shown(StateOf(mark))},
                  {"name", Shown(NameOf(shown))},
                  {"outcome", Shown(OutcomeOf(shown, report.verdict))},
                  {"cures", has_cure ? list{{"cure", Shown(item.reason.cause->cure)}} : list()}};
  };
  const auto refused = static_cast<uint64_t>(std::count_if(items.begin(), items.end(), is_refused));
  AddLines("items", items, Counted(refused, "is refused", "are refused") + " of all", make, file);
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

// Schemes of the same certificate are told together.
void AddSigners(const Report& report, data* file) {
  struct Signer {
    std::vector<std::string> schemes;
    std::string certificate;  // its digest
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

template <typename Lines, typename Make>
void AddLines(const char* name, const Lines& lines, const std::string& remark, Make make,
              data* file) {
  list made;
  while (made.size() < std::min(lines.size(), kMostPageLines)) {
    made.push_back(data(make(lines[made.size()])));
  }
  const size_t hidden = lines.size() - made.size();
  const std::string text = Grouped(hidden) + " more" + (remark.empty() ? "" : "; " + remark);
  file->set(std::string(name) + "_shown", OneIf(!made.empty()));
  file->set(name, made);
  file->set(std::string(name) + "_count", Shown(Grouped(lines.size())));
  file->set(std::string(name) + "_more", hidden > 0 ? list{{"more", Shown(text)}} : list());
}

// Nothing is shown that would deceive the eye; characters that HTML gives a meaning are escaped
// where the template is filled in.
data Shown(std::string_view bytes) { return Printable(bytes, {false, true}); }

// The beginning of what is too long, without a part of a character at its end.
std::string Short(std::string_view bytes) {
  constexpr size_t kLongestCharacter = 4;
  if (bytes.size() <= kMostPageText) return std::string(bytes);
  size_t size = kMostPageText;
  const auto is_inside = [bytes](size_t at) {
    return (static_cast<unsigned char>(bytes[at]) & 0xc0U) == 0x80;
  };
  while (size + kLongestCharacter > kMostPageText + 1 && is_inside(size)) --size;
  return std::string(bytes.substr(0, size)) + "…";
}

Reason Short(Reason reason) {
  reason.detail = Short(reason.detail);
  return reason;
}

Item Short(Item item) {
  item.name = Short(item.name);
  item.reason = Short(std::move(item.reason));
  return item;
}

// A section of the template that is shown or not, without fields of its own.
list OneIf(bool condition) { return condition ? list{data()} : list(); }

const char* StateOf(Mark mark) {
  constexpr const char* kCodes[] = {"good", "bad", "neither"};
  return kCodes[static_cast<size_t>(mark)];
}

// Such as "1,234,567".
std::string Grouped(uint64_t number) {
  std::string text = std::to_string(number);
  for (size_t at = text.size(); at > 3; at -= 3) text.insert(at - 3, ",");
  return text;
}

std::string Decimal(double number) {
  char text[32];
  snprintf(text, sizeof(text), "%.1f", number);
  return text;
}

}  // namespace

}  // namespace simulator
