// Bytes that are followed by a page that cannot be read. A read from this page crashes in every
// build, with or without a sanitizer.
#pragma once

#include <sys/mman.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>

#include "support/bytes.h"

class GuardedBytes {
 public:
  explicit GuardedBytes(const Bytes& bytes) : size_(bytes.size()) {
    const auto page = static_cast<size_t>(sysconf(_SC_PAGESIZE));
    const size_t room = (size_ + page - 1) / page * page;
    mapped_ = room + page;
    memory_ = static_cast<uint8_t*>(
        mmap(nullptr, mapped_, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0));
    if (memory_ == MAP_FAILED || mprotect(memory_ + room, page, PROT_NONE) != 0) {
      perror("memory");
      abort();
    }
    start_ = memory_ + room - size_;
    std::copy(bytes.begin(), bytes.end(), start_);
  }
  ~GuardedBytes() { munmap(memory_, mapped_); }
  GuardedBytes(const GuardedBytes&) = delete;
  GuardedBytes& operator=(const GuardedBytes&) = delete;

  uint8_t* data() { return start_; }
  const uint8_t* data() const { return start_; }
  size_t size() const { return size_; }

 private:
  const size_t size_;
  size_t mapped_;
  uint8_t* memory_;
  uint8_t* start_;
};
