// The installer of the phones: the platform's own verifier, apksig, in a Java program
// (InstallerVerifier.java). One process of it serves a whole run. It is started when the first
// package comes, and again when it did not survive one.
#pragma once

#include <sys/types.h>

#include <memory>
#include <mutex>
#include <optional>
#include <string>

#include "simulator/installer/judgement.h"
#include "util/scoped_fd.h"

namespace simulator {

// When the installer is asked: if it is there, in any case, or never.
enum class InstallerUse { kAuto, kRequired, kOff };

struct InstallerOptions {
  InstallerUse use = InstallerUse::kAuto;
  LevelRange levels = {27, kNewestLevel};  // the phones that are asked about
  double timeout = 30;                     // seconds, for each file
  std::string program;                     // the path of InstallerVerifier, in its JAR
};

class Installer {
 public:
  // `options` must outlive this object.
  explicit Installer(const InstallerOptions& options) : options_(options) {}
  // Ends the process.
  ~Installer() { Stop(); }
  Installer(const Installer&) = delete;
  Installer& operator=(const Installer&) = delete;

  // Why nothing can be asked, with what to install; none when it can.
  std::optional<std::string> Missing() const;

  // Asks the phones' installer about the file. The result is kNotAsked for a file that is not a
  // package. Several threads may ask; they are answered one after the other.
  Judgement Judge(const std::string& file);

 private:
  Judgement Ask(const std::string& path);
  bool Start();
  void Stop();

  const InstallerOptions& options_;
  std::mutex mutex_;              // of all below
  std::optional<ScopedFd> pipe_;  // both ways; none: the process does not run
  pid_t process_ = -1;
};

}  // namespace simulator
