// bench_texts: what the worst texts that a manifest can have cost ManifestMf, in memory and time. A
// line for each text:
//
//   NAME <TAB> peak bytes for each byte of the text <TAB> nanoseconds for each byte
//
// The text itself is one of the bytes. Each is read in a process of its own, since the peak of a
// process never falls.
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <utility>
#include <vector>

#include "apk/manifest_mf.h"

namespace {

constexpr size_t kTextSize = 64 << 20;

// Appends pieces, which may depend on their numbers, until the text is long enough.
template <typename MakePiece>
std::vector<uint8_t> Repeat(const MakePiece& make_piece) {
  std::vector<uint8_t> text;
  text.reserve(kTextSize + 100);
  for (size_t i = 0; text.size() < kTextSize; ++i) {
    const std::string piece = make_piece(i);
    text.insert(text.end(), piece.begin(), piece.end());
  }
  text.push_back('\n');
  text.push_back('\n');
  return text;
}

// The shortest names there are, in an order that is none.
std::string ShortName(size_t i) {
  std::string name;
  for (size_t rest = i * 2654435761U % (1U << 28); rest > 0; rest /= 64) {
    name += static_cast<char>('@' + rest % 64);
  }
  return name;
}

struct Text {
  const char* name;
  std::vector<uint8_t> (*make)();
};

constexpr Text kTexts[] = {
    {"one name, again and again", [] { return Repeat([](size_t) { return "A: 1\n"; }); }},
    {"a thousand names, again and again",
     [] { return Repeat([](size_t i) { return std::to_string(i % 1000) + ": 1\n"; }); }},
    {"two long names, then one again and again",
     [] {
       return Repeat([](size_t i) {
         return i < 2 ? std::string(kTextSize / 4, 'B') + std::to_string(i) + ": 1\n" : "A: 1\n";
       });
     }},
    {"all names different, one section",
     [] { return Repeat([](size_t i) { return ShortName(i) + ": 1\n"; }); }},
    {"one attribute a section", [] { return Repeat([](size_t) { return "A: 1\n\n"; }); }},
    {"empty sections", [] { return Repeat([](size_t) { return ":\n\n\n"; }); }},
    {"one value of many lines",
     [] { return Repeat([](size_t i) { return i == 0 ? "A: 1\n" : " 1\n"; }); }},
    {"values of two lines", [] { return Repeat([](size_t) { return "A: 1\n 2\n\n"; }); }},
    {"one name without end", [] { return Repeat([](size_t) { return "A"; }); }},
};

long PeakKilobytes() {
  rusage usage = {};
  getrusage(RUSAGE_SELF, &usage);
  return usage.ru_maxrss;
}

void Measure(const Text& text) {
  using Clock = std::chrono::steady_clock;
  std::vector<uint8_t> bytes = text.make();
  const double size = static_cast<double>(bytes.size());
  const auto start = Clock::now();
  ManifestMf manifest;
  manifest.load(std::move(bytes));
  const std::chrono::duration<double, std::nano> time = Clock::now() - start;
  printf("%s\t%.2f\t%.2f\n", text.name, static_cast<double>(PeakKilobytes()) * 1024 / size,
         time.count() / size);
}

}  // namespace

int main() {
  for (const Text& text : kTexts) {
    fflush(stdout);
    const pid_t child = fork();
    if (child == 0) {
      Measure(text);
      return 0;
    }
    int status = 1;
    if (child < 0 || waitpid(child, &status, 0) != child || status != 0) {
      fprintf(stderr, "bench_texts: %s: failed\n", text.name);
      return 1;
    }
  }
  return 0;
}
