#include "simulator/show/sarif.h"

#include <algorithm>

#include "simulator/phone/text.h"
#include "simulator/show/terminal.h"
#include "simulator/show/words.h"

namespace simulator {

namespace {

constexpr char kSchema[] =
    "https://docs.oasis-open.org/sarif/sarif/v2.1.0/errata01/os/schemas/sarif-schema-2.1.0.json";
constexpr char kError[] = "error";
constexpr char kWarning[] = "warning";
constexpr int kIndent = 2;

bool IsRefused(const Item& item) {
  return item.state == ItemState::kRefused && item.reason.cause != nullptr;
}

bool Follows(const Item& item) { return item.reason.cause->severity == Severity::kFollows; }

// A SARIF message: {"text": …}.
nlohmann::ordered_json Message(const std::string& text) {
  return {{"text", Printable(text, {false, true})}};
}

// Returns the JSON text of `value`. A byte that is not UTF-8 becomes U+FFFD.
std::string TextOf(const nlohmann::ordered_json& value, int indent = -1) {
  return value.dump(indent, ' ', false, nlohmann::ordered_json::error_handler_t::replace);
}

}  // namespace

void Sarif::Add(const Report& report) {
  const size_t index = AddArtifact(report);
  const Json location = {{"physicalLocation",
                          {{"artifactLocation", {{"uri", UriOf(report.file)}, {"index", index}}}}}};
  // A refused item of severity kFollows gets no result if the report also has a refused item of
  // another severity. The result of that other item says what to fix. If all refused items have the
  // severity kFollows, each gets a result, because a refused file must have at least one result.
  const bool has_origin =
      std::any_of(report.items.begin(), report.items.end(),
                  [](const Item& item) { return IsRefused(item) && !Follows(item); });
  for (const Item& item : report.items) {
    if (!IsRefused(item) || (has_origin && Follows(item))) continue;
    const std::string text = NameOf(item) + ": " + OutcomeOf(item, report.verdict);
    AddResult(*item.reason.cause, kError, text, location);
  }
  for (const Reason& warning : report.warnings) {
    AddResult(*warning.cause, kWarning, warning.Text(), location);
  }
  const std::string missing = MissingInstaller(report);
  if (!missing.empty() && !is_installer_missing_) {
    is_installer_missing_ = true;
    notifications_.push_back({{"level", kWarning}, {"message", Message(missing)}});
  }
  const ExitStatus status = StatusOf(report.verdict);
  if (status != kNotLookedAt && status != kCannotSimulate) return;
  is_successful_ = false;
  const std::string text = WordsOf(report.verdict).word + (": " + DecisiveReason(report));
  notifications_.push_back(
      {{"level", kError}, {"message", Message(text)}, {"locations", Json::array({location})}});
}

void Sarif::AddProblem(const std::string& problem) {
  is_successful_ = false;
  notifications_.push_back({{"level", kError}, {"message", Message(problem)}});
}

std::string Sarif::Log() const {
  Json invocation = {{"executionSuccessful", is_successful_}};
  if (!notifications_.empty()) invocation["toolExecutionNotifications"] = notifications_;
  const Json driver = {
      {"name", "apktoolkit-sim"}, {"version", APKTOOLKIT_VERSION}, {"rules", rules_}};
  const Json run = {{"tool", {{"driver", driver}}},
                    {"invocations", Json::array({invocation})},
                    {"artifacts", artifacts_},
                    {"results", results_}};
  const Json log = {{"$schema", kSchema}, {"version", "2.1.0"}, {"runs", Json::array({run})}};
  return TextOf(log, kIndent) + "\n";
}

// Adds an artifact for the file, unless the log already has an artifact with the same path and
// digest. Returns the index of the file's artifact.
size_t Sarif::AddArtifact(const Report& report) {
  Json artifact = {{"location", {{"uri", UriOf(report.file)}}},
                   {"roles", Json::array({"analysisTarget"})}};
  if (!report.file_sha256.empty()) {
    artifact["length"] = report.file_size;
    artifact["hashes"] = {{"sha-256", report.file_sha256}};
  }
  const auto& [place, is_new] = artifact_of_.emplace(TextOf(artifact), artifacts_.size());
  if (is_new) artifacts_.push_back(std::move(artifact));
  return place->second;
}

void Sarif::AddResult(const Cause& cause, const char* level, const std::string& text,
                      const Json& location) {
  const size_t rule = RuleOf(cause, level);
  results_.push_back({{"ruleId", cause.code},
                      {"ruleIndex", rule},
                      {"level", level},
                      {"message", Message(text)},
                      {"locations", Json::array({location})}});
}

// The index of the cause's rule. Adds the rule at its first use.
size_t Sarif::RuleOf(const Cause& cause, const char* level) {
  const auto& [place, is_new] = rule_of_.emplace(cause.code, rules_.size());
  if (is_new) {
    rules_.push_back({{"id", cause.code},
                      {"shortDescription", Message(Reason{&cause, "…"}.Text())},
                      {"help", Message(cause.cure)},
                      {"defaultConfiguration", {{"level", level}}}});
  }
  return place->second;
}

// All characters except unreserved characters and slashes are percent-encoded, so that no part of
// the path looks like a scheme, a query or a fragment (RFC 3986 §2.1, §4.2).
std::string UriOf(std::string_view path) {
  constexpr std::string_view kPlain =
      "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789-._~/";
  std::string uri = !path.empty() && path[0] == '/' ? "file://" : "";
  for (const char c : path) {
    const bool is_plain = kPlain.find(c) != std::string_view::npos;
    uri += is_plain ? std::string(1, c) : "%" + HexText({&c, 1});
  }
  return uri;
}

}  // namespace simulator
