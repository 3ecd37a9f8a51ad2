// bench_texts: measures the peak memory and the time that the tool needs to read a manifest. A
// "text" is one input: a META-INF/MANIFEST.MF or a compiled Android manifest. The texts are chosen
// to need much memory or time. Prints a line for each text:
//
//   READER <TAB> NAME <TAB> peak bytes for each byte of the text <TAB> nanoseconds for each byte
//
// The peak includes the text itself, so the peak is at least one byte for each byte of the text.
// Each text is read in a separate process. Memory that an earlier text left behind therefore does
// not count.
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <cstdint>
#include <cstdio>
#include <fstream>
#include <iterator>
#include <string>
#include <utility>
#include <vector>

#include "apk/apk.h"
#include "apk/manifest_mf.h"
#include "support/compiled_manifest.h"

namespace {

constexpr size_t kTextSize = 64 << 20;

// Joins make_piece(0), make_piece(1) and so on until the text has kTextSize bytes. Then appends two
// line ends.
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

// Returns a name of at most five characters. Numbers below 2^28 have different names. The names of
// consecutive numbers are not sorted.
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

void ReadManifest(std::vector<uint8_t> text) { ManifestMf().load(std::move(text)); }

void ReadAndroidManifest(std::vector<uint8_t> document) {
  ApkTools::Apk(-1).ParseAndroidManifest(std::move(document));
}

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

// A document is a compiled Android manifest. Each document has one string of kLongName characters,
// and kManyNodes equal nodes. Because the nodes are equal, deflate makes the document more than 300
// times smaller. A small package can therefore contain such a document.
constexpr size_t kManyNodes = 1 << 20;
constexpr size_t kLongName = 30000;

template <typename PutNode>
std::vector<uint8_t> Document(const PutNode& put_node) {
  CompiledXml xml(CompiledXml::Pool::kUtf16);
  for (size_t i = 0; i < kManyNodes; ++i) put_node(&xml);
  return xml.Build();
}

constexpr Text kDocuments[] = {
    {"elements of 65,535 attributes of size 0",
     [] {
       const XmlAttribute attribute = StringAttribute(std::string(kLongName, 'x'), "");
       return Document([&](CompiledXml* xml) {
         xml->StartWithSizelessAttributes("permission", attribute, 65535);
       });
     }},
    {"elements of one long name",
     [] {
       const std::string name(kLongName, 'x');
       return Document([&](CompiledXml* xml) { xml->Start(name); });
     }},
    {"namespaces of one long URI",
     [] {
       const std::string uri(kLongName, 'x');
       return Document([&](CompiledXml* xml) { xml->StartNamespace("", uri); });
     }},
};

struct Reader {
  const char* name;
  void (*read)(std::vector<uint8_t> text);
  const Text* texts;
  size_t count;
};

constexpr Reader kReaders[] = {
    {"`ManifestMf::load` of 64 MiB", ReadManifest, kTexts, std::size(kTexts)},
    {"`ParseAndroidManifest` of 25 to 59 MB", ReadAndroidManifest, kDocuments,
     std::size(kDocuments)},
};

// The peak memory of the process since ResetPeak, in KiB. Ends the process if the peak is not
// known.
long PeakKilobytes() {
  std::ifstream status("/proc/self/status");
  for (std::string word; status >> word;) {
    if (long kilobytes; word == "VmHWM:" && status >> kilobytes) return kilobytes;
  }
  _exit(1);
}

// Resets the peak, so that the memory that was used to make the text does not count. Ends the
// process if this is not possible.
void ResetPeak() {
  std::ofstream file("/proc/self/clear_refs");
  if (!(file << "5" << std::flush)) _exit(1);
}

void Measure(const Reader& reader, const Text& text) {
  using Clock = std::chrono::steady_clock;
  std::vector<uint8_t> bytes = text.make();
  const double size = static_cast<double>(bytes.size());
  ResetPeak();
  const auto start = Clock::now();
  reader.read(std::move(bytes));
  const std::chrono::duration<double, std::nano> time = Clock::now() - start;
  printf("%s\t%s\t%.2f\t%.2f\n", reader.name, text.name,
         static_cast<double>(PeakKilobytes()) * 1024 / size, time.count() / size);
}

// Calls Measure in a child process. Returns false if the child cannot be started or fails.
bool MeasureApart(const Reader& reader, const Text& text) {
  fflush(stdout);
  const pid_t child = fork();
  if (child == 0) {
    Measure(reader, text);
    fflush(stdout);
    _exit(0);
  }
  int status = 1;
  return child > 0 && waitpid(child, &status, 0) == child && status == 0;
}

}  // namespace

int main() {
  for (const Reader& reader : kReaders) {
    for (size_t i = 0; i < reader.count; ++i) {
      if (MeasureApart(reader, reader.texts[i])) continue;
      fprintf(stderr, "bench_texts: %s: failed\n", reader.texts[i].name);
      return 1;
    }
  }
  return 0;
}
