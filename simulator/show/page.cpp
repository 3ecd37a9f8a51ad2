#include "simulator/show/page.h"

#include <algorithm>
#include <cstdio>
#include <utility>

#include "simulator/show/page_template.h"
#include "simulator/show/protection_bar.h"
#include "simulator/show/terminal.h"
#include "simulator/show/timeline.h"
#include "simulator/show/words.h"

namespace simulator {

namespace {

using kainjow::mustache::data;
using kainjow::mustache::list;

// The fields of the template's sections. Every text goes through Shown, and the template escapes
// it.
data FileFields(const Report& report, size_t number);
void AddItems(const Report& report, data* file);
void AddWarnings(const std::vector<Reason>& warnings, data* file);
void AddPicture(const Report& report, data* file);
void AddChain(const std::vector<Link>& chain, data* file);
void AddSigners(const Report& report, data* file);
void AddTimeline(const Report& report, data* file);

data Shown(std::string_view bytes);
std::string Short(std::string_view bytes);
Reason Short(Reason reason);
Item Short(Item item);
list OneIf(bool condition);
void SetMark(Mark mark, data* line);
void SetLines(const char* name, const list& lines, size_t count, const std::string& remark,
              data* file);
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
  const VerdictWords& words = WordsOf(report.verdict);
  data file;
  file.set("number", Shown(std::to_string(number)));
  file.set("file", Shown(Short(report.file)));
  file.set("verdict", Shown(words.word));
  constexpr const char* kMoods[] = {"good", "mixed", "bad"};
  file.set("mood", Shown(kMoods[static_cast<size_t>(words.mood)]));
  Report head;
  head.package_name = Short(report.package_name);
  head.signer = report.signer;
  if (head.signer) head.signer->subject = Short(head.signer->subject);
  head.key = report.key;
  for (const Reason& warning : report.warnings) head.warnings.push_back(Short(warning));
  list about;
  for (const std::string& fact : HeadFacts(head, "…")) about.push_back({"fact", Shown(fact)});
  file.set("about", about);
  AddItems(report, &file);
  AddWarnings(report.warnings, &file);
  AddPicture(report, &file);
  AddChain(report.chain, &file);
  AddSigners(report, &file);
  AddTimeline(report, &file);
  return file;
}

void AddItems(const Report& report, data* file) {
  const auto is_refused = [](const Item& item) { return item.state == ItemState::kRefused; };
  std::vector<Item> items = report.items;
  if (items.size() > kMostPageLines) {
    std::stable_partition(items.begin(), items.end(), is_refused);
  }
  list lines;
  for (size_t i = 0; i < std::min(items.size(), kMostPageLines); ++i) {
    const Item item = Short(items[i]);
    data line;
    SetMark(MarkOf(item.state), &line);
    line.set("name", Shown(NameOf(item)));
    line.set("outcome", Shown(OutcomeOf(item, report.verdict)));
    const bool is_last = i + 1 == std::min(items.size(), kMostPageLines);
    const bool has_cure = HasCure(items[i], is_last ? nullptr : &items[i + 1]);
    line.set("cures", has_cure ? list{{"cure", Shown(item.reason.cause->cure)}} : list());
    lines.push_back(line);
  }
  const auto refused = static_cast<uint64_t>(std::count_if(items.begin(), items.end(), is_refused));
  SetLines("items", lines, items.size(), Counted(refused, "is refused", "are refused") + " of all",
           file);
}

void AddWarnings(const std::vector<Reason>& warnings, data* file) {
  list lines;
  for (size_t i = 0; i < std::min(warnings.size(), kMostPageLines); ++i) {
    data line("warning", Shown(Short(warnings[i]).Text()));
    line.set("remedy", Shown(warnings[i].cause->cure));
    lines.push_back(line);
  }
  SetLines("warnings", lines, warnings.size(), "", file);
}

void AddPicture(const Report& report, data* file) {
  const std::vector<BarPart> bar = MakeShareBar(report.protection, report.file_size);
  list parts;
  std::string description;
  for (const BarPart& part : bar) {
    data line;
    line.set("part", Shown(part.code));
    line.set("label", Shown(part.name));
    line.set("meaning", Shown(part.meaning));
    line.set("count", Shown(part.has_entries ? Grouped(part.share.entries) : "–"));
    line.set("bytes", Shown(Grouped(part.share.bytes)));
    line.set("percent", Shown(Decimal(part.percent)));
    line.set("drawn", part.width > 0 ? list{{"width", Shown(Decimal(part.width))}} : list());
    line.set("start", Shown(Decimal(part.start)));
    parts.push_back(line);
    description += (description.empty() ? "" : ", ") + std::string(part.name) + " " +
                   Decimal(part.percent) + " %";
  }
  file->set("picture", OneIf(!bar.empty()));
  file->set("description", Shown(description));
  file->set("parts", parts);
  const std::vector<std::string>& names = report.protection.unlisted_names;
  list unlisted;
  for (size_t i = 0; i < std::min(names.size(), kMostPageLines); ++i) {
    unlisted.push_back({"entry", Shown(Short(names[i]))});
  }
  SetLines("unlisted", unlisted, names.size(), "", file);
}

void AddChain(const std::vector<Link>& chain, data* file) {
  list links;
  for (const Link& link : chain) {
    data line;
    SetMark(MarkOf(link.state), &line);
    line.set("link", Shown(link.name));
    line.set("at", Shown(Short(TextOf(link))));
    line.set("is_broken", data(link.state == LinkState::kBroken));
    links.push_back(line);
  }
  file->set("chained", OneIf(!links.empty()));
  file->set("chain", links);
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
  list lines;
  for (size_t i = 0; i < std::min(signers.size(), kMostPageLines); ++i) {
    list rows;
    for (const auto& [label, value] : signers[i].rows) {
      data row("term", Shown(label));
      row.set("value", Shown(Short(value)));
      rows.push_back(row);
    }
    data line("schemes", Shown(Joined(signers[i].schemes)));
    line.set("rows", rows);
    lines.push_back(line);
  }
  SetLines("signers", lines, signers.size(), "", file);
}

void AddTimeline(const Report& report, data* file) {
  const std::vector<TimelineLine> events = MakeTimeline(report.events, report.path);
  list lines;
  for (size_t i = 0; i < std::min(events.size(), kMostPageLines); ++i) {
    data line("what", Shown(events[i].what));
    line.set("text", Shown(Short(events[i].text)));
    const std::string& detail = events[i].detail;
    line.set("details", detail.empty() ? list() : list{{"detail", Shown(Short(detail))}});
    line.set("is_failure", data(events[i].is_failure));
    lines.push_back(line);
  }
  SetLines("events", lines, events.size(), "the journal has them all", file);
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

void SetMark(Mark mark, data* line) {
  constexpr const char* kCodes[] = {"good", "bad", "neither"};
  line->set("mark", Shown(SymbolOf(mark, true)));
  line->set("state", Shown(kCodes[static_cast<size_t>(mark)]));
}

// Sets the section "NAME_shown" with the section `name` in it, of `count` lines those that are
// shown, and how many are not.
void SetLines(const char* name, const list& lines, size_t count, const std::string& remark,
              data* file) {
  const size_t hidden = count - lines.size();
  const std::string text = Grouped(hidden) + " more" + (remark.empty() ? "" : "; " + remark);
  file->set(std::string(name) + "_shown", OneIf(!lines.empty()));
  file->set(name, lines);
  file->set(std::string(name) + "_count", Shown(Grouped(count)));
  file->set(std::string(name) + "_more", hidden > 0 ? list{{"more", Shown(text)}} : list());
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
