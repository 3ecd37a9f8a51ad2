// Doing something for many files, several at a time, and telling of them in their order.
#pragma once

#include <cstddef>
#include <functional>

namespace simulator {

// Calls `run` for each number below `count`, in `jobs` threads, and in this one `done` for each, in
// order, as soon as its turn has come. While one takes longer than a second, `waiting` is called
// now and then with its number and the seconds. Ends early when the process is interrupted; `done`
// is called for nothing that did not end.
void RunInOrder(size_t count, unsigned jobs, const std::function<void(size_t number)>& run,
                const std::function<void(size_t number)>& done,
                const std::function<void(size_t number, int seconds)>& waiting);

}  // namespace simulator
