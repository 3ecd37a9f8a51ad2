// A package on disk. A test can add libraries beside the package. Inside the test program, a Phone
// (support/phone.h) replaces the kernel's integrity feature and libzu.
#pragma once

#include <fcntl.h>
#include <openssl/sha.h>
#include <unistd.h>

#include <optional>
#include <string>
#include <vector>

#include "apk/apk.h"
#include "sign/signing.h"
#include "support/files.h"
#include "support/log_capture.h"
#include "support/package.h"
#include "support/phone.h"

using Events = std::vector<std::string>;

inline constexpr char kSelf[] = "integrity /proc/self/integrity/value";

// The payload of every package signed with the key "rsa-2048", in hexadecimal: the length 32 as 16
// bits in little-endian order, then the SHA-256 digest of the key's modulus. libcrypto computes the
// digest.
inline std::string PackagePayload() {
  const Bytes modulus = ModulusOf("rsa-2048");
  uint8_t digest[SHA256_DIGEST_LENGTH];
  SHA256(modulus.data(), modulus.size(), digest);
  return "2000" + Hex(digest, sizeof(digest));
}

inline std::string SignEvent(int fd) {
  return "sign " + std::to_string(fd) + " " + PackagePayload();
}

inline ZipItem Library(const std::string& name) { return {name, ToBytes("\177ELF " + name)}; }

inline LogRecord Starts(int fd) {
  return Info("VeltSignJni starts: " + std::to_string(fd) + ".\n");
}
inline LogRecord Finished() { return Info("VeltSignJni finished: 0.\n"); }

// A package in a temporary directory, open for reading. `log` has only the messages that the tool
// logs after it has opened the package.
class PackageOnPhone {
 public:
  explicit PackageOnPhone(const Package& package, const std::string& directory = "")
      : path_(temp_.File(directory + "base.apk")) {
    package.WriteTo(path_);
    fd_ = open(path_.c_str(), O_RDONLY);
    apk_.emplace(fd_);
    log.Clear();
  }
  ~PackageOnPhone() { close(fd_); }

  // Writes the item's bytes to disk, at `path` in the temporary directory.
  void Install(const std::string& path, const ZipItem& item) const { temp_.Write(path, item.data); }
  std::string Path(const std::string& path) const { return temp_ / path; }

  uint32_t SignJni() { return VeltSignJni(*apk_, fd_, "not used"); }
  uint32_t Sign() { return VeltSign(*apk_, fd_, fd_); }

  ApkTools::Apk& apk() { return *apk_; }
  int fd() const { return fd_; }
  const std::string& path() const { return path_; }

  LogCapture log;
  Phone phone;

 private:
  TempDir temp_;
  std::string path_;
  int fd_;
  std::optional<ApkTools::Apk> apk_;
};
