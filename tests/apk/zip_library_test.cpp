// What the zip library's adapter makes of both generations of the library, and of long entries.
#include "apk/zip_library.h"

#include <gtest/gtest.h>
#include <sys/mman.h>

#include <cerrno>

#include "support/package.h"

using namespace ApkTools;

// The linker sends the tool's calls of mmap here, and with them its question whether there is
// memory to be had.
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

constexpr int32_t kIterationEnd = -1;

// The older generation: names are taken as a pointer and a 16-bit length.
struct OlderZip {
  using Handle = void*;
  struct Entry {
    int number;
  };
  struct Name {
    const uint8_t* name;
    uint16_t name_length;
    Name() {}
    explicit Name(const char*) { ADD_FAILURE() << "the constructor from a C string is not used"; }
  };

  static int32_t FindEntry(const Handle, const Name& name, Entry* entry) {
    asked = Text(name);
    entry->number = 7;
    return 0;
  }
  static int32_t StartIteration(Handle, void** cookie, const Name* prefix, const Name* suffix) {
    asked = (prefix ? Text(*prefix) : "null") + "|" + (suffix ? Text(*suffix) : "null");
    *cookie = &asked;
    return 0;
  }
  static int32_t Next(void*, Entry*, Name* name) {
    if (next.empty()) return kIterationEnd;
    *name = ToZipName<OlderZip>(next);
    return 0;
  }

  static std::string Text(const Name& name) {
    return std::string(reinterpret_cast<const char*>(name.name), name.name_length);
  }
  static inline std::string asked;
  static inline std::string next;
};

TEST(ZipLibrary, TheGenerationIsToldByWhatFindEntryTakes) {
  EXPECT_FALSE(TakesStringView<OlderZip>::value);
}

TEST(ZipLibraryOlder, ANameIsGivenWithItsLength) {
  const std::string name("a\0b", 3);
  OlderZip::Entry entry;
  EXPECT_EQ(FindZipEntry<OlderZip>(nullptr, name, &entry), 0);
  EXPECT_EQ(OlderZip::asked, name);
  EXPECT_EQ(entry.number, 7);
}

TEST(ZipLibraryOlder, TheLongestNameIsGivenWhole) {
  OlderZip::Entry entry;
  EXPECT_EQ(FindZipEntry<OlderZip>(nullptr, std::string(0xffff, 'n'), &entry), 0);
  EXPECT_EQ(OlderZip::asked.size(), 0xffffu);
}

TEST(ZipLibraryOlder, ALongerNameIsInvalidWithoutACall) {
  OlderZip::asked = "not asked";
  OlderZip::Entry entry;
  EXPECT_EQ(FindZipEntry<OlderZip>(nullptr, std::string(0x10000, 'n'), &entry),
            kZipInvalidEntryName);
  void* cookie;
  EXPECT_EQ(StartZipIteration<OlderZip>(nullptr, &cookie, std::string(0x10000, 'n'), ""),
            kZipInvalidEntryName);
  EXPECT_EQ(StartZipIteration<OlderZip>(nullptr, &cookie, "", std::string(0x10000, 'n')),
            kZipInvalidEntryName);
  EXPECT_EQ(OlderZip::asked, "not asked");
}

TEST(ZipLibraryOlder, AnEmptyFilterIsANullPointer) {
  void* cookie;
  EXPECT_EQ(StartZipIteration<OlderZip>(nullptr, &cookie, "", ""), 0);
  EXPECT_EQ(OlderZip::asked, "null|null");
  EXPECT_EQ(StartZipIteration<OlderZip>(nullptr, &cookie, "lib/", ""), 0);
  EXPECT_EQ(OlderZip::asked, "lib/|null");
  EXPECT_EQ(StartZipIteration<OlderZip>(nullptr, &cookie, "", ".so"), 0);
  EXPECT_EQ(OlderZip::asked, "null|.so");
}

TEST(ZipLibraryOlder, NextTakesAsManyBytesAsTheNameIsLong) {
  OlderZip::next = std::string("a\0b", 3);
  OlderZip::Entry entry;
  std::string name = "before";
  EXPECT_EQ(NextZipEntry<OlderZip>(nullptr, &entry, name), 0);
  EXPECT_EQ(name, OlderZip::next);
}

TEST(ZipLibraryOlder, NextLeavesTheNameAloneAtTheEnd) {
  OlderZip::next = "";
  OlderZip::Entry entry;
  std::string name = "before";
  EXPECT_EQ(NextZipEntry<OlderZip>(nullptr, &entry, name), kIterationEnd);
  EXPECT_EQ(name, "before");
}

// An archive of one entry, open for the length of a test.
class OpenZip {
 public:
  explicit OpenZip(const ZipItem& item) : file_(BuildZip({item})) {
    EXPECT_EQ(OpenArchiveFd(file_.fd(), "test", &handle, false), 0);
    EXPECT_EQ(FindZipEntry(handle, item.name, &entry), 0);
  }
  ~OpenZip() { CloseArchive(handle); }

  ZipArchiveHandle handle = nullptr;
  ZipEntry entry = {};

 private:
  MemoryFile file_;
};

TEST(ZipLibrary, ANameMayHoldAnyCharacters) {
  OpenZip zip({"lib/\u00fc\x01 \n", ToBytes("x")});
  ZipEntry entry;
  EXPECT_EQ(FindZipEntry(zip.handle, "lib/\u00fc\x01 \n", &entry), 0);
  EXPECT_EQ(FindZipEntry(zip.handle, "lib/", &entry), kZipEntryNotFound);
}

TEST(ZipLibrary, ANameLongerThanAnyIsInvalid) {
  OpenZip zip({"a", ToBytes("x")});
  ZipEntry entry;
  EXPECT_EQ(FindZipEntry(zip.handle, std::string(0x10000, 'a'), &entry), kZipInvalidEntryName);
}

TEST(ZipLibrary, AnEntryReplacesWhatTheVectorHeld) {
  OpenZip zip({"a", ToBytes("abc"), true});
  Bytes out(100, 1);
  EXPECT_EQ(ExtractZipEntry(zip.handle, &zip.entry, out), 0);
  EXPECT_EQ(out, ToBytes("abc"));
}

TEST(ZipLibrary, AnEmptyEntryIsExtracted) {
  for (const bool deflated : {false, true}) {
    OpenZip zip({"a", {}, deflated});
    Bytes out(100, 1);
    EXPECT_EQ(ExtractZipEntry(zip.handle, &zip.entry, out), 0);
    EXPECT_EQ(out, Bytes());
  }
}

// 258 bytes for every two bits: nothing that deflates is closer to the limit than zeros.
TEST(ZipLibrary, WhatDeflatesBestIsPlausible) {
  const Bytes zeros(10 << 20, 0);
  OpenZip zip({"a", zeros, true});
  EXPECT_GT(zeros.size(), 1020 * Deflate(zeros).size());
  Bytes out;
  EXPECT_EQ(ExtractZipEntry(zip.handle, &zip.entry, out), 0);
  EXPECT_EQ(out, zeros);
}

TEST(ZipLibrary, AnImplausibleLengthLeavesTheVectorAlone) {
  OpenZip zip(ClaimingLength({"a", ToBytes("abc"), true}, 0x7fffffff));
  Bytes out(100, 1);
  EXPECT_EQ(ExtractZipEntry(zip.handle, &zip.entry, out), kZipInconsistentInformation);
  EXPECT_EQ(out, Bytes(100, 1));
}

TEST(ZipLibrary, TheLimitOfPlausibleLengthsIs1032TimesTheData) {
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

TEST(ZipLibrary, AStoredEntryIsAsLongAsItsData) {
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

// An entry of zeros whose length is more than is believed; made once, for it takes its time.
constexpr uint32_t kLongLength = kZipTrustedLength + 2;
const ZipItem& LongItem() {
  static const ZipItem item = [] {
    ZipItem made{"a", Bytes(kLongLength, 0), true};
    made.raw = Deflate(made.data);
    return made;
  }();
  return item;
}

TEST(ZipLibrary, ALongEntryThatTellsTheTruthIsExtracted) {
  OpenZip zip(LongItem());
  Bytes out;
  EXPECT_EQ(ExtractZipEntry(zip.handle, &zip.entry, out), 0);
  EXPECT_TRUE(out == Bytes(kLongLength, 0));
}

TEST(ZipLibrary, ALongEntryThatLiesLeavesTheVectorAlone) {
  for (const uint32_t length : {kLongLength - 1, kLongLength + 1}) {
    OpenZip zip(ClaimingLength(LongItem(), length));
    Bytes out(100, 1);
    EXPECT_EQ(ExtractZipEntry(zip.handle, &zip.entry, out), kZipInconsistentInformation);
    EXPECT_EQ(out, Bytes(100, 1));
  }
}

TEST(ZipLibrary, ALongEntryThatMemoryCannotHoldLeavesTheVectorAlone) {
  OpenZip zip(LongItem());
  Bytes out(100, 1);
  memory_is_short = true;
  const int32_t result = ExtractZipEntry(zip.handle, &zip.entry, out);
  memory_is_short = false;
  EXPECT_EQ(result, kZipAllocationFailed);
  EXPECT_EQ(out, Bytes(100, 1));
}

TEST(ZipLibrary, AnUnknownMethodIsRefused) {
  ZipItem item{"a", ToBytes("abc")};
  item.method = 12;
  OpenZip zip(item);
  Bytes out;
  EXPECT_NE(ExtractZipEntry(zip.handle, &zip.entry, out), 0);
}

}  // namespace
