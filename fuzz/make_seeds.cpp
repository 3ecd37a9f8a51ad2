// make_seeds DIRECTORY: writes the first inputs of each fuzz target to DIRECTORY/<target>/.
#include <cstdio>
#include <filesystem>
#include <string>

#include "fuzz/rsa_model.h"
#include "fuzz/signer.h"
#include "support/certificate.h"
#include "support/compiled_manifest.h"
#include "support/files.h"
#include "support/jar.h"
#include "support/package.h"
#include "support/signature_block.h"
#include "support/signing_block.h"

namespace {

std::filesystem::path root;

void Seed(const std::string& target, const std::string& name, const Bytes& content) {
  std::filesystem::create_directories(root / target);
  WriteFile((root / target / name).string(), content);
}

void SeedCertificate(const std::string& name, const Certificate& certificate) {
  Seed("x509", name, certificate.Build());
}

void MakeCertificates() {
  SeedCertificate("sha256", Certificate());
  Certificate certificate;
  certificate.key = kFuzzKey;
  SeedCertificate("small-key", certificate);
  certificate.digest = Digest::kMd5;
  certificate.version = {};
  SeedCertificate("v1-md5", certificate);

  certificate = Certificate();
  certificate.key = kFuzzKey;
  certificate.issuer = Name({{"2.5.4.6", "AB"},
                             {"2.5.4.10", "Example"},
                             {"2.5.4.3", "Issuer"},
                             {"1.2.840.113549.1.9.1", "a@example.com"},
                             {"0.9.2342.19200300.100.1.25", "example"}});
  certificate.validity = der::Sequence({der::Element(der::kGeneralizedTime, "20500102030405Z"),
                                        der::Element(der::kGeneralizedTime, "20990102030405Z")});
  const Bytes names = der::Sequence({
      der::ContextPrimitive(1, ToBytes("b@example.com")),
      der::ContextPrimitive(2, ToBytes("example.com")),
      der::ContextPrimitive(6, ToBytes("https://example.com/")),
      der::ContextPrimitive(7, {127, 0, 0, 1}),
      der::ContextPrimitive(8, der::OidContents("1.2.3.4")),
  });
  certificate.extensions = {
      Extension("2.5.29.15", der::BitString({0x06}, 1), true),
      Extension("2.5.29.17", names),
      Extension("2.5.29.18", names),
      Extension("2.5.29.19", der::Sequence({der::Boolean(0xff), der::Integer(3)}), true),
      Extension("2.5.29.14", der::OctetString({1, 2, 3, 4})),
  };
  SeedCertificate("extensions", certificate);
  certificate.issuer_unique_id = der::ContextPrimitive(1, {0, 1});
  SeedCertificate("issuer-unique-id", certificate);
}

void MakeElements() {
  Seed("asn1", "certificate", Certificate().Build());
  Seed("asn1", "oid", der::Oid("1.2.840.113549.1.1.1"));
  Seed("asn1", "oid-contents", der::OidContents("2.16.840.1.101.3.4.2.1"));
  Seed("asn1", "long-tag", FromHex("1f810100"));
  Seed("asn1", "indefinite", FromHex("30800000"));
  Seed("asn1", "bit-string", der::BitString({0x80, 0x01, 0xff, 0x7f}, 0));
}

SignatureBlock SmallBlock() {
  SignatureBlock block;
  block.key = kFuzzKey;
  return block;
}

void MakeSignatureBlocks() {
  const Bytes signature_file = ToBytes("Signature-Version: 1.0\r\n\r\n");
  SignatureBlock block = SmallBlock();
  Seed("signature_block", "sha256", block.Build(signature_file));
  block.digest = Digest::kSha1;
  Seed("signature_block", "sha1", block.Build(signature_file));
  block.digest = Digest::kMd5;
  Seed("signature_block", "md5", block.Build(signature_file));
  block = SmallBlock();
  block.authenticated_attributes = true;
  Seed("signature_block", "attributes", block.Build(signature_file));
  block = SmallBlock();
  block.issuer_key = "rsa-1024";
  Seed("signature_block", "issued", block.Build(signature_file));
  for (const char* exponent : {"01", "ffffffff", "010000004000"}) {
    Seed("signature_block", std::string("forged-") + exponent,
         ForgedBlock(signature_file, kFuzzKey, FromHex(exponent)));
  }
  Seed("signature_block", "e17", [&] {
    SignatureBlock other;
    other.key = "rsa-2048-e17";
    return other.Build(signature_file);
  }());
}

// fuzz/rsa_fuzz.cpp reads the digests, the signature and the modulus from the start of the input.
// It reads the choices backwards from the end.
void SeedRsa(const std::string& name, Digest digest, size_t length, uint8_t length_choice) {
  const Bytes data = ToBytes("data");
  const Bytes choices = {1, 0 /* exponent 1 */, 1, length_choice, 1};
  Bytes modulus(length, 0xff);
  Seed("rsa", name,
       Concat({DigestOf(Digest::kSha1, data), DigestOf(Digest::kSha256, data),
               DigestOf(Digest::kMd5, data), EncodedMessage(digest, data, length), modulus,
               choices}));
}

void MakeNumbers() {
  SeedRsa("md5", Digest::kMd5, 64, 5);
  SeedRsa("sha1", Digest::kSha1, 66, 7);
  SeedRsa("sha256", Digest::kSha256, 128, 8);
  SeedRsa("no-padding", Digest::kSha256, 54, 4);
  for (uint8_t operation = 0; operation < 6; ++operation) {
    Bytes operands(300, 0x5a);
    operands.push_back(operation);
    Seed("mpi", "operation-" + std::to_string(operation), operands);
  }
}

void MakeTexts() {
  const Bytes data = ToBytes("data");
  const std::string manifest =
      JarText::Manifest()
          .Attribute("Created-By", "1.0")
          .EndSection()
          .Section("classes.dex", {"SHA1-Digest", "SHA-256-Digest"}, data)
          .Section("lib/arm64-v8a/lib" + std::string(80, 'x') + ".so", {"SHA-256-Digest"}, data)
          .text();
  Seed("manifest", "crlf", ToBytes(manifest));
  std::string lf = manifest;
  for (size_t at; (at = lf.find('\r')) != std::string::npos;) lf.erase(at, 1);
  Seed("manifest", "lf", ToBytes(lf));
  Seed("manifest", "signature-file", ToBytes(SignatureFileText(manifest, {"SHA-256-Digest"})));
  Seed("manifest", "odd", ToBytes("Key:\r\n value\r\n\r\nA:\nName: x\n\nB: 1\n\r\n\tC: 2\r\r"));
  Seed("base64", "digest", ToBytes(" " + DigestText("SHA-256-Digest", data)));
  Seed("base64", "lines", ToBytes(" QUJD\r\nREVG"));
  Seed("base64", "short", ToBytes("\x02QUI"));
  Seed("integrity", "settled", ToBytes("1f\n"));
  Seed("integrity", "waits", ToBytes("ffffffff\\\\ffffffff\\\\0x1f\n"));
  Seed("integrity", "zero", ToBytes("0\n"));
}

void MakeCompiledManifests() {
  Seed("compiled_manifest", "plain", CompiledManifest("com.example.app"));
  Seed("compiled_manifest", "permission", CompiledManifest("com.example.app", true));
  for (const auto pool : {CompiledXml::Pool::kUtf8, CompiledXml::Pool::kUtf16}) {
    CompiledXml xml(pool);
    xml.StartNamespace("android", kAndroidNamespace)
        .Start("manifest", {StringAttribute("package", "com.example.\xc3\xa9")})
        .Element("uses-permission", {InAndroidNamespace(ReferenceAttribute("name", 0x7f010001))})
        .Element("permission", {InAndroidNamespace(StringAttribute("name", "other"))})
        .Element("meta-data", {InAndroidNamespace(StringAttribute("name", "access")),
                               InAndroidNamespace(StringAttribute("value", "SS_META"))})
        .Text("text")
        .End("manifest")
        .EndNamespace("android", kAndroidNamespace);
    Seed("compiled_manifest", pool == CompiledXml::Pool::kUtf8 ? "utf-8" : "utf-16", xml.Build());
  }
  CompiledXml odd(CompiledXml::Pool::kUtf16);
  odd.StartWithSizelessAttributes("manifest", StringAttribute("package\xED\xB0\x80", "p"), 100)
      .Element("permission\xED\xA0\x80",
               {StringAttribute("name", "com.qix.android.\xED\xA0\x80SECURE_STORAGE")});
  Seed("compiled_manifest", "odd", odd.Build());
  Seed("compiled_manifest", "no-header", {3});
  Seed("compiled_manifest", "bad-node", CompiledXml().Start("manifest").BadNode().Build());
}

// `phone` is the first byte of the seed. Its bits set the phone's answers and the attacker
// (fuzz/package_fuzz.cpp). 0: the phone has no faults, and no attacker acts. 2: each file has the
// attribute "user.zu". 16: the integrity value settles at the second reading. 128: an attacker
// replaces libraries.
void SeedPackage(const std::string& name, const PackageOptions& options, uint8_t phone = 0) {
  Seed("package", name, Concat({{phone}, MakePackage(options).Build()}));
}

void MakePackages() {
  PackageOptions options;
  options.block = SmallBlock();
  SeedPackage("good", options);
  SeedPackage("exchanged", options, 128);
  options.secure_storage = true;
  options.digests = options.signature_file_digests = {"SHA1-Digest", "SHA-256-Digest"};
  SeedPackage("registered", options);
  const Bytes library = ToBytes("\177ELF foo");
  options.entries = {{"lib/armeabi-v7a/libfoo.so", library},
                     {"lib/armeabi/libbar.so", ToBytes("\177ELF bar")},
                     {"lib/arm64-v8a/../../../outside.so", library},
                     {"lib/x86/libfoo.so", library},
                     {"res/raw", Bytes(300, 'x'), true}};
  SeedPackage("libraries", options, 16);
  options.android_manifest = Bytes();
  SeedPackage("jar", options);
  SeedPackage("registered-jar", options, 2);
}

// The first byte of the seed, `reader`, is an index in kReaders (fuzz/explanation_fuzz.cpp).
void SeedExplanation(const std::string& name, uint8_t reader, const Bytes& content) {
  Seed("explanation", name, Concat({{reader}, content}));
}

void MakeExplanations() {
  const Bytes signature_file = ToBytes("Signature-Version: 1.0\r\nX-Android-APK-Signed: 2\r\n\r\n");
  const Bytes certificate = Certificate().Build();
  const Bytes signer = Signers({SignerBytes(certificate)});
  const Bytes block =
      SigningBlockBytes({{kSchemeV2, signer}, {kSchemeV3, signer}, {kSchemeV31, signer}});
  PackageOptions options;
  options.block = SmallBlock();
  SeedExplanation("package", 0, ArchiveWithBlock(MakePackage(options).Build(), block));
  SeedExplanation("signing-block", 1, block);
  SeedExplanation("certificate", 2, certificate);
  SeedExplanation("signature-block", 3, SmallBlock().Build(signature_file));
  SeedExplanation("compiled-manifest", 4, CompiledManifest("com.example.app", true));
}

// The first byte of a seed selects what its other bytes are (fuzz/journal_fuzz.cpp). 0: any text.
// 1: one line of the tool's log. 2: the journal of a run.
void MakeJournals() {
  Seed("journal", "text", Concat({{0}, ToBytes("a\u00fc\u202e\xff\uf7ff\n")}));
  Seed("journal", "line", Concat({{1}, ToBytes("VeltSignJni: File not verified: /a\n")}));
  Seed("journal", "run", Concat({{2}, ToBytes(R"({"event":"start","file":"a","path":"/a"}
{"event":"log","priority":4,"tag":"ApkToolkit","text":"VeltSignJni starts: 3.\n"}
{"event":"log","priority":4,"tag":"ApkToolkit","text":"VeltSign starts: zip_fd = 3, fd = 3.\n"}
{"event":"log","priority":4,"tag":"ApkToolkit","text":"VeltSignOat: Apk case.\n"}
{"event":"integrity","pid":0,"text":"0"}
{"event":"sign","path":"/a","payload":"0000","result":0,"errno":0}
{"event":"exit","status":0}
)")}));
}

// fuzz/verdict_fuzz.cpp makes a package and the events of its run from the bytes of the seed. With
// these bytes, the package is signed, and its key is registered.
void MakeVerdicts() {
  const Bytes package = {0, 1, 0, 1, 1, 0, 1, 0, 1, 0, 0, 1, 0};
  const Bytes run = {0, 0, 1, 1, 0, 1, 3, 1, 0, 1, 0, 0, 1, 2, 2, 0, 1};
  Seed("verdict", "signed", Concat({package, run}));
}

}  // namespace

int main(int argc, char* argv[]) {
  if (argc != 2) {
    fprintf(stderr, "usage: make_seeds DIRECTORY\n");
    return 2;
  }
  root = argv[1];
  MakeElements();
  MakeCertificates();
  MakeSignatureBlocks();
  MakeNumbers();
  MakeTexts();
  MakeCompiledManifests();
  MakePackages();
  MakeExplanations();
  MakeJournals();
  MakeVerdicts();
  return 0;
}
