#include "simulator/show/report_text.h"

#include <algorithm>

#include "simulator/show/timeline.h"
#include "simulator/show/words.h"

namespace simulator {

namespace {

constexpr size_t kWidth = 80;  // what to do is wrapped to it
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
  void PrintSigner();
  void PrintNewerSigners();
  void PrintProtection();
  void PrintUnlisted();
  void PrintChain();

 private:
  void PrintItem(const Item& item, size_t width);
  void PrintWrapped(const std::string& text, size_t indent);
  void PrintRows(const Rows& rows);
  std::string Shown(std::string_view bytes) const { return Printable(bytes, look_); }

  const Report& report_;
  const Look& look_;
  std::ostream& out_;
};

std::string ShareText(const Share& share);

}  // namespace

void PrintReport(const Report& report, Detail detail, const Look& look, std::ostream& out) {
  Printer printer(report, look, out);
  printer.PrintHead();
  if (detail == Detail::kVerdict) return;
  printer.PrintItems();
  printer.PrintWarnings();
  if (detail == Detail::kAll) printer.PrintUnlisted();
  printer.PrintSigner();
  if (detail == Detail::kAll) {
    printer.PrintNewerSigners();
    printer.PrintChain();
  }
  PrintTimeline(MakeTimeline(report.events, report.path), look, out);
}

namespace {

void Printer::PrintHead() {
  const VerdictWords& words = WordsOf(report_.verdict);
  out_ << Coloured(words.word, kMoodColours[static_cast<size_t>(words.mood)], look_) << "  "
       << Shown(report_.file);
  for (const std::string& fact : HeadFacts(report_, look_.has_utf8 ? "…" : "...")) {
    out_ << "   " << Shown(fact);
  }
  out_ << '\n';
}

void Printer::PrintItems() {
  size_t width = 0;
  for (const Item& item : report_.items) {
    width = std::max(width, Columns(Shown(NameOf(item))));
  }
  width = std::min(width, kMostName);
  for (size_t i = 0; i < report_.items.size(); ++i) {
    const Item& item = report_.items[i];
    PrintItem(item, width);
    const bool is_last = i + 1 == report_.items.size();
    if (HasCure(item, is_last ? nullptr : &item + 1)) PrintWrapped(item.reason.cause->cure, 6);
  }
}

void Printer::PrintItem(const Item& item, size_t width) {
  const std::string name = Shown(NameOf(item));
  const std::string gap(width + 2 - std::min(width, Columns(name)), ' ');
  const std::string text = "  " + std::string(SymbolOf(MarkOf(item.state), look_.has_utf8)) + " " +
                           name + gap + Shown(OutcomeOf(item, report_.verdict));
  out_ << Coloured(text, item.state == ItemState::kRefused ? Colour::kRed : Colour::kPlain, look_)
       << '\n';
}

void Printer::PrintWarnings() {
  for (const Reason& warning : report_.warnings) {
    out_ << Coloured("  ! " + Shown(warning.Text()), Colour::kYellow, look_) << '\n';
    PrintWrapped(warning.cause->cure, 6);
  }
}

void Printer::PrintWrapped(const std::string& text, size_t indent) {
  const std::string margin(indent, ' ');
  std::string line = margin;
  size_t start = 0;
  while (start < text.size()) {
    const size_t end = std::min(text.find(' ', start), text.size());
    const std::string word = text.substr(start, end - start);
    if (line.size() > indent && line.size() + 1 + word.size() > kWidth) {
      out_ << line << '\n';
      line = margin;
    }
    line += (line.size() > indent ? " " : "") + word;
    start = end + 1;
  }
  out_ << line << '\n';
}

void Printer::PrintSigner() {
  if (!report_.signer && !report_.key) return;
  out_ << "  signer\n";
  PrintRows(SignerRows(report_));
  out_ << "    schemes: " << Shown(Joined(report_.schemes)) << '\n';
  PrintProtection();
}

void Printer::PrintRows(const Rows& rows) {
  for (const auto& [label, value] : rows) {
    out_ << "    " << label << ": " << Shown(value) << '\n';
  }
}

void Printer::PrintNewerSigners() {
  for (const NewerSignerFacts& signer : report_.newer) {
    out_ << "  signer of " << Shown(signer.scheme) << '\n';
    PrintRows(CertificateRows(signer.certificate));
  }
}

void Printer::PrintProtection() {
  const Protection& all = report_.protection;
  out_ << "    protects: " << ShareText(all.verified) << " " << kVerifiedWord << ", "
       << ShareText(all.vouched) << " " << kVouchedWord << ", " << ShareText(all.unlisted) << " "
       << kUnlistedWord << '\n';
}

void Printer::PrintUnlisted() {
  for (const std::string& name : report_.protection.unlisted_names) {
    out_ << "      " << kUnlistedWord << ": " << Shown(name) << '\n';
  }
}

void Printer::PrintChain() {
  for (const Link& link : report_.chain) {
    out_ << "    " << SymbolOf(MarkOf(link.state), look_.has_utf8) << " " << link.name << ": "
         << Shown(TextOf(link)) << '\n';
  }
}

std::string ShareText(const Share& share) {
  return Counted(share.entries, "entry", "entries") + " (" + Counted(share.bytes, "byte", "bytes") +
         ")";
}

}  // namespace

}  // namespace simulator
