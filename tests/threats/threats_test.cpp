// Some rules of the tool are lenient on purpose, or trust the file. These tests show which attacks
// the rules permit, and which attacks still fail. docs/threat-model.md gives the reasons for the
// rules.
#include <sys/mman.h>
#include <sys/wait.h>

#include <algorithm>
#include <cerrno>
#include <csignal>
#include <functional>
#include <map>

#include "support/compiled_manifest.h"
#include "support/process.h"
#include "support/signature_block.h"
#include "threats/device.h"

namespace {

// ---- The owner of a package.

// A certificate for the key. Serial numbers distinguish the certificates.
Certificate CertificateOf(const std::string& key, uint64_t serial) {
  Certificate certificate;
  certificate.key = key;
  certificate.serial = der::Integer(serial);
  return certificate;
}

// A package with two signers. Its block has, in order, a certificate for each key of `certificates`
// and a SignerInfo for each key of `signers`.
Package WithTwoSigners(const Strings& certificates, const Strings& signers) {
  Package package = MakePackage();
  const Bytes signature_file = package.Item("META-INF/CERT.SF").data;
  SignatureBlock block;
  block.certificates = Bytes();
  Bytes infos;
  for (const std::string& key : certificates) {
    const Bytes certificate = CertificateOf(key, key == "rsa-2048" ? 1 : 2).Build();
    block.certificates->insert(block.certificates->end(), certificate.begin(), certificate.end());
  }
  for (const std::string& key : signers) {
    SignatureBlock signer;
    signer.key = key;
    signer.serial = der::Integer(uint64_t{key == "rsa-2048" ? 1U : 2U});
    const Bytes info = signer.SignerInfo(signature_file);
    infos.insert(infos.end(), info.begin(), info.end());
  }
  block.signer_infos = der::Element(der::kSet, infos);
  package.Item("META-INF/CERT.RSA").data = block.Build(signature_file);
  return package;
}

bool IsVerifiedByOpenssl(Package package) {
  const TempDir directory;
  directory.Write("block", package.Item("META-INF/CERT.RSA").data);
  directory.Write("file", package.Item("META-INF/CERT.SF").data);
  return RunProcess({"openssl", "cms", "-verify", "-noverify", "-binary", "-inform", "DER", "-in",
                     directory / "block", "-content", directory / "file", "-out", "/dev/null"})
             .status == 0;
}

TEST(Threat, OnlyTheFirstCertificateAndTheFirstSignatureAreUsed) {
  const Strings one = {"rsa-2048", "rsa-2048-other"}, other = {"rsa-2048-other", "rsa-2048"};
  for (const Strings& certificates : {one, other}) {
    for (const Strings& signers : {one, other}) {
      const Package package = WithTwoSigners(certificates, signers);
      // OpenSSL looks for the certificate that belongs to each signature.
      EXPECT_TRUE(IsVerifiedByOpenssl(package));
      const bool is_pair = certificates[0] == signers[0];
      EXPECT_EQ(Device(package).FilesSignedFor(certificates[0]),
                is_pair ? Strings({"app/base.apk"}) : Strings());
      EXPECT_EQ(Device(package).FilesSignedFor(certificates[1]), Strings());
    }
  }
}

// The certificate's modulus is the signer's modulus with four more bytes. The fifth to eighth bytes
// of the exponent replace the modulus length in the tool (crypto/pkcs7.h). Here, these bytes are
// 00 01 00 00. In host byte order, they are the number 256, so the tool ignores the last four bytes
// of the modulus. Other programs read a key of 2080 bits.
TEST(Threat, ModulusWithExtraBytesIsReadAsTheKeyAtItsStart) {
  Package package = MakePackage();
  Certificate certificate;
  certificate.public_key_info = PublicKeyInfoAround(
      der::Sequence({der::Integer(Concat({{0}, ModulusOf("rsa-2048"), {1, 2, 3, 4}})),
                     der::Integer(FromHex("01 00 01 00 00 01 00 00"))}));
  SignatureBlock block;
  block.certificates = certificate.Build();
  package.Item("META-INF/CERT.RSA").data = block.Build(package.Item("META-INF/CERT.SF").data);
  EXPECT_EQ(Device(package).FilesSignedFor("rsa-2048"), Strings({"app/base.apk"}));
}

// The tool does not check whether a newer version of the package exists.
TEST(Threat, OlderPackageOfASignerKeepsItsPayload) {
  const Package older = MakePackage();
  PackageOptions options;
  options.entries = {{"classes.dex", ToBytes("dex\n035 mended")}};
  EXPECT_EQ(Device(MakePackage(options)).FilesSignedFor("rsa-2048"), Strings({"app/base.apk"}));
  EXPECT_EQ(Device(older).FilesSignedFor("rsa-2048"), Strings({"app/base.apk"}));
}

// ---- Names, and the Android manifest.

PackageOptions WithLibrariesNamed(const Strings& names) {
  PackageOptions options;
  options.entries.clear();
  for (const std::string& name : names) options.entries.push_back({name, kLibrary});
  return options;
}

TEST(Threat, FileOutsideThePackagesDirectoryIsSignedIfListed) {
  Device device(MakePackage(WithLibrariesNamed({"lib/arm64-v8a/../../../other/libfoo.so"})));
  device.Install("lib/arm64/x", {}).Install("../other/libfoo.so", kLibrary);
  EXPECT_EQ(device.FilesSignedFor("rsa-2048"), Strings({"other/libfoo.so", "app/base.apk"}));
}

TEST(Threat, FileOutsideThePackagesDirectoryIsNotSignedIfDifferent) {
  Device device(MakePackage(WithLibrariesNamed({"lib/arm64-v8a/../../../other/libfoo.so"})));
  device.Install("lib/arm64/x", {}).Install("../other/libfoo.so", ToBytes("another's"));
  EXPECT_EQ(device.FilesSignedFor("rsa-2048"), Strings({"app/base.apk"}));
}

// Calls `lead`, which makes the link `name` to the file `program`. The tool looks for the library's
// file at `name`. Expects that the program is signed through this link. The name of the program
// does not end in ".so". The attacker knows the program's bytes, and the manifest lists their
// digest.
void ExpectProgramSigned(const std::function<int(const char* program, const char* name)>& lead) {
  Device device(MakePackage(WithLibrariesNamed({"lib/arm64-v8a/../../../mine/libx.so"})));
  device.Install("lib/arm64/x", {}).Install("../mine/x", {}).Install("../system/program", kLibrary);
  ASSERT_EQ(lead(device.Path("../system/program").c_str(), device.Path("../mine/libx.so").c_str()),
            0);
  const Strings files = device.FilesSignedFor("rsa-2048");
  ASSERT_EQ(files.size(), 2u);
  EXPECT_EQ(files[1], "app/base.apk");
  struct stat program, signed_file;
  ASSERT_EQ(stat(device.Path("../system/program").c_str(), &program), 0);
  ASSERT_EQ(stat(device.Path("../" + files[0]).c_str(), &signed_file), 0);
  EXPECT_EQ(program.st_ino, signed_file.st_ino);
}

TEST(Threat, TargetOfASymbolicLinkAtAPathWithDotsIsSigned) { ExpectProgramSigned(symlink); }

TEST(Threat, TargetOfAHardLinkAtAPathWithDotsIsSigned) { ExpectProgramSigned(link); }

TEST(Threat, FileIsSignedForEachEntryThatNamesIt) {
  Device device(MakePackage(WithLibrariesNamed({"lib/arm64-v8a/a.so", "lib/arm64-v8a/./a.so"})));
  device.Install("lib/arm64/a.so", kLibrary);
  EXPECT_EQ(device.FilesSignedFor("rsa-2048"),
            Strings({"app/lib/arm64/a.so", "app/lib/arm64/a.so", "app/base.apk"}));
}

TEST(Threat, ReplacedAndroidManifestDecidesThePackageNameForTheKey) {
  Package package = MakePackage();
  package.Item(kAndroidManifestName).data = CompiledManifest("com.example.other", true);
  EXPECT_EQ(Device(package).Registered(),
            Strings({"com.example.other " + Hex(ModulusOf("rsa-2048"))}));
}

TEST(Threat, PackageNameIsRegisteredUpToItsFirstNul) {
  PackageOptions options;
  options.package_name = std::string("com.example.app\0.other", 22);
  options.secure_storage = true;
  EXPECT_EQ(Device(MakePackage(options)).Registered(),
            Strings({"com.example.app " + Hex(ModulusOf("rsa-2048"))}));
}

TEST(Threat, PackageWithUnreadableAndroidManifestCountsAsAJar) {
  Package package = MakePackage();
  ZipItem& manifest = package.Item(kAndroidManifestName);
  manifest = ClaimingLength(manifest, static_cast<uint32_t>(manifest.data.size() + 1));
  EXPECT_EQ(Device(package).FilesSignedWith("0000"), Strings({"app/base.apk"}));
  Device other(package);
  other.phone.verify_errno = ENOKEY;
  EXPECT_EQ(other.FilesSignedWith("0000"), Strings());
}

// ---- Refused, damaged and unextracted libraries, and the steps that they do not stop.

TEST(Threat, PackageAndKeyAreAcceptedEvenIfEveryLibraryIsRefused) {
  PackageOptions options;
  options.secure_storage = true;
  Device device(MakePackage(options));
  device.Install("lib/arm64/libfoo.so", ToBytes("another's"));
  EXPECT_EQ(device.FilesSignedFor("rsa-2048"), Strings({"app/base.apk"}));
  EXPECT_EQ(Device(MakePackage(options)).Registered(),
            Strings({"com.example.app " + Hex(ModulusOf("rsa-2048"))}));
}

// The package's library was not extracted beside the package. The tool does not read the library's
// bytes inside the package.
TEST(Threat, LibrariesThatStayInThePackageAreNotCompared) {
  Package package = MakePackage();
  package.Item("lib/arm64-v8a/libfoo.so").data = ToBytes("another's");
  EXPECT_EQ(Device(package).FilesSignedFor("rsa-2048"), Strings({"app/base.apk"}));
}

// The names of the package's library entries, in the order in which the tool reaches them.
Strings LibrariesWalked(const Package& package) {
  const MemoryFile file(package.Build());
  ApkTools::Apk apk(file.fd());
  Strings names;
  void* cookie = nullptr;
  apk.StartIteration(&cookie, "lib/", ".so");
  ZipEntry entry;
  for (std::string name; apk.Next(cookie, &entry, name) == 0;) names.push_back(name);
  apk.EndIteration(cookie);
  return names;
}

// When the iteration reaches an entry, the zip library compares the entry's local header with its
// central directory header. If the headers differ, the zip library ends the iteration there.
TEST(Threat, DamagedLibraryEndsTheIterationAndLaterOnesStayUnsigned) {
  const Strings names = {"lib/arm64-v8a/liba.so", "lib/arm64-v8a/libb.so", "lib/arm64-v8a/libc.so"};
  const Package intact = MakePackage(WithLibrariesNamed(names));
  const Strings walked = LibrariesWalked(intact);
  ASSERT_EQ(walked.size(), 3u);
  for (size_t damaged = 0; damaged < 3; ++damaged) {
    Package package = intact;
    package.Item(walked[damaged]).local.crc = 1;
    Device device(package);
    Strings expected;
    for (size_t i = 0; i < 3; ++i) {
      const std::string file = "lib/arm64" + walked[i].substr(walked[i].rfind('/'));
      device.Install(file, kLibrary);
      if (i < damaged) expected.push_back("app/" + file);
    }
    expected.push_back("app/base.apk");
    EXPECT_EQ(device.FilesSignedFor("rsa-2048"), expected);
    const Records& records = device.log.records();
    EXPECT_EQ(std::count(records.begin(), records.end(), Info("VeltSignJni finished: 0.\n")), 1);
    EXPECT_EQ(std::count_if(records.begin(), records.end(),
                            [](const LogRecord& record) { return record.priority == 6; }),
              0);
  }
}

// ---- Files that are changed during the run.

// Runs the tool's steps. Returns the path of each signed file, and its bytes when it was signed.
std::map<std::string, std::string> BytesSigned(Device& device) {
  std::map<std::string, std::string> signed_bytes;
  device.phone.witness = [&](int fd, const std::string& event) {
    if (event.rfind("sign ", 0) != 0) return;
    char path[4096] = {};
    const std::string link = "/proc/self/fd/" + std::to_string(fd);
    ASSERT_GT(readlink(link.c_str(), path, sizeof(path) - 1), 0);
    signed_bytes[path] = ContentOf(path);
  };
  device.RunSteps();
  return signed_bytes;
}

// Writes a byte into the file, in place.
void Patch(const std::string& path, size_t position, char byte) {
  const int fd = open(path.c_str(), O_WRONLY);
  ASSERT_EQ(pwrite(fd, &byte, 1, static_cast<off_t>(position)), 1);
  close(fd);
}

TEST(Threat, LibraryWrittenToInPlaceAfterItsChecksIsSigned) {
  Device device(MakePackage());
  device.Install("lib/arm64/libfoo.so", kLibrary);
  const std::string library = device.Path("lib/arm64/libfoo.so");
  device.phone.before_integrity = [&] { Patch(library, 5, 'F'); };
  EXPECT_EQ(BytesSigned(device)[library], "\177ELF Foo");
}

// A write through the mapping to a page that is already dirty does not change the file's times.
TEST(Threat, LibraryWrittenToThroughAMappingAfterItWasReadIsSigned) {
  Device device(MakePackage());
  device.Install("lib/arm64/libfoo.so", kLibrary);
  const std::string library = device.Path("lib/arm64/libfoo.so");
  const int fd = open(library.c_str(), O_RDWR);
  void* const mapped = mmap(nullptr, kLibrary.size(), PROT_WRITE, MAP_SHARED, fd, 0);
  ASSERT_NE(mapped, MAP_FAILED);
  volatile char* const bytes = static_cast<char*>(mapped);
  bytes[5] = 'f';  // the same value; makes the page dirty
  int opened = 0;
  device.phone.before_open = [&](const char* path, int) {
    opened += library == path;
    if (opened != 2) return;
    usleep(20000);  // lets the coarse clock of the file's times advance
    bytes[5] = 'F';
  };
  EXPECT_EQ(BytesSigned(device)[library], "\177ELF Foo");
  munmap(mapped, kLibrary.size());
  close(fd);
}

TEST(Threat, PackageWrittenToInPlaceAfterItsChecksIsSigned) {
  PackageOptions options;
  options.entries.push_back({"assets/text", ToBytes("an asset")});
  const Bytes archive = MakePackage(options).Build();
  Device device(archive);
  const std::string package = device.Path("base.apk");
  const std::string text(archive.begin(), archive.end());
  const size_t asset = text.find("an asset");
  device.phone.before_integrity = [&] { Patch(package, asset, 'A'); };
  std::string expected = text;
  expected[asset] = 'A';
  EXPECT_EQ(BytesSigned(device)[package], expected);
}

// The write comes after the kernel answers that it trusts the file, and before the kernel signs the
// file.
TEST(Threat, JarWrittenToInPlaceAfterItWasTrustedIsSigned) {
  const Bytes archive = MakePackage(PlainJar()).Build();
  Device device(archive);
  const std::string jar = device.Path("base.apk");
  device.phone.before_integrity = [&] { Patch(jar, 0, 'p'); };
  EXPECT_EQ(BytesSigned(device)[jar][0], 'p');
}

// The zip library maps the archive's central directory. After the truncation of the archive, a read
// of this directory raises SIGBUS. Files that were signed before the signal stay signed.
TEST(Threat, FileThatShrinksMeanwhileEndsTheProcess) {
  PackageOptions options = WithLibrariesNamed({"lib/arm64-v8a/libfoo.so"});
  for (int i = 0; i < 1000; ++i) options.entries.push_back({"assets/" + std::to_string(i), {}});
  const Bytes archive = MakePackage(options).Build();
  const pid_t child = fork();
  if (child == 0) {
    signal(SIGBUS, SIG_DFL);
    Device device(archive);
    device.Install("lib/arm64/libfoo.so", kLibrary);
    device.phone.before_open = [&](const char* path, int) {
      if (std::string(path).find("libfoo.so") == std::string::npos) return;
      if (truncate(device.Path("base.apk").c_str(), 0) != 0) _exit(1);
    };
    device.RunSteps();
    _exit(0);
  }
  int status = 0;
  ASSERT_EQ(waitpid(child, &status, 0), child);
  EXPECT_TRUE(WIFSIGNALED(status));
  EXPECT_EQ(WTERMSIG(status), SIGBUS);
}

}  // namespace
