#include "sign/registration.h"

#include <sys/xattr.h>

#include <string>
#include <vector>

#include "sign/libzu.h"
#include "util/digest.h"
#include "util/file.h"
#include "util/log.h"

namespace {

void RegisterJar(int zip_fd, int fd);
void RegisterPackage(ApkTools::Apk& apk, int fd);
bool AsksForRegistration(int jar_fd);
std::vector<uint8_t> JarKeyBlock(const std::string& path);
void ReportMissingLocation(int fd);
void ReportResult(int result);

}  // namespace

void ZuSign(ApkTools::Apk& apk, int zip_fd, int fd) {
  const bool is_plain_jar = !apk.IsApk() && apk.IsGoodZip();
  is_plain_jar ? RegisterJar(zip_fd, fd) : RegisterPackage(apk, fd);
}

namespace {

void RegisterJar(int zip_fd, int fd) {
  if (!AsksForRegistration(zip_fd)) return;
  const std::string jar_path = GetFilenameByFd(zip_fd);
  if (jar_path.empty()) {
    LogError("Can't get jar location from fd=%d\n", zip_fd);
    return;
  }
  ReportMissingLocation(fd);
  const std::vector<uint8_t> block = JarKeyBlock(jar_path);
  LogInfo("ZuAddCertificate: Call ZuNewCertificate for JAR.\n");
  ReportResult(ZuNewCertificate(fd, jar_path.c_str(), block.data(), block.size()));
}

// This function is also called for a file that is not a zip archive. Such a file asks for no
// permission, so nothing happens.
void RegisterPackage(ApkTools::Apk& apk, int fd) {
  if (!apk.IsSsPermissionRequired()) return;
  if (!apk.IsGoodApk()) {
    LogError("Apk archive is not valid for fd=%d, path=%s\n", apk.GetFd(), apk.GetPath().c_str());
    return;
  }
  ReportMissingLocation(fd);
  const std::vector<uint8_t>& key = apk.GetManufacturerKey();
  ReportResult(ZuNewCertificate(fd, apk.GetPackageName().c_str(), key.data(), key.size()));
}

// Returns false if the extended attribute "user.zu" is missing, empty or unreadable.
bool AsksForRegistration(int jar_fd) { return fgetxattr(jar_fd, "user.zu", nullptr, 0) >= 1; }

// Returns 128 bytes: four SHA-256 digests. The first is the digest of the path. Each later digest
// is the digest of the previous digest.
std::vector<uint8_t> JarKeyBlock(const std::string& path) {
  constexpr size_t kBlockSize = 128;
  std::vector<uint8_t> block;
  std::vector<uint8_t> current = StringToVector(path);
  while (block.size() < kBlockSize) {
    std::vector<uint8_t> digest;
    ComputeSHA256Digest(current, digest);
    block.insert(block.end(), digest.begin(), digest.end());
    current = digest;
  }
  return block;
}

// Logs an error if the path of `fd` cannot be found. Deliberate: the registration then continues,
// because it does not need this path. The log text says "oat" for packages and JARs alike. Programs
// that parse the log match on this text.
void ReportMissingLocation(int fd) {
  if (GetFilenameByFd(fd).empty()) LogError("Can't get oat location from fd=%d\n", fd);
}

void ReportResult(int result) {
  if (IsZuSuccess(result)) {
    LogInfo("ZuAddCertificate: ZuNewCertificate return %d.\n", result);
  } else {
    LogError("ZuAddCertificate: ZuNewCertificate failed %d.\n", result);
  }
}

}  // namespace
