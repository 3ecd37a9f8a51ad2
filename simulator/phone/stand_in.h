// The code that the two stand-ins share. A stand-in is a library that replaces a part of the phone
// inside the tool's process: one replaces the kernel and the log, the other replaces libzu. This
// file has the phone's settings, the journal, and a class that keeps errno unchanged for the tool.
// Each stand-in has its own copy of this code. The settings are never destroyed, because the tool's
// last output is recorded after the destructors of static objects have run.
#pragma once

#include <cerrno>

#include "simulator/phone/journal.h"
#include "simulator/phone/settings.h"

// Marks a function that replaces a function of another library. All other functions are hidden.
#define STAND_IN extern "C" __attribute__((visibility("default")))

namespace simulator {

// The settings of the simulated phone. The first call reads them from the environment.
const PhoneSettings& ThisPhone();

// Appends `event` to the journal. Does nothing if the settings name no journal, or if the journal
// could not be opened.
void Record(const Event& event);

// Restores errno at the end of its scope.
class ErrnoKeeper {
 public:
  ErrnoKeeper() : errno_(errno) {}
  ~ErrnoKeeper() { errno = errno_; }
  ErrnoKeeper(const ErrnoKeeper&) = delete;
  ErrnoKeeper& operator=(const ErrnoKeeper&) = delete;

 private:
  const int errno_;
};

}  // namespace simulator
