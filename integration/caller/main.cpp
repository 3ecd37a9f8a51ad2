// apktoolkit-all DIRECTORY LIST: signs the installed packages after an update of the system. The
// file LIST has a line "DIGEST[,DIGEST]... PATH" for each file of each package. The digests are
// those of the signers that the package manager knows (integration/signers/SignerDigests.java). A
// line without digests starts with the blank. DIRECTORY contains apktoolkit, apktoolkit-bound and
// apktoolkit-verify, for example /system/bin. The program prints the outcome for each file in LIST.
//
// apktoolkit is not run for files that the kernel already trusts. After an interruption, the
// program can therefore be started again with the same LIST.
// Exit status: 0 if all files are trusted, 1 if some are not, 2 if the command line is wrong,
// the list cannot be opened or read to its end, or one of its lines is malformed.
#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

#include "integration/caller/sign_package.h"

namespace {

constexpr int kAllTrusted = 0;
constexpr int kNotAllTrusted = 1;
constexpr int kWrongInput = 2;

// Reads the next line without its line end. Returns false at the end of the file (feof), or if the
// file cannot be read.
bool ReadLine(FILE* list, std::string* line) {
  char* text = nullptr;
  size_t size = 0;
  const ssize_t length = getline(&text, &size, list);
  if (length > 0) line->assign(text, static_cast<size_t>(length));
  free(text);
  if (length > 0 && line->back() == '\n') line->pop_back();
  return length > 0;
}

// Splits the line at its first blank into digests and path. The digests may be empty, and the path
// may contain blanks. Returns false if the line has no blank, or if the path is not absolute.
bool Parse(const std::string& line, InstalledPackage* package) {
  const size_t blank = line.find(' ');
  if (blank == std::string::npos || line.compare(blank, 2, " /") != 0) return false;
  *package = {line.substr(blank + 1), line.substr(0, blank)};
  return true;
}

bool HasTrust(SignOutcome outcome) {
  return outcome == SignOutcome::kTrustedAlready || outcome == SignOutcome::kTrusted;
}

}  // namespace

int main(int argc, char* argv[]) {
  if (argc != 3) {
    fputs("usage: apktoolkit-all DIRECTORY LIST\n", stderr);
    return kWrongInput;
  }
  FILE* const list = fopen(argv[2], "re");
  if (list == nullptr) {
    fprintf(stderr, "apktoolkit-all: cannot open %s: %s\n", argv[2], strerror(errno));
    return kWrongInput;
  }
  int status = kAllTrusted;
  for (std::string line; ReadLine(list, &line);) {
    InstalledPackage package;
    if (!Parse(line, &package)) {
      fprintf(stderr, "apktoolkit-all: this line is not \"DIGEST[,DIGEST]... PATH\": %s\n",
              line.c_str());
      status = kWrongInput;
      continue;
    }
    const SignOutcome outcome = SignPackage(argv[1], package, RunLimits());
    if (!HasTrust(outcome)) status = std::max(status, kNotAllTrusted);
    printf("%s: %s\n", package.path.c_str(), Describe(outcome));
    fflush(stdout);  // show progress at once
  }
  if (feof(list) == 0) {
    fprintf(stderr, "apktoolkit-all: cannot read %s to its end\n", argv[2]);
    status = kWrongInput;
  }
  fclose(list);
  return status;
}
