#include "simulator/run/run_record.h"

#include <algorithm>
#include <utility>

#include "sign/libzu.h"
#include "util/log.h"

namespace simulator {

namespace {

using nlohmann::json;

// Reads the events one after the other, and remembers which step the tool has reached.
class Reader {
 public:
  void Read(const json& event);
  RunRecord Finish();

 private:
  enum class Step { kOpening, kLibraries, kFile, kKey };

  void ReadLog(const json& event);
  void ReadInformation(const LogLine& line);
  void ReadError(const LogLine& line);
  void ReadSign(const json& event);
  void ReadVerify(const json& event);
  bool IsOwn(const std::string& path) const;
  void Begin();
  void AddLibrary(const std::string& path, Attempt::Outcome outcome);
  void CloseAttempt();

  RunRecord record_;
  Step step_ = Step::kOpening;
  std::optional<Attempt> attempt_;  // begun, and not yet closed
  std::vector<LogLine> pending_;    // errors about a file; a later log line names this file
};

}  // namespace

RunRecord TakeApart(const Events& events) {
  Reader reader;
  for (const json& event : events) reader.Read(event);
  RunRecord record = reader.Finish();
  record.events = events;
  return record;
}

namespace {

void Reader::Read(const json& event) {
  const std::string kind = TextOf(event, "event");
  if (kind == "start") {
    record_.file = TextOf(event, "file");
    record_.path = TextOf(event, "path");
    record_.installed = TextOf(event, "installed");
  } else if (kind == "exit") {
    if (event.contains("signal")) record_.signal = NumberOf(event, "signal");
    record_.status = NumberOf(event, "status");
  }
  if (!IsOfTheRun(event)) return;
  record_.is_silent = record_.is_silent && kind == "exit";
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
  for (const LogLine& line : pending_) record_.other_errors.push_back(line.whole);
  return std::move(record_);
}

void Reader::ReadLog(const json& event) {
  if (TextOf(event, "tag") != kLogTag) return;
  const LogLine line = ReadLogLine(TextOf(event, "text"));
  if (NumberOf(event, "priority") < ANDROID_LOG_ERROR) {
    ReadInformation(line);
  } else if (step_ == Step::kOpening) {
    record_.opening_errors.push_back(line);
  } else {
    ReadError(line);
  }
}

void Reader::ReadInformation(const LogLine& line) {
  const LogMeaning meaning = line.meaning;
  if (meaning == LogMeaning::kLibrariesBegin) step_ = Step::kLibraries;
  if (meaning == LogMeaning::kFileBegins || meaning == LogMeaning::kFileEnds) {
    CloseAttempt();
    step_ = meaning == LogMeaning::kFileBegins ? Step::kFile : Step::kKey;
  }
  if (meaning == LogMeaning::kJarTakenUp) record_.is_jar = true;
  if (meaning == LogMeaning::kJarTakenUp || meaning == LogMeaning::kPackageTakenUp) Begin();
}

// Reads an error that was logged after the tool began to sign.
void Reader::ReadError(const LogLine& line) {
  switch (line.meaning) {
    case LogMeaning::kNotSigned:
      if (attempt_ && attempt_->outcome == Attempt::Outcome::kBegun) {
        attempt_->outcome = Attempt::Outcome::kNotAsked;
      }
      return CloseAttempt();
    case LogMeaning::kFileNotOpened:
    case LogMeaning::kFileNotRead:
    case LogMeaning::kNotListed:
    case LogMeaning::kDigestUnknown:
      return pending_.push_back(line);
    case LogMeaning::kDexRefused:
      record_.is_dex_refused = true;
      if (!pending_.empty()) record_.dex_why = std::exchange(pending_, {})[0].meaning;
      return;
    case LogMeaning::kLibraryRefused:
      return AddLibrary(line.text, Attempt::Outcome::kNotVerified);
    case LogMeaning::kLibraryVanished:
      return AddLibrary(line.text, Attempt::Outcome::kVanished);
    case LogMeaning::kErrorNumber:
      if (!record_.libraries.empty()) record_.libraries.back().error = line.number;
      return;
    case LogMeaning::kKeyOfRefusedPackage:
      record_.is_key_refused_with_package = true;
      return;
    case LogMeaning::kNoPathOfJar:
      record_.has_no_key_path = true;
      return;
    case LogMeaning::kRegistrationFailed:
      // Normally the last "register" event reports this failure. The log line becomes a separate
      // error only if that event reports success, or if there is no "register" event.
      if (record_.registrations.empty() ||
          IsZuSuccess(static_cast<int>(record_.registrations.back().result))) {
        record_.other_errors.push_back(line.whole);
      }
      return;
    case LogMeaning::kNoGoodPackage:
    case LogMeaning::kNoArchiveToSign:
      return;
    default:
      record_.other_errors.push_back(line.whole);
  }
}

void Reader::ReadSign(const json& event) {
  if (!attempt_ || attempt_->outcome != Attempt::Outcome::kBegun) Begin();
  attempt_->path = TextOf(event, "path");
  attempt_->payload = TextOf(event, "payload");
  attempt_->error = NumberOf(event, "errno");
  const bool is_signed = IsSuccess(event);
  attempt_->outcome = is_signed ? Attempt::Outcome::kSigned : Attempt::Outcome::kKernelRefused;
  if (is_signed) CloseAttempt();
}

void Reader::ReadVerify(const json& event) {
  if (!IsOwn(TextOf(event, "path"))) return;
  record_.is_jar = true;
  record_.verify_error = IsSuccess(event) ? 0 : std::max<int64_t>(NumberOf(event, "errno"), 1);
}

// True if an attempt to sign `path`, or a request to the kernel about `path`, is for the file
// itself, not for a library. While the tool signs libraries or the file, the step decides. At other
// times the tool makes no request to the kernel, but a program other than the tool (--tool) can
// make a request. `path` then decides, and an empty path counts as the file itself.
bool Reader::IsOwn(const std::string& path) const {
  if (step_ == Step::kLibraries || step_ == Step::kFile) return step_ == Step::kFile;
  return path.empty() || path == record_.PathForTool();
}

void Reader::Begin() {
  CloseAttempt();
  attempt_ = Attempt();
}

void Reader::AddLibrary(const std::string& path, Attempt::Outcome outcome) {
  CloseAttempt();
  Attempt attempt;
  attempt.path = path;
  attempt.outcome = outcome;
  if (!pending_.empty()) attempt.why = std::exchange(pending_, {})[0].meaning;
  record_.libraries.push_back(attempt);
}

// Adds the present attempt to the record. An attempt without a result is dropped, for example if
// the package was refused or the JAR is not trusted.
void Reader::CloseAttempt() {
  const std::optional<Attempt> attempt = std::exchange(attempt_, std::nullopt);
  if (!attempt || attempt->outcome == Attempt::Outcome::kBegun) return;
  if (IsOwn(attempt->path) && !record_.own) {
    record_.own = attempt;
  } else {
    record_.libraries.push_back(*attempt);
  }
}

}  // namespace

}  // namespace simulator
