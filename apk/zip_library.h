// The platform's zip library, as the package model uses it.
//
// Two generations of it are in use: up to API 29 it takes names as `ZipString`, later as
// std::string_view. The templates below take what the library at hand offers, and only they see the
// difference. Archives, entries and cookies are the library's own; all results are its codes (0:
// success). Nothing is logged.
#pragma once

#include <ziparchive/zip_archive.h>

#include <cstdint>
#include <string>
#include <string_view>
#include <type_traits>
#include <utility>

struct ZipString;  // Defined by the older generation alone.

namespace ApkTools {

// Codes of the library that its header does not name.
inline constexpr int32_t kZipEntryNotFound = -7;
inline constexpr int32_t kZipInvalidEntryName = -10;

// The longest name that a zip archive, and a `ZipString`, can hold, in bytes.
inline constexpr size_t kZipLongestName = 0xffff;

// The library that the tool is linked with. A look-alike with the same members may stand for it.
struct PlatformZip {
  using Handle = ZipArchiveHandle;
  using Entry = ZipEntry;
  using Name = ZipString;

  template <typename... Arguments>
  static auto FindEntry(Arguments... arguments) -> decltype(::FindEntry(arguments...)) {
    return ::FindEntry(arguments...);
  }
  template <typename... Arguments>
  static auto StartIteration(Arguments... arguments) -> decltype(::StartIteration(arguments...)) {
    return ::StartIteration(arguments...);
  }
  template <typename... Arguments>
  static auto Next(Arguments... arguments) -> decltype(::Next(arguments...)) {
    return ::Next(arguments...);
  }
};

// Whether `Zip` is of the later generation.
template <typename Zip, typename = void>
struct TakesStringView : std::false_type {};
template <typename Zip>
struct TakesStringView<Zip, std::void_t<decltype(Zip::FindEntry(
                                std::declval<typename Zip::Handle>(), std::string_view(),
                                std::declval<typename Zip::Entry*>()))>> : std::true_type {};

// The name as the older generation takes it; points into `text`. It is filled field by field: its
// constructor from a C string would stop at a NUL and abort on a long name.
template <typename Zip>
typename Zip::Name ToZipName(const std::string& text) {
  typename Zip::Name name;
  name.name = reinterpret_cast<const uint8_t*>(text.data());
  name.name_length = static_cast<uint16_t>(text.size());
  return name;
}

// Looks up the entry of this name, which may hold any bytes.
template <typename Zip = PlatformZip>
int32_t FindZipEntry(typename Zip::Handle archive, const std::string& name,
                     typename Zip::Entry* entry) {
  if (name.size() > kZipLongestName) return kZipInvalidEntryName;
  if constexpr (TakesStringView<Zip>::value) {
    return Zip::FindEntry(archive, std::string_view(name), entry);
  } else {
    return Zip::FindEntry(archive, ToZipName<Zip>(name), entry);
  }
}

// Starts to walk the entries whose names begin with `prefix` and end with `suffix`; an empty text
// filters nothing.
template <typename Zip = PlatformZip>
int32_t StartZipIteration(typename Zip::Handle archive, void** cookie, const std::string& prefix,
                          const std::string& suffix) {
  if (prefix.size() > kZipLongestName || suffix.size() > kZipLongestName) {
    return kZipInvalidEntryName;
  }
  if constexpr (TakesStringView<Zip>::value) {
    return Zip::StartIteration(archive, cookie, std::string_view(prefix), std::string_view(suffix));
  } else {
    const auto first = ToZipName<Zip>(prefix);
    const auto last = ToZipName<Zip>(suffix);
    return Zip::StartIteration(archive, cookie, prefix.empty() ? nullptr : &first,
                               suffix.empty() ? nullptr : &last);
  }
}

// The next entry and its name; unless the result is 0, `name` stays as it was.
template <typename Zip = PlatformZip>
int32_t NextZipEntry(void* cookie, typename Zip::Entry* entry, std::string& name) {
  if constexpr (TakesStringView<Zip>::value) {
    std::string_view found;
    const int32_t result = Zip::Next(cookie, entry, &found);
    if (result == 0) name.assign(found);
    return result;
  } else {
    typename Zip::Name found;
    const int32_t result = Zip::Next(cookie, entry, &found);
    if (result == 0) name.assign(reinterpret_cast<const char*>(found.name), found.name_length);
    return result;
  }
}

}  // namespace ApkTools
