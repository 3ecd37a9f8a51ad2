#include "simulator/show/timeline.h"

#include <algorithm>
#include <iomanip>
#include <sstream>

#include "sign/libzu.h"

namespace simulator {

namespace {

using nlohmann::json;

using Line = TimelineLine;

Line Describe(const json& event, const std::string& directory);
Line DescribeLog(const json& event);
Line DescribeIntegrity(const json& event);
Line DescribeAnswer(const json& event, const std::string& directory);
Line DescribeRegister(const json& event);
Line DescribeExit(const json& event);
std::string ExplainPayload(const std::string& hex);
std::string WithoutEnd(std::string text);
void PrintLine(int number, const Line& line, const Look& look, std::ostream& out);

}  // namespace

std::vector<TimelineLine> MakeTimeline(const Events& events, const std::string& path) {
  const std::string directory = path.substr(0, path.rfind('/') + 1);
  std::vector<TimelineLine> lines;
  for (auto event = events.begin(), next = event; event != events.end(); event = next) {
    next = std::find_if(event, events.end(), [event](const json& e) { return e != *event; });
    if (!IsOfTheRun(*event)) continue;
    lines.push_back(Describe(*event, directory));
    if (next - event > 1) lines.back().text += " (" + std::to_string(next - event) + " times)";
  }
  return lines;
}

void PrintTimeline(const std::vector<TimelineLine>& lines, const Look& look, std::ostream& out) {
  int number = 0;
  for (const TimelineLine& line : lines) PrintLine(++number, line, look, out);
}

namespace {

// In lines of the events "sign" and "verify", a path below `directory` is shown without
// `directory`.
Line Describe(const json& event, const std::string& directory) {
  const std::string kind = TextOf(event, "event");
  if (kind == "log") return DescribeLog(event);
  if (kind == "integrity") return DescribeIntegrity(event);
  if (kind == "sign" || kind == "verify") return DescribeAnswer(event, directory);
  if (kind == "register") return DescribeRegister(event);
  if (kind == "stdout") return {kind, WithoutEnd(TextOf(event, "text")), "", false};
  if (kind == "exit") return DescribeExit(event);
  return {kind, event.dump(), "", false};
}

Line DescribeLog(const json& event) {
  const int64_t priority = NumberOf(event, "priority");
  const std::string tag = TextOf(event, "tag");
  const std::string text = WithoutEnd(TextOf(event, "text"));
  const char* const what = priority >= 6 ? "error" : priority == 5 ? "warning" : "log";
  return {what, tag == "ApkToolkit" ? text : "[" + tag + "] " + text, "", priority >= 6};
}

Line DescribeIntegrity(const json& event) {
  const int64_t pid = NumberOf(event, "pid");
  const std::string whose =
      pid == 0 ? "the tool's own value" : "the value of task " + std::to_string(pid);
  if (!event.contains("text") || event["text"].is_null()) {
    return {"integrity", "there is no file for " + whose, "", true};
  }
  const std::string text = TextOf(event, "text");
  const char* const remark = text == "ffffffff" ? ", not settled yet" : "";
  return {"integrity", whose + " reads " + text + remark, "", false};
}

// The kernel's answer to a request to sign or to verify.
Line DescribeAnswer(const json& event, const std::string& directory) {
  const std::string kind = TextOf(event, "event");
  std::string path = TextOf(event, "path");
  if (path.compare(0, directory.size(), directory) == 0) path.erase(0, directory.size());
  const bool is_failure = !IsSuccess(event);
  const std::string answer = is_failure       ? DescribeErrno(NumberOf(event, "errno"))
                             : kind == "sign" ? "signed"
                                              : "trusted";
  const std::string detail = kind == "sign" ? ExplainPayload(TextOf(event, "payload")) : "";
  return {kind, path + ": " + answer, detail, is_failure};
}

// The payload starts with the length of its data, in two bytes, the low byte first.
std::string ExplainPayload(const std::string& hex) {
  constexpr size_t kLengthDigits = 4;
  constexpr size_t kSha256Digits = 64;
  if (hex.size() < kLengthDigits) return "no readable payload";
  const std::string data = hex.substr(kLengthDigits);
  if (data.empty()) return "payload: length 0, no data";
  const std::string length = "payload: length " + std::to_string(data.size() / 2) + ", ";
  const bool is_digest = data.size() == kSha256Digits;
  return length + (is_digest ? "SHA-256 digest of the signer's key " : "") + data;
}

Line DescribeRegister(const json& event) {
  constexpr size_t kShownDigits = 32;
  const int result = static_cast<int>(NumberOf(event, "result"));
  const std::string data = TextOf(event, "data");
  const std::string rest = data.size() > kShownDigits ? "..." : "";
  return {
      "register", TextOf(event, "name") + ": libzu answers " + std::to_string(result),
      "key: length " + std::to_string(data.size() / 2) + ", " + data.substr(0, kShownDigits) + rest,
      !IsZuSuccess(result)};
}

Line DescribeExit(const json& event) {
  if (event.contains("signal")) {
    return {"exit", "killed by signal " + std::to_string(NumberOf(event, "signal")), "", true};
  }
  const int64_t status = NumberOf(event, "status");
  return {"exit", "status " + std::to_string(status), "", status != 0};
}

std::string WithoutEnd(std::string text) {
  if (!text.empty() && text.back() == '\n') text.pop_back();
  return text;
}

// An event of an unknown kind can have a name of any length. The line shows the whole name.
void PrintLine(int number, const Line& line, const Look& look, std::ostream& out) {
  constexpr size_t kWhatColumns = 9;
  const std::string what = Printable(line.what, look);
  const size_t missing = kWhatColumns - std::min(Columns(what), kWhatColumns);
  std::ostringstream head;
  head << std::setw(4) << number << "  " << what << std::string(missing + 2, ' ');
  const Colour colour = line.is_failure ? Colour::kRed : Colour::kPlain;
  out << Coloured(head.str() + Printable(line.text, look), colour, look) << '\n';
  if (line.detail.empty()) return;
  out << std::string(Columns(head.str()), ' ') << Printable(line.detail, look) << '\n';
}

}  // namespace

}  // namespace simulator
