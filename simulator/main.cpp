// apktoolkit-sim: the phone that apktoolkit runs in, on a workstation.
#include <unistd.h>

#include <algorithm>
#include <iostream>
#include <optional>
#include <utility>
#include <vector>

#include "simulator/options.h"
#include "simulator/phone/journal.h"
#include "simulator/run/process.h"
#include "simulator/run/queue.h"
#include "simulator/run/simulator.h"
#include "simulator/show/output_file.h"
#include "simulator/show/page.h"
#include "simulator/show/report_words.h"
#include "simulator/show/verdict_event.h"
#include "simulator/verdict/make_report.h"

namespace simulator {

namespace {

constexpr OutputKind kJournal = {"--journal", "journal", "{\"event\":\"journal\""};
constexpr OutputKind kPage = {"--html", "page", kPageStart};

// What came of one file.
struct Outcome {
  Report report;
  std::string journal;  // the lines of its run, from "start" to "verdict"
};

Outcome Judged(const FileRun& run, const JudgeOptions& options) {
  const Report report = MakeReport(run.record, run.facts, options);
  return {report, run.journal + VerdictEvent(report)};
}

// Tells of each file in the ways that were asked for.
class Presenter {
 public:
  explicit Presenter(const Options& options)
      : options_(options),
        has_progress_(isatty(STDERR_FILENO) != 0),
        journal_(kJournal, options.journal),
        page_file_(kPage, options.html) {}

  // Why nothing may begin, for the sake of the user's files.
  std::optional<std::string> Objection() const;
  bool Begin();
  void Show(const Outcome& outcome);
  // What apktoolkit-verify said.
  void ShowAnswer(const FileRun& run);
  void ShowProgress(const std::string& file, int seconds);
  void ShowSummary();
  void WritePage();
  // The highest status of all; kCannotSimulate at least when something could not be written.
  int Finish() const;

 private:
  void Keep(const std::string& journal);
  void FailToWrite(const OutputFile& file);
  void EraseProgress();

  const Options& options_;
  const bool has_progress_;
  const Look look_ = LookOfStandardOutput();
  OutputFile journal_;
  OutputFile page_file_;
  Page page_;
  std::vector<Verdict> verdicts_;
  bool is_progress_shown_ = false;
  int status_ = kAllSigned;
};

int Complain(int status, const std::string& message) {
  std::cout.flush();
  std::cerr << "apktoolkit-sim: " << Printable(message, {false, LookOfStandardOutput().has_utf8})
            << '\n';
  return status;
}

// The status, if all that was printed could be written.
int EndWith(int status) {
  std::cout.flush();
  if (std::cout) return status;
  return Complain(std::max(status, kCannotSimulate), "cannot write to standard output");
}

void RunAll(const Options& options, Simulator* simulator, Presenter* presenter) {
  const std::vector<std::string>& files = options.files;
  std::vector<std::optional<Outcome>> outcomes(files.size());
  RunInOrder(
      files.size(), options.run.jobs,
      [&](size_t i) { outcomes[i] = Judged(simulator->Run(files[i]), options.judge); },
      [&](size_t i) { presenter->Show(*std::exchange(outcomes[i], std::nullopt)); },
      [&](size_t i, int seconds) { presenter->ShowProgress(files[i], seconds); });
  presenter->ShowSummary();
  presenter->WritePage();
}

void VerifyAll(const Options& options, Simulator* simulator, Presenter* presenter) {
  const std::vector<std::string>& files = options.files;
  std::vector<std::optional<FileRun>> runs(files.size());
  RunInOrder(
      files.size(), options.run.jobs, [&](size_t i) { runs[i] = simulator->Run(files[i]); },
      [&](size_t i) { presenter->ShowAnswer(*std::exchange(runs[i], std::nullopt)); },
      [&](size_t i, int seconds) { presenter->ShowProgress(files[i], seconds); });
}

}  // namespace

}  // namespace simulator

int main(int argc, char** argv) {
  using namespace simulator;
  const bool has_standard_input = KeepStandardStreams();
  Options options;
  if (const auto status = ParseOptions(argc, argv, &options)) return EndWith(*status);
  Simulator simulator(options.run, has_standard_input);
  Presenter presenter(options);
  if (const auto objection = presenter.Objection()) return Complain(kUsageError, *objection);
  std::string error;
  if (!simulator.Prepare(&error)) return Complain(kCannotSimulate, error);
  if (!presenter.Begin()) return kCannotSimulate;
  CatchInterruptions();
  if (options.verify) {
    VerifyAll(options, &simulator, &presenter);
  } else {
    RunAll(options, &simulator, &presenter);
  }
  EndIfInterrupted();
  return presenter.Finish();
}

namespace simulator {

namespace {

std::optional<std::string> Presenter::Objection() const {
  std::vector<std::string> inputs = options_.files;
  inputs.insert(inputs.end(), options_.run.trust.begin(), options_.run.trust.end());
  inputs.push_back(options_.run.tool);
  if (journal_.IsSameAs(page_file_)) return "--journal and --html name the same file";
  if (auto objection = journal_.Objection(inputs)) return objection;
  return page_file_.Objection(inputs);
}

bool Presenter::Begin() {
  if (!journal_.Open()) {
    FailToWrite(journal_);
  } else {
    Keep(Event("journal").Number("version", kJournalVersion).Line());
  }
  if (!page_file_.Open()) FailToWrite(page_file_);
  return status_ == kAllSigned;
}

void Presenter::Show(const Outcome& outcome) {
  EraseProgress();
  const Report& report = outcome.report;
  Keep(outcome.journal);
  if (!options_.json) {
    const bool has_gap = !verdicts_.empty() && options_.detail != Detail::kVerdict;
    if (has_gap) std::cout << '\n';
    PrintReport(report, options_.detail, look_, std::cout);
  }
  if (page_file_.IsWanted()) page_.Add(report);
  std::cout.flush();
  verdicts_.push_back(report.verdict);
  if (report.verdict == Verdict::kNotSimulated) {
    Complain(kCannotSimulate, report.file + ": " + report.items[0].reason.Text());
  }
  status_ = std::max(status_, StatusOf(report.verdict));
}

void Presenter::ShowAnswer(const FileRun& run) {
  EraseProgress();
  Keep(run.journal);
  for (const auto& event : run.record.events) {
    const bool is_output = TextOf(event, "event") == "stdout";
    if (is_output && !options_.json) std::cout << TextOf(event, "text");
  }
  std::cout.flush();
  const bool has_failed = run.record.failure.kind != Failure::Kind::kNone;
  std::string problem;
  if (run.record.signal) problem = "it was killed by signal " + std::to_string(*run.record.signal);
  if (has_failed) problem = Judged(run, options_.judge).report.items[0].reason.Text();
  if (!problem.empty()) Complain(kCannotSimulate, run.record.file + ": " + problem);
  const int status = static_cast<int>(run.record.status);
  status_ = std::max(status_, problem.empty() ? status : kCannotSimulate);
}

// Erased again before anything else is written.
void Presenter::ShowProgress(const std::string& file, int seconds) {
  if (!has_progress_) return;
  std::cerr << "\r\x1b[K" << verdicts_.size() << " of " << options_.files.size() << " done; "
            << Printable(file, look_) << ": " << seconds << " s" << std::flush;
  is_progress_shown_ = true;
}

void Presenter::EraseProgress() {
  if (is_progress_shown_) std::cerr << "\r\x1b[K" << std::flush;
  is_progress_shown_ = false;
}

void Presenter::ShowSummary() {
  EraseProgress();
  if (options_.json || options_.detail == Detail::kVerdict || options_.files.size() < 2) return;
  std::cout << '\n' << Summary(verdicts_) << '\n';
}

void Presenter::WritePage() {
  if (page_file_.IsWanted() && !page_file_.Append(page_.Html())) FailToWrite(page_file_);
}

int Presenter::Finish() const { return EndWith(status_); }

// The journal goes to its file, and to standard output when that is asked for.
void Presenter::Keep(const std::string& journal) {
  if (options_.json) std::cout << journal;
  if (!journal_.Append(journal)) FailToWrite(journal_);
}

void Presenter::FailToWrite(const OutputFile& file) {
  status_ = std::max(status_, Complain(kCannotSimulate, file.ErrorText()));
}

}  // namespace

}  // namespace simulator
