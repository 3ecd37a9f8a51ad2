// Documents at the very end of memory, for the platform's own parser: what it reads beyond them
// ends the test.
#include <gtest/gtest.h>

#include "apk/apk.h"
#include "support/compiled_manifest.h"
#include "support/log_capture.h"
#include "support/memory_end.h"

namespace {

TEST(CompiledManifestAtMemoryEnd, IsNotReadBeyondHoweverShortItIs) {
  const Bytes whole = CompiledManifest("com.example.app", true);
  for (size_t size = 0; size <= whole.size(); ++size) {
    ApkTools::Apk apk(-1);
    EXPECT_EQ(apk.ParseAndroidManifest(AtMemoryEnd(whole.data(), size)), size == whole.size())
        << size;
  }
}

TEST(CompiledManifestAtMemoryEnd, WithoutRoomForAHeaderIsNone) {
  const Bytes whole = CompiledManifest("com.example.app");
  for (size_t size = 0; size < 8; ++size) {
    ApkTools::Apk apk(-1);
    LogCapture log;
    EXPECT_FALSE(apk.ParseAndroidManifest(AtMemoryEnd(whole.data(), size)));
    // The parser's code for a type that it does not take.
    EXPECT_EQ(log.records(), Records({Error("ParseAndroidManifest failed to init xml parser, "
                                            "error=0x80000001\n")}))
        << size;
  }
}

}  // namespace
