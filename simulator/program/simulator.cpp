#include "simulator/program/simulator.h"

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
#include "simulator/program/run.h"

namespace {

namespace fs = std::filesystem;

bool Fail(const std::string& message, std::string* error) {
  *error = message;
  return false;
}

// Why the last system call failed, as the end of a message.
std::string ErrnoText() { return std::string(": ") + strerror(errno); }

std::string Seconds(double seconds) {
  std::ostringstream text;
  text << seconds << (seconds == 1 ? " second" : " seconds");
  return text.str();
}

// As the kernel names the file once it is open.
std::string Resolved(const std::string& file) {
  std::error_code error;
  const fs::path path = fs::canonical(file, error);
  return error ? fs::absolute(file, error).string() : path.string();
}

void AddId(const std::string& path, std::vector<FileId>* ids) {
  struct stat state = {};
  if (stat(path.c_str(), &state) == 0) ids->push_back({state.st_dev, state.st_ino});
}

// A path by which the tool's process reaches what this process has open.
std::string OwnDescriptorPath(int fd) {
  return "/proc/" + std::to_string(getpid()) + "/fd/" + std::to_string(fd);
}

}  // namespace

Simulator::Simulator(const Options& options)
    : options_(options),
      kernel_(ProgramDirectory() + "/../lib/apktoolkit/libapktoolkit_kernel.so"),
      signed_(options.state) {}

Simulator::~Simulator() {
  if (journal_ >= 0) close(journal_);
  if (kernel_descriptor_ >= 0) close(kernel_descriptor_);
}

bool Simulator::Prepare(std::string* error) {
  if (!OpenJournalFile() ||
      !Event("journal").Number("version", kJournalVersion).AppendTo(journal_)) {
    return Fail("cannot write the journal " + options_.journal + ErrnoText(), error);
  }
  if (access(kernel_.c_str(), R_OK) != 0) {
    return Fail("there is no stand-in " + kernel_ + ErrnoText(), error);
  }
  if (access(options_.tool.c_str(), X_OK) != 0) {
    return Fail("cannot run " + options_.tool + ErrnoText(), error);
  }
  return signed_.Load() || Fail("cannot use the directory " + options_.state, error);
}

bool Simulator::Run(const std::string& file, Events* events, std::string* error) {
  const size_t before = Journal().size();
  const std::string path = Resolved(file);
  const bool ended = RunTool(file, path, error);
  *events = EventsFrom(before);
  if (!ended) return false;
  const auto is_attached = [](const auto& event) { return TextOf(event, "event") == "attached"; };
  if (std::none_of(events->begin(), events->end(), is_attached)) {
    return Fail("the stand-ins were not loaded into " + options_.tool, error);
  }
  return RememberSigned(*events) || Fail("cannot write to " + options_.state, error);
}

std::string Simulator::Journal() const {
  std::string journal;
  char part[1 << 16];
  ssize_t length;
  while ((length = pread(journal_, part, sizeof(part), static_cast<off_t>(journal.size()))) > 0) {
    journal.append(part, static_cast<size_t>(length));
  }
  return journal;
}

// Opens the file that was asked for, or one without a name. Events are appended to either.
bool Simulator::OpenJournalFile() {
  constexpr int kFlags = O_RDWR | O_CREAT | O_TRUNC | O_APPEND | O_CLOEXEC;
  const std::string& path = options_.journal;
  journal_ = path.empty() ? memfd_create("journal", MFD_CLOEXEC) : open(path.c_str(), kFlags, 0666);
  return journal_ >= 0 && fcntl(journal_, F_SETFL, O_APPEND) == 0;
}

// Runs the tool between the events "start" and "exit".
bool Simulator::RunTool(const std::string& file, const std::string& path, std::string* error) {
  Event("start").Text("file", file).Text("path", path).AppendTo(journal_);
  const Command command = {
      options_.runner, options_.tool, file, PreloadName(), SettingsToEnvironment(PhoneFor(path)),
      options_.timeout};
  const Ending ending = ::Run(command);
  switch (ending.end) {
    case End::kNotStarted:
      errno = ending.value;
      return Fail("cannot start " + options_.tool + ErrnoText(), error);
    case End::kTimedOut:
      Event("exit").Number("signal", SIGKILL).AppendTo(journal_);
      return Fail(options_.tool + " was still running after " + Seconds(options_.timeout) +
                      " and was killed (it waits for ever while its integrity value is ffffffff)",
                  error);
    case End::kKilled:
      return Event("exit").Number("signal", ending.value).AppendTo(journal_);
    case End::kExited:
      return Event("exit").Number("status", ending.value).AppendTo(journal_);
  }
  return false;
}

// The phone as the run for the file at `path` finds it.
PhoneSettings Simulator::PhoneFor(const std::string& path) const {
  PhoneSettings phone = options_.phone;
  phone.journal = OwnDescriptorPath(journal_);
  for (const std::string& trusted : options_.trust) AddId(trusted, &phone.trusted);
  if (signed_.Holds(path)) AddId(path, &phone.trusted);
  return phone;
}

// The loader takes spaces and colons for separators; a descriptor's path has none.
std::string Simulator::PreloadName() {
  if (kernel_.find_first_of(" :") == std::string::npos) return kernel_;
  if (kernel_descriptor_ < 0) kernel_descriptor_ = open(kernel_.c_str(), O_RDONLY | O_CLOEXEC);
  return OwnDescriptorPath(kernel_descriptor_);
}

// Lines that are no JSON are not ours and do not count.
Events Simulator::EventsFrom(size_t offset) const {
  Events events;
  for (const std::string& line : Split(Journal().substr(offset), '\n')) {
    auto event = nlohmann::json::parse(line, nullptr, false);
    if (event.is_object()) events.push_back(std::move(event));
  }
  return events;
}

bool Simulator::RememberSigned(const Events& events) {
  bool kept = true;
  for (const auto& event : events) {
    const bool is_signed = TextOf(event, "event") == "sign" && NumberOf(event, "result") == 0;
    if (is_signed) kept = signed_.Add(TextOf(event, "path")) && kept;
  }
  return kept;
}
