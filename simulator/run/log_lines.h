// The texts of the tool's log that are understood here: the one table of them. A test holds it
// against the tool's sources.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace simulator {

// The meaning of a record of the tool's log. A comment behind it names the captured parts, if there
// are any.
enum class LogMeaning {
  // None of the texts; a detail of an error that another record names as well.
  kUnknown,
  kDetail,
  // The steps of a run: what is taken up is to be signed, the package or one of its libraries.
  kLibrariesBegin,
  kFileBegins,
  kFileEnds,
  kPackageTakenUp,
  kJarTakenUp,
  kNotSigned,
  // Reasons why a file is not a package, or not a good one. Captured are the zip library's code or
  // reason, the block's name, and the codes of crypto/rsa.h.
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
  // Reasons why a library or the dex file is not good. Captured are the library's path and errno,
  // which comes in the record behind.
  kFileNotOpened,
  kFileNotRead,
  kNotListed,
  kDigestUnknown,
  kDexRefused,
  kLibraryRefused,
  kLibraryVanished,
  kErrorNumber,
  // The key.
  kKeyOfRefusedPackage,
  kNoPathOfJar,
  kRegistrationFailed
};

struct LogLine {
  LogMeaning meaning = LogMeaning::kUnknown;
  std::string whole;  // without its line end
  std::string text;   // what is captured
  int64_t number = 0;
};

// A record's text, complete or cut as the log cuts what is too long.
LogLine ReadLogLine(const std::string& text);

// The first line of this meaning; null when no line has it.
const LogLine* FindError(const std::vector<LogLine>& lines, LogMeaning meaning);

}  // namespace simulator
