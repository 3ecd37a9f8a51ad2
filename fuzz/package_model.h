// A model of the tool's decisions. The fuzz target for packages compares the tool's actions with
// the model. Like the tool, the model reads the archive through the platform's zip library. The
// model reads the manifest and the signature file with models.h, and checks signatures and digests
// with libcrypto. The tool's own code finds two facts: the fields of the signature block
// (processCert), and the path at which a library is installed. tests/crypto/pkcs7_test.cpp and
// tests/apk/native_libraries_test.cpp test this code.
#pragma once

#include <map>
#include <string>
#include <vector>

#include "support/der.h"

struct ManifestModel;

class PackageModel {
 public:
  explicit PackageModel(const Bytes& archive);

  // True if "AndroidManifest.xml" can be extracted from the archive.
  bool is_package() const { return is_package_; }
  // True if these four conditions are true:
  //   - The package is signed with the key that key() returns.
  //   - META-INF/MANIFEST.MF has the digest that the signature file states.
  //   - "AndroidManifest.xml" is compiled XML.
  //   - classes.dex is missing, or has the digest that META-INF/MANIFEST.MF states.
  bool is_good() const { return is_good_; }
  const Bytes& key() const { return key_; }
  // `directory` is the directory of the package, with "/" at its end. True if one of the archive's
  // libraries belongs at `path`, and the manifest lists this library with the digest of `content`.
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
  // True if the manifest has the digest that the signature file states. The first section with a
  // manifest digest counts. If that section has several, the digest whose name sorts last counts.
  static bool StatesDigestOf(const Bytes& manifest, const ManifestModel& signature_file);
  static bool IsDigest(const std::string& attribute, const Bytes& digest, const Bytes& content);

  bool is_package_ = false;
  bool is_good_ = false;
  Bytes key_;
  std::vector<std::string> libraries_;
  std::map<std::string, Listed> listed_;
};

// The sum of the sizes that the archive's entries declare. "AndroidManifest.xml" counts 128 times,
// because the platform's XML parser can use far more memory than this entry has bytes. An entry is
// left out if deflate cannot make the declared size from the entry's data: the tool does not
// extract such an entry.
size_t DeclaredBytes(const Bytes& archive);
