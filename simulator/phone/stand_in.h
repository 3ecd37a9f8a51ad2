// Shared by the stand-ins inside the tool's process: the phone's settings, the journal, and ways to
// stay unseen. Each of the two libraries has these for itself. Nothing here is destroyed at exit,
// since the tool's last output is recorded after the destructors have run.
#pragma once

#include <cerrno>

#include "simulator/phone/journal.h"
#include "simulator/phone/settings.h"

// The mark of a function that takes the place of another library's; all else stays hidden.
#define STAND_IN extern "C" __attribute__((visibility("default")))

namespace simulator {

// The phone of this process, read from the environment when it is first asked for.
const PhoneSettings& ThisPhone();

// Appends `event` to the journal; without one nothing is written.
void Record(const Event& event);

// Leaves errno as it was before, on every way out.
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
