#include "simulator/program/timeline.h"

#include <algorithm>
#include <cstdio>
#include <cstring>
#include <iomanip>
#include <string_view>

#include "sign/libzu.h"
#include "simulator/phone/text.h"

namespace {

using nlohmann::json;

constexpr char kRed[] = "\x1b[31m";
constexpr char kGreen[] = "\x1b[32m";
constexpr char kPlain[] = "\x1b[0m";

// How one event reads.
struct Line {
  std::string what;
  std::string text;
  std::string detail;  // for a line of its own below; mostly empty
  bool is_failure = false;
};

std::string Summary(const Verdict& verdict);
std::string Counted(int count, const char* one, const char* many);
bool IsShown(const json& event);
Line Describe(const json& event, const std::string& directory);
Line DescribeLog(const json& event);
Line DescribeIntegrity(const json& event);
Line DescribeAnswer(const json& event, const std::string& directory);
Line DescribeRegister(const json& event);
Line DescribeExit(const json& event);
std::string ExplainPayload(const std::string& hex);
std::string Printable(std::string_view bytes);

// Prints lines, in red where something failed.
class Printer {
 public:
  Printer(bool colours, std::ostream& out) : colours_(colours), out_(out) {}

  void Coloured(const char* colour, const std::string& text) {
    out_ << (colours_ ? colour : "") << text << (colours_ ? kPlain : "") << '\n';
  }
  void Numbered(int number, const Line& line) {
    char head[64];
    snprintf(head, sizeof(head), "%4d  %-9s  ", number, line.what.c_str());
    const std::string text = head + line.text;
    if (line.is_failure) {
      Coloured(kRed, text);
    } else {
      out_ << text << '\n';
    }
    if (!line.detail.empty()) out_ << std::string(strlen(head), ' ') << line.detail << '\n';
  }

 private:
  const bool colours_;
  std::ostream& out_;
};

}  // namespace

void PrintTimeline(const std::string& file, const Events& events, const Verdict& verdict,
                   bool colours, std::ostream& out) {
  Printer printer(colours, out);
  if (verdict.reasons.empty()) {
    printer.Coloured(kGreen, "SIGNED " + Printable(file) + ": " + Summary(verdict));
  } else {
    printer.Coloured(kRed, "REFUSED " + Printable(file) + ": " + Printable(verdict.reasons[0]));
  }
  const std::string directory = verdict.path.substr(0, verdict.path.rfind('/') + 1);
  int number = 0;
  for (auto event = events.begin(), next = event; event != events.end(); event = next) {
    next = std::find_if(event, events.end(), [event](const json& e) { return e != *event; });
    if (!IsShown(*event)) continue;
    Line line = Describe(*event, directory);
    if (next - event > 1) line.text += " (" + std::to_string(next - event) + " times)";
    printer.Numbered(++number, line);
  }
}

namespace {

// Such as "2 libraries, the package, 1 key registered".
std::string Summary(const Verdict& verdict) {
  std::string text = verdict.own == Signed::kAsJar ? "the JAR" : "the package";
  if (verdict.libraries > 0)
    text = Counted(verdict.libraries, "library", "libraries") + ", " + text;
  if (verdict.keys > 0) text += ", " + Counted(verdict.keys, "key", "keys") + " registered";
  return text;
}

std::string Counted(int count, const char* one, const char* many) {
  return std::to_string(count) + " " + (count == 1 ? one : many);
}

// The others are there for the journal's own sake.
bool IsShown(const json& event) {
  const std::string kind = TextOf(event, "event");
  return kind != "journal" && kind != "start" && kind != "attached";
}

// Paths below `directory` are shown without it.
Line Describe(const json& event, const std::string& directory) {
  const std::string kind = TextOf(event, "event");
  if (kind == "log") return DescribeLog(event);
  if (kind == "integrity") return DescribeIntegrity(event);
  if (kind == "sign" || kind == "verify") return DescribeAnswer(event, directory);
  if (kind == "register") return DescribeRegister(event);
  if (kind == "stdout") return {kind, Printable(TextOf(event, "text")), "", false};
  if (kind == "exit") return DescribeExit(event);
  return {kind, event.dump(), "", false};
}

Line DescribeLog(const json& event) {
  const int64_t priority = NumberOf(event, "priority");
  const std::string tag = TextOf(event, "tag");
  const std::string text = Printable(TextOf(event, "text"));
  const char* const what = priority >= 6 ? "error" : priority == 5 ? "warning" : "log";
  return {what, tag == "ApkToolkit" ? text : "[" + Printable(tag) + "] " + text, "", priority >= 6};
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
  return {"integrity", whose + " reads " + Printable(text) + remark, "", false};
}

// What the kernel said to a request to sign or to verify.
Line DescribeAnswer(const json& event, const std::string& directory) {
  const std::string kind = TextOf(event, "event");
  std::string path = TextOf(event, "path");
  if (path.compare(0, directory.size(), directory) == 0) path.erase(0, directory.size());
  const bool is_failure = NumberOf(event, "result") != 0;
  const std::string answer = is_failure       ? DescribeErrno(NumberOf(event, "errno"))
                             : kind == "sign" ? "signed"
                                              : "trusted";
  const std::string detail = kind == "sign" ? ExplainPayload(TextOf(event, "payload")) : "";
  return {kind, Printable(path) + ": " + answer, detail, is_failure};
}

// The payload starts with the length of what follows, the low byte first.
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
      "register", Printable(TextOf(event, "name")) + ": libzu answers " + std::to_string(result),
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

// For a terminal: no control characters, no broken UTF-8, and no line end at the end.
std::string Printable(std::string_view bytes) {
  std::string out;
  if (!bytes.empty() && bytes.back() == '\n') bytes.remove_suffix(1);
  while (!bytes.empty()) {
    const size_t length = Utf8Length(bytes);
    const uint8_t first = static_cast<uint8_t>(bytes[0]);
    const bool is_c1_control =
        length == 2 && first == 0xc2 && static_cast<uint8_t>(bytes[1]) < 0xa0;
    if (length == 0 || first < 0x20 || first == 0x7f || is_c1_control) {
      char escape[8];
      snprintf(escape, sizeof(escape), "\\x%02x", first);
      out += escape;
      bytes.remove_prefix(1);
      continue;
    }
    out += bytes.substr(0, length);
    bytes.remove_prefix(length);
  }
  return out;
}

}  // namespace
