#include "support/process.h"

#include <fcntl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>

#include "support/files.h"

namespace {

// Makes the file at `path` the standard stream `number`.
bool Redirect(int number, const std::string& path, int flags) {
  const int fd = open(path.c_str(), flags, 0600);
  if (fd == number) return true;  // the stream was closed, so its number was free
  return fd >= 0 && dup2(fd, number) == number && close(fd) == 0;
}

// In the child process: executes the command, or exits with 127 as a shell does.
[[noreturn]] void Become(const std::vector<std::string>& command, const std::string& directory,
                         const std::string& output, const std::string& errors) {
  std::vector<char*> arguments;
  for (const std::string& word : command) arguments.push_back(const_cast<char*>(word.c_str()));
  arguments.push_back(nullptr);
  const bool ready = Redirect(STDIN_FILENO, "/dev/null", O_RDONLY) &&
                     Redirect(STDOUT_FILENO, output, O_WRONLY | O_CREAT) &&
                     Redirect(STDERR_FILENO, errors, O_WRONLY | O_CREAT) &&
                     (directory.empty() || chdir(directory.c_str()) == 0);
  // Closes the descriptors that this process inherited, such as ctest's log. Otherwise the files
  // that the command opens could get higher descriptor numbers than the tests expect.
  closefrom(STDERR_FILENO + 1);
  if (ready) execvp(arguments[0], arguments.data());
  perror(arguments[0]);
  _exit(127);
}

}  // namespace

ProcessResult RunProcess(const std::vector<std::string>& command, const std::string& directory) {
  const TempDir streams;
  const std::string output = streams / "output";
  const std::string errors = streams / "errors";
  const pid_t child = fork();
  if (child == 0) Become(command, directory, output, errors);
  int status = 0;
  if (child < 0 || waitpid(child, &status, 0) != child) {
    perror("fork");
    abort();
  }
  return {WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status), ContentOf(output),
          ContentOf(errors)};
}
