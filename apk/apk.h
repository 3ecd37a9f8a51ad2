// The opened file: its zip archive, what its manifest says, and how far it verified.
#pragma once

#include <ziparchive/zip_archive.h>

#include <cstdint>
#include <map>
#include <string>
#include <utility>
#include <vector>

#include "apk/manifest_mf.h"

namespace ApkTools {

class Apk {
 public:
  static const char* kMANIFEST_MF;

  explicit Apk(int fd);
  ~Apk();
  Apk(const Apk&) = delete;
  Apk& operator=(const Apk&) = delete;

  void Init(int fd, const char* path);

  const std::string& GetPath() const { return path_; }
  int GetFd() const { return fd_; }
  bool IsGoodZip() const { return is_good_zip_; }
  bool IsApk() const { return is_apk_; }
  const std::string& GetPackageName() const { return package_name_; }
  const std::vector<uint8_t>& GetManufacturerKey() const { return manufacturer_key_; }
  bool IsSsPermissionRequired() const { return ss_permission_required_; }

  int32_t StartIteration(void** cookie, const std::string& prefix, const std::string& suffix);
  int32_t Next(void* cookie, ZipEntry* entry, std::string& name);
  void EndIteration(void* cookie);

  bool InitCertSf();
  bool VerifyCertificate(std::vector<uint8_t>& block, std::vector<uint8_t>& sha1,
                         std::vector<uint8_t>& sha256, std::vector<uint8_t>& md5,
                         std::vector<uint8_t>& key);
  bool ValidateManifest(const std::vector<uint8_t>& manifest);
  bool VerifyData(const std::string& digest_name, const std::vector<uint8_t>& expected,
                  const std::vector<uint8_t>& data);
  bool ParseAndroidManifest(const std::vector<uint8_t>& bytes);

  bool IsGoodApk();
  bool VerifyEntryHash(const std::string& name, ZipEntry& entry);
  bool VerifyFileHash(const std::string& name, const std::string& path);
  bool CanSkipValidation(const std::string& name);

 private:
  int32_t ExtractEntry(const std::string& name, std::vector<uint8_t>& out);

  std::string path_;
  int fd_ = -1;
  ZipArchiveHandle zip_handle_ = nullptr;
  bool is_apk_ = false;
  bool is_good_apk_ = false;
  bool dex_checked_ = false;
  bool is_good_zip_ = false;
  std::map<std::string, std::pair<std::string, std::string>> entry_digests_;
  ManifestMf manifest_mf_;
  ManifestMf cert_sf_;
  std::vector<uint8_t> manufacturer_key_;
  bool ss_permission_required_ = false;
  std::string package_name_;
};

}  // namespace ApkTools
