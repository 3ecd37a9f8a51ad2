#include "util/memory.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdint>

namespace {

size_t AllOfTheMachine() {
  return static_cast<size_t>(sysconf(_SC_PHYS_PAGES)) * static_cast<size_t>(sysconf(_SC_PAGESIZE));
}

TEST(FitsInMemory, NothingAndAPageDo) {
  EXPECT_TRUE(FitsInMemory(0));
  EXPECT_TRUE(FitsInMemory(static_cast<size_t>(sysconf(_SC_PAGESIZE))));
}

TEST(FitsInMemory, AllOfTheMachineAndMoreDoNot) {
  EXPECT_FALSE(FitsInMemory(AllOfTheMachine()));
  EXPECT_FALSE(FitsInMemory(SIZE_MAX));
}

// More in all than a process has addresses for, so that what was tried was given back each time.
TEST(FitsInMemory, HoweverOftenItIsAskedTheAnswerIsTheSame) {
  constexpr size_t kAddresses = size_t{1} << 48;
  const size_t size = AllOfTheMachine() / 2;
  for (size_t asked = 0; asked < kAddresses; asked += size) ASSERT_TRUE(FitsInMemory(size));
}

}  // namespace
