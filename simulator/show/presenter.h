// Telling of each file in the ways that were asked for: on the terminal, in the journal, on the
// page, in reports for other programs.
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "simulator/run/run_record.h"
#include "simulator/show/junit.h"
#include "simulator/show/output_file.h"
#include "simulator/show/page.h"
#include "simulator/show/report_text.h"
#include "simulator/show/sarif.h"

namespace simulator {

struct ShowOptions {
  Detail detail = Detail::kUsual;  // of the text
  std::string journal;             // where the journal is kept; empty: it is not
  std::string html;                // where the page is written; empty: it is not
  std::string junit;               // where the JUnit report is written; empty: it is not
  std::string sarif;               // where the SARIF log is written; empty: it is not
  std::string tool;                // that --tool names; empty: the one of this build
  bool json = false;               // the journal on standard output in place of the text
};

class Presenter {
 public:
  // `file_count` files are to be told of.
  Presenter(const ShowOptions& options, size_t file_count);

  // Why nothing may begin, for the sake of the user's files, of which `inputs` are to be read.
  std::optional<std::string> Objection(const std::vector<std::string>& inputs) const;
  // False when what is to be written cannot be; that was told.
  bool Begin();
  // `journal` are the lines of the run, from "start" to "exit".
  void Show(const Report& report, const std::string& journal);
  // Of a run of apktoolkit-verify: what it printed. `report` says why it could not be simulated.
  void ShowAnswer(const RunRecord& run, const Report& report, const std::string& journal);
  void ShowProgress(const std::string& file, int seconds);
  // Tells what belongs to the end. The highest status of all; kCannotSimulate at least when
  // something could not be written. Those of `files`, all that were to be told of, that nothing was
  // told of, because the run was interrupted, are errors in the reports for other programs.
  int Finish(const std::vector<std::string>& files);
  // In place of all that: for `problem`, no file can be simulated. The status to end with.
  int GiveUp(const std::vector<std::string>& files, const std::string& problem);

 private:
  std::optional<size_t> Unseen() const;
  void Keep(const std::string& journal);
  void ReportUntold(const std::vector<std::string>& files, const Reason& why);
  void WriteReports();
  void FailToWrite(const OutputFile& file);
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
  bool is_interrupted_ = false;  // while a file was looked at
  size_t shown_ = 0;             // files, by a verdict or an answer
  bool is_progress_shown_ = false;
  std::string missing_;  // why the installer was not asked; empty: it was, or nobody wanted it
  int status_ = kAllSigned;
};

// Tells the user why the program ends with `status`, which is the result.
int Complain(int status, const std::string& message);

// The status, if all that was printed could be written.
int EndWith(int status);

}  // namespace simulator
