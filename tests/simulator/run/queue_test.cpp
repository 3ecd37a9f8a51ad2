// The order of the results, and the wait for a run that takes long.
#include "simulator/run/queue.h"

#include <gtest/gtest.h>

#include <chrono>
#include <future>
#include <vector>

namespace {

using simulator::RunInOrder;

constexpr auto kTooLong = std::chrono::seconds(20);

// For the parameter `waiting` of RunInOrder. On a busy machine, a run can take more than a second.
// RunInOrder then calls `waiting`.
void Ignore(size_t, int) {}

// The run of number 0 waits until the run of number 3 has ended.
TEST(Queue, ResultsAreDeliveredInTheOrderOfTheNumbers) {
  std::promise<void> last_has_run;
  std::vector<int> runs(4);
  std::vector<size_t> results;
  RunInOrder(
      4, 2,
      [&](size_t number) {
        if (number == 0) last_has_run.get_future().wait_for(kTooLong);
        ++runs[number];
        if (number == 3) last_has_run.set_value();
      },
      [&](size_t number) { results.push_back(number); }, Ignore);
  EXPECT_EQ(runs, std::vector<int>({1, 1, 1, 1}));
  EXPECT_EQ(results, std::vector<size_t>({0, 1, 2, 3}));
}

TEST(Queue, CallsNothingIfThereAreNoNumbers) {
  const auto never = [](size_t number) { ADD_FAILURE() << number; };
  RunInOrder(0, 2, never, never, Ignore);
}

// RunInOrder's `waiting` can block, for example if nobody reads the terminal. The other runs must
// then continue.
TEST(Queue, RunsContinueDuringACallAboutAWait) {
  std::promise<void> is_told, next_has_begun;
  bool is_first = true;
  std::future_status next = std::future_status::timeout;
  RunInOrder(
      3, 2,
      [&, told = is_told.get_future().share()](size_t number) {
        if (number == 2) next_has_begun.set_value();
        if (number != 2) told.wait_for(kTooLong);
      },
      [](size_t) {},
      [&](size_t number, int seconds) {
        EXPECT_EQ(number, 0U);
        EXPECT_GE(seconds, 1);
        if (!is_first) return;
        is_first = false;
        is_told.set_value();
        next = next_has_begun.get_future().wait_for(kTooLong);
      });
  EXPECT_EQ(next, std::future_status::ready);
}

}  // namespace
