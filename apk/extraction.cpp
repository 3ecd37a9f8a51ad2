#include "apk/extraction.h"

#include "util/memory.h"

namespace ApkTools {

bool IsPlausibleLength(const ZipEntry& entry) {
  constexpr uint64_t kMostPerByte = 1032;
  if (entry.method == kCompressStored) return entry.uncompressed_length == entry.compressed_length;
  return entry.uncompressed_length <= kMostPerByte * entry.compressed_length;
}

int32_t ExtractZipEntry(ZipArchiveHandle archive, ZipEntry* entry, std::vector<uint8_t>& out) {
  if (!IsPlausibleLength(*entry)) return kZipInconsistentInformation;
  if (entry->uncompressed_length > kZipTrustedLength) {
    // Reads the data once and discards it. Succeeds only if the data has the declared length.
    const auto keep_nothing = [](const uint8_t*, size_t, void*) { return true; };
    const int32_t result = ProcessZipEntryContents(archive, entry, keep_nothing, nullptr);
    if (result != 0) return result;
    if (!FitsInMemory(entry->uncompressed_length)) return kZipAllocationFailed;
  }
  out.resize(entry->uncompressed_length);
  return ExtractToMemory(archive, entry, out.data(), static_cast<uint32_t>(out.size()));
}

}  // namespace ApkTools
