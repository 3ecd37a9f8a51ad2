#include "support/package.h"

#include <openssl/bn.h>
#include <openssl/rsa.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>

#include "support/compiled_manifest.h"
#include "support/files.h"
#include "support/jar.h"
#include "support/keys.h"

namespace {

std::string ManifestText(const std::vector<ZipItem>& items,
                         const std::vector<std::string>& digests) {
  JarText manifest = JarText::Manifest().EndSection();
  for (const ZipItem& item : items) manifest.Section(item.name, digests, item.data);
  return manifest.text();
}

}  // namespace

Package MakePackage(const PackageOptions& options) {
  Package package;
  const Bytes android_manifest = options.android_manifest.value_or(
      CompiledManifest(options.package_name, options.secure_storage));
  if (!android_manifest.empty()) package.items.push_back({kAndroidManifestName, android_manifest});
  package.items.insert(package.items.end(), options.entries.begin(), options.entries.end());

  std::string manifest = ManifestText(package.items, options.digests);
  if (options.edit_manifest) manifest = options.edit_manifest(manifest);
  std::string signature_file = SignatureFileText(manifest, options.signature_file_digests);
  if (options.edit_signature_file) signature_file = options.edit_signature_file(signature_file);
  const Bytes block = options.block.Build(ToBytes(signature_file));

  package.items.push_back({kManifestName, ToBytes(manifest)});
  package.items.push_back({options.base_name + ".SF", ToBytes(signature_file)});
  package.items.push_back({options.base_name + options.block_extension, block});
  return package;
}

PackageOptions PlainJar() {
  PackageOptions options;
  options.android_manifest = Bytes();
  return options;
}

PackageOptions WithLibraries(const std::vector<ZipItem>& libraries) {
  PackageOptions options;
  options.entries = {{"classes.dex", ToBytes("dex\n035")}};
  options.entries.insert(options.entries.end(), libraries.begin(), libraries.end());
  return options;
}

PackageOptions WithoutDex() {
  PackageOptions options;
  options.entries = {{"lib/arm64-v8a/libfoo.so", ToBytes("foo")}};
  return options;
}

PackageOptions WithManifest(const std::string& text) {
  PackageOptions options;
  options.edit_manifest = [=](const std::string&) { return text; };
  return options;
}

ZipItem& Package::Item(const std::string& name) {
  const auto found = std::find_if(items.begin(), items.end(),
                                  [&](const ZipItem& item) { return item.name == name; });
  if (found == items.end()) {
    fprintf(stderr, "no entry %s in the package\n", name.c_str());
    abort();
  }
  return *found;
}

void Package::Remove(const std::string& name) {
  items.erase(items.begin() + (&Item(name) - &items[0]));
}

void Package::Tamper(const std::string& name) {
  Bytes& data = Item(name).data;
  data.at(data.size() / 2) ^= 1;
}

void Package::WriteTo(const std::string& path) const { WriteFile(path, Build()); }

Bytes ModulusOf(const std::string& key) {
  const BIGNUM* modulus = nullptr;
  RSA_get0_key(TestRsaKey(key), &modulus, nullptr, nullptr);
  Bytes bytes(BN_num_bytes(modulus));
  BN_bn2bin(modulus, bytes.data());
  return bytes;
}
