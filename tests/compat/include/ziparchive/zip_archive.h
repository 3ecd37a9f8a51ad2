// The interface of the platform's zip library in API level 27: names have the type ZipString,
// handles have the type void*, and an absent prefix or suffix is a null pointer. With the preset
// `zipstring`, the compiler finds this header instead of the library's own. The tool and its tests
// are then built and run with this older interface.
//
// zipstring_library.cpp defines only the parts that differ from the installed library, and calls
// that library.
#pragma once

#include <sys/types.h>

#include <cstddef>
#include <cstdint>

// `name` need not end with a NUL.
struct ZipString {
  const uint8_t* name;
  uint16_t name_length;

  ZipString() {}  // leaves both fields uninitialized, as on the phone
  // Ends the program if `entry_name` is longer than 65,535 bytes.
  explicit ZipString(const char* entry_name);

  bool operator==(const ZipString& other) const;
  bool StartsWith(const ZipString& prefix) const;
  bool EndsWith(const ZipString& suffix) const;
};

enum {
  kCompressStored = 0,
  kCompressDeflated = 8,
};

struct ZipEntry {
  uint16_t method;
  uint32_t mod_time;
  mode_t unix_mode;
  uint8_t has_data_descriptor;
  uint32_t crc32;
  uint32_t compressed_length;
  uint32_t uncompressed_length;
  off64_t offset;
};

using ZipArchiveHandle = void*;

int32_t OpenArchive(const char* file_name, ZipArchiveHandle* handle);
int32_t OpenArchiveFd(int fd, const char* debug_file_name, ZipArchiveHandle* handle,
                      bool assume_ownership = true);
void CloseArchive(ZipArchiveHandle archive);

int32_t FindEntry(ZipArchiveHandle archive, const ZipString& entry_name, ZipEntry* data);

int32_t StartIteration(ZipArchiveHandle archive, void** cookie, const ZipString* optional_prefix,
                       const ZipString* optional_suffix);
int32_t Next(void* cookie, ZipEntry* data, ZipString* name);

int32_t ExtractToMemory(ZipArchiveHandle archive, ZipEntry* entry, uint8_t* begin, uint32_t size);

using ProcessZipEntryFunction = bool (*)(const uint8_t* buffer, size_t size, void* cookie);
int32_t ProcessZipEntryContents(ZipArchiveHandle archive, ZipEntry* entry,
                                ProcessZipEntryFunction function, void* cookie);

int GetFileDescriptor(ZipArchiveHandle archive);

// These two functions are equal in both interfaces. The installed library itself defines them.
void EndIteration(void* cookie);
const char* ErrorCodeString(int32_t error_code);
