// The archive: opening it, finding and extracting an entry.
#include <fcntl.h>

#include <cerrno>
#include <cstring>

#include "apk/apk.h"
#include "apk/extraction.h"
#include "apk/zip_library.h"
#include "util/file.h"
#include "util/log.h"

namespace ApkTools {

// Settles descriptor and path, of which the caller may have given but one.
bool Apk::FindFile(const char* path) {
  if (fd_ < 0 && path == nullptr) {
    LogError("Can't initialize Apk: need valid file descriptor or filename\n");
    return false;
  }
  if (fd_ == -1) {
    fd_ = open(path, O_RDONLY | O_CLOEXEC);
    // Deliberate: descriptor 0 is a failure too. It is standard input's, and only a process that
    // was started without one, not as it should be, could be given it here.
    if (fd_ < 1) {
      LogError("open('%s') failed: %s\n", path, strerror(errno));
      return false;
    }
  }
  path_ = path == nullptr ? GetFilenameByFd(fd_) : path;
  return true;
}

// With `own_fd`, closing the descriptor becomes the archive's task.
bool Apk::OpenZip(bool own_fd) {
  const int32_t result = OpenArchiveFd(fd_, path_.c_str(), &zip_handle_, own_fd);
  if (result != 0) {
    LogError("OpenArchiveFd(%d) [file: %s] returned: %d: %s\n", fd_, path_.c_str(), result,
             ErrorCodeString(result));
    zip_handle_ = nullptr;
    return false;
  }
  return true;
}

// Extracts the entry of this name whole. Results are the zip library's; `out` is untouched when
// there is no such entry.
int32_t Apk::ExtractEntry(const std::string& name, std::vector<uint8_t>& out) {
  ZipEntry entry;
  const int32_t result = FindZipEntry(zip_handle_, name, &entry);
  return result != 0 ? result : ExtractZipEntry(zip_handle_, &entry, out);
}

}  // namespace ApkTools
