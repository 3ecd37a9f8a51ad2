// What the zip library's adapter makes of both generations of the library.
#include "apk/zip_library.h"

#include <gtest/gtest.h>

#include "apk/open_entry.h"

using namespace ApkTools;

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

TEST(ZipLibrary, ANameMayHoldAnyCharacters) {
  OpenEntry zip({"lib/\u00fc\x01 \n", ToBytes("x")});
  ZipEntry entry;
  EXPECT_EQ(FindZipEntry(zip.handle, "lib/\u00fc\x01 \n", &entry), 0);
  EXPECT_EQ(FindZipEntry(zip.handle, "lib/", &entry), kZipEntryNotFound);
}

TEST(ZipLibrary, ANameLongerThanAnyIsInvalid) {
  OpenEntry zip({"a", ToBytes("x")});
  ZipEntry entry;
  EXPECT_EQ(FindZipEntry(zip.handle, std::string(0x10000, 'a'), &entry), kZipInvalidEntryName);
}

}  // namespace
