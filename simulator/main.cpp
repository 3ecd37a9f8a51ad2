// apktoolkit-sim: the phone that apktoolkit runs in, on a workstation.
#include <future>
#include <utility>

#include "simulator/installer/installer.h"
#include "simulator/options.h"
#include "simulator/run/process.h"
#include "simulator/run/queue.h"
#include "simulator/run/simulator.h"
#include "simulator/show/presenter.h"
#include "simulator/verdict/gate.h"
#include "simulator/verdict/make_report.h"

int main(int argc, char** argv) {
  using namespace simulator;
  const bool has_standard_input = KeepStandardStreams();
  Options options;
  if (const auto status = ParseOptions(argc, argv, &options)) return EndWith(*status);
  const std::vector<std::string>& files = options.files;
  Simulator simulator(options.run, has_standard_input);
  Installer installer(options.installer);
  Gate gate(options.gate);
  Presenter presenter(options.show, files.size());
  std::vector<std::string> inputs = files;
  inputs.insert(inputs.end(), options.run.trust.begin(), options.run.trust.end());
  inputs.push_back(options.run.tool);
  if (const auto objection = presenter.Objection(inputs)) return Complain(kUsageError, *objection);
  if (const auto problem = simulator.Prepare()) return presenter.GiveUp(files, *problem);
  if (options.installer.use == InstallerUse::kRequired) {
    if (const auto missing = installer.Missing()) return presenter.GiveUp(files, *missing);
  }
  if (!presenter.Begin()) return kCannotSimulate;
  CatchInterruptions();
  std::vector<std::optional<FileRun>> runs(files.size());
  std::vector<Judgement> judgements(files.size());
  RunInOrder(
      files.size(), options.run.jobs,
      [&](size_t i) {
        // The two do not know of each other, and so they work at the same time.
        auto judged = std::async(std::launch::async, [&] { return installer.Judge(files[i]); });
        runs[i] = simulator.Run(files[i]);
        judgements[i] = judged.get();
      },
      [&](size_t i) {
        const FileRun run = *std::exchange(runs[i], std::nullopt);
        const Judgement judgement = std::exchange(judgements[i], {});
        Report report = MakeReport(run.record, run.facts, options.judge, judgement);
        gate.Judge(&report);
        if (options.verify) {
          presenter.ShowAnswer(run.record, report, run.journal);
        } else {
          presenter.Show(report, run.journal);
        }
      },
      [&](size_t i, int seconds) { presenter.ShowProgress(files[i], seconds); });
  const int status = presenter.Finish(files);
  EndIfInterrupted();
  return status;
}
