// Computes a second time what may be done for an archive. It judges the package target. It reads
// the archive through the platform's zip library, as the tool does. It reads texts with models.h,
// checks signatures with libcrypto, and compares digests in one straight walk.
// It asks the tool where a library lies; tests/apk/native_libraries_test.cpp pins those paths.
#pragma once

#include <map>
#include <string>
#include <vector>

#include "support/der.h"

struct ManifestModel;

class PackageModel {
 public:
  explicit PackageModel(const Bytes& archive);

  // The archive holds "AndroidManifest.xml".
  bool is_package() const { return is_package_; }
  // The package is signed by `key`, and its manifest and classes.dex are as signed.
  bool is_good() const { return is_good_; }
  const Bytes& key() const { return key_; }
  // True if one of the archive's libraries is installed at `path`, for a package in `directory`
  // (with its "/"), and is listed with the digest of `content`.
  bool AllowsLibrary(const std::string& directory, const std::string& path,
                     const Bytes& content) const;

 private:
  struct Listed {
    std::string attribute;
    Bytes digest;
  };
  struct Archive;

  bool Judge(const Archive& archive);
  bool IsListed(const std::string& name, const Bytes& content) const;
  // True if the signature file's first section with a digest states that of the manifest. Of
  // several digests in the section the last counts.
  static bool StatesDigestOf(const Bytes& manifest, const ManifestModel& signature_file);
  static bool IsDigest(const std::string& attribute, const Bytes& digest, const Bytes& content);

  bool is_package_ = false;
  bool is_good_ = false;
  Bytes key_;
  std::vector<std::string> libraries_;
  std::map<std::string, Listed> listed_;
};

// The sum of the sizes that the archive's entries declare. Entries that declare more than deflate
// could make of their data are left out.
size_t DeclaredBytes(const Bytes& archive);
