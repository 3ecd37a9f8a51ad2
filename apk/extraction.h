// Extracts an entry into memory. The signature does not cover the lengths that an archive declares,
// so each length is checked before memory is allocated for it. Results are the zip library's codes
// (0: success). Nothing is logged.
#pragma once

#include <ziparchive/zip_archive.h>

#include <cstdint>
#include <vector>

namespace ApkTools {

// The library's codes for the refusals here; its header does not name them.
inline constexpr int32_t kZipInconsistentInformation = -9;
inline constexpr int32_t kZipAllocationFailed = -13;

// Up to this length, in bytes, memory is allocated without a trial run through the data.
inline constexpr uint32_t kZipTrustedLength = 64 << 20;

// True if the declared length is possible: a stored entry is as long as its data, a deflated one at
// most 1032 times as long (RFC 1951 section 3.2.5: two bits give at most 258 bytes).
bool IsPlausibleLength(const ZipEntry& entry);

// Extracts the whole entry into `out`, which becomes as long as the entry. Refuses, with `out`
// unchanged, an entry whose length is impossible (kZipInconsistentInformation). Above
// kZipTrustedLength it also refuses an entry whose data has another length (the library's code) or
// that does not fit in memory (kZipAllocationFailed).
int32_t ExtractZipEntry(ZipArchiveHandle archive, ZipEntry* entry, std::vector<uint8_t>& out);

}  // namespace ApkTools
