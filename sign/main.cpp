// One file, three steps: sign its native libraries, sign the file itself, register its signer.
// Nothing is printed here; the exit status only tells a usage error (1) from everything else (0),
// and the Android log is the only record of what was signed and what was refused.
#include <sys/statvfs.h>
#include <unistd.h>

#include "apk/apk.h"
#include "sign/registration.h"
#include "sign/signing.h"
#include "util/file.h"

namespace {

// A file system whose state cannot be told counts as writable.
bool IsOnReadOnlyFileSystem(int fd) {
  struct statvfs state = {};
  return fstatvfs(fd, &state) == 0 && (state.f_flag & ST_RDONLY) != 0;
}

}  // namespace

int main(int argc, char* argv[]) {
  if (argc != 2) return 1;
  // Deliberate: without waiting for a FIFO's writer. It is a file that is no archive.
  const int fd = OpenForReading(argv[1], 0);
  // Deliberate: descriptor 0 is refused like a failed open. A caller that closed standard input
  // did not set this process up as the install path does. Nothing can be signed on a read-only file
  // system, and that is no error. The descriptor is left to the process exit.
  if (fd < 1 || IsOnReadOnlyFileSystem(fd)) return 0;

  ApkTools::Apk apk(fd);
  // Deliberate: the results are not looked at. Each step asks the package itself whether it may
  // go on, and none is skipped because an earlier one failed.
  VeltSignJni(apk, fd, argv[1]);
  VeltSign(apk, fd, fd);
  ZuSign(apk, fd, fd);
  close(fd);
  return 0;
}
