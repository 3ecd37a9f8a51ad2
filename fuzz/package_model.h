// What may be done for an archive, worked out a second time: the judge of the package target. It
// reads the archive through the platform's zip library, as the tool does, but the texts with the
// readers of models.h, the signatures with libcrypto, and the digests on a straight walk. Where a
// library lies the tool itself says; tests/apk/native_libraries_test.cpp has those paths in full.
#pragma once

#include <map>
#include <string>
#include <vector>

#include "support/der.h"

struct ManifestModel;

class PackageModel {
 public:
  explicit PackageModel(const Bytes& archive);

  // Holds "AndroidManifest.xml".
  bool is_package() const { return is_package_; }
  // Signed by `key`, manifest and classes.dex as signed.
  bool is_good() const { return is_good_; }
  const Bytes& key() const { return key_; }
  // Whether one of the libraries in the archive lands at `path`, for a package installed in
  // `directory` (with its "/"), and is listed with the digest of `content`.
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
  // Whether the first section of the signature file that has a digest has that of the manifest; of
  // several in the section the last counts.
  static bool StatesDigestOf(const Bytes& manifest, const ManifestModel& signature_file);
  static bool IsDigest(const std::string& attribute, const Bytes& digest, const Bytes& content);

  bool is_package_ = false;
  bool is_good_ = false;
  Bytes key_;
  std::vector<std::string> libraries_;
  std::map<std::string, Listed> listed_;
};

// The bytes that the entries of the archive declare, those left out that claim more than deflate
// could make of their data.
size_t DeclaredBytes(const Bytes& archive);
