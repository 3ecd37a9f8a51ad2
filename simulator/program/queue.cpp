#include "simulator/program/queue.h"

#include <algorithm>
#include <chrono>
#include <condition_variable>
#include <mutex>
#include <optional>
#include <thread>

#include "simulator/program/process.h"

namespace {

// What the threads share. Outcomes are taken out as soon as they are told of.
struct Shared {
  std::mutex mutex;
  std::condition_variable finished;
  size_t next = 0;  // the file that nobody has taken yet
  std::vector<std::optional<Outcome>> outcomes;
};

void Work(const std::vector<std::string>& files,
          const std::function<Outcome(const std::string& file)>& run, Shared* shared) {
  while (!IsInterrupted()) {
    size_t mine = 0;
    {
      const std::lock_guard<std::mutex> lock(shared->mutex);
      if (shared->next == files.size()) return;
      mine = shared->next++;
    }
    Outcome outcome = run(files[mine]);
    const std::lock_guard<std::mutex> lock(shared->mutex);
    shared->outcomes[mine] = std::move(outcome);
    shared->finished.notify_all();
  }
}

}  // namespace

void RunInOrder(const std::vector<std::string>& files, unsigned jobs,
                const std::function<Outcome(const std::string& file)>& run,
                const std::function<void(const Outcome& outcome)>& done,
                const std::function<void(const std::string& file, int seconds)>& waiting) {
  using Clock = std::chrono::steady_clock;
  constexpr auto kNowAndThen = std::chrono::milliseconds(200);
  Shared shared;
  shared.outcomes.resize(files.size());
  std::vector<std::thread> threads;
  for (size_t i = 0; i < std::min<size_t>(jobs, files.size()); ++i) {
    threads.emplace_back(Work, std::cref(files), std::cref(run), &shared);
  }
  for (size_t i = 0; i < files.size() && !IsInterrupted(); ++i) {
    const auto start = Clock::now();
    std::unique_lock<std::mutex> lock(shared.mutex);
    while (!shared.outcomes[i] && !IsInterrupted()) {
      shared.finished.wait_for(lock, kNowAndThen);
      const auto passed = std::chrono::duration_cast<std::chrono::seconds>(Clock::now() - start);
      if (!shared.outcomes[i] && passed.count() > 0) {
        waiting(files[i], static_cast<int>(passed.count()));
      }
    }
    if (!shared.outcomes[i]) break;
    const Outcome outcome = *std::exchange(shared.outcomes[i], std::nullopt);
    lock.unlock();
    done(outcome);
  }
  for (std::thread& thread : threads) thread.join();
}
