// A package influences names and texts in the journal of a run. This target calls the simulator's
// functions that escape, read and print these names and texts. The first byte of the input selects
// what the rest of the input is: a text to escape and read back, one line of the tool's log, or the
// journal of a whole run.
#include <algorithm>
#include <sstream>
#include <string>

#include "fuzz/fuzz.h"
#include "simulator/phone/text.h"
#include "simulator/run/run_record.h"
#include "simulator/show/timeline.h"
#include "util/log.h"

using namespace simulator;
using nlohmann::json;

namespace {

// True if the text is not UTF-8, or has a hidden character (IsHidden) other than LF.
bool HasHidden(std::string_view text) {
  while (!text.empty()) {
    const size_t length = Utf8Length(text);
    if (length == 0 || (text[0] != '\n' && IsHidden(text.substr(0, length)))) return true;
    text.remove_prefix(length);
  }
  return false;
}

void JudgeText(std::string_view bytes) {
  const std::string encoded = EncodeText(bytes);
  Require(!HasHidden(encoded) && encoded.find('\n') == std::string::npos,
          "the encoded text has no hidden character");
  Require(DecodeText(json::parse(encoded).get<std::string>()) == bytes,
          "the encoded text decodes to the same bytes");
  DecodeText(bytes);
  for (const bool has_utf8 : {false, true}) {
    const std::string shown = Printable(bytes, {false, has_utf8});
    Require(!HasHidden(shown) && shown.find('\n') == std::string::npos,
            "no hidden character is printed");
    const bool is_ascii = std::all_of(shown.begin(), shown.end(), [](char c) { return c >= 0; });
    Require(has_utf8 || is_ascii, "without UTF-8, only ASCII is printed");
  }
}

void JudgeLogLine(std::string_view bytes) {
  const std::string text(bytes);
  const LogLine line = ReadLogLine(text);
  Require(text.rfind(line.whole, 0) == 0 && text.size() - line.whole.size() <= 1,
          "at most the last byte of the line is cut off");
  Require(text.find(line.text) != std::string::npos, "captured text is a part of the line");
  const bool is_known = line.meaning != LogMeaning::kUnknown;
  Require(is_known || (line.text.empty() && line.number == 0),
          "an unknown line has no captured parts");
}

size_t CountOf(const Events& events, const char* kind, bool is_success) {
  return static_cast<size_t>(std::count_if(events.begin(), events.end(), [&](const json& event) {
    return TextOf(event, "event") == kind && (!is_success || IsSuccess(event));
  }));
}

// Requires that the record agrees with the kernel's answers in the events, and that it keeps every
// event.
void JudgeRecord(const Events& events) {
  const RunRecord record = TakeApart(events);
  Require(record.events == events, "the events are kept");
  std::vector<Attempt> attempts = record.libraries;
  if (record.own) attempts.push_back(*record.own);
  size_t is_signed = 0, answers = 0;
  for (const Attempt& attempt : attempts) {
    const bool was_signed = attempt.outcome == Attempt::Outcome::kSigned;
    is_signed += was_signed;
    answers += was_signed || attempt.outcome == Attempt::Outcome::kKernelRefused;
    Require(attempt.outcome != Attempt::Outcome::kBegun, "an attempt without a result is not kept");
    const auto has_payload = [&](const json& event) {
      return TextOf(event, "event") == "sign" && IsSuccess(event) &&
             TextOf(event, "payload") == attempt.payload;
    };
    Require(!was_signed || std::any_of(events.begin(), events.end(), has_payload),
            "the kernel got the recorded payload");
  }
  Require(is_signed == CountOf(events, "sign", true),
          "the record has as many signed files as the kernel signed");
  Require(answers == CountOf(events, "sign", false), "each answer to a sign command is kept");
  Require(record.registrations.size() == CountOf(events, "register", false),
          "each registration is kept");
  Require(record.verify_error != 0 || CountOf(events, "verify", true) > 0,
          "a JAR counts as trusted only if the kernel trusted it");
}

void JudgeJournal(std::string_view bytes) {
  const Events events = ParseEvents(std::string(bytes));
  JudgeRecord(events);
  const std::vector<TimelineLine> timeline = MakeTimeline(events, "/data/app/base.apk");
  Require(timeline.size() <= events.size(), "each event has at most one line");
  std::ostringstream out;
  PrintTimeline(timeline, Look(), out);
  Require(!HasHidden(out.str()), "no hidden character is printed");
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  constexpr void (*kReaders[])(std::string_view) = {JudgeText, JudgeLogLine, JudgeJournal};
  if (size == 0) return 0;
  const size_t which = data[0] % (sizeof(kReaders) / sizeof(kReaders[0]));
  // An exact copy, so that AddressSanitizer detects a read beyond its end.
  const std::vector<char> copy(data + 1, data + size);
  kReaders[which]({copy.data(), copy.size()});
  return 0;
}
