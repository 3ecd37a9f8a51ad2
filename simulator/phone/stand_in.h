// Shared by the two stand-ins: the libraries that replace the phone's kernel and libzu inside the
// tool's process. This file has the phone's settings, the journal, and a means to keep errno
// unchanged for the tool. Each of the two libraries has its own copy of this code. Nothing here is
// destroyed at exit, because the tool's last output is recorded after the destructors have run.
#pragma once

#include <cerrno>

#include "simulator/phone/journal.h"
#include "simulator/phone/settings.h"

// Marks a function that replaces a function of another library. All other functions are hidden.
#define STAND_IN extern "C" __attribute__((visibility("default")))

namespace simulator {

// The settings of the simulated phone. The first call reads them from the environment.
const PhoneSettings& ThisPhone();

// Appends `event` to the journal. Does nothing without a journal.
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
