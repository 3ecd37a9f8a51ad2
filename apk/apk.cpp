// Init, and the order of the steps that verify a package.
#include "apk/apk.h"

#include <utility>

#include "util/log.h"

namespace ApkTools {

// Deliberate: this is a pointer that a program may change, not a constant. The pointer is read each
// time the manifest's entry is looked up. CanSkipValidation has a table of the names that need no
// digest. A change of the pointer does not change this table.
const char* Apk::kMANIFEST_MF = "META-INF/MANIFEST.MF";

void Apk::Init(int fd, const char* path) {
  zip_handle_ = nullptr;
  is_apk_ = is_good_apk_ = dex_checked_ = is_good_zip_ = false;
  fd_ = fd;
  ss_permission_required_ = false;

  if (!FindFile(path)) return;
  if (!OpenZip(/*own_fd=*/fd == -1)) return;
  is_good_zip_ = true;

  std::vector<uint8_t> android_manifest;
  const int32_t result = ExtractEntry("AndroidManifest.xml", android_manifest);
  if (result != 0) {
    LogError("Can't extract Android Manifest: %s\n", ErrorCodeString(result));
    return;
  }
  is_apk_ = true;
  is_good_apk_ = VerifyPackage(std::move(android_manifest));
}

// Verifies the signature, and then the digest of META-INF/MANIFEST.MF. Parses META-INF/MANIFEST.MF
// and AndroidManifest.xml only after both checks. The digest of AndroidManifest.xml is not checked.
bool Apk::VerifyPackage(std::vector<uint8_t> android_manifest) {
  std::vector<uint8_t> manifest;
  if (ExtractEntry(kMANIFEST_MF, manifest) != 0) return false;

  if (!InitCertSf()) return false;
  if (!ValidateManifest(manifest)) {
    // Deliberate: ValidateManifest has already logged this text. Programs that parse the log match
    // on the two lines together.
    LogError("Can't validate manifest.\n");
    return false;
  }
  const size_t size = manifest.size();
  if (!entry_digests_.Load(std::move(manifest))) {
    LogError("Can't load manifest: size=%zu\n", size);
    return false;
  }
  if (!ParseAndroidManifest(std::move(android_manifest))) {
    LogError("Can't process Android Manifest.\n");
    return false;
  }
  entry_digests_.List();
  return true;
}

}  // namespace ApkTools
