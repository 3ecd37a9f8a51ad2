// What a hostile file can reach by rules that are lenient or trusting on purpose, and where that
// ends. docs/threat-model.md says why each is as it is.
#include <fcntl.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>

#include "apk/apk.h"
#include "sign/registration.h"
#include "sign/signing.h"
#include "support/compiled_manifest.h"
#include "support/files.h"
#include "support/package.h"
#include "support/phone.h"

namespace {

using Strings = std::vector<std::string>;

const Bytes kLibrary = ToBytes("\177ELF foo");

// The whole tool over a file, on a healthy phone.
class Device {
 public:
  explicit Device(const Package& package) : path_(temp_.File("app/base.apk")) {
    package.WriteTo(path_);
  }

  // Puts the bytes on disk, at a path from the package's folder on.
  Device& Install(const std::string& path, const Bytes& content) {
    WriteFile(temp_.File("app/" + path), content);
    return *this;
  }

  // The names, from the folder above the package's on, of the files that were signed with the key
  // of `signer`, in their order.
  Strings FilesSignedFor(const std::string& signer) {
    const std::string payload = "2000" + Hex(DigestOf(Digest::kSha256, ModulusOf(signer)));
    return FilesSignedWith(payload);
  }

  Strings FilesSignedWith(const std::string& payload) {
    Strings files;
    phone.witness = [&](int fd, const std::string& event) {
      if (event != "sign " + std::to_string(fd) + " " + payload) return;
      char path[4096] = {};
      const std::string link = "/proc/self/fd/" + std::to_string(fd);
      if (readlink(link.c_str(), path, sizeof(path) - 1) < 0) return;
      files.push_back(std::string(path).substr(temp_.path().size() + 1));
    };
    RunSteps();
    return files;
  }

  // What libzu was asked to register: name and data.
  Strings Registered() {
    RunSteps();
    Strings registered;
    for (const std::string& event : phone.events) {
      if (event.rfind("register ", 0) != 0) continue;
      registered.push_back(event.substr(event.find(' ', 9) + 1));
    }
    return registered;
  }

  Phone phone;

 private:
  void RunSteps() {
    const int fd = open(path_.c_str(), O_RDONLY);
    ASSERT_GE(fd, 0);
    ApkTools::Apk apk(fd);
    VeltSignJni(apk, fd, path_.c_str());
    VeltSign(apk, fd, fd);
    ZuSign(apk, fd, fd);
    close(fd);
  }

  TempDir temp_;
  const std::string path_;
};

PackageOptions WithLibrariesNamed(const Strings& names) {
  PackageOptions options;
  options.entries.clear();
  for (const std::string& name : names) options.entries.push_back({name, kLibrary});
  return options;
}

// The package as somebody signs it who knows no more of the key `victim` than everyone does, and
// writes the encoded messages themselves where signatures belong.
Package SignedWithoutPrivateKey(const std::string& victim, uint64_t exponent) {
  Package package = MakePackage();
  const Bytes modulus = ModulusOf(victim);
  Certificate certificate;
  certificate.public_key_info = PublicKeyInfoAround(
      der::Sequence({der::Integer(Concat({{0}, modulus})), der::Integer(exponent)}));
  certificate.signature =
      der::BitString(EncodedMessage(Digest::kSha256, certificate.Tbs(), modulus.size()));
  SignatureBlock block;
  block.certificates = certificate.Build();
  const Bytes signature_file = package.Item("META-INF/CERT.SF").data;
  block.encrypted_digest =
      der::OctetString(EncodedMessage(Digest::kSha256, signature_file, modulus.size()));
  package.Item("META-INF/CERT.RSA").data = block.Build(signature_file);
  return package;
}

TEST(Threat, ExponentOfOneTakesOnAnyonesModulus) {
  Device device(SignedWithoutPrivateKey("rsa-2048", 1));
  EXPECT_EQ(device.FilesSignedFor("rsa-2048"), Strings({"app/base.apk"}));
}

TEST(Threat, AnyOtherExponentAsksForThePrivateKey) {
  for (const uint64_t exponent : {0, 2, 3, 65537}) {
    Device device(SignedWithoutPrivateKey("rsa-2048", exponent));
    EXPECT_EQ(device.FilesSignedFor("rsa-2048"), Strings()) << exponent;
  }
}

TEST(Threat, DotsInAnEntryNameReachAFileOutsideWhoseBytesTheManifestLists) {
  Device device(MakePackage(WithLibrariesNamed({"lib/arm64-v8a/../../../other/libfoo.so"})));
  device.Install("lib/arm64/x", {}).Install("../other/libfoo.so", kLibrary);
  EXPECT_EQ(device.FilesSignedFor("rsa-2048"), Strings({"other/libfoo.so", "app/base.apk"}));
}

TEST(Threat, DotsInAnEntryNameSignNoFileOutsideWithOtherBytes) {
  Device device(MakePackage(WithLibrariesNamed({"lib/arm64-v8a/../../../other/libfoo.so"})));
  device.Install("lib/arm64/x", {}).Install("../other/libfoo.so", ToBytes("another's"));
  EXPECT_EQ(device.FilesSignedFor("rsa-2048"), Strings({"app/base.apk"}));
}

TEST(Threat, FileIsReadAndSignedForEachEntryThatNamesIt) {
  Device device(MakePackage(WithLibrariesNamed({"lib/arm64-v8a/a.so", "lib/arm64-v8a/./a.so"})));
  device.Install("lib/arm64/a.so", kLibrary);
  EXPECT_EQ(device.FilesSignedFor("rsa-2048"),
            Strings({"app/lib/arm64/a.so", "app/lib/arm64/a.so", "app/base.apk"}));
}

TEST(Threat, ReplacedAndroidManifestNamesWhatTheSignersKeyIsRegisteredFor) {
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

TEST(Threat, PackageWhoseAndroidManifestCannotBeExtractedIsAJarThatTheKernelMustTrust) {
  Package package = MakePackage();
  ZipItem& manifest = package.Item(kAndroidManifestName);
  manifest = ClaimingLength(manifest, static_cast<uint32_t>(manifest.data.size() + 1));
  EXPECT_EQ(Device(package).FilesSignedWith("0000"), Strings({"app/base.apk"}));
  Device other(package);
  other.phone.verify_errno = ENOKEY;
  EXPECT_EQ(other.FilesSignedWith("0000"), Strings());
}

}  // namespace
