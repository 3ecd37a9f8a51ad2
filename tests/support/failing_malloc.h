// Memory exhaustion at will, and a look at what is freed.
//
// A test program linked with -Wl,--wrap=malloc,--wrap=free sends the calls of its own objects here,
// and on to the real functions; the platform's libraries and the sanitizers keep theirs.
#pragma once

#include <cstddef>

// While it lives, makes one call of malloc fail and watches the blocks that the others return. One
// at a time.
class FailingMalloc {
 public:
  // Fails call number `failing_call`, the first being 1; 0 fails none.
  explicit FailingMalloc(int failing_call = 0);
  ~FailingMalloc();
  FailingMalloc(const FailingMalloc&) = delete;
  FailingMalloc& operator=(const FailingMalloc&) = delete;

  // How often malloc was called.
  int calls() const { return calls_; }
  // Whether the call that is to fail was made.
  bool failed() const { return failing_call_ != 0 && calls_ >= failing_call_; }
  // Blocks returned and not yet freed.
  int live() const;
  // Blocks freed; and those among them that held other bytes than zeros at that time.
  int freed() const { return freed_; }
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
