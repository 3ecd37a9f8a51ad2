// The exit statuses of apktoolkit-sim, for scripts. A run over several files has at least the
// highest status of these files.
#pragma once

namespace simulator {

enum ExitStatus {
  kAllSigned = 0,
  kSomeRefused = 1,
  kUsageError = 2,
  kCannotSimulate = 3,
  kNotLookedAt = 4,
};

}  // namespace simulator
