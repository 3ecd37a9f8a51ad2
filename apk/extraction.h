// Extracts an entry into memory. The signature does not cover the lengths that an archive declares,
// so each length is checked before memory is allocated for it. Results are the zip library's codes
// (0: success). These functions log nothing, but the zip library can log a failure.
#pragma once

#include <ziparchive/zip_archive.h>

#include <cstdint>
#include <vector>

namespace ApkTools {

// The zip library's codes for the refusals of ExtractZipEntry. The library's header has no names
// for them.
inline constexpr int32_t kZipInconsistentInformation = -9;
inline constexpr int32_t kZipAllocationFailed = -13;

// A limit for the declared length of an entry, in bytes. Up to this limit, memory is allocated
// before the data is read. If an entry declares more, its data is first read once, to check that
// the data has the declared length.
inline constexpr uint32_t kZipTrustedLength = 64 << 20;

// True if the declared length is possible for the entry's compressed length. For a stored entry,
// the two must be equal. A deflated entry is at most 1032 times as long as its compressed data: two
// bits encode at most 258 bytes (RFC 1951 section 3.2.5), so one byte encodes at most 4 * 258
// bytes.
bool IsPlausibleLength(const ZipEntry& entry);

// Extracts the whole entry into `out`. If the declared length is impossible, returns
// kZipInconsistentInformation. If the declared length is more than kZipTrustedLength, the data is
// first read once. If this reading fails, returns the library's code. If this reading succeeds, but
// the entry does not fit in memory, returns kZipAllocationFailed. After each of these three
// failures, `out` is unchanged. Otherwise `out` gets the declared length, and the result is the
// library's code for the extraction.
int32_t ExtractZipEntry(ZipArchiveHandle archive, ZipEntry* entry, std::vector<uint8_t>& out);

}  // namespace ApkTools
