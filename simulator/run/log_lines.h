// The texts of the tool's log that are understood here: the one table of them. A test holds it
// against the tool's sources.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace simulator {

// What a record of the tool's log says. What is captured of it, if anything, stands behind.
enum class LogMeaning {
  kUnknown,  // none of the texts below
  kDetail,   // of an error that another record names as well

  // The steps of a run.
  kLibrariesBegin,
  kFileBegins,
  kFileEnds,
  kPackageTakenUp,  // the package or one of its libraries, to be signed
  kJarTakenUp,
  kNotSigned,  // what was taken up

  // Why a file is no package, or none that is good.
  kNoArchive,          // number: the zip library's code
  kNoAndroidManifest,  // text: the zip library's reason
  kNoBlock,            // text: its name
  kBlockMalformed,
  kKeyRefused,  // number: the code, as crypto/rsa.h has it; so are the next two
  kCertificateRefused,
  kSignatureRefused,
  kOtherDigest,  // a signature is over other data
  kManifestRefused,
  kManifestMalformed,
  kTextMalformed,  // of the manifest or the signature file
  kAndroidManifestMalformed,
  kNoArchiveToSign,
  kNoGoodPackage,  // said of a JAR, too

  // Why a library or the dex file is none that is good.
  kFileNotOpened,
  kFileNotRead,
  kNotListed,
  kDigestUnknown,
  kDexRefused,
  kLibraryRefused,   // text: its path
  kLibraryVanished,  // text: its path; the next record has the reason
  kErrorNumber,      // number: errno

  // The key.
  kKeyOfRefusedPackage,
  kNoPathOfJar,
  kRegistrationFailed,
};

struct LogLine {
  LogMeaning meaning = LogMeaning::kUnknown;
  std::string whole;  // without its line end
  std::string text;   // what is captured
  int64_t number = 0;
};

// A record's text, complete or cut as the log cuts what is too long.
LogLine ReadLogLine(const std::string& text);

// The first line of this meaning; null when there is none.
const LogLine* FindError(const std::vector<LogLine>& lines, LogMeaning meaning);

}  // namespace simulator
