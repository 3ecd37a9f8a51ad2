#include "simulator/run/simulator.h"

#include <fcntl.h>
#include <signal.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <filesystem>
#include <sstream>

#include "simulator/phone/journal.h"
#include "simulator/phone/text.h"
#include "simulator/run/tool_process.h"
#include "util/file.h"

namespace simulator {

namespace {

namespace fs = std::filesystem;

// Why the last system call failed, as the end of a message.
std::string ErrnoText() { return std::string(": ") + strerrordesc_np(errno); }

// The file's absolute path without symbolic links. If the path cannot be resolved, the absolute
// path with its symbolic links.
std::string Resolved(const std::string& file) {
  std::error_code error;
  const fs::path path = fs::canonical(file, error);
  return error ? fs::absolute(file, error).string() : path.string();
}

void AddId(const std::string& path, std::vector<FileId>* ids) {
  struct stat state = {};
  if (stat(path.c_str(), &state) == 0) ids->push_back({state.st_dev, state.st_ino});
}

// A path by which the tool's process can open the open file `fd` of this process.
std::string OwnDescriptorPath(int fd) {
  return "/proc/" + std::to_string(getpid()) + "/fd/" + std::to_string(fd);
}

// For some names, the tool is not run (ListedFile::State): for a directory without packages, an
// unreadable directory, or an unreadable entry of a directory. The result for such a name has only
// the name, the path, and the reason why the tool is not run.
FileRun RunOfDirectory(const ListedFile& directory) {
  FileRun run;
  const std::string path = Resolved(directory.name);
  run.journal = Event("start").Text("file", directory.name).Text("path", path).Line();
  run.record = TakeApart(ParseEvents(run.journal));
  run.record.has_no_packages = directory.state == ListedFile::State::kWithoutPackages;
  run.facts.kind = FileKind::kDirectory;
  run.facts.error = directory.error;
  return run;
}

std::string ContentOf(int fd) {
  struct stat state = {};
  fstat(fd, &state);
  return ReadAt(fd, 0, static_cast<size_t>(state.st_size));
}

}  // namespace

// Each run has its own journal, so that several runs are possible at the same time.
struct Simulator::Task {
  const Deadline deadline;
  const ScopedFd journal;
  std::string path;  // the resolved path of the file on which the tool is run
  Failure failure;
};

Simulator::Simulator(const RunOptions& options, bool has_standard_input)
    : options_(options),
      has_standard_input_(has_standard_input),
      kernel_(ProgramDirectory() + "/../lib/apktoolkit/libapktoolkit_kernel.so"),
      signed_(options.state, options.jobs == 1) {}

std::optional<std::string> Simulator::Prepare() {
  kernel_descriptor_.emplace(open(kernel_.c_str(), O_RDONLY | O_CLOEXEC));
  if (kernel_descriptor_->get() < 0) return "there is no stand-in " + kernel_ + ErrnoText();
  if (access(options_.tool.c_str(), X_OK) != 0) return "cannot run " + options_.tool + ErrnoText();
  const ScopedFd tool(open(options_.tool.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK));
  tool_sha256_ = FileSha256(tool.get());
  if (!signed_.Load()) return "cannot use the directory " + options_.state;
  return {};
}

FileRun Simulator::Run(const ListedFile& listed) {
  if (listed.state != ListedFile::State::kToRun) return RunOfDirectory(listed);
  const std::string& file = listed.name;
  Task task = {Deadline(options_.timeout), ScopedFd(memfd_create("journal", MFD_CLOEXEC)), "", {}};
  if (task.journal.get() >= 0) fcntl(task.journal.get(), F_SETFL, O_APPEND);
  Installation installation;
  const auto problem = installation.LayOut(file, options_.install, options_.abi, task.deadline);
  if (problem) Fail(Failure::Kind::kNotInstalled, *problem, &task);
  const std::string& installed = installation.path();
  task.path = Resolved(installed);
  Event start("start");
  start.Text("file", file).Text("path", Resolved(file));
  if (installation.is_done()) start.Text("installed", task.path);
  start.AppendTo(task.journal.get());
  if (task.failure.kind == Failure::Kind::kNone) RunToolFor(installed, &task);

  FileRun run;
  const std::string journal = ContentOf(task.journal.get());
  RememberSigned(ParseEvents(journal), &task);
  run.journal = installation.WithStablePaths(journal);
  run.record = TakeApart(ParseEvents(run.journal));
  run.record.failure = task.failure;
  run.record.tool = {options_.is_own_tool, tool_sha256_};
  run.record.has_standard_input = has_standard_input_;
  run.record.of_other_abis = installation.of_other_abis();
  run.record.not_laid_out = installation.left_out();
  run.record.not_extracted = installation.not_extracted();
  // A run that cannot be judged needs no facts.
  if (task.failure.kind != Failure::Kind::kNone) return run;
  run.facts = LookAt(installed, [&task] { return task.deadline.HasPassed(); });
  return run;
}

// Runs the tool. If the tool started, records in the journal how the tool ended.
void Simulator::RunToolFor(const std::string& file, Task* task) {
  const PhoneSettings phone = PhoneFor(*task);
  if (task->deadline.HasPassed()) return Fail(Failure::Kind::kTimedOut, "", task);
  const ToolCommand command = {options_.runner, options_.tool, file, PreloadName(),
                               SettingsToEnvironment(phone)};
  const ToolEnd end = RunTool(command, task->deadline);
  switch (end.how) {
    case ToolEnd::How::kNotStarted:
      errno = end.value;
      return Fail(Failure::Kind::kNotStarted, "cannot start " + ProgramOf(command) + ErrnoText(),
                  task);
    case ToolEnd::How::kStopped:
      Event("exit").Number("signal", SIGKILL).AppendTo(task->journal.get());
      return Fail(Failure::Kind::kTimedOut, "", task);
    case ToolEnd::How::kKilled:
      Event("exit").Number("signal", end.value).AppendTo(task->journal.get());
      if (IsInterrupted()) return Fail(Failure::Kind::kInterrupted, "", task);
      break;
    case ToolEnd::How::kExited:
      Event("exit").Number("status", end.value).AppendTo(task->journal.get());
      break;
  }
  const Events events = ParseEvents(ContentOf(task->journal.get()));
  const auto is_attached = [](const auto& event) { return TextOf(event, "event") == "attached"; };
  if (std::none_of(events.begin(), events.end(), is_attached)) {
    Fail(Failure::Kind::kStandInsMissing, options_.tool, task);
  }
}

// The settings of the phone at the start of the run.
PhoneSettings Simulator::PhoneFor(const Task& task) {
  PhoneSettings phone = options_.phone;
  phone.journal = OwnDescriptorPath(task.journal.get());
  for (const std::string& trusted : options_.trust) AddId(trusted, &phone.trusted);
  if (signed_.Holds(task.path, task.deadline)) AddId(task.path, &phone.trusted);
  return phone;
}

// The dynamic loader treats spaces and colons in LD_PRELOAD as separators. The path of a descriptor
// has neither.
std::string Simulator::PreloadName() const {
  if (kernel_.find_first_of(" :") == std::string::npos) return kernel_;
  return OwnDescriptorPath(kernel_descriptor_->get());
}

void Simulator::RememberSigned(const Events& events, Task* task) {
  for (const auto& event : events) {
    const bool is_signed = TextOf(event, "event") == "sign" && NumberOf(event, "result") == 0;
    if (!is_signed || signed_.Add(TextOf(event, "path"), task->deadline)) continue;
    return Fail(Failure::Kind::kStateNotKept, options_.state, task);
  }
}

// After an interruption, every failure becomes kInterrupted. After the deadline, if there was no
// interruption, every failure becomes kTimedOut.
void Simulator::Fail(Failure::Kind kind, const std::string& detail, Task* task) const {
  task->failure = {kind, detail};
  if (!task->deadline.HasPassed()) return;
  std::ostringstream seconds;
  seconds << options_.timeout << (options_.timeout == 1 ? " second" : " seconds");
  const bool is_late = !IsInterrupted();
  task->failure = {is_late ? Failure::Kind::kTimedOut : Failure::Kind::kInterrupted,
                   is_late ? seconds.str() : ""};
}

}  // namespace simulator
