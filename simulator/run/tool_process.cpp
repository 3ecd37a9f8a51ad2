#include "simulator/run/tool_process.h"

#include <fcntl.h>
#include <signal.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <climits>
#include <map>
#include <thread>

namespace simulator {

namespace {

using Words = std::vector<std::string>;

Words CommandWords(const ToolCommand& command, Words* environment);
Words EnvironmentWith(const Words& assignments);
int Spawn(Words words, Words environment, pid_t* child);
ToolEnd Wait(pid_t child, const Deadline& deadline);
std::vector<char*> Pointers(Words* words);

}  // namespace

ToolEnd RunTool(const ToolCommand& command, const Deadline& deadline) {
  Words environment = command.environment;
  const Words words = CommandWords(command, &environment);
  pid_t child = 0;
  const int error = Spawn(words, EnvironmentWith(environment), &child);
  if (error != 0) return {ToolEnd::How::kNotStarted, error};
  return Wait(child, deadline);
}

const std::string& ProgramOf(const ToolCommand& command) {
  return command.runner.empty() ? command.tool : command.runner[0];
}

std::string ProgramDirectory() {
  char path[PATH_MAX];
  const ssize_t length = readlink("/proc/self/exe", path, sizeof(path));
  const std::string program(path, length < 0 ? 0 : static_cast<size_t>(length));
  return program.substr(0, program.rfind('/'));
}

namespace {

// The kernel's stand-in is loaded only into the tool. If a runner, such as an emulator, starts the
// tool, the runner itself must not load the stand-in. The runner's option -E sets LD_PRELOAD for
// the tool alone.
Words CommandWords(const ToolCommand& command, Words* environment) {
  const std::string preload = "LD_PRELOAD=" + command.kernel;
  Words words = command.runner;
  if (words.empty()) {
    environment->push_back(preload);
  } else {
    words.insert(words.end(), {"-E", preload});
  }
  words.insert(words.end(), {command.tool, command.file});
  return words;
}

Words EnvironmentWith(const Words& assignments) {
  std::map<std::string, std::string> by_name;
  const auto assign = [&by_name](const std::string& assignment) {
    by_name[assignment.substr(0, assignment.find('='))] = assignment;
  };
  for (char** variable = environ; *variable != nullptr; ++variable) assign(*variable);
  for (const std::string& assignment : assignments) assign(assignment);
  Words environment;
  for (const auto& [name, assignment] : by_name) environment.push_back(assignment);
  return environment;
}

// Returns 0, or the errno of the failure to start the child. The child gets no descriptors except
// the standard streams. If all three streams are open, the tool's first file gets descriptor 3, as
// on a phone.
int Spawn(Words words, Words environment, pid_t* child) {
  posix_spawn_file_actions_t actions;
  posix_spawn_file_actions_init(&actions);
  posix_spawn_file_actions_addopen(&actions, STDOUT_FILENO, "/dev/null", O_WRONLY, 0);
  posix_spawn_file_actions_addclosefrom_np(&actions, STDERR_FILENO + 1);
  const OwnProcessGroup group;
  const std::string program = words[0];
  const int error = posix_spawnp(child, program.c_str(), &actions, group.get(),
                                 Pointers(&words).data(), Pointers(&environment).data());
  posix_spawn_file_actions_destroy(&actions);
  return error;
}

// Returns pointers to the words and then a null pointer, as posix_spawnp needs them. The words are
// not copied.
std::vector<char*> Pointers(Words* words) {
  std::vector<char*> pointers;
  for (std::string& word : *words) pointers.push_back(word.data());
  pointers.push_back(nullptr);
  return pointers;
}

ToolEnd Wait(pid_t child, const Deadline& deadline) {
  int status = 0;
  bool is_stopped = false;
  while (waitpid(child, &status, WNOHANG) == 0) {
    if (!deadline.HasPassed()) {
      std::this_thread::sleep_for(std::chrono::milliseconds(2));
    } else {
      is_stopped = true;
      kill(child, SIGKILL);
      waitpid(child, &status, 0);
      break;
    }
  }
  if (is_stopped) return {ToolEnd::How::kStopped, 0};
  return WIFEXITED(status) ? ToolEnd{ToolEnd::How::kExited, WEXITSTATUS(status)}
                           : ToolEnd{ToolEnd::How::kKilled, WTERMSIG(status)};
}

}  // namespace

}  // namespace simulator
