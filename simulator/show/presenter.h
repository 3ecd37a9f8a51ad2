// Shows the result of each file in the requested forms: on the terminal, in the journal, on the
// page, and in reports for other programs.
#pragma once

#include <array>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "simulator/run/run_record.h"
#include "simulator/show/junit.h"
#include "simulator/show/output_file.h"
#include "simulator/show/page.h"
#include "simulator/show/report_text.h"
#include "simulator/show/sarif.h"

namespace simulator {

struct ShowOptions {
  Detail detail = Detail::kUsual;  // how much of the report the text shows
  std::string journal;             // the path of the journal; empty: none
  std::string html;                // the path of the page; empty: none
  std::string junit;               // the path of the JUnit report; empty: none
  std::string sarif;               // the path of the SARIF log; empty: none
  std::string tool;                // the argument of --tool; empty: the tool of this build
  bool json = false;               // prints the journal instead of the text
};

class Presenter {
 public:
  // `file_count`: the number of files to show.
  Presenter(const ShowOptions& options, size_t file_count);

  // Returns an error text if two outputs are the same file, or if OutputFile::Objection objects to
  // an output. The run must then not begin. Otherwise returns none.
  std::optional<std::string> Objection(const std::vector<std::string>& inputs) const;
  // Opens the outputs. If an output cannot be written, returns the reason, and the caller must call
  // GiveUp. Otherwise returns none.
  std::optional<std::string> Begin();
  // `journal`: the lines of the run, without the verdict.
  void Show(const Report& report, const std::string& journal);
  // Shows the output of a run of apktoolkit-verify. If the run could not be simulated, `report` has
  // the reason.
  void ShowAnswer(const RunRecord& run, const Report& report, const std::string& journal);
  void ShowProgress(const std::string& file, int seconds);
  // Writes the summary, the page and the reports. `files` are all files of the run, in the order in
  // which they are shown. If the run was interrupted, the files that were not shown are errors in
  // the reports for other programs. Returns the highest status of all files, or at least
  // kCannotSimulate if an output failed.
  int Finish(const std::vector<std::string>& files);
  // Called instead of Show and Finish if `problem` prevents the whole run. The page and the reports
  // then have an error for each file. Returns the exit status.
  int GiveUp(const std::vector<std::string>& files, const std::string& problem);

 private:
  std::optional<size_t> Unseen() const;
  void Keep(const std::string& journal);
  void WriteReports();
  void Write(OutputFile* file, std::string_view text);
  void FailToWrite(OutputFile* file);
  std::array<OutputFile*, 4> AllFiles();
  void EraseProgress();

  const ShowOptions& options_;
  const size_t file_count_;
  const bool has_progress_;
  const Look look_;
  OutputFile journal_;
  OutputFile page_file_;
  Page page_;
  OutputFile junit_file_;
  Junit junit_;
  OutputFile sarif_file_;
  Sarif sarif_;
  std::vector<Verdict> verdicts_;
  bool is_interrupted_ = false;  // the run was interrupted during the simulation of a file
  size_t shown_ = 0;             // the number of files whose result was shown
  bool is_progress_shown_ = false;
  std::string missing_;  // the message of MissingInstaller (words.h); empty: none
  int status_ = kAllSigned;
};

// Prints the error text `message`. Returns `status`.
int Complain(int status, const std::string& message);

// If standard output could not be written and the run was not interrupted, prints an error and
// returns at least kCannotSimulate. Otherwise returns `status`.
int EndWith(int status);

}  // namespace simulator
