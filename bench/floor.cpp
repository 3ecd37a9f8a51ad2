// bench_floor FILE: does the tool's job without the verification. The cost of this program is the
// floor, a lower bound for the tool's cost. The program extracts the same entries as the tool,
// reads the same libraries, and writes the same log. It digests the same bytes as the tool, except
// those of the certificate.
#include <openssl/md5.h>
#include <openssl/sha.h>

#include "bench/job.h"

int main(int argc, char** argv) {
  const GivenPackage package = OpenGiven(argc, argv);
  Buffer compiled_manifest, manifest, signature_file, block;
  Extract(package, "AndroidManifest.xml", compiled_manifest);
  Extract(package, "META-INF/MANIFEST.MF", manifest);
  const std::string signature_file_name = SignatureFileName(package);
  Extract(package, signature_file_name, signature_file);
  Extract(package, signature_file_name.substr(0, signature_file_name.rfind('.')) + ".RSA", block);

  uint8_t digest[SHA256_DIGEST_LENGTH];
  SHA1(signature_file.data(), signature_file.size(), digest);
  SHA256(signature_file.data(), signature_file.size(), digest);
  MD5(signature_file.data(), signature_file.size(), digest);
  SHA256(manifest.data(), manifest.size(), digest);
  const std::string name = WalkManifest(compiled_manifest);
  {
    Buffer dex;
    Extract(package, "classes.dex", dex);
    SHA256(dex.data(), dex.size(), digest);
  }
  SignLibraries(package, [&](const std::string&, const Buffer& content) {
    SHA256(content.data(), content.size(), digest);
  });
  SignGiven(package);
  Register(package, name, block.data(), block.size());
  return 0;
}
