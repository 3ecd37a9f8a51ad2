#include "simulator/run/queue.h"

#include <algorithm>
#include <chrono>
#include <condition_variable>
#include <mutex>
#include <thread>
#include <vector>

#include "simulator/run/process.h"

namespace simulator {

namespace {

// What the threads share.
struct Shared {
  std::mutex mutex;
  std::condition_variable finished;
  size_t next = 0;  // the number that nobody has taken yet
  std::vector<bool> has_run;
};

void Work(const std::function<void(size_t number)>& run, Shared* shared) {
  while (!IsInterrupted()) {
    size_t mine = 0;
    {
      const std::lock_guard<std::mutex> lock(shared->mutex);
      if (shared->next == shared->has_run.size()) return;
      mine = shared->next++;
    }
    run(mine);
    const std::lock_guard<std::mutex> lock(shared->mutex);
    shared->has_run[mine] = true;
    shared->finished.notify_all();
  }
}

}  // namespace

void RunInOrder(size_t count, unsigned jobs, const std::function<void(size_t number)>& run,
                const std::function<void(size_t number)>& done,
                const std::function<void(size_t number, int seconds)>& waiting) {
  using Clock = std::chrono::steady_clock;
  constexpr auto kNowAndThen = std::chrono::milliseconds(200);
  Shared shared;
  shared.has_run.resize(count);
  std::vector<std::thread> threads;
  for (size_t i = 0; i < std::min<size_t>(jobs, count); ++i) {
    threads.emplace_back(Work, std::cref(run), &shared);
  }
  for (size_t i = 0; i < count; ++i) {
    const auto start = Clock::now();
    std::unique_lock<std::mutex> lock(shared.mutex);
    const auto is_never_run = [&] { return IsInterrupted() && i >= shared.next; };
    while (!shared.has_run[i] && !is_never_run()) {
      shared.finished.wait_for(lock, kNowAndThen);
      const auto passed = std::chrono::duration_cast<std::chrono::seconds>(Clock::now() - start);
      if (!shared.has_run[i] && passed.count() > 0) waiting(i, static_cast<int>(passed.count()));
    }
    if (!shared.has_run[i]) break;
    lock.unlock();
    done(i);
  }
  for (std::thread& thread : threads) thread.join();
}

}  // namespace simulator
