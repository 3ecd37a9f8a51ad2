// apktoolkit-verify prints one line per file: whether the kernel trusts the file. The program does
// not read the files and logs nothing. The kernel alone decides whether a regular file is trusted.
// A file of any other kind is not trusted. Exit status: 0 if all files are trusted; 1 if a file is
// not trusted or cannot be opened; 2 if the command line is wrong or the output cannot be written.
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>

#include "sign/integrity.h"
#include "verify/error_name.h"

namespace {

constexpr int kAllTrusted = 0;
constexpr int kNotTrusted = 1;
constexpr int kUsageError = 2;

bool IsCommandLineRight(int argc, char* argv[]);
bool IsTrusted(const char* path);
bool AskKernel(int fd);
void PrintPath(const char* path);
void PrintError(const char* fact, int error);

}  // namespace

int main(int argc, char* argv[]) {
  if (!IsCommandLineRight(argc, argv)) {
    fputs(
        "usage: apktoolkit-verify FILE...\n(for a file whose name begins with -, write ./-NAME)\n",
        stderr);
    return kUsageError;
  }
  int status = kAllTrusted;
  for (int i = 1; i < argc; ++i) {
    if (!IsTrusted(argv[i])) status = kNotTrusted;
  }
  const bool is_written = fflush(stdout) == 0 && ferror(stdout) == 0;
  return is_written ? status : kUsageError;
}

namespace {

// True if there is at least one argument, and no argument begins with "-". The program has no
// options. It nevertheless refuses a file's name that begins with "-".
bool IsCommandLineRight(int argc, char* argv[]) {
  for (int i = 1; i < argc; ++i) {
    if (argv[i][0] == '-') return false;
  }
  return argc > 1;
}

// Prints the file's line. Returns true if the kernel trusts the file. The open does not wait, even
// for a FIFO or a leased file.
bool IsTrusted(const char* path) {
  PrintPath(path);
  const int fd = open(path, O_RDONLY | O_NONBLOCK | O_NOCTTY | O_CLOEXEC);
  if (fd < 0) {
    PrintError("cannot be opened", errno);
    return false;
  }
  const bool is_trusted = AskKernel(fd);
  close(fd);
  return is_trusted;
}

// The kernel protects the bytes of regular files only. The kernel's answer for other files means
// nothing, so the program does not request it.
bool AskKernel(int fd) {
  struct stat state = {};
  if (fstat(fd, &state) != 0) {
    PrintError("not trusted", errno);
    return false;
  }
  if (!S_ISREG(state.st_mode)) {
    puts("not trusted (not a regular file)");
    return false;
  }
  if (VeltVerifyFd(fd) != 0) {
    PrintError("not trusted", errno);
    return false;
  }
  puts("trusted");
  return true;
}

// A path may contain any byte except NUL. Control characters and the backslash are printed as \xHH,
// so that a path cannot end the line or control a terminal. The control characters are those of
// ASCII, and U+0080 to U+009F, which UTF-8 encodes as 0xC2 and one more byte.
void PrintPath(const char* path) {
  bool begins_control = false;
  for (; *path != '\0'; ++path) {
    const auto byte = static_cast<unsigned char>(*path);
    const auto next = static_cast<unsigned char>(path[1]);
    const bool ends_control = begins_control;
    begins_control = byte == 0xc2 && next >= 0x80 && next < 0xa0;
    if (byte < 0x20 || byte == 0x7f || byte == '\\' || begins_control || ends_control) {
      printf("\\x%02x", static_cast<unsigned>(byte));
    } else {
      putchar(byte);
    }
  }
  fputs(": ", stdout);
}

void PrintError(const char* fact, int error) {
  const std::string_view name = ErrorName(error);
  printf("%s (errno %d, %.*s)\n", fact, error, static_cast<int>(name.size()), name.data());
}

}  // namespace
