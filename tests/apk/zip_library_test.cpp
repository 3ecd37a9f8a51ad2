// Tests apk/zip_library.h for both generations of the zip library. The older generation accepts
// names as `ZipString`, and the later generation as std::string_view.
#include "apk/zip_library.h"

#include <gtest/gtest.h>

#include "apk/open_entry.h"

using namespace ApkTools;

namespace {

// Stands for `ZipString`, the older generation's type for names.
struct OlderName {
  const uint8_t* name;
  uint16_t name_length;
  OlderName() {}
  explicit OlderName(const char*) { ADD_FAILURE() << "the constructor from a C string was called"; }
};

OlderName Older(const std::string& text) {
  OlderName name;
  SetZipName(name, text);
  return name;
}

TEST(OlderZipLibrary, NameIsGivenWithItsLength) {
  const std::string text("a\0b", 3);
  const OlderName name = Older(text);
  EXPECT_EQ(reinterpret_cast<const char*>(name.name), text.data());
  EXPECT_EQ(name.name_length, 3);
}

TEST(OlderZipLibrary, LongestNameIsGivenWhole) {
  const std::string text(0xffff, 'n');
  EXPECT_EQ(Older(text).name_length, 0xffff);
}

TEST(OlderZipLibrary, NameWithANulIsReadWhole) {
  const std::string text("a\0b", 3);
  EXPECT_EQ(ZipNameText(Older(text)), text);
}

TEST(OlderZipLibrary, EmptyFilterIsANullPointer) {
  const std::string text = "lib/";
  const OlderName name = Older(text), none = Older("");
  EXPECT_EQ(ZipFilter(name), &name);
  EXPECT_EQ(ZipFilter(none), nullptr);
}

TEST(LaterZipLibrary, NameAndFilterEqualTheText) {
  const std::string text("a\0b", 3);
  std::string_view name;
  SetZipName(name, text);
  EXPECT_EQ(name, text);
  EXPECT_EQ(ZipNameText(name), text);
  EXPECT_EQ(ZipFilter(name), text);
  EXPECT_EQ(ZipFilter(std::string_view()), "");
}

TEST(ZipLibrary, NameWithUnusualCharactersIsFound) {
  OpenEntry zip({"lib/\u00fc\x01 \n", ToBytes("x")});
  ZipEntry entry;
  EXPECT_EQ(FindZipEntry(zip.handle, "lib/\u00fc\x01 \n", &entry), 0);
  EXPECT_EQ(FindZipEntry(zip.handle, "lib/", &entry), kZipEntryNotFound);
}

TEST(ZipLibrary, NameOf65536BytesIsInvalid) {
  OpenEntry zip({"a", ToBytes("x")});
  ZipEntry entry;
  EXPECT_EQ(FindZipEntry(zip.handle, std::string(0x10000, 'a'), &entry), kZipInvalidEntryName);
}

TEST(ZipLibrary, FilterOf65536BytesIsInvalidWithoutALibraryCall) {
  const std::string longer(0x10000, 'a');
  void* cookie = nullptr;
  EXPECT_EQ(StartZipIteration(nullptr, &cookie, longer, ""), kZipInvalidEntryName);
  EXPECT_EQ(StartZipIteration(nullptr, &cookie, "", longer), kZipInvalidEntryName);
  EXPECT_EQ(cookie, nullptr);
}

TEST(ZipLibrary, NextAtTheEndLeavesTheNameAsItWas) {
  OpenEntry zip({"a", ToBytes("x")});
  void* cookie;
  ASSERT_EQ(StartZipIteration(zip.handle, &cookie, "", ""), 0);
  ZipEntry entry;
  std::string name = "before";
  EXPECT_EQ(NextZipEntry(cookie, &entry, name), 0);
  EXPECT_EQ(name, "a");
  EXPECT_EQ(NextZipEntry(cookie, &entry, name), -1);
  EXPECT_EQ(name, "a");
  EndIteration(cookie);
}

}  // namespace
