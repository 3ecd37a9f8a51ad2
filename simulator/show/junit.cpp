#include "simulator/show/junit.h"

#include <tinyxml2.h>

#include <algorithm>

#include "simulator/show/terminal.h"
#include "simulator/show/words.h"

namespace simulator {

namespace {

constexpr char kSuite[] = "apktoolkit-sim";
constexpr Look kXml = {false, true};

std::string DetailText(const Report& report);

}  // namespace

void Junit::Add(const Report& report) {
  Case made = {Printable(report.file, kXml), Outcome::kPassed, "", "", DetailText(report)};
  const ExitStatus status = StatusOf(report.verdict);
  if (status != kAllSigned) {
    const Item* const item = DecisiveItem(report);
    const bool is_known = item != nullptr && item->reason.cause != nullptr;
    made.outcome = status == kSomeRefused ? Outcome::kFailure : Outcome::kError;
    made.type = is_known ? item->reason.cause->code : WordsOf(report.verdict).code;
    made.message = WordsOf(report.verdict).word + (": " + Printable(DecisiveReason(report), kXml));
  }
  cases_.push_back(std::move(made));
}

std::string Junit::Xml() const {
  tinyxml2::XMLPrinter out;
  const auto push_counts = [&] {
    out.PushAttribute("name", kSuite);
    out.PushAttribute("tests", std::to_string(cases_.size()).c_str());
    out.PushAttribute("failures", std::to_string(Count(Outcome::kFailure)).c_str());
    out.PushAttribute("errors", std::to_string(Count(Outcome::kError)).c_str());
  };
  out.PushDeclaration("xml version=\"1.0\" encoding=\"UTF-8\"");
  out.PushComment(" A JUnit report of apktoolkit-sim ");
  out.OpenElement("testsuites");
  push_counts();
  out.OpenElement("testsuite");
  push_counts();
  out.PushAttribute("skipped", "0");
  out.OpenElement("properties");
  out.OpenElement("property");
  out.PushAttribute("name", "version");
  out.PushAttribute("value", APKTOOLKIT_VERSION);
  out.CloseElement();
  out.CloseElement();
  for (const Case& each : cases_) {
    out.OpenElement("testcase");
    out.PushAttribute("classname", kSuite);
    out.PushAttribute("name", each.name.c_str());
    const bool has_passed = each.outcome == Outcome::kPassed;
    if (!has_passed || !each.text.empty()) {
      constexpr const char* kElements[] = {"system-out", "failure", "error"};
      out.OpenElement(kElements[static_cast<size_t>(each.outcome)]);
      if (!has_passed) {
        out.PushAttribute("type", each.type.c_str());
        out.PushAttribute("message", each.message.c_str());
      }
      out.PushText(each.text.c_str());
      out.CloseElement();
    }
    out.CloseElement();
  }
  out.CloseElement();
  out.CloseElement();
  return out.CStr();
}

size_t Junit::Count(Outcome outcome) const {
  return static_cast<size_t>(
      std::count_if(cases_.begin(), cases_.end(),
                    [outcome](const Case& each) { return each.outcome == outcome; }));
}

namespace {

// Returns two lines for each refused item and each warning: the fact, and below it what to do. If
// the installer's verifier is missing, one more line reports this fact.
std::string DetailText(const Report& report) {
  std::string text;
  const auto add = [&text](const std::string& line, const Reason& reason) {
    text += Printable(line, kXml) + "\n    " + reason.cause->cure + "\n";
  };
  for (const Item& item : report.items) {
    if (item.state != ItemState::kRefused || item.reason.cause == nullptr) continue;
    add(NameOf(item) + ": " + OutcomeOf(item, report.verdict), item.reason);
  }
  for (const Reason& warning : report.warnings) add("warning: " + warning.Text(), warning);
  const std::string missing = MissingInstaller(report);
  if (!missing.empty()) text += Printable("warning: " + missing, kXml) + "\n";
  return text;
}

}  // namespace

}  // namespace simulator
