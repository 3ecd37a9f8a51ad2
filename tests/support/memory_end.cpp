#include "support/memory_end.h"

#include <sys/mman.h>
#include <unistd.h>

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <new>
#include <utility>

namespace {

constexpr size_t kRoom = 1 << 20;

// The end of the kRoom bytes that MakeMemory maps. The page after these bytes cannot be accessed.
// The block that PutNextBlockAtMemoryEnd requests ends at memory_end or up to 3 bytes before.
uint8_t* memory_end = nullptr;
// operator new puts the next block of this size, in bytes, before memory_end; 0: none is requested.
size_t size_at_end = 0;

void MakeMemory() {
  const auto page = static_cast<size_t>(sysconf(_SC_PAGESIZE));
  void* const room =
      mmap(nullptr, kRoom + page, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
  memory_end = static_cast<uint8_t*>(room) + kRoom;
  if (room == MAP_FAILED || mprotect(memory_end, page, PROT_NONE) != 0) {
    perror("memory");
    abort();
  }
}

bool IsAtEnd(const void* block) {
  return memory_end != nullptr && block >= memory_end - kRoom && block < memory_end;
}

}  // namespace

void PutNextBlockAtMemoryEnd(size_t size) {
  if (size > kRoom) abort();
  if (memory_end == nullptr) MakeMemory();
  size_at_end = size;
}

bool WasPutAtMemoryEnd() { return std::exchange(size_at_end, 0) == 0; }

void* operator new(size_t size) {
  if (size_at_end != 0 && size == size_at_end) {
    size_at_end = 0;
    return memory_end - (size + 3) / 4 * 4;
  }
  void* const block = malloc(size == 0 ? 1 : size);
  if (block == nullptr) abort();
  return block;
}
void* operator new(size_t size, const std::nothrow_t&) noexcept { return malloc(size); }
void operator delete(void* block) noexcept {
  if (!IsAtEnd(block)) free(block);
}
void operator delete(void* block, size_t) noexcept { operator delete(block); }
