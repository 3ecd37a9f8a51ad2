// Lists a manifest whose sections are not sorted, and finds one section. With the argument "hash",
// computes the C++ library's hash of the manifest instead. tests/overflow/run compiles this program
// with traps for integer overflows. The computation of the hash overflows, so a trap must end the
// program.
#include <cstdio>
#include <functional>
#include <string>

#include "apk/entry_digests.h"

int main(int argc, char*[]) {
  std::string text = "Manifest-Version: 1.0\r\n\r\n";
  for (int i = 0; i < 100; ++i) {
    const std::string name(static_cast<size_t>(1 + i * 7 % 50), static_cast<char>('a' + i % 26));
    text += "Name: " + name + std::to_string(i) + "\r\nSHA-256-Digest: AA==\r\n\r\n";
  }
  if (argc > 1) return static_cast<int>(std::hash<std::string_view>()(text) & 1);
  ApkTools::EntryDigests digests;
  if (!digests.Load({text.begin(), text.end()})) return 1;
  digests.List();
  std::string attribute, digest;
  const bool found = digests.Find("a0", attribute, digest) && digest == "AA==";
  puts(found ? "found" : "not found");
  return found ? 0 : 1;
}
