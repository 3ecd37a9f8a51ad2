// What the simulated phone is like. The settings travel from apktoolkit-sim to the stand-ins in
// environment variables, one per setting, all with the prefix APKTOOLKIT_SIM_; what is not set is
// as on a healthy phone. Shared by both sides, so that the names and formats stand in one place.
#pragma once

#include <sys/types.h>

#include <cerrno>
#include <string>
#include <vector>

namespace simulator {

// A file as the kernel tells files apart, whatever its name.
struct FileId {
  dev_t device;
  ino_t inode;
};

inline bool operator==(const FileId& a, const FileId& b) {
  return a.device == b.device && a.inode == b.inode;
}

// In `PhoneSettings::integrity`: at this opening there is no such file.
inline constexpr char kMissing[] = "missing";

struct PhoneSettings {
  // The file that the stand-ins append their events to. Empty: there is no simulation, nothing is
  // recorded, and libzu finds no service.
  std::string journal;
  // What each opening of an integrity file finds in it; the last one repeats. Never empty.
  std::vector<std::string> integrity = {"1f"};
  // The files that the kernel trusts from the start.
  std::vector<FileId> trusted;
  // What the kernel answers to a signing that is in order, 0: it signs.
  int sign_errno = 0;
  // What the kernel answers when it verifies a file that it does not trust.
  int verify_errno = ENOKEY;
  // What libzu answers to a registration.
  int zu_result = 0;
};

// The settings of this process's environment.
PhoneSettings SettingsFromEnvironment();

// The same as NAME=VALUE words, complete: no setting is left to what a variable was before.
std::vector<std::string> SettingsToEnvironment(const PhoneSettings& phone);

}  // namespace simulator
