// apktoolkit-sim: runs apktoolkit in a simulated phone on a workstation.
#include <future>
#include <memory>
#include <utility>

#include "simulator/installer/installer.h"
#include "simulator/options.h"
#include "simulator/run/file_list.h"
#include "simulator/run/file_watch.h"
#include "simulator/run/process.h"
#include "simulator/run/queue.h"
#include "simulator/run/simulator.h"
#include "simulator/show/presenter.h"
#include "simulator/verdict/gate.h"
#include "simulator/verdict/make_report.h"
#include "simulator/verdict/wording.h"

namespace simulator {

namespace {

// The answers of the tool and of the phones' installer about one file.
struct Answers {
  FileRun run;
  Judgement judgement;
};

// The tool and the installer's verifier run at the same time, because neither needs the other's
// answer.
Answers Ask(const ListedFile& file, Simulator* simulator, Installer* installer) {
  const FileWatch watch(file.name);
  const bool is_run = file.state == ListedFile::State::kToRun;
  auto judgement = std::async(std::launch::async,
                              [&] { return is_run ? installer->Judge(file.name) : Judgement(); });
  FileRun run = simulator->Run(file);
  Answers answers = {std::move(run), judgement.get()};
  watch.Check(&answers.run);
  if (IsInterrupted() && answers.judgement.state == Judgement::State::kGaveUp) {
    answers.run.record.failure = {Failure::Kind::kInterrupted, ""};
  }
  return answers;
}

}  // namespace

}  // namespace simulator

int main(int argc, char** argv) {
  using namespace simulator;
  const bool has_standard_input = KeepStandardStreams();
  Options options;
  if (const auto status = ParseOptions(argc, argv, &options)) return EndWith(*status);
  FileList list;
  if (const auto problem = ListFiles(options.files, &list)) return Complain(kUsageError, *problem);
  const std::vector<ListedFile>& files = list.files;
  Simulator simulator(options.run, has_standard_input);
  Installer installer(options.installer);
  Gate gate(options.gate);
  Presenter presenter(options.show, files.size());
  std::vector<std::string> names;
  names.reserve(files.size());
  for (const ListedFile& file : files) names.push_back(file.name);
  std::vector<std::string> inputs = names;
  inputs.push_back(options.files.list);
  inputs.insert(inputs.end(), options.run.trust.begin(), options.run.trust.end());
  inputs.push_back(options.run.tool);
  if (const auto objection = presenter.Objection(inputs)) return Complain(kUsageError, *objection);
  if (const auto problem = simulator.Prepare()) return presenter.GiveUp(names, *problem);
  if (options.installer.use == InstallerUse::kRequired) {
    if (const auto missing = installer.Missing()) return presenter.GiveUp(names, *missing);
  }
  if (const auto problem = presenter.Begin()) return presenter.GiveUp(names, *problem);
  if (list.others > 0) {
    const std::string others = Counted(list.others, "file", "files");
    Complain(kAllSigned, "skipped " + others + " below the directories: not named like a package");
  }
  CatchInterruptions();
  std::vector<std::unique_ptr<Answers>> answers(files.size());
  RunInOrder(
      files.size(), options.run.jobs,
      [&](size_t i) {
        answers[i] = std::make_unique<Answers>(Ask(files[i], &simulator, &installer));
      },
      [&](size_t i) {
        const auto owned = std::move(answers[i]);
        const FileRun& run = owned->run;
        Report report = MakeReport(run.record, run.facts, options.judge, owned->judgement);
        gate.Judge(&report);
        if (options.verify) {
          presenter.ShowAnswer(run.record, report, run.journal);
        } else {
          presenter.Show(report, run.journal);
        }
      },
      [&](size_t i, int seconds) { presenter.ShowProgress(names[i], seconds); });
  const int status = presenter.Finish(names);
  EndIfInterrupted();
  return status;
}
