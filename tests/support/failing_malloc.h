// Can make one chosen allocation fail, and counts the blocks that are freed before they are wiped.
//
// The test program must be linked with -Wl,--wrap=malloc,--wrap=free. Its own object files then
// call the functions of failing_malloc.cpp, which call the real malloc and free. The platform's
// libraries and the sanitizers call the real functions directly.
#pragma once

#include <cstddef>

// While an object of this class exists, it makes at most one call of malloc fail, and watches the
// blocks of the other calls. Only one FailingMalloc may exist at a time.
class FailingMalloc {
 public:
  // Makes call number `failing_call` fail, counted from 1; 0 lets all succeed.
  explicit FailingMalloc(int failing_call = 0);
  ~FailingMalloc();
  FailingMalloc(const FailingMalloc&) = delete;
  FailingMalloc& operator=(const FailingMalloc&) = delete;

  // The number of calls of malloc.
  int calls() const { return calls_; }
  // True if the call that must fail was made.
  bool failed() const { return failing_call_ != 0 && calls_ >= failing_call_; }
  // The number of watched blocks that are not yet freed.
  int live() const;
  // The number of watched blocks that were freed.
  int freed() const { return freed_; }
  // The number of freed blocks that still had bytes other than zero.
  int freed_unwiped() const { return freed_unwiped_; }

  // Called only by __wrap_malloc and __wrap_free.
  void* Allocate(size_t size);
  void Release(void* block);

 private:
  struct Block {
    unsigned char* start;
    size_t size;
  };
  static constexpr int kMaxBlocks = 1024;

  int failing_call_;
  int calls_ = 0;
  int freed_ = 0;
  int freed_unwiped_ = 0;
  Block blocks_[kMaxBlocks] = {};
};
