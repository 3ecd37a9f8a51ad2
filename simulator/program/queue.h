// Doing something for many files, several at a time, and telling of them in their order.
#pragma once

#include <functional>
#include <string>
#include <vector>

#include "simulator/program/simulator.h"

// Calls `run` for each of `files`, in `jobs` threads, and in this one `done` with what came of
// each, in the order of `files`, as soon as its turn has come. While one takes longer than a
// second, `waiting` is called now and then with the file and the seconds. Ends early when the
// process is interrupted.
void RunInOrder(const std::vector<std::string>& files, unsigned jobs,
                const std::function<Outcome(const std::string& file)>& run,
                const std::function<void(const Outcome& outcome)>& done,
                const std::function<void(const std::string& file, int seconds)>& waiting);
