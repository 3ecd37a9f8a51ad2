#include "simulator/program/verdict.h"

#include <cstring>

#include "sign/libzu.h"
#include "simulator/phone/text.h"

namespace {

using nlohmann::json;

constexpr char kToolTag[] = "ApkToolkit";
constexpr int kErrorPriority = 6;

void JudgeStart(const json& event, Verdict* verdict);
void JudgeSign(const json& event, Verdict* verdict);
void JudgeVerify(const json& event, Verdict* verdict);
void JudgeRegister(const json& event, Verdict* verdict);
void JudgeLog(const json& event, Verdict* verdict);
void JudgeExit(const json& event, Verdict* verdict);

// Who judges which event.
constexpr struct {
  const char* kind;
  void (*judge)(const json& event, Verdict* verdict);
} kJudges[] = {{"start", JudgeStart},       {"sign", JudgeSign}, {"verify", JudgeVerify},
               {"register", JudgeRegister}, {"log", JudgeLog},   {"exit", JudgeExit}};

}  // namespace

Verdict Judge(const Events& events) {
  Verdict verdict;
  bool has_log = false;
  for (const json& event : events) {
    const std::string kind = TextOf(event, "event");
    has_log = has_log || kind == "log";
    for (const auto& row : kJudges) {
      if (kind == row.kind) row.judge(event, &verdict);
    }
  }
  if (verdict.reasons.empty() && verdict.own == Signed::kNot) {
    verdict.reasons.push_back(
        has_log
            ? "nobody asked the kernel to sign it"
            : "the tool left it alone: it cannot be opened, or lies on a read-only file system");
  }
  return verdict;
}

int64_t NumberOf(const json& event, const char* key) {
  const auto value = event.find(key);
  return value != event.end() && value->is_number_integer() ? value->get<int64_t>() : 0;
}

std::string TextOf(const json& event, const char* key) {
  const auto value = event.find(key);
  return value != event.end() && value->is_string() ? DecodeText(value->get<std::string>()) : "";
}

std::string DescribeErrno(int64_t error) {
  const char* const name = strerrorname_np(static_cast<int>(error));
  if (name == nullptr) return "error " + std::to_string(error);
  return std::string(name) + ": " + strerror(static_cast<int>(error));
}

namespace {

void JudgeStart(const json& event, Verdict* verdict) { verdict->path = TextOf(event, "path"); }

void JudgeSign(const json& event, Verdict* verdict) {
  const std::string signed_path = TextOf(event, "path");
  if (NumberOf(event, "result") != 0) {
    verdict->reasons.push_back("the kernel did not sign " + signed_path + " (" +
                               DescribeErrno(NumberOf(event, "errno")) + ")");
  } else if (signed_path != verdict->path) {
    ++verdict->libraries;
  } else {
    constexpr char kNoData[] = "0000";
    const bool has_data = TextOf(event, "payload") != kNoData;
    verdict->own = has_data ? Signed::kAsPackage : Signed::kAsJar;
  }
}

// Only a plain JAR is verified. What the tool said before, about what it lacks of a package, is no
// failure then: the kernel's own answer is what counts.
void JudgeVerify(const json& event, Verdict* verdict) {
  if (TextOf(event, "path") != verdict->path) return;
  verdict->reasons.clear();
  if (NumberOf(event, "result") == 0) return;
  verdict->reasons.push_back("the kernel does not trust it (" +
                             DescribeErrno(NumberOf(event, "errno")) + ")");
}

void JudgeRegister(const json& event, Verdict* verdict) {
  const int result = static_cast<int>(NumberOf(event, "result"));
  if (IsZuSuccess(result)) {
    ++verdict->keys;
  } else {
    verdict->reasons.push_back("libzu did not register " + TextOf(event, "name") + " (result " +
                               std::to_string(result) + ")");
  }
}

void JudgeLog(const json& event, Verdict* verdict) {
  if (NumberOf(event, "priority") < kErrorPriority || TextOf(event, "tag") != kToolTag) return;
  std::string text = TextOf(event, "text");
  if (!text.empty() && text.back() == '\n') text.pop_back();
  verdict->reasons.push_back(text);
}

void JudgeExit(const json& event, Verdict* verdict) {
  if (event.contains("signal")) {
    verdict->reasons.push_back("the tool was killed by signal " +
                               std::to_string(NumberOf(event, "signal")));
  } else if (NumberOf(event, "status") != 0) {
    verdict->reasons.push_back("the tool ended with status " +
                               std::to_string(NumberOf(event, "status")));
  }
}

}  // namespace
