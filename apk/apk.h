// The opened file: its zip archive, the facts in its manifests, and how far it verified.
//
// An Apk owns its facts, but not the descriptor that it is given. It never writes to the file. Its
// destructor closes neither the archive nor the descriptor: the process ends right after the run.
// Release() is for a process that goes on. Nothing throws: the constructor sets flags that say how
// far it got, and checks return true or false. Every failure is logged as an error where it is
// found, unless a comment says otherwise. One thread uses an object from its construction to its
// end.
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

// The name of the signature block that belongs to a signature file. It replaces the text after the
// name's last dot by "RSA". A name without a dot is returned unchanged.
std::string SignatureBlockName(const std::string& signature_file_name);

class Apk {
 public:
  // The name of the manifest's entry, read at each use.
  static const char* kMANIFEST_MF;

  // Like Init(fd, nullptr) on an empty object.
  explicit Apk(int fd) { Init(fd, nullptr); }
  Apk(const Apk&) = delete;
  Apk& operator=(const Apk&) = delete;

  // Opens the file as a zip archive and, when it is a package (it holds "AndroidManifest.xml"),
  // verifies its JAR signature and reads its manifests.
  // `fd`: the file, open for reading. The caller keeps it open for the life of the object and
  // closes it. With -1, Init opens `path` itself, for the life of the process. `path`: the file's
  // name; null takes the descriptor's name in /proc.
  //
  // The flags below tell the outcome. A second call first clears the flags. Facts that it does not
  // reach keep their former values.
  // that it does not get to keeps what it was.
  void Init(int fd, const char* path);

  // Closes the archive, and the descriptor if Init opened it. The facts stay. Nothing may read an
  // entry afterwards, and StartIteration fails. Called again, it does nothing.
  void Release() { CloseArchive(std::exchange(zip_handle_, nullptr)); }

  // The path given to Init, or the descriptor's path; may be empty.
  const std::string& GetPath() const { return path_; }
  // The descriptor given to Init, or the result of Init's own open.
  int GetFd() const { return fd_; }
  // The file could be opened as a zip archive.
  bool IsGoodZip() const { return is_good_zip_; }
  // The archive holds "AndroidManifest.xml", and it could be extracted.
  bool IsApk() const { return is_apk_; }
  // The package attribute of the Android manifest, UTF-8; may be empty.
  const std::string& GetPackageName() const { return package_name_; }
  // The signer's RSA modulus, big-endian, less one leading zero byte; empty unless the signature
  // verified.
  const std::vector<uint8_t>& GetManufacturerKey() const { return manufacturer_key_; }
  // The Android manifest asks for the secure-storage permission.
  bool IsSsPermissionRequired() const { return ss_permission_required_; }

  // Walking the archive, which must be open. Results are the zip library's codes (0: success).
  // StartIteration stores a cookie for the entries whose names begin with `prefix` and end with
  // `suffix`; an empty text filters nothing. Next returns them one by one in the library's order,
  // and -1 after the last; `name` changes only with a result of 0. EndIteration releases the
  // cookie.
  int32_t StartIteration(void** cookie, const std::string& prefix, const std::string& suffix) {
    return StartZipIteration(zip_handle_, cookie, prefix, suffix);
  }
  int32_t Next(void* cookie, ZipEntry* entry, std::string& name) {
    return NextZipEntry(cookie, entry, name);
  }
  void EndIteration(void* cookie) { ::EndIteration(cookie); }

  // The steps of Init that read more than the archive. Each returns true for success.

  // Finds the signature file (the first entry "META-INF/….SF" in the archive's order), parses it,
  // and verifies its signature block ("RSA" in place of "SF"). Fails without a message if the
  // package has no signature file, or if that file cannot be extracted.
  bool InitCertSf();
  // True if the block's certificate is signed with its own key, and the block's signature by the
  // same key covers the signature file with these digests. On success `key` becomes the key's
  // modulus; otherwise it is untouched.
  bool VerifyCertificate(std::vector<uint8_t>& block, std::vector<uint8_t>& sha1,
                         std::vector<uint8_t>& sha256, std::vector<uint8_t>& md5,
                         std::vector<uint8_t>& key);
  // True if the signature file's "-Digest-Manifest" is the digest of `manifest`, the raw manifest.
  bool ValidateManifest(const std::vector<uint8_t>& manifest);
  // True if `expected` is the digest of `data` by the algorithm that `digest_name` names
  // ("SHA1-Digest" or "SHA-256-Digest"). A mismatch is not logged.
  bool VerifyData(const std::string& digest_name, const std::vector<uint8_t>& expected,
                  const std::vector<uint8_t>& data);
  // Reads the package name and the secure-storage permission from a compiled "AndroidManifest.xml".
  // Returns false, and changes nothing, only if the bytes are not compiled XML at all.
  bool ParseAndroidManifest(std::vector<uint8_t> bytes);

  // True if the package verified, and its "classes.dex", if it has one, as well. The first call
  // checks that entry; later calls return the same result.
  bool IsGoodApk();
  // True if the entry, which the zip library found under `name`, has the digest that the manifest
  // records for the name. Neither a mismatch nor an entry that cannot be extracted is logged.
  bool VerifyEntryHash(const std::string& name, ZipEntry& entry);
  // True if the file at `path` has the digest that the manifest records for the entry `name`. A
  // mismatch is not logged. `state` and `fd` are those of ReadFile: the state of the file that was
  // read, unless null, and the file itself, unless -1. `state` is unchanged if no file was read.
  bool VerifyFileHash(const std::string& name, const std::string& path,
                      struct stat* state = nullptr, int fd = -1);
  // True if `name` is one of the signature's own files, which no manifest lists.
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
  EntryDigests entry_digests_;  // and the manifest that they are from
  ManifestMf cert_sf_;
  std::vector<uint8_t> manufacturer_key_;
  bool ss_permission_required_ = false;
  std::string package_name_;
  // The content of the last digested entry or file. Its memory is kept for the next one: freeing it
  // and allocating it again costs 2 % of the time of large libraries.
  std::vector<uint8_t> content_;
};

}  // namespace ApkTools
