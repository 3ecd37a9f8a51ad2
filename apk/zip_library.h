// Wraps the functions of the platform's zip library that accept or return entry names. The wrappers
// are the same for all releases of the library.
//
// The library has two generations. Its functions accept names as `ZipString` up to API 29, and as
// std::string_view later. In the tool, only this file depends on the difference. The library
// allocates archives and cookies. Its CloseArchive and EndIteration release them. The caller owns
// each ZipEntry. Each int32_t result is one of the library's codes (0: success). The functions of
// this file log nothing, but the library can log a failure.
#pragma once

#include <ziparchive/zip_archive.h>

#include <cstdint>
#include <string>
#include <string_view>

struct ZipString;  // Only the older generation defines it.

namespace ApkTools {

// Codes of the library that its header does not name.
inline constexpr int32_t kZipEntryNotFound = -7;
inline constexpr int32_t kZipInvalidEntryName = -10;

// The length in bytes of the longest name that a zip archive and a `ZipString` can have.
inline constexpr size_t kZipLongestName = 0xffff;

// ZipName is the type of a name in the library of this build. The first overload of ZipNameFor
// exists only in the later generation, in which FindEntry accepts a std::string_view.
template <typename Entry>
auto ZipNameFor(Entry* entry)
    -> decltype(FindEntry(ZipArchiveHandle(), std::string_view(), entry), std::string_view());
ZipString ZipNameFor(...);
using ZipName = decltype(ZipNameFor(static_cast<ZipEntry*>(nullptr)));

// In each pair of functions below, the first is for std::string_view. The template is for
// `ZipString`, or for a test's type with the same fields. A name points to text that it does not
// own.

inline void SetZipName(std::string_view& name, const std::string& text) { name = text; }
// Sets the fields one by one, because the constructor of `ZipString` from a C string would stop at
// a NUL and abort on a long name.
template <typename Name>
void SetZipName(Name& name, const std::string& text) {
  name.name = reinterpret_cast<const uint8_t*>(text.data());
  name.name_length = static_cast<uint16_t>(text.size());
}

inline std::string_view ZipNameText(std::string_view name) { return name; }
template <typename Name>
std::string_view ZipNameText(const Name& name) {
  return {reinterpret_cast<const char*>(name.name), name.name_length};
}

// Returns `name` in the form in which StartIteration accepts a prefix or a suffix. In the older
// generation, a null pointer replaces an empty name.
inline std::string_view ZipFilter(std::string_view name) { return name; }
template <typename Name>
const Name* ZipFilter(const Name& name) {
  return name.name_length == 0 ? nullptr : &name;
}

// Finds the entry whose name is `text`. `text` may contain any bytes.
inline int32_t FindZipEntry(ZipArchiveHandle archive, const std::string& text, ZipEntry* entry) {
  if (text.size() > kZipLongestName) return kZipInvalidEntryName;
  ZipName name;
  SetZipName(name, text);
  return FindEntry(archive, name, entry);
}

// Starts an iteration over the entries whose names begin with `prefix` and end with `suffix`. An
// empty `prefix` or `suffix` excludes no name.
inline int32_t StartZipIteration(ZipArchiveHandle archive, void** cookie, const std::string& prefix,
                                 const std::string& suffix) {
  if (prefix.size() > kZipLongestName || suffix.size() > kZipLongestName) {
    return kZipInvalidEntryName;
  }
  ZipName first, last;
  SetZipName(first, prefix);
  SetZipName(last, suffix);
  return StartIteration(archive, cookie, ZipFilter(first), ZipFilter(last));
}

// Stores the next entry in `*entry` and its name in `name`. Changes `name` only if the result is 0.
inline int32_t NextZipEntry(void* cookie, ZipEntry* entry, std::string& name) {
  ZipName found;
  const int32_t result = Next(cookie, entry, &found);
  if (result == 0) name = ZipNameText(found);
  return result;
}

}  // namespace ApkTools
