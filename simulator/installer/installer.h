// The installer of the phones: the platform's own verifier, apksig, in a Java program
// (InstallerVerifier.java). The first package of a run starts a process of this program. The
// process says for each package whether phones install it. If the process gives no answer for a
// package, the next package starts a new process.
#pragma once

#include <sys/types.h>

#include <memory>
#include <mutex>
#include <optional>
#include <string>

#include "simulator/installer/judgement.h"
#include "util/scoped_fd.h"

namespace simulator {

// kAuto: the installer is asked if it is installed. kRequired: the same, but the run fails if the
// installer is not installed. kOff: the installer is never asked. Installer::Missing says whether
// the installer is installed.
enum class InstallerUse { kAuto, kRequired, kOff };

struct InstallerOptions {
  InstallerUse use = InstallerUse::kAuto;
  LevelRange levels = {27, kNewestLevel};  // of the phones whose installer is asked
  double timeout = 30;                     // seconds, for each file
  std::string program;                     // the path of the JAR with InstallerVerifier
};

class Installer {
 public:
  // `options` must outlive this object.
  explicit Installer(const InstallerOptions& options) : options_(options) {}
  // Ends the Java process if it runs.
  ~Installer() { Stop(); }
  Installer(const Installer&) = delete;
  Installer& operator=(const Installer&) = delete;

  // If a part of the installer's verifier is missing, returns which part, and what to install or
  // build. Otherwise returns none.
  std::optional<std::string> Missing() const;

  // Asks the phones' installer about the file. The result is kNotAsked for a file that cannot be
  // opened or is not a package, and for every file with kOff. Several threads may call Judge; the
  // packages are judged one after the other.
  Judgement Judge(const std::string& file);

 private:
  Judgement Ask(const std::string& path);
  bool Start();
  void Stop();

  const InstallerOptions& options_;
  std::mutex mutex_;                // protects the members below
  std::optional<ScopedFd> socket_;  // for both directions; none: the process does not run
  pid_t process_ = -1;
};

}  // namespace simulator
