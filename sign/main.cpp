// One file, three steps: sign its native libraries, sign the file itself, register its signer. The
// tool prints nothing here. The exit status is 1 for a usage error and 0 for everything else. Only
// the Android log tells what was signed and what was refused.
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
  // Deliberate: does not wait for a FIFO's writer. A FIFO is not an archive.
  const int fd = OpenForReading(argv[1], 0);
  // Deliberate: descriptor 0 is refused like a failed open. A caller that closed standard input did
  // not set this process up as the install path does. On a read-only file system nothing can be
  // signed, and the tool ends without an error. The process exit closes the descriptor.
  if (fd < 1 || IsOnReadOnlyFileSystem(fd)) return 0;

  ApkTools::Apk apk(fd);
  // Deliberate: the results are ignored. Each step asks the package itself whether it may go on,
  // and a failed step does not make the tool skip the next.
  VeltSignJni(apk, fd, argv[1]);
  VeltSign(apk, fd, fd);
  ZuSign(apk, fd, fd);
  close(fd);
  return 0;
}
