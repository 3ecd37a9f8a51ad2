#include "simulator/verdict/gate.h"

#include <algorithm>
#include <set>
#include <tuple>

#include "simulator/verdict/parts.h"
#include "simulator/verdict/wording.h"

namespace simulator {

namespace {

using Signers = std::vector<CertificateFacts>;

void Refuse(ItemKind kind, const char* name, const Reason& reason, Report* report);
CertificateFacts JarSigner(const Report& report);
std::vector<const CertificateFacts*> NewestSigners(const RangeJudgement& range);
Signers InstalledSigners(const Report& report);
bool IsJudged(const Report& report);
bool HasForgeableKey(const Report& report);
bool IsOneOf(const std::vector<std::string>& digests, const CertificateFacts& signer);
bool AreSameSigner(const CertificateFacts& one, const CertificateFacts& other);
std::string SignersText(const Signers& signers);
std::string DigestsText(const CertificateFacts& signer);

}  // namespace

std::optional<std::string> ReadDigest(const std::string& text) {
  constexpr size_t kDigits = 64;
  const bool has_colons = text.size() == kDigits + kDigits / 2 - 1;
  std::string digest;
  for (size_t i = 0; i < text.size(); ++i) {
    const bool is_colon = has_colons && i % 3 == 2;
    if (is_colon != (text[i] == ':')) return {};
    if (!is_colon) digest += static_cast<char>(tolower(static_cast<unsigned char>(text[i])));
  }
  const bool is_hex = digest.find_first_not_of("0123456789abcdef") == std::string::npos;
  if (digest.size() != kDigits || !is_hex) return {};
  return digest;
}

void Gate::Judge(Report* report) {
  const bool is_looked_at =
      report->verdict != Verdict::kNotLookedAt && report->verdict != Verdict::kNotSimulated;
  if (!is_looked_at) return;
  const bool is_good = StatusOf(report->verdict) == kAllSigned;
  const bool is_other_signers = report->verdict == Verdict::kOtherSigner;
  if (!options_.signers.empty()) DemandExpectedSigner(report);
  if (report->items[0].is_verified) DemandOneSigner(report);
  if (options_.refuses_warnings && is_good) DemandNoWarnings(is_other_signers, report);
}

// The signer is known only if the tool verified the signature. Otherwise the file only claims a
// signer.
void Gate::DemandExpectedSigner(Report* report) const {
  std::string expected;
  for (const std::string& digest : options_.signers) {
    expected += (expected.empty() ? "expected " : " or ") + digest;
  }
  const auto refuse = [&](const Reason& reason) {
    Refuse(ItemKind::kSigner, "signer", reason, report);
  };
  const Item& own = report->items[0];
  if (own.kind == ItemKind::kJar && own.state == ItemState::kDone) {
    return refuse({&cause::kSignerNone, expected});
  }
  if (!own.is_verified) return refuse({&cause::kSignerNotVerified, expected});
  const CertificateFacts jar = JarSigner(*report);
  if (HasForgeableKey(*report)) {
    refuse({&cause::kSignerUnexpected,
            expected + ", and anyone can sign with the key of " + DigestsText(jar)});
  } else if (!IsOneOf(options_.signers, jar)) {
    refuse({&cause::kSignerUnexpected,
            expected + ", and the JAR signature is by " + DigestsText(jar)});
  }
  std::set<std::string> told;
  const auto demand = [&](const CertificateFacts& signer, const std::string& what) {
    if (IsOneOf(options_.signers, signer) || AreSameSigner(signer, jar)) return;
    if (!told.insert(signer.sha256).second) return;
    refuse({&cause::kSignerUnexpected, expected + ", and " + what + DigestsText(signer)});
  };
  for (const RangeJudgement& range : report->installer.ranges) {
    for (const CertificateFacts* const signer : NewestSigners(range)) {
      demand(*signer, "phones install it as signed by ");
    }
  }
  if (IsJudged(*report)) return;
  for (const NewerSignerFacts& signer : report->newer) {
    demand(signer.certificate, "its " + signer.scheme + " signature names this signer: ");
  }
}

void Gate::DemandOneSigner(Report* report) {
  if (report->package_name.empty()) return;
  const First own = {report->file, JarSigner(*report), InstalledSigners(*report)};
  const auto& [place, is_first] = first_.emplace(report->package_name, own);
  if (is_first) return;
  const First& first = place->second;
  const auto refuse = [&](const Signers& one, const Signers& other) {
    Refuse(
        ItemKind::kSigner, "signer",
        {&cause::kSignerDiffers, first.file + " of " + report->package_name + " is by " +
                                     SignersText(one) + ", and this one by " + SignersText(other)},
        report);
  };
  if (!AreSameSigner(first.jar, own.jar)) return refuse({first.jar}, {own.jar});
  if (first.installed.empty() || own.installed.empty()) return;
  const bool are_same = std::equal(first.installed.begin(), first.installed.end(),
                                   own.installed.begin(), own.installed.end(), AreSameSigner);
  if (!are_same) refuse(first.installed, own.installed);
}

void Gate::DemandNoWarnings(bool is_other_signers, Report* report) {
  std::vector<std::string> texts;
  if (is_other_signers) {
    const CertificateFacts* const other = OtherSigner(report->installer, *report);
    texts.push_back(std::string("phones install it as signed by another signer") +
                    (other == nullptr ? "" : ", " + other->subject));
  }
  for (const Reason& warning : report->warnings) texts.push_back(warning.Text());
  if (texts.empty()) return;
  const size_t others = texts.size() - 1;
  const std::string more = others == 0 ? "" : " (and " + std::to_string(others) + " more)";
  Refuse(ItemKind::kWarnings, "warnings", {&cause::kWarningsRefused, texts[0] + more}, report);
}

namespace {

void Refuse(ItemKind kind, const char* name, const Reason& reason, Report* report) {
  report->items.push_back(NotDone(kind, name, reason, {}));
  if (StatusOf(report->verdict) == kAllSigned) report->verdict = Verdict::kNotAccepted;
}

// The JAR signer. key.modulus_sha256 is the digest that the kernel got, or that the tool would
// send. If the modulus of report.signer has this digest, the other facts are those of
// report.signer. Otherwise they are empty.
CertificateFacts JarSigner(const Report& report) {
  CertificateFacts signer;
  const std::string modulus = report.key ? report.key->sha256 : "";
  if (report.signer && report.signer->key.modulus_sha256 == modulus) signer = *report.signer;
  signer.key.modulus_sha256 = modulus;
  return signer;
}

// The signers of the newest scheme that phones of the range's API levels verify. Empty if these
// phones refuse the package.
std::vector<const CertificateFacts*> NewestSigners(const RangeJudgement& range) {
  std::vector<const CertificateFacts*> signers;
  if (!range.is_verified) return signers;
  for (const InstallerSigner& signer : range.signers) {
    if (signer.scheme == range.signers.back().scheme) signers.push_back(&signer.certificate);
  }
  return signers;
}

// The signers whom phones of at least one API level take as the package's signers, each once, in a
// fixed order. If the installer did not judge the package: the signers of the newest scheme after
// v1 in the file, or the JAR signer if the file has no such scheme.
Signers InstalledSigners(const Report& report) {
  Signers signers;
  for (const RangeJudgement& range : report.installer.ranges) {
    for (const CertificateFacts* const signer : NewestSigners(range)) signers.push_back(*signer);
  }
  if (!IsJudged(report)) {
    std::string newest;
    for (const NewerSignerFacts& signer : report.newer) newest = std::max(newest, signer.scheme);
    for (const NewerSignerFacts& signer : report.newer) {
      if (signer.scheme == newest) signers.push_back(signer.certificate);
    }
    if (newest.empty()) signers.push_back(JarSigner(report));
  }
  const auto comes_before = [](const CertificateFacts& one, const CertificateFacts& other) {
    return std::tie(one.sha256, one.key.modulus_sha256) <
           std::tie(other.sha256, other.key.modulus_sha256);
  };
  std::sort(signers.begin(), signers.end(), comes_before);
  signers.erase(std::unique(signers.begin(), signers.end(), AreSameSigner), signers.end());
  return signers;
}

bool IsJudged(const Report& report) { return report.installer.state == Judgement::State::kJudged; }

// Anyone can sign with a forgeable key, so the signature does not prove who signed.
bool HasForgeableKey(const Report& report) {
  return std::any_of(report.warnings.begin(), report.warnings.end(),
                     [](const Reason& warning) { return warning.cause == &cause::kForgeableKey; });
}

bool IsOneOf(const std::vector<std::string>& digests, const CertificateFacts& signer) {
  return std::any_of(digests.begin(), digests.end(), [&](const std::string& digest) {
    return digest == signer.sha256 || digest == signer.key.sha256 ||
           digest == signer.key.modulus_sha256;
  });
}

// The kernel identifies a signer by the key, and the installer identifies a signer by the
// certificate. Two signers are the same only if their keys and their certificates are equal.
bool AreSameSigner(const CertificateFacts& one, const CertificateFacts& other) {
  return one.sha256 == other.sha256 && one.key.modulus_sha256 == other.key.modulus_sha256;
}

std::string SignersText(const Signers& signers) {
  std::string text;
  for (const CertificateFacts& signer : signers) {
    text += (text.empty() ? "" : " and ") + DigestsText(signer);
  }
  return text;
}

std::string DigestsText(const CertificateFacts& signer) {
  std::string digests;
  const auto add = [&digests](const std::string& digest, const char* of) {
    if (digest.empty()) return;
    digests += (digests.empty() ? "SHA-256 digest of " : ", of ") + (of + (" " + digest));
  };
  add(signer.sha256, "the certificate");
  add(signer.key.sha256, "the public key");
  add(signer.key.modulus_sha256, "the modulus");
  return (signer.subject.empty() ? "a signer without a readable name" : signer.subject) + " (" +
         (digests.empty() ? "no digest is known" : digests) + ")";
}

}  // namespace

}  // namespace simulator
