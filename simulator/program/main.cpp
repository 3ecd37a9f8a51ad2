// apktoolkit-sim: the phone that apktoolkit runs in, on a workstation.
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <iostream>

#include "simulator/phone/journal.h"
#include "simulator/program/journal_file.h"
#include "simulator/program/options.h"
#include "simulator/program/process.h"
#include "simulator/program/queue.h"
#include "simulator/program/simulator.h"

namespace {

// Tells of each file in the ways that were asked for.
class Presenter {
 public:
  explicit Presenter(const Options& options)
      : options_(options), has_progress_(isatty(STDERR_FILENO) != 0) {}

  bool OpenJournal();
  void Show(const Outcome& outcome);
  void ShowProgress(const std::string& file, int seconds);
  void ShowSummary();
  // The highest status of all; kCannotSimulate at least when something could not be written.
  int Finish() const;

 private:
  void Keep(const std::string& journal);
  void EraseProgress();

  const Options& options_;
  const bool has_progress_;
  const Look look_ = LookOfStandardOutput();
  JournalFile journal_;
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

}  // namespace

int main(int argc, char** argv) {
  const bool has_standard_input = KeepStandardStreams();
  Options options;
  if (const auto status = ParseOptions(argc, argv, &options)) return *status;
  std::vector<std::string> inputs = options.files;
  inputs.insert(inputs.end(), options.trust.begin(), options.trust.end());
  inputs.push_back(options.tool);
  if (const auto objection = JournalFile::Objection(options.journal, inputs)) {
    return Complain(kUsageError, *objection);
  }
  Simulator simulator(options, has_standard_input);
  Presenter presenter(options);
  std::string error;
  if (!simulator.Prepare(&error)) return Complain(kCannotSimulate, error);
  if (!presenter.OpenJournal()) {
    return Complain(kCannotSimulate,
                    "cannot write the journal " + options.journal + ": " + strerrordesc_np(errno));
  }
  CatchInterruptions();
  RunInOrder(
      options.files, options.jobs, [&](const std::string& file) { return simulator.Run(file); },
      [&](const Outcome& outcome) { presenter.Show(outcome); },
      [&](const std::string& file, int seconds) { presenter.ShowProgress(file, seconds); });
  presenter.ShowSummary();
  EndIfInterrupted();
  return presenter.Finish();
}

namespace {

bool Presenter::OpenJournal() {
  if (!options_.journal.empty() && !journal_.Open(options_.journal)) return false;
  Keep(Event("journal").Number("version", kJournalVersion).Line());
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
  std::cout.flush();
  verdicts_.push_back(report.verdict);
  if (report.verdict == Verdict::kNotSimulated) {
    Complain(kCannotSimulate, report.file + ": " + report.items[0].reason.Text());
  }
  status_ = std::max(status_, StatusOf(report.verdict));
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

int Presenter::Finish() const {
  std::cout.flush();
  if (std::cout) return status_;
  return Complain(std::max(status_, kCannotSimulate), "cannot write to standard output");
}

// The journal goes to its file, and to standard output when that is asked for.
void Presenter::Keep(const std::string& journal) {
  if (options_.json) std::cout << journal;
  if (options_.journal.empty() || journal_.Append(journal)) return;
  status_ =
      std::max(status_, Complain(kCannotSimulate, "cannot write the journal " + options_.journal +
                                                      ": " + strerrordesc_np(errno)));
}

}  // namespace
