#include "simulator/program/report_text.h"

#include <algorithm>

#include "simulator/program/timeline.h"

namespace {

constexpr size_t kWidth = 80;  // what to do is wrapped to it
constexpr size_t kMostName = 40;

struct VerdictWords {
  const char* word;
  const char* one;  // in the summary, after a number
  const char* many;
  Colour colour;
};

VerdictWords WordsOf(Verdict verdict);

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
  bool HasCure(size_t i) const;
  void PrintWrapped(const std::string& text, size_t indent);
  void PrintCertificate(const CertificateFacts& certificate);
  const char* Mark(ItemState state) const;
  std::string Shown(std::string_view bytes) const { return Printable(bytes, look_); }

  const Report& report_;
  const Look& look_;
  std::ostream& out_;
};

std::string NameOf(const Item& item);
std::string TextOf(const Item& item, bool is_looked_at);
std::string KeyName(const PublicKey& key);
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
  PrintTimeline(report.events, report.path, look, out);
}

std::string Summary(const std::vector<Verdict>& verdicts) {
  std::string text = std::to_string(verdicts.size()) + " files: ";
  bool is_first = true;
  for (const Verdict verdict :
       {Verdict::kSigned, Verdict::kTrustedJar, Verdict::kPartlySigned, Verdict::kRefused,
        Verdict::kNotTrustedJar, Verdict::kNotLookedAt, Verdict::kNotSimulated}) {
    const auto count = std::count(verdicts.begin(), verdicts.end(), verdict);
    if (count == 0) continue;
    text += (is_first ? "" : ", ") + std::to_string(count) + " " +
            (count == 1 ? WordsOf(verdict).one : WordsOf(verdict).many);
    is_first = false;
  }
  return text;
}

namespace {

VerdictWords WordsOf(Verdict verdict) {
  switch (verdict) {
    case Verdict::kSigned:
      return {"SIGNED", "signed", "signed", Colour::kGreen};
    case Verdict::kPartlySigned:
      return {"PARTLY SIGNED", "partly signed", "partly signed", Colour::kYellow};
    case Verdict::kRefused:
      return {"REFUSED", "refused", "refused", Colour::kRed};
    case Verdict::kTrustedJar:
      return {"TRUSTED JAR", "trusted JAR", "trusted JARs", Colour::kGreen};
    case Verdict::kNotTrustedJar:
      return {"NOT TRUSTED JAR", "JAR not trusted", "JARs not trusted", Colour::kRed};
    case Verdict::kNotLookedAt:
      return {"NOT LOOKED AT", "not looked at", "not looked at", Colour::kRed};
    case Verdict::kNotSimulated:
      return {"NOT SIMULATED", "not simulated", "not simulated", Colour::kRed};
  }
  return {"", "", "", Colour::kPlain};
}

void Printer::PrintHead() {
  const VerdictWords words = WordsOf(report_.verdict);
  std::string line = Coloured(words.word, words.colour, look_) + "  " + Shown(report_.file);
  if (!report_.package_name.empty()) line += "   " + Shown(report_.package_name);
  if (report_.signer) {
    const PublicKey& key = report_.signer->key;
    line += "   signer " + Shown(report_.signer->subject) + ", " + Shown(KeyName(key));
    if (!key.modulus_sha256.empty()) {
      const std::string& digest = key.modulus_sha256;
      line += ", key " + digest.substr(0, 8) + (look_.has_utf8 ? "…" : "...") +
              digest.substr(digest.size() - 6);
    }
  }
  out_ << line << '\n';
}

void Printer::PrintItems() {
  size_t width = 0;
  for (const Item& item : report_.items) {
    width = std::max(width, Columns(Shown(NameOf(item))));
  }
  width = std::min(width, kMostName);
  for (size_t i = 0; i < report_.items.size(); ++i) {
    PrintItem(report_.items[i], width);
    if (HasCure(i)) PrintWrapped(report_.items[i].reason.cause->cure, 6);
  }
}

void Printer::PrintItem(const Item& item, size_t width) {
  const std::string name = Shown(NameOf(item));
  const std::string gap(width + 2 - std::min(width, Columns(name)), ' ');
  const bool is_looked_at = report_.verdict != Verdict::kNotLookedAt;
  const std::string text =
      "  " + std::string(Mark(item.state)) + " " + name + gap + Shown(TextOf(item, is_looked_at));
  out_ << Coloured(text, item.state == ItemState::kRefused ? Colour::kRed : Colour::kPlain, look_)
       << '\n';
}

// What to do is said once for neighbours that need the same, and not where it follows from another.
bool Printer::HasCure(size_t i) const {
  const Item& item = report_.items[i];
  const Cause* const why = item.reason.cause;
  if (why == nullptr || item.state == ItemState::kNothing) return false;
  if (why == &cause::kPackageRefused || why == &cause::kNotReached) return false;
  return i + 1 == report_.items.size() || report_.items[i + 1].reason.cause != why;
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
  if (!report_.signer) return;
  out_ << "  signer\n";
  PrintCertificate(*report_.signer);
  std::string schemes;
  for (const std::string& scheme : report_.schemes) {
    schemes += (schemes.empty() ? "" : ", ") + scheme;
  }
  out_ << "    schemes: " << schemes << '\n';
  PrintProtection();
}

// The labels are those of apksigner, so that one search finds both.
void Printer::PrintCertificate(const CertificateFacts& certificate) {
  const PublicKey& key = certificate.key;
  out_ << "    certificate DN: " << Shown(certificate.subject) << '\n'
       << "    certificate SHA-256 digest: " << certificate.sha256 << '\n'
       << "    key algorithm: " << Shown(key.algorithm) << '\n'
       << "    key size (bits): " << key.bits << '\n'
       << "    public key SHA-256 digest: " << key.sha256 << '\n';
  if (key.modulus_sha256.empty()) return;
  out_ << "    modulus SHA-256 digest: " << key.modulus_sha256
       << " (of the modulus alone: what the kernel gets)\n";
}

void Printer::PrintNewerSigners() {
  for (const NewerSignerFacts& signer : report_.newer) {
    out_ << "  signer of " << signer.scheme << '\n';
    PrintCertificate(signer.certificate);
  }
}

void Printer::PrintProtection() {
  const Protection& all = report_.protection;
  out_ << "    protects: " << ShareText(all.verified) << " verified, " << ShareText(all.vouched)
       << " listed and not checked, " << ShareText(all.unlisted) << " not listed\n";
}

void Printer::PrintUnlisted() {
  for (const std::string& name : report_.protection.unlisted_names) {
    out_ << "      not listed: " << Shown(name) << '\n';
  }
}

void Printer::PrintChain() {
  for (const Link& link : report_.chain) {
    const ItemState state = link.state == LinkState::kHolds    ? ItemState::kDone
                            : link.state == LinkState::kBroken ? ItemState::kRefused
                                                               : ItemState::kNothing;
    const std::string text = link.state == LinkState::kNotReached ? "not reached" : link.text;
    out_ << "    " << Mark(state) << " " << link.name << ": " << Shown(text) << '\n';
  }
}

const char* Printer::Mark(ItemState state) const {
  switch (state) {
    case ItemState::kDone:
      return look_.has_utf8 ? "✓" : "+";
    case ItemState::kRefused:
      return look_.has_utf8 ? "✗" : "x";
    case ItemState::kAbsent:
    case ItemState::kNothing:
      return look_.has_utf8 ? "–" : "-";
  }
  return "";
}

std::string NameOf(const Item& item) { return item.kind == ItemKind::kKey ? "key" : item.name; }

std::string TextOf(const Item& item, bool is_looked_at) {
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
  return (is_looked_at ? "not signed: " : "not looked at: ") + reason;
}

// Such as "RSA-2048".
std::string KeyName(const PublicKey& key) {
  return key.bits == 0 ? key.algorithm : key.algorithm + "-" + std::to_string(key.bits);
}

std::string ShareText(const Share& share) {
  return std::to_string(share.entries) + (share.entries == 1 ? " entry (" : " entries (") +
         std::to_string(share.bytes) + (share.bytes == 1 ? " byte)" : " bytes)");
}

}  // namespace
