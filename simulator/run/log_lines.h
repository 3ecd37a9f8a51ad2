// Finds the meaning of the texts in the tool's log. A table in log_lines.cpp has all texts that the
// simulator understands. A test compares the table with the tool's sources.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace simulator {

// The meaning of a record of the tool's log. For some meanings, LogLine::text is a captured part of
// the record. The comments below name these parts.
enum class LogMeaning {
  // kUnknown: the record has none of the known texts. kDetail: the record adds a detail to an error
  // that another record reports.
  kUnknown,
  kDetail,
  // The steps of a run. "Taken up": the tool starts to sign a package, one of its libraries, or a
  // JAR.
  kLibrariesBegin,
  kFileBegins,
  kFileEnds,
  kPackageTakenUp,
  kJarTakenUp,
  kNotSigned,
  // Reasons why a file is not a package, or is a package that the tool refuses. The captured parts
  // are the zip library's code (kNoArchive), the zip library's reason (kNoAndroidManifest), the
  // name of the PKCS#7 block (kNoBlock), and the codes of crypto/rsa.h (kKeyRefused,
  // kCertificateRefused, kSignatureRefused).
  kNoArchive,
  kNoAndroidManifest,
  kNoBlock,
  kBlockMalformed,
  kKeyRefused,
  kCertificateRefused,
  kSignatureRefused,
  kOtherDigest,
  kManifestRefused,
  kManifestMalformed,
  kTextMalformed,
  kAndroidManifestMalformed,
  kNoGoodPackage,
  kNoArchiveToSign,
  // Reasons why the tool refuses a library or the dex file. The captured parts are the library's
  // path (kLibraryRefused, kLibraryVanished) and the errno (kErrorNumber).
  kFileNotOpened,
  kFileNotRead,
  kNotListed,
  kDigestUnknown,
  kDexRefused,
  kLibraryRefused,
  kLibraryVanished,
  kErrorNumber,
  // Reasons why a key is not registered.
  kKeyOfRefusedPackage,
  kNoPathOfJar,
  kRegistrationFailed
};

struct LogLine {
  LogMeaning meaning = LogMeaning::kUnknown;
  std::string whole;   // without its line end
  std::string text;    // the captured part; empty if the meaning has none, or if the log cut it off
  int64_t number = 0;  // `text` as a number; 0 if `text` is not a number or was cut
};

// Returns the meaning and the captured part of a record's text. Also recognizes the start of a text
// that the log cut because it was too long.
LogLine ReadLogLine(const std::string& text);

// The first line with this meaning; null if no line has it.
const LogLine* FindLine(const std::vector<LogLine>& lines, LogMeaning meaning);

}  // namespace simulator
