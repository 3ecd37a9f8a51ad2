#include "util/memory.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdint>
#include <fstream>

namespace {

size_t AllOfTheMachine() {
  return static_cast<size_t>(sysconf(_SC_PHYS_PAGES)) * static_cast<size_t>(sysconf(_SC_PAGESIZE));
}

TEST(FitsInMemory, ZeroBytesAndOnePageFit) {
  EXPECT_TRUE(FitsInMemory(0));
  EXPECT_TRUE(FitsInMemory(static_cast<size_t>(sysconf(_SC_PAGESIZE))));
}

TEST(FitsInMemory, AllMemoryOfTheMachineAndMoreDoNotFit) {
  EXPECT_FALSE(FitsInMemory(AllOfTheMachine()));
  EXPECT_FALSE(FitsInMemory(SIZE_MAX));
}

// The address space that the process uses, in bytes.
size_t AddressesTaken() {
  size_t pages = 0;
  std::ifstream("/proc/self/statm") >> pages;
  EXPECT_NE(pages, 0u);
  return pages * static_cast<size_t>(sysconf(_SC_PAGESIZE));
}

TEST(FitsInMemory, TrialMemoryIsFreed) {
  const size_t size = AllOfTheMachine() / 2;
  const size_t before = AddressesTaken();
  ASSERT_TRUE(FitsInMemory(size));
  EXPECT_LT(AddressesTaken(), before + size / 2);
}

}  // namespace
