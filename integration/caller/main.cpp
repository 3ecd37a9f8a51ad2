// apktoolkit-all DIRECTORY: has every installed package signed, after an update of the system.
// Reads a line "DIGEST[,DIGEST]... PATH" for each from standard input, as the package manager lists
// them (SignerDigests.java), and prints a line for each. DIRECTORY is where the programs lie:
// /system/bin.
//
// What the kernel trusts already is passed over, so that a run that was cut off goes on where it
// was. The exit status: 0 all are trusted, 1 some are not, 2 the command line or a line of input is
// wrong.
#include <cstdio>
#include <cstdlib>
#include <string>

#include "integration/caller/sign_package.h"

namespace {

constexpr int kAllTrusted = 0;
constexpr int kNotAllTrusted = 1;
constexpr int kWrongInput = 2;

// The next line without its end; false at the end of the input.
bool ReadLine(std::string* line) {
  char* text = nullptr;
  size_t size = 0;
  const ssize_t length = getline(&text, &size, stdin);
  if (length > 0) line->assign(text, static_cast<size_t>(length));
  free(text);
  if (length > 0 && line->back() == '\n') line->pop_back();
  return length > 0;
}

// The signers may be none; the path is absolute, and may have blanks.
bool Parse(const std::string& line, InstalledPackage* package) {
  const size_t blank = line.find(' ');
  if (blank == std::string::npos || line.compare(blank, 2, " /") != 0) return false;
  *package = {line.substr(blank + 1), line.substr(0, blank)};
  return true;
}

}  // namespace

int main(int argc, char* argv[]) {
  if (argc != 2) {
    fputs("usage: apktoolkit-all DIRECTORY <LIST\n", stderr);
    return kWrongInput;
  }
  bool is_input_right = true;
  bool all_trusted = true;
  for (std::string line; ReadLine(&line);) {
    InstalledPackage package;
    if (!Parse(line, &package)) {
      fprintf(stderr, "apktoolkit-all: no line of signers and path: %s\n", line.c_str());
      is_input_right = false;
      continue;
    }
    const SignOutcome outcome = SignPackage(argv[1], package, RunLimits());
    if (outcome != SignOutcome::kTrustedAlready && outcome != SignOutcome::kTrusted) {
      all_trusted = false;
    }
    printf("%s: %s\n", package.path.c_str(), Describe(outcome));
    fflush(stdout);  // for whoever watches
  }
  if (!is_input_right) return kWrongInput;
  return all_trusted ? kAllTrusted : kNotAllTrusted;
}
