#include "sign/signing.h"

#include <fcntl.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <string>
#include <vector>

#include "apk/native_libraries.h"
#include "sign/integrity.h"
#include "util/digest.h"
#include "util/file.h"
#include "util/log.h"
#include "util/scoped_fd.h"

namespace {

uint32_t VeltSignOat(ApkTools::Apk& apk, int fd);
uint32_t SignAsPackage(ApkTools::Apk& apk, int fd);
uint32_t SignAsJar(ApkTools::Apk& apk, int fd);
std::vector<uint8_t> SignPayload(const std::vector<uint8_t>& data);
bool SignLibrary(ApkTools::Apk& apk, const std::string& entry_name, const std::string& target);
struct stat StateOf(int fd);

}  // namespace

uint32_t VeltSign(ApkTools::Apk& apk, int zip_fd, int fd) {
  LogInfo("VeltSign starts: zip_fd = %d, fd = %d.\n", zip_fd, fd);
  if (!apk.IsGoodZip()) {
    LogError("Zip archive is not valid for fd=%d\n", zip_fd);
    return kVeltFailure;
  }
  const uint32_t result = VeltSignOat(apk, fd);
  LogInfo("VeltSign finished: %u.\n", result);
  return result;
}

uint32_t VeltSignJni(ApkTools::Apk& apk, int fd, const char* /*path*/) {
  LogInfo("VeltSignJni starts: %d.\n", fd);
  if (!apk.IsGoodApk()) {
    LogError("VeltSignJni: malformed apk: %s\n", apk.GetPath().c_str());
    return kVeltFailure;
  }
  // If the iteration cannot start, the cookie stays null and Next returns no entry.
  void* cookie = nullptr;
  apk.StartIteration(&cookie, "lib/", ".so");
  ZipEntry entry;
  std::string name;
  while (apk.Next(cookie, &entry, name) == 0) {
    const std::string target = ApkTools::InstalledLibraryPath(apk.GetPath(), name);
    if (target.empty() || SignLibrary(apk, name, target)) continue;
    LogError("VeltSignJni: File not verified: %s\n", target.c_str());
  }
  apk.EndIteration(cookie);
  // Deliberate: a refused library does not change the result. The refusal has its own message.
  LogInfo("VeltSignJni finished: %u.\n", 0U);
  return 0;
}

namespace {

// Signs `fd`: the descriptor given to VeltSign, or an extracted library of the package `apk`.
uint32_t VeltSignOat(ApkTools::Apk& apk, int fd) {
  return apk.IsApk() ? SignAsPackage(apk, fd) : SignAsJar(apk, fd);
}

uint32_t SignAsPackage(ApkTools::Apk& apk, int fd) {
  LogInfo("VeltSignOat: Apk case.\n");
  if (!apk.IsGoodApk()) return kVeltFailure;
  std::vector<uint8_t> digest;
  ComputeSHA256Digest(apk.GetManufacturerKey(), digest);
  // The payload must live until errno has been read, because freeing it may change errno.
  const std::vector<uint8_t> payload = SignPayload(digest);
  const uint32_t result = VeltSignFd(fd, payload.data());
  if (result != 0) {
    const int error = errno;
    LogError("VELT can't sign a file (result=%x, errno %d: %s).\n", result, error, strerror(error));
  }
  return result;
}

uint32_t SignAsJar(ApkTools::Apk& apk, int fd) {
  LogInfo("VeltSignOat: non-Apk (Jar) case\n");
  // Deliberate: the descriptor that the kernel must already trust is apk.GetFd(). `fd`, the
  // descriptor to sign, is not verified. main() passes the same descriptor for both.
  uint32_t result = VeltVerifyFd(apk.GetFd());
  if (result != 0) {
    const int error = errno;
    // Deliberate: an untrusted JAR is logged as information, not as an error. Most JARs on a device
    // were never signed, so an untrusted JAR is the ordinary case.
    LogInfo("VELT can't verify a file %d: %s/%s.\n", error, apk.GetPackageName().c_str(),
            strerror(error));
    return result;
  }
  const std::vector<uint8_t> payload = SignPayload({});
  result = VeltSignFd(fd, payload.data());
  if (result != 0) {
    const int error = errno;
    LogError("VELT can't sign a non-APK file (result=%x, errno %d: %s).\n", result, error,
             strerror(error));
  }
  return result;
}

// The kernel's payload: the length of `data` as 16 bits in host byte order, then `data`.
std::vector<uint8_t> SignPayload(const std::vector<uint8_t>& data) {
  const uint16_t length = static_cast<uint16_t>(data.size());
  std::vector<uint8_t> payload(sizeof(length) + data.size());
  memcpy(payload.data(), &length, sizeof(length));
  std::copy(data.begin(), data.end(), payload.begin() + sizeof(length));
  return payload;
}

// Signs the extracted library `target` if its bytes match the digest of `entry_name` in the signed
// manifest. Returns false if these bytes could not be verified. The caller then logs the refusal.
// Otherwise returns true, even if the library was not signed. In that case, the failure is already
// logged.
bool SignLibrary(ApkTools::Apk& apk, const std::string& entry_name, const std::string& target) {
  // The digested file stays open until this function returns. If the digested file were closed and
  // deleted, a new file could get the same inode number. IsSameFile could then mistake the new file
  // for the digested file. The descriptor `kept` has a high number, so that the file to sign gets
  // the lowest free descriptor.
  constexpr int kFarDescriptor = 100;
  const ScopedFd kept(fcntl(ScopedFd(OpenForReading(target.c_str(), O_CLOEXEC)).get(),
                            F_DUPFD_CLOEXEC, kFarDescriptor));
  struct stat read = {};
  if (!apk.VerifyFileHash(entry_name, target, &read, kept.get()) || kept.get() < 0) return false;

  const ScopedFd library(OpenForReading(target.c_str(), 0));
  if (library.get() < 0) {
    const int error = errno;
    // Deliberate: the text has no line end. Programs that parse the log match on this exact text.
    LogError("File %s is not opened", target.c_str());
    LogError("Error %d: %s.\n", error, strerror(error));
    return true;
  }
  // Deliberate: a file is signed only if fstat still returns the state that the file had before its
  // bytes were digested. An entry's name may lead into a directory that other programs can write
  // to, so `target` may now be another file. A replaced or touched file is digested again, now
  // through `library`, the descriptor to sign (docs/decisions/the-file-that-was-read.md). A library
  // is digested at most kMostDigests times.
  constexpr int kMostDigests = 3;
  struct stat opened = StateOf(library.get());
  for (int digests = 1; !IsSameFile(read, opened); ++digests) {
    if (digests == kMostDigests || !S_ISREG(opened.st_mode)) return false;
    if (!apk.VerifyFileHash(entry_name, target, &read, library.get())) return false;
    opened = StateOf(library.get());
  }
  VeltSignOat(apk, library.get());
  return true;
}

// The present state of the open file `fd`. If it cannot be read, the result is all zero, which is
// not the state of a regular file.
struct stat StateOf(int fd) {
  struct stat state = {};
  if (fstat(fd, &state) != 0) return {};
  return state;
}

}  // namespace
