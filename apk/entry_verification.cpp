// Compares single entries and files with the digests that the manifest records for them.
#include <set>

#include "apk/apk.h"
#include "apk/base64.h"
#include "apk/extraction.h"
#include "apk/zip_library.h"
#include "util/log.h"

namespace ApkTools {

bool Apk::IsGoodApk() {
  if (!is_good_apk_ || dex_checked_) return is_good_apk_;
  if (!VerifyDex()) {
    LogError("Integrity not confirmed: classes.dex\n");
    is_good_apk_ = false;
  }
  dex_checked_ = true;
  return is_good_apk_;
}

// True if classes.dex has the digest that the manifest records, or if the package has no such
// entry. False if the entry cannot be looked up or read.
bool Apk::VerifyDex() {
  ZipEntry dex;
  const int32_t result = FindZipEntry(zip_handle_, "classes.dex", &dex);
  if (result == kZipEntryNotFound) return true;
  return result == 0 && VerifyEntryHash("classes.dex", dex);
}

bool Apk::VerifyEntryHash(const std::string& name, ZipEntry& entry) {
  return VerifyContent(name, [&] { return ExtractZipEntry(zip_handle_, &entry, content_) == 0; });
}

bool Apk::VerifyFileHash(const std::string& name, const std::string& path, struct stat* state,
                         int fd) {
  return VerifyContent(name, [&] { return ReadFile(path, content_, state, fd); });
}

// `read_content` fills the empty content_, and returns true for success. VerifyContent calls
// `read_content` only if the manifest lists `name`.
template <typename ReadContent>
bool Apk::VerifyContent(const std::string& name, ReadContent read_content) {
  std::string digest_name, digest;
  if (!entry_digests_.Find(name, digest_name, digest)) {
    if (CanSkipValidation(name)) return true;
    LogError("Can't find file in %s: %s\n", kMANIFEST_MF, name.c_str());
    return false;
  }
  const std::vector<uint8_t> expected = Base64Decode(digest);
  content_.clear();
  return read_content() && VerifyData(digest_name, expected, content_);
}

bool Apk::CanSkipValidation(const std::string& name) {
  static const std::set<std::string> kSignatureFiles = {
      "META-INF/CERT.RSA",    "META-INF/ANDROIDD.RSA", "META-INF/SECUREST.RSA", "META-INF/CERT.SF",
      "META-INF/ANDROIDD.SF", "META-INF/SECUREST.SF",  "META-INF/MANIFEST.MF",
  };
  return kSignatureFiles.count(name) != 0;
}

}  // namespace ApkTools
