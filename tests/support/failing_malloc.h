// Makes one chosen allocation fail, and counts the blocks that are freed before they are wiped.
//
// A test program linked with -Wl,--wrap=malloc,--wrap=free sends the calls of its own object files
// here, and this file calls the real functions. The platform's libraries and the sanitizers call
// the real functions directly.
#pragma once

#include <cstddef>

// While it lives, makes one call of malloc fail and watches the blocks of the other calls. Only one
// FailingMalloc may live at a time.
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
  // The number of blocks that were returned and not yet freed.
  int live() const;
  // The number of blocks that were freed.
  int freed() const { return freed_; }
  // The number of freed blocks that still had bytes other than zero.
  int freed_unwiped() const { return freed_unwiped_; }

  // For the wrapped functions.
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
