#include "simulator/package/archive.h"

#include <android/log.h>

namespace simulator {

namespace {

void SilenceTheLibrary() {
  static const bool done = [] {
    // A logger's parameters are others in each generation of the log library.
    __android_log_set_logger([](auto...) {});
    return true;
  }();
  static_cast<void>(done);
}

bool HandOver(const uint8_t* bytes, size_t size, void* take) {
  const std::string_view part(reinterpret_cast<const char*>(bytes), size);
  return (*static_cast<const std::function<bool(std::string_view)>*>(take))(part);
}

}  // namespace

Archive::Archive(int fd, int32_t* result) {
  SilenceTheLibrary();
  *result = OpenArchiveFd(fd, "", &handle_, false);
}

Archive::~Archive() { CloseArchive(handle_); }

std::vector<ArchiveEntry> Archive::Entries(std::string_view prefix, std::string_view suffix) const {
  std::vector<ArchiveEntry> entries;
  void* cookie = nullptr;
  if (StartIteration(handle_, &cookie, prefix, suffix) != 0) return entries;
  ZipEntry entry;
  std::string name;
  while (Next(cookie, &entry, &name) == 0) {
    entries.push_back({name, entry.compressed_length, entry.uncompressed_length,
                       entry.method == kCompressStored});
  }
  EndIteration(cookie);
  return entries;
}

bool Archive::Has(const std::string& name) const {
  constexpr int32_t kEntryNotFound = -7;  // which the library's header does not name
  ZipEntry entry;
  return name.size() <= UINT16_MAX && FindEntry(handle_, name, &entry) != kEntryNotFound;
}

std::optional<std::string> Archive::Read(const std::string& name, uint64_t most) const {
  std::string content;
  const bool is_whole = Stream(name, [&](std::string_view part) {
    content += part;
    return content.size() <= most;
  });
  return is_whole ? std::optional(std::move(content)) : std::nullopt;
}

bool Archive::Stream(const std::string& name,
                     const std::function<bool(std::string_view part)>& take) const {
  ZipEntry entry;
  if (name.size() > UINT16_MAX || FindEntry(handle_, name, &entry) != 0) return false;
  auto* const context = const_cast<std::function<bool(std::string_view)>*>(&take);
  return ProcessZipEntryContents(handle_, &entry, HandOver, context) == 0;
}

}  // namespace simulator
