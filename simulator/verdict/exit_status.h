// The exit statuses, for scripts. For several files, the highest one counts.
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
