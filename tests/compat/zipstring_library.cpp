// Implements the older interface of the zip library, with ZipString, by calls of the installed
// library.
#include <ziparchive/zip_archive.h>

#include <cstdlib>
#include <cstring>
#include <string_view>

#include "installed_library.h"

namespace {

std::string_view View(const ZipString& name) {
  return {reinterpret_cast<const char*>(name.name), name.name_length};
}

std::string_view Filter(const ZipString* name) { return name == nullptr ? "" : View(*name); }

ZipEntry FromInstalled(const installed::Entry& entry) {
  return {
      entry.method, entry.mod_time,          entry.unix_mode,           entry.has_data_descriptor,
      entry.crc32,  entry.compressed_length, entry.uncompressed_length, entry.offset};
}

installed::Entry ToInstalled(const ZipEntry& entry) {
  return {
      entry.method, entry.mod_time,          entry.unix_mode,           entry.has_data_descriptor,
      entry.crc32,  entry.compressed_length, entry.uncompressed_length, entry.offset};
}

}  // namespace

ZipString::ZipString(const char* entry_name)
    : name(reinterpret_cast<const uint8_t*>(entry_name)), name_length(0) {
  const size_t length = strlen(entry_name);
  if (length > UINT16_MAX) abort();
  name_length = static_cast<uint16_t>(length);
}

bool ZipString::operator==(const ZipString& other) const { return View(*this) == View(other); }

bool ZipString::StartsWith(const ZipString& prefix) const {
  return View(*this).substr(0, prefix.name_length) == View(prefix);
}

bool ZipString::EndsWith(const ZipString& suffix) const {
  return name_length >= suffix.name_length &&
         View(*this).substr(name_length - suffix.name_length) == View(suffix);
}

int32_t OpenArchive(const char* file_name, ZipArchiveHandle* handle) {
  return installed::Open(file_name, handle);
}

int32_t OpenArchiveFd(int fd, const char* debug_file_name, ZipArchiveHandle* handle,
                      bool assume_ownership) {
  return installed::OpenFd(fd, debug_file_name, handle, assume_ownership);
}

void CloseArchive(ZipArchiveHandle archive) { installed::Close(archive); }

int32_t FindEntry(ZipArchiveHandle archive, const ZipString& entry_name, ZipEntry* data) {
  installed::Entry found;
  const int32_t result = installed::Find(archive, View(entry_name), &found);
  if (result == 0) *data = FromInstalled(found);
  return result;
}

int32_t StartIteration(ZipArchiveHandle archive, void** cookie, const ZipString* optional_prefix,
                       const ZipString* optional_suffix) {
  return installed::Start(archive, cookie, Filter(optional_prefix), Filter(optional_suffix));
}

int32_t Next(void* cookie, ZipEntry* data, ZipString* name) {
  installed::Entry found;
  std::string_view found_name;
  const int32_t result = installed::Advance(cookie, &found, &found_name);
  if (result != 0) return result;
  *data = FromInstalled(found);
  name->name = reinterpret_cast<const uint8_t*>(found_name.data());
  name->name_length = static_cast<uint16_t>(found_name.size());
  return 0;
}

int32_t ExtractToMemory(ZipArchiveHandle archive, ZipEntry* entry, uint8_t* begin, uint32_t size) {
  return installed::Extract(archive, ToInstalled(*entry), begin, size);
}

int32_t ProcessZipEntryContents(ZipArchiveHandle archive, ZipEntry* entry,
                                ProcessZipEntryFunction function, void* cookie) {
  return installed::Process(archive, ToInstalled(*entry), function, cookie);
}

int GetFileDescriptor(ZipArchiveHandle archive) { return installed::Descriptor(archive); }
