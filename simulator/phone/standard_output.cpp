// Records the tool's standard output as events. `stdout` becomes a line-buffered stream. This
// stream first records each line in the journal, and then writes the line to descriptor 1. Without
// line buffering, an event that happened after a line was printed could precede this line in the
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
  return written < 0 ? 0 : written;  // fopencookie(3): 0 reports a failure
}

__attribute__((constructor)) void ReplaceStandardOutput() {
  const ErrnoKeeper keeper;
  if (ThisPhone().journal.empty()) return;
  FILE* const stream = fopencookie(nullptr, "w", {nullptr, Print, nullptr, nullptr});
  if (stream == nullptr) return;
  setvbuf(stream, nullptr, _IOLBF, 0);
  stdout = stream;
}

// The C library flushes `stdout` only after all destructors. A later destructor could end the
// process before that flush, and the last output would be lost. This destructor therefore flushes
// `stdout` itself.
__attribute__((destructor)) void FlushStandardOutput() { fflush(stdout); }

}  // namespace

}  // namespace simulator
