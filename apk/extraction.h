// Extracting an entry into memory. Nobody vouches for the lengths that an archive declares, so none
// is believed before memory is made for it. Results are the zip library's codes (0: success);
// nothing is logged.
#pragma once

#include <ziparchive/zip_archive.h>

#include <cstdint>
#include <vector>

namespace ApkTools {

// The library's codes for what is refused here; its header does not name them.
inline constexpr int32_t kZipInconsistentInformation = -9;
inline constexpr int32_t kZipAllocationFailed = -13;

// Up to this length, in bytes, memory is made on an entry's word alone.
inline constexpr uint32_t kZipTrustedLength = 64 << 20;

// Whether an entry can be as long as it says: as long as its data when stored, else at most 1032
// times as long, since deflate (RFC 1951 section 3.2.5) makes no more than 258 bytes of two bits.
bool IsPlausibleLength(const ZipEntry& entry);

// Extracts the entry whole into `out`, which becomes as long as the entry. Three are refused and
// leave `out` alone: an entry that cannot be as long as it says (kZipInconsistentInformation), and
// above kZipTrustedLength one whose data is not as long as it says (the library's code) and one
// that is longer than can be had in memory (kZipAllocationFailed).
int32_t ExtractZipEntry(ZipArchiveHandle archive, ZipEntry* entry, std::vector<uint8_t>& out);

}  // namespace ApkTools
