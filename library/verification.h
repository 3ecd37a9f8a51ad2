// For programs that link the verification: one package, why it is refused, and its archive
// released.
//
// The tool's own code decides. It says why in the Android log alone, so the lines that it logs
// while it works are read here, and go on to the log as they are. For that this library defines
// __android_log_print, for the whole program. It is made for programs: in a shared library the call
// may reach the platform's function instead, and refusals are then kUnknown.
#pragma once

#include <optional>

#include "apk/apk.h"

namespace ApkTools {

// Why a file is no good package, in the order in which the checks are made.
enum class Reason {
  kGood,
  kNoDescriptor,               // there is no file: the descriptor is negative
  kNoArchive,                  // the zip library cannot open it
  kNoPackage,                  // an archive without "AndroidManifest.xml": a JAR, or any other
  kAndroidManifestUnreadable,  // that entry cannot be extracted
  kUnsigned,                   // no "META-INF/MANIFEST.MF", or no signature file "META-INF/*.SF"
  kSignatureUnreadable,        // both are there, and one of them cannot be extracted
  kSignatureFileMalformed,     // the signature file does not parse
  kNoRsaBlock,                 // its block "*.RSA" is missing, or cannot be extracted
  kBlockMalformed,             // the block does not parse, or its key is not RSA
  kKeyRefused,                 // the key is cut off, or has the exponent 1 or -1
  kCertificateRefused,         // the certificate is not signed with its own key, or by SHA-384 etc.
  kSignatureRefused,           // the block's signature does not cover the signature file
  kManifestRefused,            // the signature file has no digest of the manifest, or another one
  kManifestMalformed,          // the manifest does not parse
  kAndroidManifestMalformed,   // "AndroidManifest.xml" is not compiled XML
  kDexRefused,                 // "classes.dex" is not what the manifest lists
  kUnknown,                    // it is refused, and no line that was logged is known
};

// The reason as the end of a sentence such as "refused: …", in English. The text is static.
const char* TextOf(Reason reason);

// A package that was opened and verified. Its end releases the archive: its mapping, and its
// memory.
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
  // The package: its name, the signer's key, the entries. Gone with this object.
  Apk& apk() { return *apk_; }

 private:
  std::optional<Apk> apk_;
  Reason reason_ = Reason::kUnknown;
};

}  // namespace ApkTools
