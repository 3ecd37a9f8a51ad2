#include "simulator/package/facts.h"

#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>

#include "support/files.h"
#include "support/package.h"
#include "support/signing_block.h"

using namespace simulator;

namespace {

PackageFacts FactsOf(const Bytes& content) { return LookAt(DiskFile(content).path()); }

// The names of the entries for which this holds.
template <typename Predicate>
std::vector<std::string> NamesWhere(const PackageFacts& facts, Predicate holds) {
  std::vector<std::string> names;
  for (const ListedEntry& entry : facts.entries) {
    if (holds(entry)) names.push_back(entry.entry.name);
  }
  std::sort(names.begin(), names.end());
  return names;
}

}  // namespace

// mknod makes a socket of it that nobody listens at.
TEST(FileKind, OfWhatCannotBeOpenedIsNotTold) {
  const TempDir folder;
  const std::string socket = folder / "socket";
  ASSERT_EQ(mknod(socket.c_str(), S_IFSOCK | 0600, 0), 0);
  EXPECT_EQ(LookAt(socket).error, ENXIO);
  EXPECT_EQ(LookAt(folder / "none").error, ENOENT);
}

TEST(FileKind, IsToldByWhatTheFileIs) {
  const TempDir folder;
  const std::string pipe = folder / "pipe";
  ASSERT_EQ(mkfifo(pipe.c_str(), 0600), 0);
  EXPECT_EQ(LookAt(folder.path()).kind, FileKind::kFolder);
  EXPECT_EQ(LookAt(pipe).kind, FileKind::kSpecial);
  EXPECT_EQ(LookAt("/dev/zero").kind, FileKind::kSpecial);
  EXPECT_EQ(FactsOf({}).kind, FileKind::kEmpty);
  EXPECT_EQ(FactsOf(ToBytes("<html>404</html>\n")).kind, FileKind::kText);
  EXPECT_EQ(FactsOf(ToBytes("caf\xc3\xa9\t\x1b[1m")).kind, FileKind::kText);
  EXPECT_EQ(FactsOf({'\177', 'E', 'L', 'F', 0}).kind, FileKind::kNoArchive);
  const Bytes package = MakePackage().Build();
  EXPECT_EQ(FactsOf(package).kind, FileKind::kArchive);
  EXPECT_EQ(FactsOf({package.begin(), package.begin() + 500}).kind, FileKind::kCutArchive);
}

TEST(FileKind, FileThatCannotBeOpenedSaysWhy) {
  const PackageFacts missing = LookAt("/nowhere/base.apk");
  EXPECT_EQ(missing.kind, FileKind::kUnreadable);
  EXPECT_EQ(missing.error, ENOENT);
}

TEST(PackageFacts, OfASignedPackage) {
  PackageOptions options = WithLibraries({{"lib/arm64-v8a/liba.so", ToBytes("a")},
                                          {"lib/x86/libb.so", ToBytes("b")},
                                          {"lib/readme.txt", ToBytes("c")}});
  Package package = MakePackage(options);
  package.items.push_back({"META-INF/services/x", ToBytes("x")});
  package.items.push_back({"added", ToBytes("x")});
  const PackageFacts facts = FactsOf(package.Build());

  EXPECT_EQ(facts.archive_result, 0);
  EXPECT_TRUE(facts.is_package);
  EXPECT_EQ(facts.manifest.package_name, "com.example.app");
  EXPECT_TRUE(facts.jar.has_manifest);
  EXPECT_TRUE(facts.jar.can_read_manifest);
  EXPECT_TRUE(facts.jar.has_manifest_digest);
  EXPECT_EQ(facts.jar.signature_files, std::vector<std::string>({"META-INF/CERT.SF"}));
  EXPECT_EQ(facts.jar.block_name, "META-INF/CERT.RSA");
  EXPECT_EQ(facts.jar.signer_count, 1U);
  ASSERT_TRUE(facts.jar.certificate.has_value());
  EXPECT_EQ(facts.jar.certificate->key.bits, 2048);
  EXPECT_EQ(facts.libraries.size(), 2U);
  EXPECT_TRUE(facts.newer.empty());
  EXPECT_FALSE(facts.has_damaged_signing_block);
  EXPECT_EQ(
      NamesWhere(facts, [](const auto& e) { return e.is_signature; }),
      std::vector<std::string>({"META-INF/CERT.RSA", "META-INF/CERT.SF", "META-INF/MANIFEST.MF"}));
  EXPECT_EQ(NamesWhere(facts, [](const auto& e) { return !e.is_listed && !e.is_signature; }),
            std::vector<std::string>({"META-INF/services/x", "added"}));
}

TEST(PackageFacts, OfNewerSigners) {
  const Bytes certificate = SignatureBlock().SignerCertificate().Build();
  const Bytes signer = Signers({SignerBytes(certificate)});
  const Bytes block = SigningBlockBytes({{kSchemeV2, signer}, {kSchemeV3, signer}});
  const PackageFacts facts = FactsOf(ArchiveWithBlock(MakePackage().Build(), block));
  ASSERT_EQ(facts.newer.size(), 2U);
  EXPECT_EQ(NewerSchemes(facts), std::vector<std::string>({"v2", "v3"}));
  EXPECT_EQ(facts.newer[0].certificate.sha256, facts.jar.certificate->sha256);
  EXPECT_FALSE(facts.has_damaged_signing_block);

  const Bytes no_certificate = Signers({SignerBytes(ToBytes("none"))});
  EXPECT_TRUE(FactsOf(ArchiveWithBlock(MakePackage().Build(),
                                       SigningBlockBytes({{kSchemeV2, no_certificate}})))
                  .has_damaged_signing_block);
}

TEST(PackageFacts, OfAJar) {
  const PackageFacts facts = FactsOf(MakePackage(PlainJar()).Build());
  EXPECT_FALSE(facts.is_package);
  EXPECT_EQ(facts.manifest.package_name, "");
  EXPECT_TRUE(facts.jar.has_manifest);
}

TEST(PackageFacts, EntryThatLiesAboutItsLengthIsNotRead) {
  Package package = MakePackage();
  ZipItem& manifest = package.Item(kManifestName);
  manifest = ClaimingLength(manifest, 0xfffffff0);
  const PackageFacts facts = FactsOf(package.Build());
  EXPECT_TRUE(facts.jar.has_manifest);
  EXPECT_FALSE(facts.jar.can_read_manifest);
}
