// Uses apksig's judgement of the package for the report: adds an item, writes texts, and finds a
// signer other than the JAR signer.
#include <algorithm>

#include "simulator/verdict/parts.h"
#include "simulator/verdict/wording.h"

namespace simulator {

namespace {

std::string LevelsText(const std::vector<RangeJudgement>& ranges, bool is_verified);
std::string WhyRefusedByInstaller(const InstallerIssue& issue);

}  // namespace

void AddInstallerItem(const Judgement& judgement, const JudgeOptions& options,
                      std::vector<Item>* items) {
  const auto add = [&](const Reason& reason) {
    items->push_back(NotDone(ItemKind::kInstaller, "installer", reason, options));
  };
  if (judgement.state == Judgement::State::kGaveUp) add({&cause::kInstallerGaveUp, judgement.why});
  const auto is_refused = [](const RangeJudgement& range) { return !range.is_verified; };
  const auto refused = std::find_if(judgement.ranges.begin(), judgement.ranges.end(), is_refused);
  if (refused == judgement.ranges.end()) return;
  const std::string why = WhyRefusedByInstaller(refused->errors[0]);
  const std::string takers = LevelsText(judgement.ranges, true);
  if (takers.empty()) return add({&cause::kNotInstallable, why});
  add({&cause::kNotInstallableOnSome, "those of " + takers + " do, but those of " +
                                          LevelsText(judgement.ranges, false) +
                                          " refuse it: " + why});
}

std::string LevelText(const LevelRange& levels) {
  const std::string first = "API " + std::to_string(levels.first);
  if (levels.last == kNewestLevel) return first + " and later";
  return levels.first == levels.last ? first : first + " to " + std::to_string(levels.last);
}

std::string TakersText(const Judgement& judgement) {
  if (judgement.ranges.empty() || !LevelsText(judgement.ranges, false).empty()) return {};
  std::vector<std::string> schemes;
  for (const RangeJudgement& range : judgement.ranges) {
    for (const std::string& scheme : range.schemes) {
      const bool is_known = std::find(schemes.begin(), schemes.end(), scheme) != schemes.end();
      if (!is_known) schemes.push_back(scheme);
    }
  }
  return "phones of " + LevelsText(judgement.ranges, true) + " install it, verified by " +
         Joined(schemes);
}

// A phone verifies only one of the package's signature schemes: the newest that the phone knows.
// Therefore, for each range of API levels, only the signers of the newest verified scheme are
// compared with the JAR signer. The result is for the newest phones that install the package, so
// each verified range replaces the result of the earlier ranges.
const CertificateFacts* OtherSigner(const Judgement& judgement, const Report& report) {
  const CertificateFacts* other = nullptr;
  for (const RangeJudgement& range : judgement.ranges) {
    if (!range.is_verified) continue;
    other = nullptr;
    for (const InstallerSigner& signer : range.signers) {
      const bool is_newest = signer.scheme == range.signers.back().scheme;
      if (is_newest && !IsJarSigner(signer.certificate.key, report)) other = &signer.certificate;
    }
  }
  return other;
}

namespace {

// The API levels of the phones that install the package. If `is_verified` is false, the API levels
// of the phones that refuse the package. The text continues a text that ends in "of": (phones of)
// "API 27 to 29", (phones of) "API 27 and those of API 30 and later".
std::string LevelsText(const std::vector<RangeJudgement>& ranges, bool is_verified) {
  std::vector<LevelRange> levels;
  for (const RangeJudgement& range : ranges) {
    if (range.is_verified != is_verified) continue;
    const bool follows = !levels.empty() && levels.back().last + 1 == range.levels.first;
    if (follows) {
      levels.back().last = range.levels.last;
    } else {
      levels.push_back(range.levels);
    }
  }
  std::string text;
  for (const LevelRange& each : levels) {
    text += (text.empty() ? "" : " and those of ") + LevelText(each);
  }
  return text;
}

// Sentences for the most frequent errors of apksig. "%s" is replaced by the issue's parameter with
// the index `parameter`, such as an entry's name. apksig's own sentence reports all other errors,
// and errors that lack the parameter for "%s".
constexpr struct {
  const char* issue;
  size_t parameter;
  const char* words;
} kFaults[] = {
    {"JAR_SIG_ZIP_ENTRY_DIGEST_DID_NOT_VERIFY", 0, "%s was changed after it was signed"},
    {"JAR_SIG_MISSING_ZIP_ENTRY_REFERENCED_IN_MANIFEST", 0,
     "%s was removed after it was signed: the manifest still lists it"},
    {"JAR_SIG_NO_ZIP_ENTRY_DIGEST_IN_MANIFEST", 0,
     "%s was added after signing: the manifest does not list it"},
    {"JAR_SIG_ZIP_ENTRY_NOT_SIGNED", 0, "%s is not signed"},
    {"JAR_SIG_DUPLICATE_ZIP_ENTRY", 0, "%s is in it more than once"},
    {"JAR_SIG_MISSING_APK_SIG_REFERENCED", 2,
     "it was also signed with %s, but that signature is missing"},
    {"MIN_SIG_SCHEME_FOR_TARGET_SDK_NOT_MET", 0,
     "an app that targets API %s must be signed with v2 or later"},
    {"V2_SIG_APK_DIGEST_DID_NOT_VERIFY", SIZE_MAX, "it was changed after it was signed with v2"},
    {"V3_SIG_APK_DIGEST_DID_NOT_VERIFY", SIZE_MAX, "it was changed after it was signed with v3"},
};

std::string WhyRefusedByInstaller(const InstallerIssue& issue) {
  for (const auto& fault : kFaults) {
    if (issue.name != fault.issue) continue;
    std::string words = fault.words;
    const size_t at = words.find("%s");
    if (at == std::string::npos) return words;
    if (fault.parameter >= issue.parameters.size()) break;
    return words.replace(at, 2, issue.parameters[fault.parameter]);
  }
  return issue.text + " (" + issue.name + ")";
}

}  // namespace

}  // namespace simulator
