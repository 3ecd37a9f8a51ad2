// apktoolkit-sim: the phone that apktoolkit runs in, on a workstation.
#include <utility>

#include "simulator/options.h"
#include "simulator/run/process.h"
#include "simulator/run/queue.h"
#include "simulator/run/simulator.h"
#include "simulator/show/presenter.h"
#include "simulator/verdict/make_report.h"

int main(int argc, char** argv) {
  using namespace simulator;
  const bool has_standard_input = KeepStandardStreams();
  Options options;
  if (const auto status = ParseOptions(argc, argv, &options)) return EndWith(*status);
  const std::vector<std::string>& files = options.files;
  Simulator simulator(options.run, has_standard_input);
  Presenter presenter(options.show, files.size());
  std::vector<std::string> inputs = files;
  inputs.insert(inputs.end(), options.run.trust.begin(), options.run.trust.end());
  inputs.push_back(options.run.tool);
  if (const auto objection = presenter.Objection(inputs)) return Complain(kUsageError, *objection);
  if (const auto problem = simulator.Prepare()) return Complain(kCannotSimulate, *problem);
  if (!presenter.Begin()) return kCannotSimulate;
  CatchInterruptions();
  std::vector<std::optional<FileRun>> runs(files.size());
  RunInOrder(
      files.size(), options.run.jobs, [&](size_t i) { runs[i] = simulator.Run(files[i]); },
      [&](size_t i) {
        const FileRun run = *std::exchange(runs[i], std::nullopt);
        const Report report = MakeReport(run.record, run.facts, options.judge);
        if (options.verify) {
          presenter.ShowAnswer(run.record, report, run.journal);
        } else {
          presenter.Show(report, run.journal);
        }
      },
      [&](size_t i, int seconds) { presenter.ShowProgress(files[i], seconds); });
  const int status = presenter.Finish();
  EndIfInterrupted();
  return status;
}
