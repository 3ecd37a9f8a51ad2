#include "simulator/show/report_text.h"

#include <algorithm>

#include "simulator/show/timeline.h"
#include "simulator/show/words.h"

namespace simulator {

namespace {

constexpr size_t kWidth = 80;  // in columns; cures are wrapped to it
constexpr size_t kMostName = 40;
constexpr Colour kMoodColours[] = {Colour::kGreen, Colour::kYellow, Colour::kRed};

// Prints one report.
class Printer {
 public:
  Printer(const Report& report, const Look& look, std::ostream& out)
      : report_(report), look_(look), out_(out) {}

  void PrintHead();
  void PrintItems();
  void PrintWarnings();
  void PrintUnlisted();
  void PrintSigner();
  void PrintNewerSigners();
  void PrintChain();

 private:
  // Prints a line. Characters that must not be shown are escaped.
  void Print(const std::string& text, Colour colour = Colour::kPlain) {
    out_ << Coloured(Printable(text, look_), colour, look_) << '\n';
  }
  std::string Symbol(Mark mark) const { return SymbolOf(mark, look_.has_utf8); }
  void PrintCure(const Cause& cause);
  void PrintRows(const Rows& rows);

  const Report& report_;
  const Look& look_;
  std::ostream& out_;
};

std::string ShareText(const Share& share, const char* what);

}  // namespace

void PrintReport(const Report& report, Detail detail, const Look& look, std::ostream& out) {
  Printer printer(report, look, out);
  printer.PrintHead();
  if (detail == Detail::kVerdict) return;
  printer.PrintItems();
  if (!report.installed.empty()) out << "  " << kLaidOutText << '\n';
  printer.PrintWarnings();
  if (detail == Detail::kAll) printer.PrintUnlisted();
  printer.PrintSigner();
  if (detail == Detail::kAll) {
    printer.PrintNewerSigners();
    printer.PrintChain();
  }
  PrintTimeline(MakeTimeline(report.events, PathForTool(report)), look, out);
}

namespace {

void Printer::PrintHead() {
  const VerdictWords& words = WordsOf(report_.verdict);
  out_ << Coloured(words.word, kMoodColours[static_cast<size_t>(words.mood)], look_) << "  ";
  std::string line = Printable(report_.file, look_);
  for (const std::string& fact : HeadFacts(report_, look_.has_utf8 ? "…" : "...")) {
    line += "   " + Printable(fact, look_);
  }
  out_ << line << '\n';
}

void Printer::PrintItems() {
  size_t width = 0;
  for (const Item& item : report_.items) {
    width = std::max(width, Columns(Printable(NameOf(item), look_)));
  }
  width = std::min(width, kMostName);
  for (const Item& item : report_.items) {
    const size_t columns = Columns(Printable(NameOf(item), look_));
    const std::string gap(width + 2 - std::min(width, columns), ' ');
    const bool is_refused = item.state == ItemState::kRefused;
    Print("  " + Symbol(MarkOf(item.state)) + " " + NameOf(item) + gap +
              OutcomeOf(item, report_.verdict),
          is_refused ? Colour::kRed : Colour::kPlain);
    const bool is_last = &item == &report_.items.back();
    if (HasCure(item, is_last ? nullptr : &item + 1)) PrintCure(*item.reason.cause);
  }
}

void Printer::PrintWarnings() {
  for (const Reason& warning : report_.warnings) {
    Print("  ! " + warning.Text(), Colour::kYellow);
    PrintCure(*warning.cause);
  }
}

void Printer::PrintUnlisted() {
  const Protection& all = report_.protection;
  const struct {
    const std::vector<std::string>& names;
    const char* word;
  } parts[] = {{all.differing_names, kDifferingWord},
               {all.missing_names, kMissingWord},
               {all.unlisted_names, kUnlistedWord}};
  for (const auto& [names, word] : parts) {
    for (const std::string& name : names) Print(std::string("      ") + word + ": " + name);
  }
}

void Printer::PrintSigner() {
  if (!report_.signer && !report_.key) return;
  Print("  signer");
  PrintRows(SignerRows(report_));
  Print("    schemes: " + Joined(report_.schemes));
  const std::string takers = TakersText(report_.installer);
  if (!takers.empty()) Print("    installer: " + takers);
  const Protection& all = report_.protection;
  std::string text = ShareText(all.verified, kVerifiedWord) + ", " +
                     ShareText(all.vouched, kVouchedWord) + ", " +
                     ShareText(all.unlisted, kUnlistedWord);
  if (all.differing.entries > 0) text += ", " + ShareText(all.differing, kDifferingWord);
  if (all.uncompared.entries > 0) text += ", " + ShareText(all.uncompared, kUncomparedWord);
  const uint64_t missing = all.missing_names.size();
  if (missing > 0) text += ", " + Counted(missing, "entry ", "entries ") + kMissingWord;
  Print("    protects: " + text);
}

void Printer::PrintNewerSigners() {
  for (const NewerSignerFacts& signer : report_.newer) {
    Print("  signer of " + signer.scheme);
    PrintRows(CertificateRows(signer.certificate));
  }
}

void Printer::PrintChain() {
  for (const Link& link : report_.chain) {
    Print("    " + Symbol(MarkOf(link.state)) + " " + link.name + ": " + TextOf(link));
  }
}

// Prints the cure, wrapped. Call PrintCure directly after printing the line of the item or warning.
void Printer::PrintCure(const Cause& cause) {
  const std::string margin(6, ' ');
  const std::string text = cause.cure;
  std::string line = margin;
  for (size_t start = 0; start < text.size();) {
    const size_t end = std::min(text.find(' ', start), text.size());
    const std::string word = text.substr(start, end - start);
    if (line != margin && line.size() + 1 + word.size() > kWidth) {
      Print(line);
      line = margin;
    }
    line += (line == margin ? "" : " ") + word;
    start = end + 1;
  }
  Print(line);
}

void Printer::PrintRows(const Rows& rows) {
  for (const auto& [label, value] : rows) {
    Print(std::string("    ").append(label).append(": ").append(value));
  }
}

std::string ShareText(const Share& share, const char* what) {
  return Counted(share.entries, "entry", "entries") + " (" + Counted(share.bytes, "byte", "bytes") +
         ") " + what;
}

}  // namespace

}  // namespace simulator
