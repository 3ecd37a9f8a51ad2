// probe FILE: takes the place of the tool in tests. Executes the lines of FILE, each of which is a
// command and its arguments. The first line of FILE.out is "fd N", with the descriptor of FILE.
// After each command, the probe writes the line "RESULT ERRNO" to FILE.out. errno is set to 77
// before the command, so that the line shows whether the command changed it. In place of a
// payload's hexadecimal digits, "null" and "wild" name memory that cannot be read, and "cut" names
// a payload that continues into an unmapped page.
#include <fcntl.h>
#include <sys/mman.h>
#include <sys/resource.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <functional>
#include <map>
#include <sstream>
#include <string>
#include <vector>

#include "sign/libzu.h"
#include "simulator/phone/log_library.h"

// Programs that are built for large files call fcntl by the name fcntl64.
extern "C" int fcntl64(int, int, ...);

namespace {

// Writes a record as the platform's C++ libraries do.
template <typename Data = __android_logger_data, typename Message = __android_log_message>
void WriteLogRecord(int priority, const char* tag, const char* text) {
  if constexpr (simulator::kLogLibraryHas<Message>) {
    Message message = {sizeof(message), LOG_ID_MAIN, priority, tag, nullptr, 0, text};
    __android_log_write_log_message(&message);
  } else {
    Data data = {sizeof(data), LOG_ID_MAIN, priority, tag, nullptr, 0};
    __android_log_write_logger_data(&data, text);
  }
}

using Words = std::vector<std::string>;
using Command = std::function<long(const Words&)>;

constexpr int kSign = 1124;
constexpr int kVerify = 1125;

int Int(const std::string& word) { return static_cast<int>(strtol(word.c_str(), nullptr, 0)); }

std::string FromHex(const std::string& digits) {
  std::string bytes;
  for (size_t i = 0; i + 1 < digits.size(); i += 2) {
    bytes += static_cast<char>(strtol(digits.substr(i, 2).c_str(), nullptr, 16));
  }
  return bytes;
}

// The memory that `word` names. The bytes stay valid until the next call.
const void* Memory(const std::string& word) {
  if (word == "null") return nullptr;
  const auto page = static_cast<size_t>(sysconf(_SC_PAGESIZE));
  void* const pages =
      mmap(nullptr, 2 * page, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
  char* const second = static_cast<char*>(pages) + page;
  munmap(second, page);
  if (word == "wild") return second;
  // "cut": only the first of the two bytes of data can be read.
  if (word == "cut") return memcpy(second - 3, "\2\0a", 3);
  static std::string bytes;
  bytes = FromHex(word);
  return bytes.data();
}

// Returns the number in the file, and closes the file. Returns -1 for a null pointer, and -2 if the
// file contains no number.
long ReadAndClose(FILE* file) {
  unsigned value = 0;
  if (file == nullptr) return -1;
  const bool is_read = fscanf(file, "%x", &value) == 1;
  const int before = errno;
  fclose(file);
  errno = before;
  return is_read ? static_cast<long>(value) : -2;
}

// The number of bytes in the file, at most 64.
long CountAndClose(FILE* file) {
  char bytes[64];
  const size_t count = fread(bytes, 1, sizeof(bytes), file);
  fclose(file);
  return static_cast<long>(count);
}

// Writes to a file that was opened for reading.
long WriteAndClose(FILE* file) {
  const long result = write(fileno(file), "2e", 2);
  const int error = errno;
  fclose(file);
  errno = error;
  return result;
}

long Limit(const Words& words) {
  const rlimit limit = {static_cast<rlim_t>(Int(words[1])), static_cast<rlim_t>(Int(words[1]))};
  return setrlimit(RLIMIT_NOFILE, &limit);
}

std::string g_file;

// Tests wait until FILE.pid is not empty. Some tests later check that this process has ended.
long WriteId(const Words&) {
  std::ofstream(g_file + ".pid") << getpid() << std::endl;
  return 0;
}

// The number of descriptors from 3 to 19999 that exec would leave open. The journal's descriptor is
// also in this range, but must not be counted: exec must close this descriptor.
long Inherited(const Words&) {
  long count = 0;
  for (int fd = 3; fd < 20000; ++fd) {
    const int flags = fcntl(fd, F_GETFD);
    if (flags >= 0 && (flags & FD_CLOEXEC) == 0) ++count;
  }
  errno = 77;
  return count;
}

const std::map<std::string, Command> kCommands = {
    {"sign", [](const Words& w) { return fcntl(Int(w[1]), kSign, Memory(w[2])); }},
    {"sign64", [](const Words& w) { return fcntl64(Int(w[1]), kSign, Memory(w[2])); }},
    {"verify", [](const Words& w) { return fcntl(Int(w[1]), kVerify); }},
    {"verify64", [](const Words& w) { return fcntl64(Int(w[1]), kVerify); }},
    {"fcntl", [](const Words& w) { return fcntl(Int(w[1]), Int(w[2]), Int(w[3])); }},
    {"fcntl64", [](const Words& w) { return fcntl64(Int(w[1]), Int(w[2]), Int(w[3])); }},
    {"open", [](const Words& w) { return open(w[1].c_str(), O_RDONLY); }},
    {"name", [](const Words& w) { return open(w[1].c_str(), O_PATH); }},
    {"close", [](const Words& w) { return close(Int(w[1])); }},
    {"fopen", [](const Words& w) { return ReadAndClose(fopen(w[1].c_str(), w[2].c_str())); }},
    {"fopen64", [](const Words& w) { return ReadAndClose(fopen64(w[1].c_str(), w[2].c_str())); }},
    {"bytes", [](const Words& w) { return CountAndClose(fopen(w[1].c_str(), "r")); }},
    {"keep", [](const Words& w) { return fileno(fopen(w[1].c_str(), "r")); }},
    {"write", [](const Words& w) { return WriteAndClose(fopen(w[1].c_str(), "r")); }},
    {"own-task",
     [](const Words&) {
       const std::string path = "/proc/" + std::to_string(getpid()) + "/integrity/value";
       return ReadAndClose(fopen(path.c_str(), "r"));
     }},
    {"register",
     [](const Words& w) {
       const std::string data = FromHex(w[3]);
       return ZuNewCertificate(Int(w[1]), w[2].c_str(),
                               reinterpret_cast<const unsigned char*>(data.data()), data.size());
     }},
    {"log",
     [](const Words& w) {
       return __android_log_print(Int(w[1]), w[2].c_str(), "%s|%d\n", FromHex(w[3]).c_str(), 5);
     }},
    {"log-write",
     [](const Words& w) {
       return __android_log_write(Int(w[1]), w[2].c_str(), FromHex(w[3]).c_str());
     }},
    {"log-data",
     [](const Words& w) {
       WriteLogRecord(Int(w[1]), w[2].c_str(), FromHex(w[3]).c_str());
       return 0;
     }},
    {"log-assert",
     [](const Words& w) -> long { __android_log_assert("condition", w[1].c_str(), "why %d", 7); }},
    {"print", [](const Words& w) { return printf("%s", FromHex(w[1]).c_str()); }},
    {"puts", [](const Words& w) { return puts(w[1].c_str()); }},
    {"limit", Limit},
    {"inherited", Inherited},
    {"pid", WriteId},
    {"has-variable", [](const Words& w) { return getenv(w[1].c_str()) == nullptr ? 0L : 1L; }},
    {"exit", [](const Words& w) -> long { _exit(Int(w[1])); }},
    {"ignore", [](const Words& w) { return signal(Int(w[1]), SIG_IGN) == SIG_ERR ? -1L : 0L; }},
    {"kill", [](const Words& w) { return raise(Int(w[1])); }},
    {"sleep", [](const Words& w) { return sleep(static_cast<unsigned>(Int(w[1]))); }},
};

void Do(const std::string& line, std::ofstream& out) {
  std::istringstream text(line);
  Words words;
  for (std::string word; text >> word;) words.push_back(word);
  if (words.empty()) return;
  const Command& command = kCommands.at(words[0]);
  errno = 77;
  const long result = command(words);
  const int error = errno;
  out << result << ' ' << error << std::endl;
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 2) return 1;
  g_file = argv[1];
  // Opens the file before anything else, as the tool does.
  const int fd = open(argv[1], O_RDONLY);
  std::string script(1 << 20, '\0');
  const ssize_t length = read(fd, script.data(), script.size());
  if (length < 0) return 1;
  script.resize(static_cast<size_t>(length));
  // The file of the results is opened before any command runs. The files that commands open
  // therefore get higher descriptors.
  std::ofstream out(argv[1] + std::string(".out"));
  out << "fd " << fd << std::endl;
  std::istringstream lines(script);
  for (std::string line; std::getline(lines, line);) Do(line, out);
  return 0;
}
