#include "simulator/run/queue.h"

#include <algorithm>
#include <chrono>
#include <condition_variable>
#include <mutex>
#include <thread>
#include <vector>

#include "simulator/run/process.h"

namespace simulator {

void RunInOrder(size_t count, unsigned jobs, const std::function<void(size_t number)>& run,
                const std::function<void(size_t number)>& done,
                const std::function<void(size_t number, int seconds)>& waiting) {
  using Clock = std::chrono::steady_clock;
  constexpr auto kUpdateInterval = std::chrono::milliseconds(200);
  std::mutex mutex;  // protects `next` and `has_run`
  std::condition_variable finished;
  size_t next = 0;  // the first number that no thread has taken yet
  std::vector<bool> has_run(count);
  const auto work = [&] {
    std::unique_lock<std::mutex> lock(mutex);
    while (next < count && !IsInterrupted()) {
      const size_t mine = next++;
      lock.unlock();
      run(mine);
      lock.lock();
      has_run[mine] = true;
      finished.notify_all();
    }
  };
  std::vector<std::thread> threads;
  while (threads.size() < std::min<size_t>(jobs, count)) threads.emplace_back(work);
  for (size_t i = 0; i < count; ++i) {
    const auto start = Clock::now();
    std::unique_lock<std::mutex> lock(mutex);
    const auto is_never_run = [&] { return IsInterrupted() && i >= next; };
    while (!has_run[i] && !is_never_run()) {
      finished.wait_for(lock, kUpdateInterval);
      const auto passed = std::chrono::duration_cast<std::chrono::seconds>(Clock::now() - start);
      if (has_run[i] || passed.count() == 0) continue;
      lock.unlock();
      waiting(i, static_cast<int>(passed.count()));
      lock.lock();
    }
    if (!has_run[i]) break;
    lock.unlock();
    done(i);
  }
  for (std::thread& thread : threads) thread.join();
}

}  // namespace simulator
