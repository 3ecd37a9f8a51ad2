// Tests the extraction of entries, and the checks of an entry's lengths before memory is allocated
// for the entry.
#include "apk/extraction.h"

#include <gtest/gtest.h>
#include <sys/mman.h>

#include <cerrno>

#include "apk/open_entry.h"

using namespace ApkTools;

// The linker redirects the tool's calls of mmap to __wrap_mmap, including the call that checks
// whether memory is available.
static bool memory_is_short = false;

extern "C" void* __real_mmap(void* address, size_t size, int protection, int flags, int fd,
                             off_t offset);

extern "C" void* __wrap_mmap(void* address, size_t size, int protection, int flags, int fd,
                             off_t offset) {
  if (!memory_is_short) return __real_mmap(address, size, protection, flags, fd, offset);
  errno = ENOMEM;
  return MAP_FAILED;
}

namespace {

TEST(Extraction, EntryReplacesTheVectorsContents) {
  OpenEntry zip({"a", ToBytes("abc"), true});
  Bytes out(100, 1);
  EXPECT_EQ(ExtractZipEntry(zip.handle, &zip.entry, out), 0);
  EXPECT_EQ(out, ToBytes("abc"));
}

TEST(Extraction, EmptyEntryIsExtracted) {
  for (const bool deflated : {false, true}) {
    OpenEntry zip({"a", {}, deflated});
    Bytes out(100, 1);
    EXPECT_EQ(ExtractZipEntry(zip.handle, &zip.entry, out), 0);
    EXPECT_EQ(out, Bytes());
  }
}

// Deflate encodes at most 258 bytes in two bits, so a byte of compressed data stands for at most
// 1032 bytes. Zeros come close to this limit.
TEST(Extraction, EntryThatDeflatesBestIsExtracted) {
  const Bytes zeros(10 << 20, 0);
  OpenEntry zip({"a", zeros, true});
  EXPECT_GT(zeros.size(), 1020 * Deflate(zeros).size());
  Bytes out;
  EXPECT_EQ(ExtractZipEntry(zip.handle, &zip.entry, out), 0);
  EXPECT_EQ(out, zeros);
}

TEST(Extraction, ImplausibleLengthLeavesTheVectorUnchanged) {
  OpenEntry zip(ClaimingLength({"a", ToBytes("abc"), true}, 0x7fffffff));
  Bytes out(100, 1);
  EXPECT_EQ(ExtractZipEntry(zip.handle, &zip.entry, out), kZipInconsistentInformation);
  EXPECT_EQ(out, Bytes(100, 1));
}

TEST(Extraction, PlausibleLengthIsAtMost1032TimesTheData) {
  ZipEntry entry = {};
  entry.method = kCompressDeflated;
  entry.compressed_length = 100;
  entry.uncompressed_length = 103200;
  EXPECT_TRUE(IsPlausibleLength(entry));
  entry.uncompressed_length = 103201;
  EXPECT_FALSE(IsPlausibleLength(entry));
  entry.compressed_length = 0xffffffff;  // the product does not fit in 32 bits
  EXPECT_TRUE(IsPlausibleLength(entry));
}

TEST(Extraction, StoredEntryMustBeAsLongAsItsData) {
  ZipEntry entry = {};
  entry.method = kCompressStored;
  entry.compressed_length = 100;
  for (const uint32_t length : {99u, 101u}) {
    entry.uncompressed_length = length;
    EXPECT_FALSE(IsPlausibleLength(entry));
  }
  entry.uncompressed_length = 100;
  EXPECT_TRUE(IsPlausibleLength(entry));
}

// One test declares the length kLongLength - 1. This length must be above kZipTrustedLength, too.
constexpr uint32_t kLongLength = kZipTrustedLength + 2;
// An entry of kLongLength zeros. It is made once, because the compression takes time.
const ZipItem& LongItem() {
  static const ZipItem item = [] {
    ZipItem made{"a", Bytes(kLongLength, 0), true};
    made.raw = Deflate(made.data);
    return made;
  }();
  return item;
}

TEST(Extraction, LongEntryWithItsTrueLengthIsExtracted) {
  OpenEntry zip(LongItem());
  Bytes out;
  EXPECT_EQ(ExtractZipEntry(zip.handle, &zip.entry, out), 0);
  EXPECT_TRUE(out == Bytes(kLongLength, 0));
}

TEST(Extraction, LongEntryWithAFalseLengthLeavesTheVectorUnchanged) {
  for (const uint32_t length : {kLongLength - 1, kLongLength + 1}) {
    OpenEntry zip(ClaimingLength(LongItem(), length));
    Bytes out(100, 1);
    EXPECT_EQ(ExtractZipEntry(zip.handle, &zip.entry, out), kZipInconsistentInformation);
    EXPECT_EQ(out, Bytes(100, 1));
  }
}

// The zip library's result if the data of an entry cannot be inflated.
constexpr int32_t kZlibError = -2;

TEST(Extraction, EntryThatCannotBeInflatedFailsWithZlibError) {
  for (const bool is_long : {false, true}) {
    ZipItem item = is_long ? LongItem() : ZipItem{"a", Bytes(1000, 0), true};
    item.raw = Bytes(is_long ? LongItem().raw->size() : 100, 0xFF);
    OpenEntry zip(item);
    Bytes out;
    EXPECT_EQ(ExtractZipEntry(zip.handle, &zip.entry, out), kZlibError);
  }
}

TEST(Extraction, LongEntryThatDoesNotFitInMemoryLeavesTheVectorUnchanged) {
  OpenEntry zip(LongItem());
  Bytes out(100, 1);
  memory_is_short = true;
  const int32_t result = ExtractZipEntry(zip.handle, &zip.entry, out);
  memory_is_short = false;
  EXPECT_EQ(result, kZipAllocationFailed);
  EXPECT_EQ(out, Bytes(100, 1));
}

TEST(Extraction, UnknownMethodIsRefused) {
  ZipItem item{"a", ToBytes("abc")};
  item.method = 12;
  OpenEntry zip(item);
  Bytes out;
  EXPECT_NE(ExtractZipEntry(zip.handle, &zip.entry, out), 0);
}

}  // namespace
