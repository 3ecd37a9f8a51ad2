// Opens the archive, finds an entry and extracts it.
#include <fcntl.h>

#include <cerrno>
#include <cstring>

#include "apk/apk.h"
#include "apk/extraction.h"
#include "apk/zip_library.h"
#include "util/file.h"
#include "util/log.h"

namespace ApkTools {

// Sets the descriptor and the path. The caller may have given only one of them.
bool Apk::FindFile(const char* path) {
  if (fd_ < 0 && path == nullptr) {
    LogError("Can't initialize Apk: need valid file descriptor or filename\n");
    return false;
  }
  if (fd_ == -1) {
    fd_ = open(path, O_RDONLY | O_CLOEXEC);
    // Deliberate: descriptor 0 counts as a failure, because it belongs to standard input. open
    // returns 0 only if the standard input of the process is closed.
    if (fd_ < 1) {
      LogError("open('%s') failed: %s\n", path, strerror(errno));
      return false;
    }
  }
  path_ = path == nullptr ? GetFilenameByFd(fd_) : path;
  return true;
}

// If `own_fd` is true, the descriptor is closed together with the archive.
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

// Extracts the whole entry of this name. Results are the zip library's codes. If the archive has no
// such entry, `out` is untouched.
int32_t Apk::ExtractEntry(const std::string& name, std::vector<uint8_t>& out) {
  ZipEntry entry;
  const int32_t result = FindZipEntry(zip_handle_, name, &entry);
  return result != 0 ? result : ExtractZipEntry(zip_handle_, &entry, out);
}

}  // namespace ApkTools
