#include "installed_library.h"

#include <ziparchive/zip_archive.h>

namespace installed {

namespace {

ZipArchiveHandle Handle(void* archive) { return static_cast<ZipArchiveHandle>(archive); }

Entry FromLibrary(const ZipEntry& entry) {
  return {
      entry.method, entry.mod_time,          entry.unix_mode,           entry.has_data_descriptor,
      entry.crc32,  entry.compressed_length, entry.uncompressed_length, entry.offset};
}

ZipEntry ToLibrary(const Entry& entry) {
  ZipEntry result = {};
  result.method = entry.method;
  result.mod_time = entry.mod_time;
  result.unix_mode = entry.unix_mode;
  result.has_data_descriptor = entry.has_data_descriptor;
  result.crc32 = entry.crc32;
  result.compressed_length = entry.compressed_length;
  result.uncompressed_length = entry.uncompressed_length;
  result.offset = entry.offset;
  return result;
}

}  // namespace

int32_t Open(const char* file_name, void** archive) {
  ZipArchiveHandle handle = nullptr;
  const int32_t result = OpenArchive(file_name, &handle);
  *archive = handle;
  return result;
}

int32_t OpenFd(int fd, const char* debug_file_name, void** archive, bool assume_ownership) {
  ZipArchiveHandle handle = nullptr;
  const int32_t result = OpenArchiveFd(fd, debug_file_name, &handle, assume_ownership);
  *archive = handle;
  return result;
}

void Close(void* archive) { CloseArchive(Handle(archive)); }

int32_t Find(void* archive, std::string_view name, Entry* entry) {
  ZipEntry found = {};
  const int32_t result = FindEntry(Handle(archive), name, &found);
  if (result == 0) *entry = FromLibrary(found);
  return result;
}

int32_t Start(void* archive, void** cookie, std::string_view prefix, std::string_view suffix) {
  return StartIteration(Handle(archive), cookie, prefix, suffix);
}

int32_t Advance(void* cookie, Entry* entry, std::string_view* name) {
  ZipEntry found = {};
  const int32_t result = Next(cookie, &found, name);
  if (result == 0) *entry = FromLibrary(found);
  return result;
}

int32_t Extract(void* archive, const Entry& entry, uint8_t* begin, uint32_t size) {
  ZipEntry copy = ToLibrary(entry);
  return ExtractToMemory(Handle(archive), &copy, begin, size);
}

int32_t Process(void* archive, const Entry& entry,
                bool (*function)(const uint8_t* buffer, size_t size, void* cookie), void* cookie) {
  ZipEntry copy = ToLibrary(entry);
  return ProcessZipEntryContents(Handle(archive), &copy, function, cookie);
}

int Descriptor(void* archive) { return GetFileDescriptor(Handle(archive)); }

}  // namespace installed
