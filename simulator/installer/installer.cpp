#include "simulator/installer/installer.h"

#include <fcntl.h>
#include <poll.h>
#include <signal.h>
#include <spawn.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <sstream>

#include "simulator/package/archive.h"
#include "simulator/run/process.h"

namespace simulator {

namespace {

// The path of apksig, the library that verifies the packages.
constexpr char kVerifierLibrary[] = APKTOOLKIT_APKSIG;
constexpr char kClass[] = "InstallerVerifier";

bool HasProgram(const std::string& name);
bool IsPackage(int fd);
bool Send(int fd, std::string_view bytes);
bool Receive(int fd, const Deadline& deadline, std::string* line);
Judgement GaveUp(const std::string& why) { return {Judgement::State::kGaveUp, why, {}}; }

}  // namespace

std::optional<std::string> Installer::Missing() const {
  constexpr char kInstall[] =
      " is missing; run apt-get install default-jre-headless libapksig-java";
  if (access(options_.program.c_str(), R_OK) != 0) {
    return options_.program +
           " is missing; build it where default-jdk-headless and libapksig-java are installed";
  }
  if (access(kVerifierLibrary, R_OK) != 0) return std::string(kVerifierLibrary) + kInstall;
  if (!HasProgram("java")) return std::string("java") + kInstall;
  return {};
}

// The Java program reads one path per line, but a file's own name can contain a line feed. The Java
// program therefore gets a path in /proc, which leads to this process's descriptor of the file.
Judgement Installer::Judge(const std::string& file) {
  if (options_.use == InstallerUse::kOff) return {};
  const ScopedFd opened(open(file.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK | O_NOCTTY));
  if (opened.get() < 0 || !IsPackage(opened.get())) return {};
  if (const auto missing = Missing()) return {Judgement::State::kMissing, *missing, {}};
  const std::lock_guard<std::mutex> lock(mutex_);
  return Ask("/proc/" + std::to_string(getpid()) + "/fd/" + std::to_string(opened.get()));
}

Judgement Installer::Ask(const std::string& path) {
  if (!socket_ && !Start()) return GaveUp("java does not start");
  const Deadline deadline(options_.timeout);
  std::string answer;
  if (Send(socket_->get(), path + "\n") && Receive(socket_->get(), deadline, &answer)) {
    return ParseJudgement(answer);
  }
  Stop();  // the next package starts a new process
  if (IsInterrupted()) return GaveUp("it was interrupted");
  if (!deadline.HasPassed()) return GaveUp("it ended");
  std::ostringstream seconds;
  seconds << "it was still busy after " << options_.timeout << " s";
  return GaveUp(seconds.str());
}

// Uses a socket and not a pipe, because send() can suppress SIGPIPE if the Java program has ended.
bool Installer::Start() {
  int ends[2];
  if (socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, ends) != 0) return false;
  const ScopedFd theirs(ends[1]);
  socket_.emplace(ends[0]);
  std::string words[] = {"java",
                         "-Xmx512m",  // limits the heap, even for a hostile package
                         "-XX:+UseSerialGC",
                         "-XX:TieredStopAtLevel=1",  // only the fast compiler: most runs are short
                         "-XX:-UsePerfData",         // leaves no files in /tmp
                         "-cp",
                         options_.program + ":" + kVerifierLibrary,
                         kClass,
                         std::to_string(options_.levels.first),
                         std::to_string(options_.levels.last)};
  char* arguments[std::size(words) + 1] = {};
  for (size_t i = 0; i < std::size(words); ++i) arguments[i] = words[i].data();
  posix_spawn_file_actions_t actions;
  posix_spawn_file_actions_init(&actions);
  posix_spawn_file_actions_adddup2(&actions, theirs.get(), STDIN_FILENO);
  posix_spawn_file_actions_adddup2(&actions, theirs.get(), STDOUT_FILENO);
  posix_spawn_file_actions_addopen(&actions, STDERR_FILENO, "/dev/null", O_WRONLY, 0);
  posix_spawn_file_actions_addclosefrom_np(&actions, STDERR_FILENO + 1);
  const OwnProcessGroup group;
  const int error =
      posix_spawnp(&process_, arguments[0], &actions, group.get(), arguments, environ);
  posix_spawn_file_actions_destroy(&actions);
  if (error != 0) socket_.reset();
  return error == 0;
}

void Installer::Stop() {
  if (!socket_) return;
  socket_.reset();
  kill(process_, SIGKILL);
  waitpid(process_, nullptr, 0);
}

namespace {

bool HasProgram(const std::string& name) {
  const char* const path = getenv("PATH");
  std::istringstream directories(path == nullptr ? "" : path);
  for (std::string directory; std::getline(directories, directory, ':');) {
    directory.append("/").append(name);
    if (access(directory.c_str(), X_OK) == 0) return true;
  }
  return false;
}

// True if the file is a package for the tool: an archive with AndroidManifest.xml.
bool IsPackage(int fd) {
  struct stat state = {};
  if (fstat(fd, &state) != 0 || !S_ISREG(state.st_mode)) return false;
  int32_t result = -1;
  const Archive archive(fd, &result);
  return result == 0 && archive.Has(kAndroidManifestName);
}

bool Send(int fd, std::string_view bytes) {
  while (!bytes.empty()) {
    const ssize_t sent = send(fd, bytes.data(), bytes.size(), MSG_NOSIGNAL);
    if (sent <= 0) return false;
    bytes.remove_prefix(static_cast<size_t>(sent));
  }
  return true;
}

// Receives one line, without its line feed. Returns false if the deadline passes first, if about
// kLongest bytes contain no line feed, or if the Java program ends first.
bool Receive(int fd, const Deadline& deadline, std::string* line) {
  constexpr int kPollMilliseconds = 100;
  constexpr size_t kLongest = 64 << 20;
  std::string part(1 << 16, '\0');
  while (line->size() < kLongest && !deadline.HasPassed()) {
    pollfd waiting = {fd, POLLIN, 0};
    if (poll(&waiting, 1, kPollMilliseconds) <= 0) continue;
    // Judge holds mutex_ during this wait on purpose: packages are judged one after the other.
    // NOLINTNEXTLINE(clang-analyzer-unix.BlockInCriticalSection)
    const ssize_t size = recv(fd, part.data(), part.size(), 0);
    if (size <= 0) return false;
    line->append(part, 0, static_cast<size_t>(size));
    if (line->back() != '\n') continue;
    line->pop_back();
    return true;
  }
  return false;
}

}  // namespace

}  // namespace simulator
