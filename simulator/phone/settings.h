// The settings of the simulated phone. apktoolkit-sim passes them to the stand-ins, the libraries
// that answer in place of the phone. Each setting is passed in an environment variable with the
// prefix APKTOOLKIT_SIM_. Without its variable, a setting has the default below. The defaults,
// except that of `journal`, are those of a healthy phone. Only settings.cpp defines the names and
// formats of the variables. Both apktoolkit-sim and the stand-ins use the functions below.
#pragma once

#include <sys/types.h>

#include <cerrno>
#include <string>
#include <vector>

namespace simulator {

// The identity of a file for the kernel, independent of its name.
struct FileId {
  dev_t device;
  ino_t inode;
};

inline bool operator==(const FileId& a, const FileId& b) {
  return a.device == b.device && a.inode == b.inode;
}

// If this text is next in `PhoneSettings::integrity` (below), opening /proc/PID/integrity/value
// fails with ENOENT.
inline constexpr char kMissing[] = "missing";

struct PhoneSettings {
  // The path of the file to which the stand-ins append their events. Empty: nothing is recorded,
  // and each registration with libzu fails.
  std::string journal;
  // The texts of the files /proc/PID/integrity/value. Each opening of any of these files delivers
  // the next text. After the last text, each opening delivers the last text again. The list has at
  // least one element.
  std::vector<std::string> integrity = {"1f"};
  // The files that the kernel trusts from the start.
  std::vector<FileId> trusted;
  // The kernel's errno for a valid request to sign; 0: the kernel signs.
  int sign_errno = 0;
  // The kernel's errno for a request to verify a file that it does not trust.
  int verify_errno = ENOKEY;
  // The result of ZuNewCertificate, the function of libzu that registers a key.
  int zu_result = 0;
};

// Reads the settings from this process's environment.
PhoneSettings SettingsFromEnvironment();

// Returns the environment variables of all settings, as NAME=VALUE. Even a default is passed.
// Otherwise a variable that this process inherited could change the setting.
std::vector<std::string> SettingsToEnvironment(const PhoneSettings& phone);

}  // namespace simulator
