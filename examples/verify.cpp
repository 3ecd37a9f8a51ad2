// An example of a program that links the tool's verification. Prints whether a package has a good
// JAR signature. If the signature is good, also prints the package's name and the digest of the JAR
// signer's key. Signs nothing. A package can also have a newer signature: v2 for phones from
// Android 7 on, v3 for phones from Android 9 on. These phones take the signer from the newer
// signature. This program does not read newer signatures. README.md in this directory shows how to
// compare the signers.
#include <fcntl.h>
#include <unistd.h>

#include <cstdint>
#include <cstdio>
#include <vector>

#include "library/verification.h"
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

// A separate function, so that the archive is released before main() closes the descriptor.
bool IsGood(const char* name, int fd) {
  ApkTools::Verification verification(fd);
  const ApkTools::Reason reason = verification.reason();
  if (reason != ApkTools::Reason::kGood) {
    printf("%s: refused: %s\n", name, ApkTools::TextOf(reason));
    return false;
  }
  printf("%s: good\n", name);
  PrintSigner(verification.apk());
  return true;
}

}  // namespace

// Exit status: 0 if the package is good, 1 if the file is refused, 2 if the command line is wrong
// or the file cannot be opened.
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
  const bool good = IsGood(argv[1], fd);
  close(fd);
  return good ? 0 : 1;
}
