#include "journeys/simulation.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <nlohmann/json.hpp>
#include <sstream>

#include "support/package.h"

namespace fs = std::filesystem;

Folder::Folder(const std::string& parent) {
  const fs::path place = parent.empty() ? fs::temp_directory_path() : fs::path(parent);
  path_ = (fs::canonical(place) / "apktoolkit-XXXXXX").string();
  if (mkdtemp(path_.data()) == nullptr) {
    perror(path_.c_str());
    abort();
  }
}

Folder::~Folder() { fs::remove_all(path_); }

std::string Folder::Write(const std::string& name, const Bytes& content) const {
  const std::string path = *this / name;
  fs::create_directories(fs::path(path).parent_path());
  WriteFile(path, content);
  return path;
}

namespace {

std::string ReadText(const std::string& path) {
  std::ifstream file(path, std::ios::binary);
  std::stringstream text;
  text << file.rdbuf();
  return text.str();
}

// Makes the file at `path` the standard stream `number`.
bool Redirect(int number, const std::string& path, int flags) {
  const int fd = open(path.c_str(), flags, 0600);
  return fd >= 0 && dup2(fd, number) == number && close(fd) == 0;
}

// In the child: becomes the command, or exits with 127 as a shell does.
[[noreturn]] void Become(const std::vector<std::string>& command, const std::string& directory,
                         const std::string& output, const std::string& errors) {
  std::vector<char*> arguments;
  for (const std::string& word : command) arguments.push_back(const_cast<char*>(word.c_str()));
  arguments.push_back(nullptr);
  const bool ready = Redirect(STDIN_FILENO, "/dev/null", O_RDONLY) &&
                     Redirect(STDOUT_FILENO, output, O_WRONLY | O_CREAT) &&
                     Redirect(STDERR_FILENO, errors, O_WRONLY | O_CREAT) &&
                     (directory.empty() || chdir(directory.c_str()) == 0);
  // What this process was started with, such as ctest's log, would move the command's own numbers.
  closefrom(STDERR_FILENO + 1);
  if (ready) execvp(arguments[0], arguments.data());
  perror(arguments[0]);
  _exit(127);
}

// The journal without the events that tell of the simulation and not of the phone, which come
// before all others, and without the platform libraries' own log records.
std::string TimelineOf(const std::string& journal) {
  std::istringstream lines(journal);
  std::string line;
  for (const char* event : {"journal", "start", "attached"}) {
    std::getline(lines, line);
    EXPECT_EQ(nlohmann::json::parse(line, nullptr, false).value("event", ""), event) << line;
  }
  std::string timeline;
  while (std::getline(lines, line)) {
    const nlohmann::json event = nlohmann::json::parse(line, nullptr, false);
    if (event.value("tag", "ApkToolkit") == "ApkToolkit") timeline += event.dump() + "\n";
  }
  return timeline;
}

}  // namespace

ProcessResult RunProcess(const std::vector<std::string>& command, const std::string& directory) {
  const Folder folder;
  const std::string output = folder / "output";
  const std::string errors = folder / "errors";
  const pid_t child = fork();
  if (child == 0) Become(command, directory, output, errors);
  int status = 0;
  if (child < 0 || waitpid(child, &status, 0) != child) {
    perror("fork");
    abort();
  }
  return {WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status), ReadText(output),
          ReadText(errors)};
}

Simulation Simulate(const std::string& file, const std::vector<std::string>& options) {
  return Simulate(file, options, {});
}

Simulation Simulate(const std::string& file, const std::vector<std::string>& options,
                    const Start& start) {
  std::vector<std::string> command = start.before;
  command.insert(command.end(), {SimulatorPath(), "--json"});
  command.insert(command.end(), options.begin(), options.end());
  command.push_back(file);
  const ProcessResult run = RunProcess(command, start.directory);
  EXPECT_EQ(run.errors, "");
  EXPECT_LE(run.status, 1) << "the simulation itself failed";
  return {run.status, TimelineOf(run.output)};
}

bool AreProgramsEmulated() { return *APKTOOLKIT_RUNNER != '\0'; }

std::string ToolPath() { return APKTOOLKIT_PATH; }

std::string SimulatorPath() { return APKTOOLKIT_SIM_PATH; }
