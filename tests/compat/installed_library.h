// The functions of the installed zip library, under other names. The library's own header and the
// header of API level 27 (include/ziparchive) declare the same names, so no source file can include
// both headers. installed_library.cpp includes the library's own header and defines these
// functions. zipstring_library.cpp includes the header of API level 27 and calls these functions.
// Result codes, lifetimes and handles are those of the library.
#pragma once

#include <sys/types.h>

#include <cstddef>
#include <cstdint>
#include <string_view>

namespace installed {

struct Entry {
  uint16_t method;
  uint32_t mod_time;
  mode_t unix_mode;
  uint8_t has_data_descriptor;
  uint32_t crc32;
  uint32_t compressed_length;
  uint32_t uncompressed_length;
  off64_t offset;
};

int32_t Open(const char* file_name, void** archive);
int32_t OpenFd(int fd, const char* debug_file_name, void** archive, bool assume_ownership);
void Close(void* archive);
int32_t Find(void* archive, std::string_view name, Entry* entry);
// Only names with this prefix and this suffix match. Every name has the empty prefix and the empty
// suffix.
int32_t Start(void* archive, void** cookie, std::string_view prefix, std::string_view suffix);
int32_t Advance(void* cookie, Entry* entry, std::string_view* name);
int32_t Extract(void* archive, const Entry& entry, uint8_t* begin, uint32_t size);
int32_t Process(void* archive, const Entry& entry,
                bool (*function)(const uint8_t* buffer, size_t size, void* cookie), void* cookie);
int Descriptor(void* archive);

}  // namespace installed
