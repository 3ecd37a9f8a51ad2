// The tool's standard output, as events among the others: `stdout` becomes a stream of complete
// lines that are recorded and then written to the descriptor that they were meant for. On a phone,
// nobody sees when the bytes of a line leave the process; here each line has its place in the
// journal.
#include <unistd.h>

#include <cstdio>
#include <string_view>

#include "simulator/phone/stand_in.h"

namespace simulator {

namespace {

ssize_t Print(void*, const char* bytes, size_t size) {
  Record(Event("stdout").Text("text", std::string_view(bytes, size)));
  const ssize_t written = write(STDOUT_FILENO, bytes, size);
  return written < 0 ? 0 : written;  // 0 is how such a stream is told of a failure
}

__attribute__((constructor)) void ReplaceStandardOutput() {
  const ErrnoKeeper keeper;
  if (ThisPhone().journal.empty()) return;
  FILE* const stream = fopencookie(nullptr, "w", {nullptr, Print, nullptr, nullptr});
  if (stream == nullptr) return;
  setvbuf(stream, nullptr, _IOLBF, 0);
  stdout = stream;
}

// The C library would do the same a little later, but an end of the process may come between.
__attribute__((destructor)) void FlushStandardOutput() { fflush(stdout); }

}  // namespace

}  // namespace simulator
