// Runs three steps on one file: signs its native libraries, signs the file itself, and registers
// its signer. main returns 1 for a usage error, and else 0. Only the Android log reports what was
// signed and what was refused. Of the tool's code, only crypto/pkcs7.cpp prints: the faults of a
// signature block, to standard output.
#include <sys/statvfs.h>
#include <unistd.h>

#include "apk/apk.h"
#include "sign/registration.h"
#include "sign/signing.h"
#include "util/file.h"

namespace {

// A file system counts as writable if its state cannot be read.
bool IsOnReadOnlyFileSystem(int fd) {
  struct statvfs state = {};
  return fstatvfs(fd, &state) == 0 && (state.f_flag & ST_RDONLY) != 0;
}

}  // namespace

int main(int argc, char* argv[]) {
  if (argc != 2) return 1;
  // Deliberate: OpenForReading does not wait for the writer of a FIFO, because a FIFO is not an
  // archive.
  const int fd = OpenForReading(argv[1], 0);
  // Deliberate: descriptor 0 is refused like a failed open. A file gets descriptor 0 only if the
  // caller closed standard input, and the install service never does this. Nothing can be signed on
  // a read-only file system, so the tool ends without an error. The end of the process closes the
  // descriptor.
  if (fd < 1 || IsOnReadOnlyFileSystem(fd)) return 0;

  ApkTools::Apk apk(fd);
  // Deliberate: the results are ignored. Each step itself checks the file, and a failed step does
  // not stop the next step.
  VeltSignJni(apk, fd, argv[1]);
  VeltSign(apk, fd, fd);
  ZuSign(apk, fd, fd);
  close(fd);
  return 0;
}
