// Tests a second Apk::Init of the same object (docs/decisions/second-init.md). The first file is
// always a good package. The second file is a good package or a file that does not verify.
#include <gtest/gtest.h>

#include <fcntl.h>
#include <unistd.h>

#include <memory>
#include <ostream>
#include <string>
#include <vector>

#include "apk/apk.h"
#include "support/files.h"
#include "support/log_capture.h"
#include "support/package.h"

using ApkTools::Apk;

namespace {

// The names of the entries that WithEntries adds. The content of each added entry is its name.
constexpr const char* kNames[] = {"a", "b", "c", "lib/long/name/of/an/entry.so", "classes.dex"};

// The facts that an Apk returns about its file, and the log.
struct Facts {
  bool is_good_zip, is_apk, is_good_apk, asks_for_storage;
  std::string path, package_name, verified;
  Bytes key;
  Records records;
};

bool operator==(const Facts& a, const Facts& b) {
  return a.is_good_zip == b.is_good_zip && a.is_apk == b.is_apk && a.is_good_apk == b.is_good_apk &&
         a.asks_for_storage == b.asks_for_storage && a.path == b.path &&
         a.package_name == b.package_name && a.verified == b.verified && a.key == b.key &&
         a.records == b.records;
}

std::ostream& operator<<(std::ostream& out, const Facts& facts) {
  out << facts.is_good_zip << facts.is_apk << facts.is_good_apk << facts.asks_for_storage << " "
      << facts.path << " " << facts.package_name << " of " << facts.key.size()
      << " bytes, verifies " << facts.verified;
  for (const LogRecord& record : facts.records) out << "\n  " << record;
  return out;
}

// The object's facts after Init with the file.
Facts AfterInit(Apk& apk, const MemoryFile& file) {
  LogCapture log;
  apk.Init(file.fd(), nullptr);
  std::string verified;
  for (const char* name : kNames) {
    const DiskFile content(ToBytes(name));
    if (apk.VerifyFileHash(name, content.path())) verified += std::string(name) + " ";
  }
  const bool is_good = apk.IsGoodApk();
  return {apk.IsGoodZip(), apk.IsApk(),          is_good,  apk.IsSsPermissionRequired(),
          apk.GetPath(),   apk.GetPackageName(), verified, apk.GetManufacturerKey(),
          log.records()};
}

PackageOptions WithEntries(const std::vector<std::string>& names) {
  PackageOptions options;
  options.entries.clear();
  for (const std::string& name : names) options.entries.push_back({name, ToBytes(name)});
  return options;
}

// Packages that verify. They differ in their manifests, keys, names and permissions.
std::vector<PackageOptions> GoodPackages() {
  std::vector<PackageOptions> all;
  // Names in order, and a dex file.
  all.push_back(WithEntries({"a", "b", "classes.dex"}));
  // Names not in order, SHA-1, a longer key, a longer package name, the storage permission.
  all.push_back(WithEntries({"lib/long/name/of/an/entry.so", "c", "a"}));
  all.back().digests = {"SHA1-Digest"};
  all.back().block.key = "rsa-3072";
  all.back().package_name = "org.example.a.longer.name";
  all.back().secure_storage = true;
  // No package name, a short key, one entry.
  all.push_back(WithEntries({"c"}));
  all.back().block.key = "rsa-1024";
  all.back().package_name = "";
  // Three manifests: without entries, with an empty section, and without text.
  for (const char* text : {"Manifest-Version: 1.0\r\n\r\n", "Key:\r\n\r\n", ""}) {
    all.push_back(WithManifest(text));
    all.back().entries.clear();
  }
  return all;
}

TEST(SecondInit, HasOnlyTheFactsOfTheSecondPackage) {
  std::vector<std::unique_ptr<MemoryFile>> files;
  for (const PackageOptions& options : GoodPackages()) {
    const std::string name = "package" + std::to_string(files.size());
    files.push_back(std::make_unique<MemoryFile>(MakePackage(options).Build(), name));
  }
  for (const auto& second : files) {
    auto fresh = std::make_unique<Apk>(-1);
    const Facts expected = AfterInit(*fresh, *second);
    EXPECT_TRUE(expected.is_good_apk);
    for (const auto& first : files) {
      Apk used(first->fd());
      used.IsGoodApk();
      EXPECT_EQ(expected, AfterInit(used, *second));
    }
  }
}

TEST(SecondInit, HasNoFlagOfTheFirstPackageIfItFails) {
  Package unsigned_package = MakePackage(WithEntries({"a"}));
  unsigned_package.Remove("META-INF/CERT.SF");
  Package tampered = MakePackage(WithEntries({"b"}));
  tampered.Tamper(kManifestName);
  const Bytes files[] = {ToBytes("no archive"), MakePackage(PlainJar()).Build(),
                         unsigned_package.Build(), tampered.Build()};
  for (const Bytes& content : files) {
    const MemoryFile file(content, "another");
    for (const PackageOptions& options : GoodPackages()) {
      const MemoryFile first(MakePackage(options).Build());
      LogCapture log;
      Apk used(first.fd()), fresh(file.fd());
      ASSERT_TRUE(used.IsGoodApk());
      log.Clear();
      used.Init(file.fd(), nullptr);
      EXPECT_EQ(fresh.IsGoodZip(), used.IsGoodZip());
      EXPECT_EQ(fresh.IsApk(), used.IsApk());
      EXPECT_FALSE(used.IsGoodApk());
      EXPECT_FALSE(used.IsSsPermissionRequired());
      EXPECT_EQ(file.path(), used.GetPath());
    }
  }
}

}  // namespace
