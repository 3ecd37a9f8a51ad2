#include "simulator/package/facts.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <csignal>
#include <map>

#include "simulator/cut_file.h"
#include "simulator/package/signing_block.h"
#include "support/files.h"
#include "support/package.h"
#include "support/signing_block.h"

using namespace simulator;

namespace {

PackageFacts FactsOf(const Bytes& content) { return LookAt(DiskFile(content).path()); }

// The names of the entries for which `holds` returns true.
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

// The expected digest is that of: printf 'no archive\n' | sha256sum.
TEST(PackageFacts, HaveTheDigestOfTheFile) {
  const Bytes content = ToBytes("no archive\n");
  EXPECT_EQ(FactsOf(content).sha256,
            "cfa9d62752dbe09c9131c8d75dfdf852b5a57f3725c9b639710ea6a68b33f288");
  EXPECT_EQ(LookAt(DiskFile(content).path(), [] { return true; }).sha256, "");
}

// mknod makes a socket at which no process listens.
TEST(FileKind, SocketOrMissingFileHasItsErrno) {
  const TempDir directory;
  const std::string socket = directory / "socket";
  ASSERT_EQ(mknod(socket.c_str(), S_IFSOCK | 0600, 0), 0);
  EXPECT_EQ(LookAt(socket).error, ENXIO);
  EXPECT_EQ(LookAt(directory / "none").error, ENOENT);
}

TEST(FileKind, DependsOnTypeAndContentOfTheFile) {
  const TempDir directory;
  const std::string pipe = directory / "pipe";
  ASSERT_EQ(mkfifo(pipe.c_str(), 0600), 0);
  EXPECT_EQ(LookAt(directory.path()).kind, FileKind::kDirectory);
  EXPECT_EQ(LookAt(pipe).kind, FileKind::kSpecial);
  EXPECT_EQ(LookAt("/dev/zero").kind, FileKind::kSpecial);
  EXPECT_EQ(FactsOf({}).kind, FileKind::kEmpty);
  EXPECT_EQ(FactsOf(ToBytes("<html>404</html>\n")).kind, FileKind::kText);
  EXPECT_EQ(FactsOf(ToBytes("caf\xc3\xa9\t\x1b[1m")).kind, FileKind::kText);
  EXPECT_EQ(FactsOf({'\177', 'E', 'L', 'F', 0}).kind, FileKind::kNoArchive);
  for (const uint8_t control : {'\6', '\16', '\37', '\177'}) {
    EXPECT_EQ(FactsOf({'a', control}).kind, FileKind::kNoArchive);
  }
  const Bytes package = MakePackage().Build();
  EXPECT_EQ(FactsOf(package).kind, FileKind::kArchive);
  EXPECT_EQ(FactsOf({package.begin(), package.begin() + 500}).kind, FileKind::kCutArchive);
}

TEST(FileKind, MissingFileIsUnreadableWithEnoent) {
  const PackageFacts missing = LookAt("/nowhere/base.apk");
  EXPECT_EQ(missing.kind, FileKind::kUnreadable);
  EXPECT_EQ(missing.error, ENOENT);
}

TEST(PackageFacts, AreFoundInASignedPackage) {
  PackageOptions options = WithLibraries({{"lib/arm64-v8a/liba.so", ToBytes("a")},
                                          {"lib/x86/libb.so", ToBytes("b")},
                                          {"lib/readme.txt", ToBytes("c")}});
  Package package = MakePackage(options);
  package.items.push_back({"META-INF/services/x", ToBytes("x")});
  package.items.push_back({"added", ToBytes("x")});
  const PackageFacts facts = FactsOf(package.Build());

  EXPECT_EQ(facts.archive_result, 0);
  EXPECT_EQ(facts.manifest.package_name, "com.example.app");
  EXPECT_EQ(facts.jar.manifest, Archive::ReadResult::kRead);
  EXPECT_TRUE(facts.jar.has_manifest_digest);
  EXPECT_EQ(facts.jar.signature_files, std::vector<std::string>({"META-INF/CERT.SF"}));
  EXPECT_EQ(facts.jar.block_name, "META-INF/CERT.RSA");
  EXPECT_EQ(facts.jar.block.signer_count, 1U);
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

TEST(PackageFacts, IncludeSignersOfNewerSchemes) {
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

TEST(PackageFacts, JarHasAManifestButNoPackageName) {
  const PackageFacts facts = FactsOf(MakePackage(PlainJar()).Build());
  EXPECT_EQ(facts.manifest.package_name, std::nullopt);
  EXPECT_EQ(facts.jar.manifest, Archive::ReadResult::kRead);
}

TEST(PackageFacts, EntryWithAFalseLengthIsDamaged) {
  Package package = MakePackage();
  ZipItem& manifest = package.Item(kManifestName);
  manifest = ClaimingLength(manifest, 0xfffffff0);
  const PackageFacts facts = FactsOf(package.Build());
  EXPECT_EQ(facts.jar.manifest, Archive::ReadResult::kDamaged);
}

TEST(PackageFacts, EntryIsListedIfTheToolFindsItsDigest) {
  const std::string manifest =
      "Manifest-Version: 1.0\r\n\r\nName: a\r\nSHA-256-Digest: x\r\n\r\nName: b\r\n\r\n"
      "Name: c\r\nMD5-Digest: y\r\n\r\n";
  PackageOptions options = WithManifest(manifest);
  for (const char* name : {"a", "b", "c"}) options.entries.push_back({name, ToBytes("x")});
  const PackageFacts facts = FactsOf(MakePackage(options).Build());
  EXPECT_EQ(NamesWhere(facts, [](const auto& e) { return e.is_listed; }),
            std::vector<std::string>({"a", "c"}));
}

TEST(PackageFacts, EntryWithASha1DigestIsMarked) {
  PackageOptions options = WithManifest(
      "Manifest-Version: 1.0\r\n\r\nName: a\r\nSHA1-Digest: x\r\n\r\n"
      "Name: b\r\nSHA-256-Digest: x\r\n\r\nName: c\r\nMD5-Digest: y\r\n\r\n");
  for (const char* name : {"a", "b", "c", "d"}) options.entries.push_back({name, ToBytes("x")});
  const PackageFacts facts = FactsOf(MakePackage(options).Build());
  EXPECT_EQ(NamesWhere(facts, [](const auto& e) { return e.has_sha1; }),
            std::vector<std::string>({"a"}));
}

// The digests other than "AAAA" are digests of "x". This command prints the SHA-256 digest:
//   printf x | sha256sum | xxd -r -p | base64
// With sha1sum in place of sha256sum, the command prints the SHA-1 digest.
TEST(PackageFacts, EachListedEntryIsComparedWithItsDigest) {
  const std::string manifest =
      "Manifest-Version: 1.0\r\n\r\n"
      "Name: same\r\nSHA-256-Digest: LXEWQrcmsEQBYnyp+6wy9chTD7GQPMTbAiWHF5IaSIE=\r\n\r\n"
      "Name: same1\r\nSHA1-Digest: EfatjsUqKYSrqv18O1FlA3hcIHI=\r\n\r\n"
      "Name: other\r\nSHA-256-Digest: LXEWQrcmsEQBYnyp+6wy9chTD7GQPMTbAiWHF5IaSIE=\r\n\r\n"
      "Name: unknown\r\nSHA-512-Digest: AAAA\r\n\r\n"
      "Name: gone\r\nSHA-256-Digest: AAAA\r\n\r\n"
      "Name: gone\r\nSHA-256-Digest: AAAA\r\n\r\n"
      "Name: damaged\r\nSHA-256-Digest: AAAA\r\n\r\n";
  PackageOptions options = WithManifest(manifest);
  options.entries = {{"same", ToBytes("x")},  {"same1", ToBytes("x")},
                     {"other", ToBytes("y")}, {"unknown", ToBytes("x")},
                     {"added", ToBytes("x")}, {"damaged", ToBytes("long")}};
  Package package = MakePackage(options);
  package.Item("damaged").local.crc = 1;
  const DiskFile file(package.Build());
  const auto with = [](const PackageFacts& facts, EntryDigest digest) {
    return NamesWhere(facts, [digest](const auto& e) { return e.digest == digest; });
  };
  const PackageFacts facts = LookAt(file.path());
  EXPECT_EQ(with(facts, EntryDigest::kMatches), std::vector<std::string>({"same", "same1"}));
  EXPECT_EQ(with(facts, EntryDigest::kDiffers), std::vector<std::string>({"other"}));
  EXPECT_EQ(with(facts, EntryDigest::kNotCompared),
            std::vector<std::string>({"damaged", "unknown"}));
  EXPECT_EQ(facts.missing, std::vector<std::string>({"gone"}));
  // If there was no time to compare an entry, the entry does not count as matching.
  const PackageFacts late = LookAt(file.path(), [] { return true; });
  EXPECT_EQ(with(late, EntryDigest::kMatches), std::vector<std::string>());
  EXPECT_EQ(with(late, EntryDigest::kNotCompared).size(), 5U);
}

// An entry in a directory below META-INF is an ordinary entry.
TEST(PackageFacts, SignatureFilesAreDirectlyInMetaInf) {
  Package package = MakePackage();
  for (const char* name :
       {"META-INF/sub/A.SF", "META-INF/A.EC", "META-INF/A.DSA", "A.RSA", "META-INF/A.RSA.txt"}) {
    package.items.push_back({name, ToBytes("x")});
  }
  EXPECT_EQ(NamesWhere(FactsOf(package.Build()), [](const auto& e) { return e.is_signature; }),
            std::vector<std::string>({"META-INF/A.DSA", "META-INF/A.EC", "META-INF/CERT.RSA",
                                      "META-INF/CERT.SF", "META-INF/MANIFEST.MF"}));
}

TEST(PackageFacts, IncludeDamagedEntries) {
  PackageOptions options = WithLibraries({{"lib/arm64-v8a/liba.so", ToBytes("a")}});
  Package package = MakePackage(options);
  package.Item("lib/arm64-v8a/liba.so").local.crc = 1;
  package.items.push_back({"classes2.dex", ToBytes("another's")});
  const PackageFacts facts = FactsOf(package.Build());
  EXPECT_EQ(NamesWhere(facts, [](const auto& e) { return e.entry.is_damaged; }),
            std::vector<std::string>({"lib/arm64-v8a/liba.so"}));
  EXPECT_EQ(NamesWhere(facts, [](const auto& e) { return !e.is_listed && !e.is_signature; }),
            std::vector<std::string>({"classes2.dex"}));
  ASSERT_EQ(facts.libraries.size(), 1U);
  EXPECT_EQ(facts.libraries[0].entry, "lib/arm64-v8a/liba.so");
  EXPECT_FALSE(facts.libraries[0].is_met);
}

// The zip library chooses the order of the entries. This test therefore does not know which
// libraries come after the first damaged library.
TEST(PackageFacts, LibrariesAfterADamagedOneAreNotReached) {
  PackageOptions options;
  for (int i = 0; i < 64; ++i) {
    options.entries.push_back({"lib/arm64-v8a/lib" + std::to_string(i) + ".so", ToBytes("a")});
  }
  Package package = MakePackage(options);
  const auto count_met = [](const PackageFacts& facts) {
    const auto is_met = [](const LibraryFacts& library) { return library.is_met; };
    return std::count_if(facts.libraries.begin(), facts.libraries.end(), is_met);
  };
  EXPECT_EQ(count_met(FactsOf(package.Build())), 65);
  for (int i = 20; i < 40; ++i) {
    package.Item("lib/arm64-v8a/lib" + std::to_string(i) + ".so").local.crc = 1;
  }
  const PackageFacts facts = FactsOf(package.Build());
  EXPECT_EQ(facts.libraries.size(), 65U);
  EXPECT_LT(count_met(facts), 45) << "damaged libraries must not count";
}

TEST(PackageFacts, ListThePartsThatAreTooLong) {
  Package package = MakePackage();
  ZipItem& manifest = package.Item(kManifestName);
  manifest.data.resize(Archive::kLongestRead + 1, ' ');
  manifest.deflated = true;
  const Bytes huge = SigningBlockBytes({{7, Bytes(kMostBlockBytes, 0)}});
  const PackageFacts facts = FactsOf(ArchiveWithBlock(package.Build(), huge));
  EXPECT_EQ(facts.jar.manifest, Archive::ReadResult::kTooLong);
  EXPECT_EQ(facts.too_long,
            std::vector<std::string>({kManifestName, "the signing block (v2 and later)"}));
  EXPECT_FALSE(facts.has_damaged_signing_block);
}

TEST(PackageFacts, FileThatShrinksMeanwhileWasChanged) {
  PackageOptions options;
  for (int i = 0; i < 20000; ++i) options.entries.push_back({"assets/" + std::to_string(i), {}});
  EXPECT_TRUE(NoticesCut(MakePackage(options).Build(),
                         [](const std::string& file) { return LookAt(file).was_changed; }));
}

// Each library is opened as the tool opens it, but without waiting.
TEST(PackageFacts, ShowWhetherTheToolCanOpenEachLibrary) {
  const std::vector<std::string> names = {"there", "missing", "pipe", "loop", "leased"};
  PackageOptions options;
  for (const std::string& name : names) {
    options.entries.push_back({"lib/arm64-v8a/" + name + ".so", ToBytes(name)});
  }
  options.entries.push_back({"lib/armeabi/other.so", ToBytes("x")});
  options.entries.push_back({"lib/x86/other.so", ToBytes("x")});
  const TempDir directory;
  const std::string file = directory / "base.apk";
  MakePackage(options).WriteTo(file);
  directory.Write("lib/arm64/there.so", ToBytes("x"));
  const std::string leased = directory.Write("lib/arm64/leased.so", ToBytes("x"));
  ASSERT_EQ(mkfifo((directory / "lib/arm64/pipe.so").c_str(), 0600), 0);
  ASSERT_EQ(symlink("loop.so", (directory / "lib/arm64/loop.so").c_str()), 0);
  signal(SIGIO, SIG_IGN);
  const int holder = open(leased.c_str(), O_RDWR);
  ASSERT_EQ(fcntl(holder, F_SETLEASE, F_WRLCK), 0);
  std::map<std::string, LibraryFacts> found;
  for (const LibraryFacts& library : LookAt(file).libraries) found[library.entry] = library;
  fcntl(holder, F_SETLEASE, F_UNLCK);
  close(holder);
  const auto error = [&](const std::string& name) {
    return found["lib/arm64-v8a/" + name + ".so"].error;
  };
  EXPECT_EQ(error("there"), 0);
  EXPECT_EQ(error("missing"), ENOENT);
  EXPECT_EQ(error("pipe"), 0);
  EXPECT_EQ(error("loop"), ELOOP);
  EXPECT_EQ(error("leased"), EWOULDBLOCK);
  EXPECT_EQ(found["lib/arm64-v8a/there.so"].place, "lib/arm64/there.so");
  EXPECT_TRUE(found["lib/arm64-v8a/missing.so"].has_directory);
  EXPECT_EQ(found["lib/armeabi/other.so"].place, "lib/arm/other.so");
  EXPECT_FALSE(found["lib/armeabi/other.so"].has_directory);
  EXPECT_EQ(found["lib/x86/other.so"].place, "");
}

// Libraries are beside the file itself, and not beside a link to it.
TEST(PackageFacts, LibrariesAreLookedForBesideTheFileItself) {
  const TempDir directory;
  MakePackage().WriteTo(directory.File("app/base.apk"));
  directory.Write("app/lib/arm64/libfoo.so", ToBytes("x"));
  ASSERT_EQ(symlink("app/base.apk", (directory / "link").c_str()), 0);
  const PackageFacts facts = LookAt(directory / "link");
  ASSERT_EQ(facts.libraries.size(), 1U);
  EXPECT_EQ(facts.libraries[0].error, 0);
}
