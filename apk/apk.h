// An opened file: its zip archive, the facts from its manifests, and the results of its
// verification.
//
// An Apk owns its facts, but not the descriptor that the caller passes. It never writes to the
// file. The destructor closes neither the archive nor the descriptor, because the tool's process
// ends right after the run. A process that continues must call Release(). Nothing throws. Init sets
// flags that show which steps succeeded, and the checks return true or false. Every failure is
// logged as an error where it is found, unless a comment says otherwise. An object must be used by
// one thread only.
#pragma once

#include <cstdint>
#include <string>
#include <utility>
#include <vector>

#include "apk/entry_digests.h"
#include "apk/manifest_mf.h"
#include "apk/zip_library.h"
#include "util/file.h"

namespace ApkTools {

// Returns the name of the signature block that belongs to a signature file: the file's name with
// "RSA" in place of the text after the last dot. A name without a dot is returned unchanged.
std::string SignatureBlockName(const std::string& signature_file_name);

class Apk {
 public:
  // The name of the JAR manifest's entry. A program may set this pointer to another name.
  static const char* kMANIFEST_MF;

  explicit Apk(int fd) { Init(fd, nullptr); }
  Apk(const Apk&) = delete;
  Apk& operator=(const Apk&) = delete;

  // Opens the file as a zip archive. If its entry "AndroidManifest.xml" can be extracted, the
  // archive is a package: Init then verifies its JAR signature. Init parses the package's manifests
  // only if the signature verifies.
  //
  // `fd`: the file, open for reading. The caller keeps it open for the life of the object and
  // closes it. If `fd` is -1, Init opens `path` itself. Release() closes a descriptor that Init
  // opened for a zip archive. A descriptor that Init opened for any other file stays open until the
  // process ends.
  // `path`: the file's path. If `path` is null, Init asks the kernel for the path of `fd`.
  //
  // Verification fails without a message if the entry kMANIFEST_MF is missing or cannot be
  // extracted.
  //
  // IsGoodZip, IsApk and IsGoodApk show the outcome. A second call of Init first clears all flags.
  // Other facts of the first file can stay (docs/decisions/second-init.md).
  void Init(int fd, const char* path);

  // Closes the archive, and its descriptor if Init opened the descriptor. The facts stay. The
  // caller must not read an entry afterwards. Release() does nothing if no archive is open.
  void Release() { CloseArchive(std::exchange(zip_handle_, nullptr)); }

  // The path given to Init, or the path that the kernel reported for `fd`; may be empty.
  const std::string& GetPath() const { return path_; }
  // The descriptor given to Init, or the result of Init's own open.
  int GetFd() const { return fd_; }
  // The file could be opened as a zip archive.
  bool IsGoodZip() const { return is_good_zip_; }
  // The archive contains "AndroidManifest.xml", and this entry could be extracted.
  bool IsApk() const { return is_apk_; }
  // The package attribute of the Android manifest, UTF-8; may be empty.
  const std::string& GetPackageName() const { return package_name_; }
  // The signer's RSA modulus, from the signature block of the last call of InitCertSf that
  // succeeded. Empty if no call succeeded. Big-endian; one leading zero byte is left out.
  const std::vector<uint8_t>& GetManufacturerKey() const { return manufacturer_key_; }
  // The Android manifest was parsed, and asks for secure storage: it requests or declares the
  // secure-storage permission, or has a "meta-data" element with the name "access" and the value
  // "SS_META".
  bool IsSsPermissionRequired() const { return ss_permission_required_; }

  // Iterate over the entries of the archive. Results are the zip library's codes (0: success). Apk
  // does not log failures of these functions. StartIteration stores a cookie for the entries whose
  // names begin with `prefix` and end with `suffix`. An empty `prefix` or `suffix` excludes no
  // name. StartIteration fails if no archive is open. Each call of Next stores the next entry, in
  // the library's order. Next returns -1 after the last entry, and changes `name` only if the
  // result is 0. EndIteration releases the cookie.
  int32_t StartIteration(void** cookie, const std::string& prefix, const std::string& suffix) {
    return StartZipIteration(zip_handle_, cookie, prefix, suffix);
  }
  int32_t Next(void* cookie, ZipEntry* entry, std::string& name) {
    return NextZipEntry(cookie, entry, name);
  }
  void EndIteration(void* cookie) { ::EndIteration(cookie); }

  // The steps in which Init verifies a package, from InitCertSf to ParseAndroidManifest. Each
  // returns true for success.

  // Finds the signature file (the first entry "META-INF/….SF" in the zip library's order), parses
  // it, and verifies its signature block ("RSA" in place of "SF"). Fails without a message if the
  // package has no signature file, or if that file cannot be extracted.
  bool InitCertSf();
  // True if the certificate in `block` is signed with its own key, and `block` also has a signature
  // by that key over the signature file. The three digests are those of the signature file. On
  // success, `key` becomes the modulus of that key. On failure, `key` is unchanged.
  bool VerifyCertificate(std::vector<uint8_t>& block, std::vector<uint8_t>& sha1,
                         std::vector<uint8_t>& sha256, std::vector<uint8_t>& md5,
                         std::vector<uint8_t>& key);
  // True if the "…-Digest-Manifest" attribute of the signature file is the digest of `manifest`,
  // the manifest's raw bytes.
  bool ValidateManifest(const std::vector<uint8_t>& manifest);
  // True if `expected` is the digest of `data` by the algorithm that `digest_name` names
  // ("SHA1-Digest" or "SHA-256-Digest"). A mismatch is not logged.
  bool VerifyData(const std::string& digest_name, const std::vector<uint8_t>& expected,
                  const std::vector<uint8_t>& data);
  // Sets the results of GetPackageName and IsSsPermissionRequired from a compiled
  // "AndroidManifest.xml". If the bytes are not compiled XML at all, returns false and changes
  // nothing. Otherwise returns true.
  bool ParseAndroidManifest(std::vector<uint8_t> bytes);

  // True if Init verified the package, and "classes.dex" is missing or has the digest that the
  // manifest records. Only the first call after Init reads "classes.dex". Later calls return the
  // same result.
  bool IsGoodApk();
  // True if `entry`, which the zip library found under `name`, has the digest that the manifest
  // records for `name`. Mismatches and failed extractions are not logged.
  bool VerifyEntryHash(const std::string& name, ZipEntry& entry);
  // True if the file at `path` has the digest that the manifest records for the entry `name`. A
  // mismatch is not logged. `state` and `fd` are passed to ReadFile. If `state` is not null,
  // `*state` becomes the file's state before the first byte was read. `*state` is unchanged if no
  // file was read. If `fd` is not -1, the bytes are read from `fd`.
  bool VerifyFileHash(const std::string& name, const std::string& path,
                      struct stat* state = nullptr, int fd = -1);
  // True if `name` is "META-INF/MANIFEST.MF" or one of six fixed names of signature files and
  // blocks. If the manifest records no digest for such a name, VerifyEntryHash and VerifyFileHash
  // return true without reading the content.
  bool CanSkipValidation(const std::string& name);

 private:
  bool FindFile(const char* path);
  bool OpenZip(bool own_fd);
  int32_t ExtractEntry(const std::string& name, std::vector<uint8_t>& out);
  bool VerifyPackage(std::vector<uint8_t> android_manifest);
  bool ExtractSignatureFile(std::string& name, std::vector<uint8_t>& content);
  bool VerifyDex();
  template <typename ReadContent>
  bool VerifyContent(const std::string& name, ReadContent read_content);

  std::string path_;
  int fd_ = -1;
  ZipArchiveHandle zip_handle_ = nullptr;
  bool is_apk_ = false;
  bool is_good_apk_ = false;
  bool dex_checked_ = false;
  bool is_good_zip_ = false;
  EntryDigests entry_digests_;  // with the manifest that records them
  ManifestMf cert_sf_;
  std::vector<uint8_t> manufacturer_key_;
  bool ss_permission_required_ = false;
  std::string package_name_;
  // The content that VerifyContent read last. The memory is reused for the next entry or file. For
  // large libraries, freeing the memory and allocating it again would cost 2 % of the tool's time.
  std::vector<uint8_t> content_;
};

}  // namespace ApkTools
