// Makes whole packages and JARs: entries, the manifest that lists them, the signature file and the
// signature block.
//
// A package is made in steps, so that a test can change the package between two steps.
// `MakePackage` signs; `Package` has the entries, which a test can change, remove or add; `Build`
// or `WriteTo` makes the archive.
#pragma once

#include <functional>
#include <optional>
#include <string>
#include <vector>

#include "support/certificate.h"
#include "support/signature_block.h"
#include "support/zip.h"

inline constexpr char kManifestName[] = "META-INF/MANIFEST.MF";
inline constexpr char kAndroidManifestName[] = "AndroidManifest.xml";

// The contents and the signature. The defaults make a good package with a dex file and one native
// library.
struct PackageOptions {
  std::string package_name = "com.example.app";
  bool secure_storage = false;
  // Replaces the compiled manifest that is made from the two fields above. If this member is an
  // empty Bytes, the archive has no Android manifest, and is a plain JAR.
  std::optional<Bytes> android_manifest;
  // The entries other than the Android manifest and the signature-related files in META-INF, in the
  // order of the archive.
  std::vector<ZipItem> entries = {{"classes.dex", ToBytes("dex\n035")},
                                  {"lib/arm64-v8a/libfoo.so", ToBytes("\177ELF foo")}};

  // The names of the digest attributes in the manifest's sections and in the signature file. The
  // attributes in the signature file get the suffix "-Manifest".
  std::vector<std::string> digests = {"SHA-256-Digest"};
  std::vector<std::string> signature_file_digests = {"SHA-256-Digest"};
  // The signature file is `base_name` + ".SF". Its block is `base_name` + `block_extension`.
  std::string base_name = "META-INF/CERT";
  std::string block_extension = ".RSA";

  // Each function gets the generated text, and returns the text that the package gets instead.
  std::function<std::string(const std::string&)> edit_manifest;
  std::function<std::string(const std::string&)> edit_signature_file;
  // The key, digest and faults of the signature block.
  SignatureBlock block;
};

class Package {
 public:
  std::vector<ZipItem> items;

  // The first entry of this name. Aborts if the package lacks this entry.
  ZipItem& Item(const std::string& name);
  void Remove(const std::string& name);
  // Flips one bit in the middle of the entry's data, after signing.
  void Tamper(const std::string& name);

  Bytes Build() const { return BuildZip(items); }
  void WriteTo(const std::string& path) const;
};

Package MakePackage(const PackageOptions& options = {});

// Options for a plain JAR: everything but the Android manifest.
PackageOptions PlainJar();
// Options for a package with these entries, the Android manifest and a dex file.
PackageOptions WithLibraries(const std::vector<ZipItem>& libraries);
// Options for a good package with a native library and no dex file.
PackageOptions WithoutDex();
// Options for a package whose META-INF/MANIFEST.MF is this text.
PackageOptions WithManifest(const std::string& text);

// The big-endian modulus of the RSA test key `key`.
Bytes ModulusOf(const std::string& key);
