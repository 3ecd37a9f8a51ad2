// Tests how the tool calls the zip library. The tool's results do not show these calls, so the
// linker redirects them to the Wrap functions below. The Wrap functions record the calls and call
// the library. If the test sets no_iteration, WrapStartIteration fails without a call of the
// library. tests/sign/CMakeLists.txt has the mangled names of the library's functions.
#include <gtest/gtest.h>

#include <algorithm>
#include <vector>

#include "apk/zip_library.h"
#include "sign/signing.h"
#include "support/log_capture.h"
#include "support/open_package.h"
#include "support/phone.h"

using ApkTools::Apk;

namespace {

constexpr int32_t kInvalidHandle = -4;  // an error code of the zip library

struct ZipCalls {
  std::vector<bool> ownership;       // for each opening: true if the archive owns its descriptor
  std::vector<std::string> filters;  // "PREFIX SUFFIX" of each StartIteration call
  std::vector<void*> archives;       // the archive of each StartIteration call
  std::vector<void*> open_cookies;   // the cookies of iterations that have not ended
  bool no_iteration = false;         // true: every start of an iteration fails
} calls;

template <typename Filter>
std::string TextOf(const Filter& filter) {
  if constexpr (std::is_pointer_v<Filter>) {
    if (filter == nullptr) return "";
    return std::string(reinterpret_cast<const char*>(filter->name), filter->name_length);
  } else {
    return std::string(filter);
  }
}

#ifdef APKTOOLKIT_ZIPSTRING
using Filter = const ZipString*;
#else
using Filter = std::string_view;
#endif

}  // namespace

int32_t RealOpenArchiveFd(int, const char*, ZipArchiveHandle*,
                          bool) __asm__("__real_" OPEN_ARCHIVE_FD);
int32_t WrapOpenArchiveFd(int, const char*, ZipArchiveHandle*,
                          bool) __asm__("__wrap_" OPEN_ARCHIVE_FD);
int32_t RealStartIteration(ZipArchiveHandle, void**, Filter,
                           Filter) __asm__("__real_" START_ITERATION);
int32_t WrapStartIteration(ZipArchiveHandle, void**, Filter,
                           Filter) __asm__("__wrap_" START_ITERATION);
void RealEndIteration(void*) __asm__("__real_" END_ITERATION);
void WrapEndIteration(void*) __asm__("__wrap_" END_ITERATION);

int32_t WrapOpenArchiveFd(int fd, const char* name, ZipArchiveHandle* handle, bool ownership) {
  calls.ownership.push_back(ownership);
  return RealOpenArchiveFd(fd, name, handle, ownership);
}

int32_t WrapStartIteration(ZipArchiveHandle archive, void** cookie, Filter prefix, Filter suffix) {
  calls.archives.push_back(archive);
  calls.filters.push_back(TextOf(prefix) + " " + TextOf(suffix));
  if (calls.no_iteration) return kInvalidHandle;
  const int32_t result = RealStartIteration(archive, cookie, prefix, suffix);
  if (result == 0) calls.open_cookies.push_back(*cookie);
  return result;
}

void WrapEndIteration(void* cookie) {
  auto& open = calls.open_cookies;
  open.erase(std::remove(open.begin(), open.end(), cookie), open.end());
  RealEndIteration(cookie);
}

namespace {

class ZipLibraryCalls : public testing::Test {
 protected:
  ZipLibraryCalls() { calls = {}; }
  LogCapture log_;
  Phone phone_;
};

TEST_F(ZipLibraryCalls, CallersDescriptorIsNotOwnedByTheArchive) {
  OpenPackage open{PackageOptions()};
  EXPECT_EQ(calls.ownership, std::vector<bool>({false}));
}

TEST_F(ZipLibraryCalls, DescriptorThatInitOpenedIsOwnedByTheArchive) {
  const DiskFile file(MakePackage().Build());
  Apk apk(-1);
  apk.Init(-1, file.path().c_str());
  EXPECT_EQ(calls.ownership, std::vector<bool>({true}));
}

TEST_F(ZipLibraryCalls, CallersDescriptorWithAPathIsNotOwnedByTheArchive) {
  const DiskFile file(MakePackage().Build());
  const MemoryFile memory(MakePackage().Build());
  Apk apk(-1);
  apk.Init(memory.fd(), file.path().c_str());
  EXPECT_EQ(calls.ownership, std::vector<bool>({false}));
}

TEST_F(ZipLibraryCalls, FailedOpeningLeavesNoArchive) {
  OpenPackage open(ToBytes("This is not a zip archive, but a text."));
  void* cookie = nullptr;
  EXPECT_NE(open.apk.StartIteration(&cookie, "", ""), 0);
  EXPECT_EQ(calls.archives, std::vector<void*>({nullptr}));
}

TEST_F(ZipLibraryCalls, EachIterationHasItsFilterAndIsEnded) {
  OpenPackage open(WithLibraries({{"lib/arm64-v8a/libfoo.so", ToBytes("foo")}}));
  VeltSignJni(open.apk, open.file.fd(), "not used");
  EXPECT_EQ(calls.filters, std::vector<std::string>({"META-INF/ .SF", "lib/ .so"}));
  EXPECT_EQ(calls.open_cookies, std::vector<void*>());
}

TEST_F(ZipLibraryCalls, LibrariesAreSkippedWithResultZeroIfIterationFails) {
  OpenPackage open(WithLibraries({{"lib/arm64-v8a/libfoo.so", ToBytes("foo")}}));
  calls.no_iteration = true;
  log_.Clear();
  EXPECT_EQ(VeltSignJni(open.apk, 7, "not used"), 0u);
  EXPECT_EQ(log_.records(),
            Records({Info("VeltSignJni starts: 7.\n"), Info("VeltSignJni finished: 0.\n")}));
  EXPECT_EQ(phone_.events, std::vector<std::string>());
  EXPECT_EQ(calls.filters.back(), "lib/ .so");
}

TEST_F(ZipLibraryCalls, SignatureFileIsNotFoundIfIterationFails) {
  const Package package = MakePackage();
  calls.no_iteration = true;
  OpenPackage open(package);
  EXPECT_TRUE(open.apk.IsApk());
  EXPECT_FALSE(open.apk.IsGoodApk());
  EXPECT_EQ(log_.records(), Records());
}

TEST_F(ZipLibraryCalls, IterationThatFindsNothingIsEndedToo) {
  Package package = MakePackage();
  package.Remove("META-INF/CERT.SF");
  OpenPackage open(package);
  EXPECT_EQ(calls.filters, std::vector<std::string>({"META-INF/ .SF"}));
  EXPECT_EQ(calls.open_cookies, std::vector<void*>());
}

}  // namespace
