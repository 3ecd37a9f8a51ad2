#include "simulator/package/archive.h"

#include <android/log.h>

#include <unordered_set>

#include "apk/extraction.h"
#include "apk/zip_library.h"

namespace simulator {

namespace {

constexpr int32_t kNoMoreEntries = -1;

void SilenceTheLog() {
  [[maybe_unused]] static const bool done = [] {
    // The parameters of a logger differ between the generations of the log library.
    __android_log_set_logger([](auto...) {});
    return true;
  }();
}

// Also true for an invalid name, because an archive cannot have an entry with this name.
bool IsMissing(int32_t result) {
  return result == ApkTools::kZipEntryNotFound || result == ApkTools::kZipInvalidEntryName;
}

bool HandOver(const uint8_t* bytes, size_t size, void* take) {
  const std::string_view part(reinterpret_cast<const char*>(bytes), size);
  return (*static_cast<const std::function<bool(std::string_view)>*>(take))(part);
}

}  // namespace

Archive::Archive(int fd, int32_t* result) : fd_(fd) {
  SilenceTheLog();
  *result = OpenArchiveFd(fd, "", &handle_, false);
}

Archive::~Archive() { CloseArchive(handle_); }

std::vector<ArchiveEntry> Archive::Entries() const {
  const auto end = FindArchiveEnd(fd_);
  if (!end) return {};
  const std::vector<std::string> good = Walk(kAllNames).names;
  const std::unordered_set<std::string> names(good.begin(), good.end());
  std::vector<ArchiveEntry> entries = ReadDirectory(fd_, *end);
  for (ArchiveEntry& entry : entries) entry.is_damaged = names.count(entry.name) == 0;
  return entries;
}

ArchiveWalk Archive::Walk(const EntryNames& names) const {
  ArchiveWalk walk;
  void* cookie = nullptr;
  if (ApkTools::StartZipIteration(handle_, &cookie, names.prefix, names.suffix) != 0) return walk;
  bool has_ended = false;  // true after the first error, which ends the tool's iteration
  ZipEntry entry;
  std::string name;
  int32_t result;
  while ((result = ApkTools::NextZipEntry(cookie, &entry, name)) != kNoMoreEntries) {
    has_ended = has_ended || result != 0;
    if (result == 0) walk.names.push_back(name);
    if (!has_ended) walk.met = walk.names.size();
  }
  EndIteration(cookie);
  return walk;
}

bool Archive::Has(const std::string& name) const {
  ZipEntry entry;
  return !IsMissing(ApkTools::FindZipEntry(handle_, name, &entry));
}

Archive::ReadResult Archive::Read(const std::string& name, std::vector<uint8_t>* content) {
  const ReadResult result = ReadUpTo(kLongestRead, name, content);
  if (result == ReadResult::kTooLong) too_long_.push_back(name);
  return result;
}

Archive::ReadResult Archive::ReadToCompare(const std::string& name,
                                           std::vector<uint8_t>* content) const {
  return ReadUpTo(kLongestCompared, name, content);
}

Archive::ReadResult Archive::ReadUpTo(uint32_t most, const std::string& name,
                                      std::vector<uint8_t>* content) const {
  ZipEntry entry;
  const int32_t found = ApkTools::FindZipEntry(handle_, name, &entry);
  if (IsMissing(found)) return ReadResult::kMissing;
  if (found == 0 && entry.uncompressed_length > most && ApkTools::IsPlausibleLength(entry)) {
    return ReadResult::kTooLong;
  }
  std::vector<uint8_t> extracted;
  if (found != 0 || ApkTools::ExtractZipEntry(handle_, &entry, extracted) != 0) {
    return ReadResult::kDamaged;
  }
  *content = std::move(extracted);
  return ReadResult::kRead;
}

bool Archive::Stream(const std::string& name,
                     const std::function<bool(std::string_view part)>& take) const {
  ZipEntry entry;
  if (ApkTools::FindZipEntry(handle_, name, &entry) != 0) return false;
  auto* const context = const_cast<std::function<bool(std::string_view)>*>(&take);
  return ProcessZipEntryContents(handle_, &entry, HandOver, context) == 0;
}

}  // namespace simulator
