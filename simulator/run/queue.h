// Works on several files at a time, and delivers the results in the order of the files.
#pragma once

#include <cstddef>
#include <functional>

namespace simulator {

// Calls `run` for each number below `count`, in `jobs` threads. Calls `done` in the caller's
// thread, in the order of the numbers, for each number whose `run` has ended. If the wait for a
// number takes longer than a second, calls `waiting` from time to time with the number and the
// seconds of the wait. After an interruption of the process, begins no more runs, and returns when
// the runs that have begun are over. `done` is never called for a number whose `run` was not begun.
void RunInOrder(size_t count, unsigned jobs, const std::function<void(size_t number)>& run,
                const std::function<void(size_t number)>& done,
                const std::function<void(size_t number, int seconds)>& waiting);

}  // namespace simulator
