#include "apk/extraction.h"

#include "util/memory.h"

namespace ApkTools {

namespace {

int32_t ProveZipLength(ZipArchiveHandle archive, ZipEntry* entry);

}  // namespace

bool IsPlausibleLength(const ZipEntry& entry) {
  constexpr uint64_t kMostPerByte = 1032;
  if (entry.method == kCompressStored) return entry.uncompressed_length == entry.compressed_length;
  return entry.uncompressed_length <= kMostPerByte * entry.compressed_length;
}

int32_t ExtractZipEntry(ZipArchiveHandle archive, ZipEntry* entry, std::vector<uint8_t>& out) {
  if (!IsPlausibleLength(*entry)) return kZipInconsistentInformation;
  if (entry->uncompressed_length > kZipTrustedLength) {
    const int32_t result = ProveZipLength(archive, entry);
    if (result != 0) return result;
    if (!FitsInMemory(entry->uncompressed_length)) return kZipAllocationFailed;
  }
  out.resize(entry->uncompressed_length);
  return ExtractToMemory(archive, entry, out.data(), static_cast<uint32_t>(out.size()));
}

namespace {

// Runs through an entry's data, keeping none of it. Succeeds when there is as much of it as the
// entry says.
int32_t ProveZipLength(ZipArchiveHandle archive, ZipEntry* entry) {
  const auto keep_nothing = [](const uint8_t*, size_t, void*) { return true; };
  return ProcessZipEntryContents(archive, entry, keep_nothing, nullptr);
}

}  // namespace

}  // namespace ApkTools
