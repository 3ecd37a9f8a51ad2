// A library with which other programs verify packages. Each Verification verifies one package,
// reports the reason for a refusal, and releases the archive.
//
// The tool's own code decides whether a package is good, and reports the reason for a refusal only
// in the Android log. This library therefore reads each line that the code logs, and passes the
// line on to the log unchanged. To read the lines, the library defines __android_log_print for the
// whole program. Link this library into programs only. In a shared library, calls of
// __android_log_print can reach the platform's function instead. The reasons for refusals are then
// wrong or kUnknown.
#pragma once

#include <optional>

#include "apk/apk.h"

namespace ApkTools {

// kGood, or the reason why a file is not a good package. The reasons are in the order of the
// checks.
enum class Reason {
  kGood,
  kNoDescriptor,               // there is no file: the descriptor is negative
  kNoArchive,                  // the zip library cannot open the file
  kNoPackage,                  // the archive has no "AndroidManifest.xml"; it may be a JAR
  kAndroidManifestUnreadable,  // "AndroidManifest.xml" cannot be extracted
  kUnsigned,                   // no "META-INF/MANIFEST.MF", or no signature file "META-INF/*.SF"
  kSignatureUnreadable,        // the manifest or the signature file cannot be extracted
  kSignatureFileMalformed,     // the signature file does not parse
  kNoRsaBlock,                 // the signature block "*.RSA" is missing, or cannot be extracted
  kBlockMalformed,             // the block does not parse, or its key is not RSA
  kKeyRefused,                 // the key ends beyond the block, or has the exponent 1 or -1
  kCertificateRefused,         // certificate not self-signed, or with an unsupported key or digest
  kSignatureRefused,           // the block's signature does not cover the signature file
  kManifestRefused,            // the signature file has no digest of the manifest, or a wrong one
  kManifestMalformed,          // the manifest does not parse
  kAndroidManifestMalformed,   // "AndroidManifest.xml" is not compiled XML
  kDexRefused,                 // "classes.dex" is not what the manifest lists
  kUnknown,                    // the file is refused, and no line in the log gives a known reason
};

// The reason as the end of a sentence such as "refused: …", in English. The text is static.
const char* TextOf(Reason reason);

// The verification of one file. The constructor opens and verifies the package. The destructor
// releases the archive, with its mapping and its memory.
class Verification {
 public:
  // `fd`: the file, open for reading. The caller keeps it open for the life of the object, and
  // closes it.
  explicit Verification(int fd);
  ~Verification();
  Verification(const Verification&) = delete;
  Verification& operator=(const Verification&) = delete;

  // kGood if and only if the package's IsGoodApk() is true.
  Reason reason() const { return reason_; }
  // The facts that were found: package name, signer's key, entries. Valid for the life of this
  // object.
  Apk& apk() { return *apk_; }

 private:
  std::optional<Apk> apk_;
  Reason reason_ = Reason::kUnknown;
};

}  // namespace ApkTools
