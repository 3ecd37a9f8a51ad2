#include "support/failing_malloc.h"

#include <algorithm>
#include <cstdlib>
#include <iterator>

extern "C" {
void* __real_malloc(size_t size);
void __real_free(void* block);
void* __wrap_malloc(size_t size);
void __wrap_free(void* block);
}

namespace {
FailingMalloc* current = nullptr;
}  // namespace

void* __wrap_malloc(size_t size) {
  return current != nullptr ? current->Allocate(size) : __real_malloc(size);
}

void __wrap_free(void* block) {
  if (current != nullptr) current->Release(block);
  __real_free(block);
}

FailingMalloc::FailingMalloc(int failing_call) : failing_call_(failing_call) { current = this; }

FailingMalloc::~FailingMalloc() { current = nullptr; }

int FailingMalloc::live() const {
  return static_cast<int>(std::count_if(std::begin(blocks_), std::end(blocks_),
                                        [](const Block& block) { return block.start != nullptr; }));
}

void* FailingMalloc::Allocate(size_t size) {
  if (++calls_ == failing_call_) return nullptr;
  void* const start = __real_malloc(size);
  Block* const slot = std::find_if(std::begin(blocks_), std::end(blocks_),
                                   [](const Block& block) { return block.start == nullptr; });
  if (slot == std::end(blocks_)) abort();
  *slot = {static_cast<unsigned char*>(start), size};
  return start;
}

void FailingMalloc::Release(void* start) {
  if (start == nullptr) return;
  Block* const block =
      std::find_if(std::begin(blocks_), std::end(blocks_),
                   [start](const Block& candidate) { return candidate.start == start; });
  if (block == std::end(blocks_)) return;
  ++freed_;
  const bool wiped = std::all_of(block->start, block->start + block->size,
                                 [](unsigned char byte) { return byte == 0; });
  if (!wiped) ++freed_unwiped_;
  *block = {};
}
