// The settings of the simulated phone. apktoolkit-sim passes them to the stand-ins, the libraries
// that answer in place of the phone. Each setting is passed in an environment variable with the
// prefix APKTOOLKIT_SIM_. Without its variable, a setting has the default below. The defaults,
// except that of `journal`, are those of a healthy phone. Both apktoolkit-sim and the stand-ins use
// this file, so that names and formats are defined in one place.
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

// As a value in `PhoneSettings::integrity`: the integrity file does not exist when it is opened.
inline constexpr char kMissing[] = "missing";

struct PhoneSettings {
  // The file that the stand-ins append their events to. Empty: nothing is recorded, and libzu finds
  // no service.
  std::string journal;
  // The texts of the files /proc/PID/integrity/value. Each opening of such a file reads the next
  // text. The last text repeats. The list has at least one element.
  std::vector<std::string> integrity = {"1f"};
  // The files that the kernel trusts from the start.
  std::vector<FileId> trusted;
  // The kernel's errno for a valid request to sign; 0: the kernel signs.
  int sign_errno = 0;
  // The kernel's errno for a request to verify a file that it does not trust.
  int verify_errno = ENOKEY;
  // The answer of libzu to a registration.
  int zu_result = 0;
};

// Reads the settings from this process's environment.
PhoneSettings SettingsFromEnvironment();

// Returns the settings as NAME=VALUE words. Every setting has a word, so a variable that this
// process inherited cannot change a setting.
std::vector<std::string> SettingsToEnvironment(const PhoneSettings& phone);

}  // namespace simulator
