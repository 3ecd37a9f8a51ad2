#include "simulator/installer/judgement.h"

#include <nlohmann/json.hpp>
#include <optional>

namespace simulator {

namespace {

using Json = nlohmann::json;

Judgement NoAnswer(const std::string& why);
bool ReadRange(const Json& json, RangeJudgement* range);
bool IsNext(const LevelRange& levels, const std::vector<RangeJudgement>& before);
bool ReadIssues(const Json& json, const char* key, std::vector<InstallerIssue>* issues);
bool ReadTexts(const Json& json, const char* key, std::vector<std::string>* texts);
bool ReadSigners(const Json& json, std::vector<InstallerSigner>* signers);
std::optional<std::string> FromHex(const std::string& digits);
std::string TextOf(const Json& json, const char* key);
const Json* ListOf(const Json& json, const char* key);

}  // namespace

Judgement ParseJudgement(const std::string& line) {
  const Json answer = Json::parse(line, nullptr, false);
  if (!answer.is_object()) return NoAnswer("its answer is malformed");
  const std::string failure = TextOf(answer, "failure");
  if (!failure.empty()) return NoAnswer(failure);
  const Json* const ranges = ListOf(answer, "ranges");
  if (ranges == nullptr || ranges->empty()) return NoAnswer("its answer is malformed");
  Judgement judgement;
  judgement.state = Judgement::State::kJudged;
  for (const Json& each : *ranges) {
    RangeJudgement range;
    if (!ReadRange(each, &range) || !IsNext(range.levels, judgement.ranges)) {
      return NoAnswer("its answer is malformed");
    }
    for (const InstallerSigner& signer : range.signers) {
      if (!signer.certificate.sha256.empty()) continue;
      return NoAnswer("the crypto library does not read the certificate of the " + signer.scheme +
                      " signer");
    }
    judgement.ranges.push_back(std::move(range));
  }
  return judgement;
}

namespace {

Judgement NoAnswer(const std::string& why) { return {Judgement::State::kGaveUp, why, {}}; }

// Returns false if the range is malformed. A verified range must have a signer and no error. Any
// other range must have an error.
bool ReadRange(const Json& json, RangeJudgement* range) {
  if (!json.is_object()) return false;
  const auto first = json.find("first"), last = json.find("last"), verified = json.find("verified");
  if (first == json.end() || last == json.end() || verified == json.end()) return false;
  if (!first->is_number_integer() || !last->is_number_integer()) return false;
  if (!verified->is_boolean()) return false;
  range->levels = {first->get<int>(), last->get<int>()};
  range->is_verified = verified->get<bool>();
  return ReadTexts(json, "schemes", &range->schemes) && ReadSigners(json, &range->signers) &&
         ReadIssues(json, "errors", &range->errors) &&
         ReadIssues(json, "warnings", &range->warnings) &&
         range->is_verified == range->errors.empty() &&
         (!range->is_verified || !range->signers.empty());
}

// The ranges must not overlap or leave a gap. The report would otherwise name phones of an API
// level twice, or not at all.
bool IsNext(const LevelRange& levels, const std::vector<RangeJudgement>& before) {
  return levels.first > 0 && levels.first <= levels.last &&
         (before.empty() || before.back().levels.last == levels.first - 1);
}

bool ReadIssues(const Json& json, const char* key, std::vector<InstallerIssue>* issues) {
  const Json* const list = ListOf(json, key);
  if (list == nullptr) return false;
  for (const Json& each : *list) {
    InstallerIssue issue = {TextOf(each, "issue"), {}, TextOf(each, "text")};
    if (issue.name.empty() || !ReadTexts(each, "parameters", &issue.parameters)) return false;
    issues->push_back(std::move(issue));
  }
  return true;
}

bool ReadTexts(const Json& json, const char* key, std::vector<std::string>* texts) {
  const Json* const list = ListOf(json, key);
  if (list == nullptr) return false;
  for (const Json& each : *list) {
    if (!each.is_string()) return false;
    texts->push_back(each.get<std::string>());
  }
  return true;
}

bool ReadSigners(const Json& json, std::vector<InstallerSigner>* signers) {
  const Json* const list = ListOf(json, "signers");
  if (list == nullptr) return false;
  for (const Json& each : *list) {
    const auto der = FromHex(TextOf(each, "certificate"));
    if (!der || der->empty()) return false;
    signers->push_back(
        {TextOf(each, "scheme"), ParseCertificate(*der).value_or(CertificateFacts())});
  }
  return true;
}

// Returns none if the text is malformed. An odd number of digits is refused, because the last digit
// is then paired with the text's terminating NUL, which is not a digit.
std::optional<std::string> FromHex(const std::string& digits) {
  constexpr char kDigits[] = "0123456789abcdef";
  std::string bytes;
  for (size_t i = 0; i < digits.size(); i += 2) {
    const size_t high = std::string_view(kDigits).find(digits[i]);
    const size_t low = std::string_view(kDigits).find(digits[i + 1]);
    if (high == std::string::npos || low == std::string::npos) return {};
    bytes += static_cast<char>(high << 4U | low);
  }
  return bytes;
}

// Returns an empty text if `json` is not an object, or has no text under `key`.
std::string TextOf(const Json& json, const char* key) {
  if (!json.is_object()) return {};
  const auto text = json.find(key);
  return text != json.end() && text->is_string() ? text->get<std::string>() : std::string();
}

// Returns null if `json` is not an object, or has no list under `key`.
const Json* ListOf(const Json& json, const char* key) {
  if (!json.is_object()) return nullptr;
  const auto list = json.find(key);
  return list != json.end() && list->is_array() ? &*list : nullptr;
}

}  // namespace

}  // namespace simulator
