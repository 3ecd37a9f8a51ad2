// The exit statuses, for scripts. Of several files, the highest counts.
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
