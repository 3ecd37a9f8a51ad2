// The settings of the simulated phone. They travel from apktoolkit-sim to the stand-ins in
// environment variables, one per setting, all with the prefix APKTOOLKIT_SIM_. A setting without a
// variable is as on a healthy phone. Both sides use this file, so that names and formats stand in
// one place.
#pragma once

#include <sys/types.h>

#include <cerrno>
#include <string>
#include <vector>

namespace simulator {

// A file as the kernel tells files apart, independent of its name.
struct FileId {
  dev_t device;
  ino_t inode;
};

inline bool operator==(const FileId& a, const FileId& b) {
  return a.device == b.device && a.inode == b.inode;
}

// In `PhoneSettings::integrity`: at this opening the file does not exist.
inline constexpr char kMissing[] = "missing";

struct PhoneSettings {
  // The file that the stand-ins append their events to. Empty: nothing is simulated or recorded,
  // and libzu finds no service.
  std::string journal;
  // The contents of an integrity file, one for each opening; the last one repeats. Never empty.
  std::vector<std::string> integrity = {"1f"};
  // The files that the kernel trusts from the start.
  std::vector<FileId> trusted;
  // The kernel's answer to a signing that is in order; 0: it signs.
  int sign_errno = 0;
  // The kernel's answer when it verifies a file that it does not trust.
  int verify_errno = ENOKEY;
  // The answer of libzu to a registration.
  int zu_result = 0;
};

// The settings of this process's environment.
PhoneSettings SettingsFromEnvironment();

// The same as NAME=VALUE words, complete: no setting is left to what a variable was before.
std::vector<std::string> SettingsToEnvironment(const PhoneSettings& phone);

}  // namespace simulator
