// Tells whether a package's JAR signature is good, and who signed it. It shows what a program looks
// like that links the verification. It signs nothing. The reason of a refusal is in the Android
// log, which the platform's log library writes to standard error on a workstation.
#include <fcntl.h>
#include <unistd.h>

#include <cstdint>
#include <cstdio>
#include <vector>

#include "apk/apk.h"
#include "util/digest.h"

namespace {

void PrintSigner(const ApkTools::Apk& apk) {
  std::vector<uint8_t> digest;
  ComputeSHA256Digest(apk.GetManufacturerKey(), digest);
  printf("package name: %s\nSHA-256 digest of the signer's modulus: ",
         apk.GetPackageName().c_str());
  for (const uint8_t byte : digest) printf("%02x", byte);
  printf("\n");
}

}  // namespace

// Exit status: 0 a good package; 1 another file; 2 a wrong command line, or the file cannot be
// opened.
int main(int argc, char* argv[]) {
  if (argc != 2) {
    fprintf(stderr, "usage: verify FILE\n");
    return 2;
  }
  const int fd = open(argv[1], O_RDONLY | O_CLOEXEC);
  if (fd < 0) {
    perror(argv[1]);
    return 2;
  }
  ApkTools::Apk apk(fd);
  const bool good = apk.IsGoodApk();
  printf("%s: %s\n", argv[1], good ? "good" : "not good");
  if (good) PrintSigner(apk);
  close(fd);
  return good ? 0 : 1;
}
