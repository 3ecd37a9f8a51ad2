// Cuts a file while it is examined.
#pragma once

#include <gtest/gtest.h>
#include <unistd.h>

#include <chrono>
#include <functional>
#include <thread>

#include "support/files.h"

// True if `notices` returns true for a file that is cut meanwhile. `notices` gets the path of a
// file with the bytes `whole`, and another thread cuts the file to 3000 bytes. This is tried up to
// 120 times, with cuts at different times. These times are spread over the duration of a call for
// an uncut file, which is far longer in an emulator. For the uncut file, `notices` must return
// false.
inline bool NoticesCut(const Bytes& whole, const std::function<bool(const std::string&)>& notices) {
  const TempDir directory;
  const auto start = std::chrono::steady_clock::now();
  EXPECT_FALSE(notices(directory.Write("base.apk", whole))) << "the file was not cut";
  const auto duration = std::chrono::steady_clock::now() - start;
  for (int i = 0; i < 120; ++i) {
    const std::string file = directory.Write("base.apk", whole);
    std::thread cutter([&] {
      std::this_thread::sleep_for(duration * (i % 40) / 40);
      EXPECT_EQ(truncate(file.c_str(), 3000), 0);
    });
    const bool has_noticed = notices(file);
    cutter.join();
    if (has_noticed) return true;
  }
  return false;
}
