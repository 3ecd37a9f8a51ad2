#include "simulator/show/presenter.h"

#include <unistd.h>

#include <algorithm>
#include <array>
#include <ctime>
#include <iostream>

#include "simulator/phone/journal.h"
#include "simulator/run/process.h"
#include "simulator/show/verdict_event.h"
#include "simulator/show/words.h"
#include "simulator/verdict/make_report.h"

namespace simulator {

namespace {

constexpr OutputKind kJournal = {"--journal", "journal", "{\"event\":\"journal\""};
constexpr OutputKind kPage = {"--html", "page", kPageStart};
constexpr OutputKind kJunit = {"--junit", "JUnit report", kJunitStart};
constexpr OutputKind kSarif = {"--sarif", "SARIF log", kSarifStart};
constexpr char kEraseLine[] = "\r\x1b[K";

std::string JournalStart() { return Event("journal").Number("version", kJournalVersion).Line(); }

// The report for a file that was not examined.
Report Untold(const std::string& file, const Reason& why) {
  Report report;
  report.file = file;
  report.items = {NotDone(ItemKind::kTool, "tool", why, {})};
  return report;
}

}  // namespace

Presenter::Presenter(const ShowOptions& options, size_t file_count)
    : options_(options),
      file_count_(file_count),
      has_progress_(isatty(STDERR_FILENO) != 0),
      look_(LookOfStandardOutput()),
      journal_(kJournal, options.journal),
      page_file_(kPage, options.html),
      page_({std::time(nullptr), options.tool}),
      junit_file_(kJunit, options.junit),
      sarif_file_(kSarif, options.sarif) {}

std::optional<std::string> Presenter::Objection(const std::vector<std::string>& inputs) const {
  const std::array<const OutputFile*, 4> files = {&journal_, &page_file_, &junit_file_,
                                                  &sarif_file_};
  for (size_t i = 0; i < files.size(); ++i) {
    for (size_t j = i + 1; j < files.size(); ++j) {
      if (!files[i]->IsSameAs(*files[j])) continue;
      return std::string(files[i]->option()) + " and " + files[j]->option() + " name the same file";
    }
    if (auto objection = files[i]->Objection(inputs)) return objection;
  }
  return {};
}

std::optional<std::string> Presenter::Begin() {
  for (OutputFile* const file : AllFiles()) {
    if (!file->Open()) return file->ErrorText();
  }
  Keep(JournalStart());
  return {};
}

void Presenter::Show(const Report& report, const std::string& journal) {
  EraseProgress();
  ++shown_;
  Keep(journal + VerdictEvent(report));
  if (!options_.json) {
    const bool has_gap = !verdicts_.empty() && options_.detail != Detail::kVerdict;
    if (has_gap) std::cout << '\n';
    PrintReport(report, options_.detail, look_, std::cout);
  }
  if (page_file_.IsWanted()) page_.Add(report);
  if (junit_file_.IsWanted()) junit_.Add(report);
  if (sarif_file_.IsWanted()) sarif_.Add(report);
  std::cout.flush();
  verdicts_.push_back(report.verdict);
  if (missing_.empty()) missing_ = MissingInstaller(report);
  if (report.verdict == Verdict::kNotSimulated) {
    if (DecisiveItem(report)->reason.cause == &cause::kInterrupted) is_interrupted_ = true;
    Complain(kCannotSimulate, report.file + ": " + DecisiveItem(report)->reason.Text());
  }
  status_ = std::max<int>(status_, StatusOf(report.verdict));
}

void Presenter::ShowAnswer(const RunRecord& run, const Report& report, const std::string& journal) {
  EraseProgress();
  ++shown_;
  Keep(journal);
  for (const auto& event : run.events) {
    const bool is_output = TextOf(event, "event") == "stdout";
    if (is_output && !options_.json) std::cout << TextOf(event, "text");
  }
  std::cout.flush();
  std::string problem;
  if (run.signal) problem = "it was killed by signal " + std::to_string(*run.signal);
  if (run.failure.kind != Failure::Kind::kNone) problem = report.items[0].reason.Text();
  if (!problem.empty()) Complain(kCannotSimulate, run.file + ": " + problem);
  const int status = static_cast<int>(run.status);
  status_ = std::max(status_, problem.empty() ? status : kCannotSimulate);
}

// The progress line is erased before anything else is written.
void Presenter::ShowProgress(const std::string& file, int seconds) {
  if (!has_progress_) return;
  std::cerr << kEraseLine << shown_ << " of " << file_count_ << " done; " << Printable(file, look_)
            << ": " << seconds << " s" << std::flush;
  is_progress_shown_ = true;
}

void Presenter::EraseProgress() {
  if (is_progress_shown_) std::cerr << kEraseLine << std::flush;
  is_progress_shown_ = false;
}

int Presenter::Finish(const std::vector<std::string>& files) {
  EraseProgress();
  if (!options_.json && options_.detail != Detail::kVerdict && file_count_ > 1 &&
      !verdicts_.empty()) {
    std::cout << '\n' << Summary(verdicts_, Unseen()) << '\n';
  }
  Write(&page_file_, page_.Html(Unseen()));
  for (size_t i = shown_; i < files.size(); ++i) {
    const Report report = Untold(files[i], {&cause::kInterrupted, ""});
    junit_.Add(report);
    sarif_.Add(report);
  }
  WriteReports();
  if (!missing_.empty()) Complain(status_, missing_);
  return EndWith(status_);
}

// Returns none if all files were shown, and no shown report has the cause kInterrupted. Otherwise
// the run was interrupted: returns the number of files that were not shown, which can be 0.
std::optional<size_t> Presenter::Unseen() const {
  const size_t unseen = file_count_ - shown_;
  if (unseen == 0 && !is_interrupted_) return std::nullopt;
  return unseen;
}

// Overwrites every output file. An output file of an earlier run would otherwise look like an
// output of this run.
int Presenter::GiveUp(const std::vector<std::string>& files, const std::string& problem) {
  status_ = Complain(kCannotSimulate, problem);
  for (OutputFile* const file : AllFiles()) {
    if (!file->Open() && file->ErrorText() != problem) FailToWrite(file);
  }
  Write(&journal_, JournalStart());
  for (const std::string& file : files) {
    const Report report = Untold(file, {&cause::kNotBegun, problem});
    page_.Add(report);
    junit_.Add(report);
    sarif_.Add(report);
  }
  Write(&page_file_, page_.Html());
  WriteReports();
  return status_;
}

void Presenter::WriteReports() {
  Write(&junit_file_, junit_.Xml());
  Write(&sarif_file_, sarif_.Log());
}

// After a failure, nothing more is written to this output, and no second message is printed.
void Presenter::Write(OutputFile* file, std::string_view text) {
  if (file->IsOpen() && !file->Append(text)) FailToWrite(file);
}

// Writes to the journal's file and, with --json, to standard output.
void Presenter::Keep(const std::string& journal) {
  if (options_.json) std::cout << journal;
  Write(&journal_, journal);
}

void Presenter::FailToWrite(OutputFile* file) {
  const std::string problem = file->ErrorText();
  status_ = std::max(status_, Complain(kCannotSimulate, problem));
  sarif_.AddProblem(problem);
  file->Close();
}

std::array<OutputFile*, 4> Presenter::AllFiles() {
  return {&journal_, &page_file_, &junit_file_, &sarif_file_};
}

int Complain(int status, const std::string& message) {
  std::cout.flush();
  std::cerr << "apktoolkit-sim: " << Printable(message, {false, LookOfStandardOutput().has_utf8})
            << '\n';
  return status;
}

int EndWith(int status) {
  std::cout.flush();
  // If the program that reads the output has ended, IsInterrupted() is true because of SIGPIPE.
  // This process later ends by that signal, as other programs do.
  if (std::cout || IsInterrupted()) return status;
  return Complain(std::max<int>(status, kCannotSimulate), "cannot write to standard output");
}

}  // namespace simulator
