#include "simulator/run/run_record.h"

#include <cstdlib>
#include <utility>

#include "sign/libzu.h"

namespace simulator {

namespace {

using nlohmann::json;

constexpr char kToolTag[] = "ApkToolkit";
constexpr int kErrorPriority = 6;

bool StartsWith(const std::string& text, const char* start) { return text.rfind(start, 0) == 0; }

// Reads the events one after the other, and keeps in which step the tool is.
class Reader {
 public:
  void Read(const json& event);
  RunRecord Finish();

 private:
  enum class Step { kOpening, kLibraries, kFile, kKey };

  void ReadLog(const json& event);
  void ReadInformation(const std::string& text);
  void ReadError(const std::string& text);
  bool ReadLibraryError(const std::string& text);
  bool ReadKeyError(const std::string& text);
  void ReadSign(const json& event);
  void ReadVerify(const json& event);
  void ReadEnd(const json& event);
  void Begin();
  void CloseAttempt();

  RunRecord record_;
  Step step_ = Step::kOpening;
  std::optional<Attempt> attempt_;      // begun, and not yet closed
  std::vector<std::string> pending_;    // errors that the next line tells the use of
  std::optional<std::string> opening_;  // the library that could not be opened
};

}  // namespace

RunRecord TakeApart(const Events& events) {
  Reader reader;
  for (const json& event : events) reader.Read(event);
  RunRecord record = reader.Finish();
  record.events = events;
  return record;
}

std::optional<std::string> Between(const std::string& line, const std::string& before,
                                   const std::string& after) {
  if (line.rfind(before, 0) != 0) return {};
  const size_t end = after.empty() ? line.size() : line.rfind(after);
  if (end == std::string::npos || end < before.size()) return {};
  return line.substr(before.size(), end - before.size());
}

namespace {

void Reader::Read(const json& event) {
  const std::string kind = TextOf(event, "event");
  if (kind == "start") {
    record_.file = TextOf(event, "file");
    record_.path = TextOf(event, "path");
    return;
  }
  if (kind == "exit") return ReadEnd(event);
  if (kind == "journal" || kind == "attached" || kind == "verdict") return;
  record_.is_silent = false;
  if (kind == "log") ReadLog(event);
  if (kind == "sign") ReadSign(event);
  if (kind == "verify") ReadVerify(event);
  if (kind == "integrity" && attempt_) {
    const bool is_there = event.contains("text") && event["text"].is_string();
    attempt_->integrity = is_there ? std::optional(TextOf(event, "text")) : std::nullopt;
  }
  if (kind == "register") {
    record_.registrations.push_back({TextOf(event, "name"), NumberOf(event, "result")});
  }
}

RunRecord Reader::Finish() {
  CloseAttempt();
  auto& others = record_.other_errors;
  others.insert(others.end(), pending_.begin(), pending_.end());
  return std::move(record_);
}

void Reader::ReadLog(const json& event) {
  if (TextOf(event, "tag") != kToolTag) return;
  std::string text = TextOf(event, "text");
  if (!text.empty() && text.back() == '\n') text.pop_back();
  if (NumberOf(event, "priority") < kErrorPriority) {
    ReadInformation(text);
  } else {
    ReadError(text);
  }
}

void Reader::ReadInformation(const std::string& text) {
  if (StartsWith(text, "VeltSignJni starts:")) step_ = Step::kLibraries;
  if (StartsWith(text, "VeltSign starts:")) {
    CloseAttempt();
    step_ = Step::kFile;
  }
  if (StartsWith(text, "VeltSignOat: Apk case.")) Begin();
  if (StartsWith(text, "VeltSignOat: non-Apk")) {
    record_.is_jar = true;
    Begin();
  }
  if (StartsWith(text, "VeltSign finished:")) {
    CloseAttempt();
    step_ = Step::kKey;
  }
}

void Reader::ReadError(const std::string& text) {
  const bool is_of_signing = StartsWith(text, "VELT can't sign a ");
  if (is_of_signing && attempt_) {
    if (attempt_->outcome == Attempt::Outcome::kBegun) {
      attempt_->outcome = Attempt::Outcome::kNotAsked;
    }
    return CloseAttempt();
  }
  if (StartsWith(text, "Zip archive is not valid for fd=")) {
    step_ = Step::kKey;
  } else if (step_ == Step::kOpening) {
    record_.opening_errors.push_back(text);
  } else if (!(step_ == Step::kLibraries ? ReadLibraryError(text) : ReadKeyError(text))) {
    record_.other_errors.push_back(text);
  }
}

bool Reader::ReadLibraryError(const std::string& text) {
  if (StartsWith(text, "Can't open file: ") || StartsWith(text, "Can't read file: ") ||
      StartsWith(text, "Can't find file in ") || StartsWith(text, "verifyData: ")) {
    pending_.push_back(text);
    return true;
  }
  if (text == "Integrity not confirmed: classes.dex") {
    record_.is_dex_refused = true;
    record_.dex_errors = std::exchange(pending_, {});
    return true;
  }
  if (StartsWith(text, "VeltSignJni: malformed apk: ")) return true;
  if (const auto path = Between(text, "VeltSignJni: File not verified: ", "")) {
    CloseAttempt();
    Attempt attempt;
    attempt.path = *path;
    attempt.outcome = Attempt::Outcome::kNotVerified;
    attempt.errors = std::exchange(pending_, {});
    record_.libraries.push_back(attempt);
    return true;
  }
  if (const auto path = Between(text, "File ", " is not opened")) {
    CloseAttempt();
    opening_ = *path;
    return true;
  }
  if (const auto number = Between(text, "Error ", ""); number && opening_) {
    Attempt attempt;
    attempt.path = *std::exchange(opening_, std::nullopt);
    attempt.outcome = Attempt::Outcome::kNotOpened;
    attempt.error = strtol(number->c_str(), nullptr, 10);
    record_.libraries.push_back(attempt);
    return true;
  }
  return false;
}

bool Reader::ReadKeyError(const std::string& text) {
  if (StartsWith(text, "Apk archive is not valid for fd=")) {
    return record_.is_key_refused_with_package = true;
  }
  if (StartsWith(text, "Can't get jar location from fd=")) return record_.has_no_key_path = true;
  // The answer itself is an event.
  return StartsWith(text, "ZuAddCertificate: ZuNewCertificate failed ") &&
         !record_.registrations.empty() &&
         !IsZuSuccess(static_cast<int>(record_.registrations.back().result));
}

// Whether it is the file itself that was signed, its path tells.
void Reader::ReadSign(const json& event) {
  if (!attempt_) Begin();
  attempt_->path = TextOf(event, "path");
  attempt_->payload = TextOf(event, "payload");
  attempt_->error = NumberOf(event, "errno");
  const bool is_signed = NumberOf(event, "result") == 0;
  attempt_->outcome = is_signed ? Attempt::Outcome::kSigned : Attempt::Outcome::kKernelRefused;
  if (is_signed) CloseAttempt();
}

void Reader::ReadVerify(const json& event) {
  if (TextOf(event, "path") != record_.path) return;
  record_.is_jar = true;
  record_.verify_error = NumberOf(event, "result") == 0 ? 0 : NumberOf(event, "errno");
}

void Reader::ReadEnd(const json& event) {
  if (event.contains("signal")) {
    record_.signal = NumberOf(event, "signal");
  } else {
    record_.status = NumberOf(event, "status");
  }
}

void Reader::Begin() {
  CloseAttempt();
  attempt_ = Attempt();
}

// A package that is not good, and a JAR that is not trusted, leave an attempt that came to nothing.
void Reader::CloseAttempt() {
  if (!attempt_) return;
  if (attempt_->outcome == Attempt::Outcome::kBegun) return attempt_.reset();
  const bool is_own =
      attempt_->path.empty() ? step_ != Step::kLibraries : attempt_->path == record_.path;
  if (is_own) {
    record_.own = std::move(attempt_);
  } else {
    record_.libraries.push_back(*std::move(attempt_));
  }
  attempt_.reset();
}

}  // namespace

}  // namespace simulator
