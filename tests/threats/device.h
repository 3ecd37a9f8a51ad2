// Runs the tool's three steps (sign the libraries, sign the file, register the key) on a file on
// disk. Inside the test program, a Phone takes the place of the kernel and of libzu.
#pragma once

#include <fcntl.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <string>
#include <vector>

#include "apk/apk.h"
#include "sign/registration.h"
#include "sign/signing.h"
#include "support/certificate.h"
#include "support/files.h"
#include "support/log_capture.h"
#include "support/package.h"
#include "support/phone.h"

using Strings = std::vector<std::string>;

inline const Bytes kLibrary = ToBytes("\177ELF foo");

// A package that aapt and apksigner made.
inline Bytes Made(const std::string& name) {
  return ToBytes(ContentOf(THREAT_PACKAGES "/" + name + "/base.apk"));
}

class Device {
 public:
  explicit Device(const Bytes& archive) : path_(temp_.Write("app/base.apk", archive)) {}
  explicit Device(const Package& package) : Device(package.Build()) {}

  // Writes the bytes to disk, at a path relative to the package's directory.
  Device& Install(const std::string& path, const Bytes& content) {
    temp_.Write("app/" + path, content);
    return *this;
  }
  // The absolute path for a path relative to the package's directory.
  std::string Path(const std::string& path) const { return temp_ / ("app/" + path); }

  // Runs the steps. Returns the files that the tool asks the Phone to sign with the payload for the
  // test key `signer`, in the order of these requests. The result includes files that the Phone
  // refuses to sign. The names are relative to the directory above the package's directory.
  Strings FilesSignedFor(const std::string& signer) {
    const std::string payload = "2000" + Hex(DigestOf(Digest::kSha256, ModulusOf(signer)));
    return FilesSignedWith(payload);
  }

  // Like FilesSignedFor, but counts the requests whose payload begins with the hexadecimal digits
  // `payload`.
  Strings FilesSignedWith(const std::string& payload) {
    Strings files;
    phone.witness = [&](int fd, const std::string& event) {
      const std::string sign = "sign " + std::to_string(fd) + " ";
      if (event.rfind(sign + payload, 0) != 0) return;
      char path[4096] = {};
      const std::string link = "/proc/self/fd/" + std::to_string(fd);
      if (readlink(link.c_str(), path, sizeof(path) - 1) < 0) return;
      files.push_back(std::string(path).substr(temp_.path().size() + 1));
    };
    RunSteps();
    return files;
  }

  // Runs the steps. Returns the registrations with libzu, each as "NAME DATA-HEX".
  Strings Registered() {
    RunSteps();
    Strings registered;
    for (const std::string& event : phone.events) {
      if (event.rfind("register ", 0) != 0) continue;
      registered.push_back(event.substr(event.find(' ', 9) + 1));
    }
    return registered;
  }

  void RunSteps() {
    const int fd = open(path_.c_str(), O_RDONLY);
    ASSERT_GE(fd, 0);
    ApkTools::Apk apk(fd);
    VeltSignJni(apk, fd, path_.c_str());
    VeltSign(apk, fd, fd);
    ZuSign(apk, fd, fd);
    close(fd);
  }

  LogCapture log;
  Phone phone;

 private:
  TempDir temp_;
  const std::string path_;
};
