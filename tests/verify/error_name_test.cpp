#include "verify/error_name.h"

#include <gtest/gtest.h>

#include <climits>
#include <cstring>

// Compares the names of all error numbers with the names in the C library. The highest error number
// that a system call can return is 4095.
TEST(ErrorName, IsTheNameThatTheCLibraryHas) {
  constexpr int kLast = 4095;
  int named = 0;
  for (int error = 1; error <= kLast; ++error) {
    const char* const known = strerrorname_np(error);
    EXPECT_EQ(ErrorName(error), known == nullptr ? "-" : known) << error;
    if (known != nullptr) ++named;
  }
  EXPECT_EQ(named, 131);  // in include/uapi/asm-generic of Linux: 1 to 133 without 41 and 58
}

TEST(ErrorName, IsADashForAnUnknownNumber) {
  for (const int error : {0, -1, -126, INT_MIN, INT_MAX}) EXPECT_EQ(ErrorName(error), "-") << error;
}
