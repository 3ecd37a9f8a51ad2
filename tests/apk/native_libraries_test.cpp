// The path of a library on disk. tests/sign/signing_test.cpp tests that exactly this path is read.
#include "apk/native_libraries.h"

#include <gtest/gtest.h>

namespace {

using ApkTools::InstalledLibraryPath;

TEST(InstalledLibraryPath, IsInLibArmOrLibArm64BesideThePackage) {
  const auto path = [](const char* entry) {
    return InstalledLibraryPath("/data/app/pkg-1/base.apk", entry);
  };
  EXPECT_EQ(path("lib/arm64-v8a/libfoo.so"), "/data/app/pkg-1/lib/arm64/libfoo.so");
  EXPECT_EQ(path("lib/armeabi-v8a/libfoo.so"), "/data/app/pkg-1/lib/arm64/libfoo.so");
  EXPECT_EQ(path("lib/armeabi-v7a/libfoo.so"), "/data/app/pkg-1/lib/arm/libfoo.so");
  EXPECT_EQ(path("lib/armeabi/libfoo.so"), "/data/app/pkg-1/lib/arm/libfoo.so");
}

TEST(InstalledLibraryPath, IsEmptyForOtherAbis) {
  for (const char* entry : {"lib/x86/libfoo.so", "lib/x86_64/libfoo.so", "lib/arm64/libfoo.so",
                            "lib/arm64-v8/libfoo.so", "Lib/arm64-v8a/libfoo.so", ""}) {
    EXPECT_EQ(InstalledLibraryPath("/data/app/pkg-1/base.apk", entry), "") << entry;
  }
}

TEST(InstalledLibraryPath, PackagePathWithoutSlashGivesARelativePath) {
  EXPECT_EQ(InstalledLibraryPath("base.apk", "lib/arm64-v8a/libfoo.so"), "lib/arm64/libfoo.so");
  EXPECT_EQ(InstalledLibraryPath("/base.apk", "lib/arm64-v8a/libfoo.so"), "/lib/arm64/libfoo.so");
}

}  // namespace
