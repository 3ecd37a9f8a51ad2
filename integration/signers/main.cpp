// apktoolkit-bound DIGESTS COMMAND... FILE: runs `COMMAND... FILE` if the JAR signer of the package
// FILE is one of the signers that the package manager knows for this package. In all other cases,
// and if COMMAND cannot be started, this program ends with one of its own exit statuses.
//
// Of a package's signature schemes, the package manager uses the newest one that it knows. This can
// be a scheme of the APK signing block (v2 or later). apktoolkit always uses the JAR signature.
// Neither the package manager nor apktoolkit compares the signer of that scheme with the JAR signer
// (docs/threat-model.md, "Before you ship it"). DIGESTS is a comma-separated list that
// SignerDigests.java makes. For each RSA signer that the package manager knows, the list has the
// SHA-256 digest of the modulus, in lower-case hexadecimal. This program finds the JAR signer with
// the tool's own code, so it finds the same signer as the tool. This program is separate from its
// caller for two reasons. The tool's code ends the process if memory runs out. The tool's code also
// does not free all of its memory.
#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <string>
#include <string_view>
#include <vector>

#include "apk/apk.h"
#include "util/digest.h"
#include "util/file.h"
#include "util/scoped_fd.h"

namespace {

// The exit statuses of this program. They differ from 0 and 1, the exit statuses of apktoolkit,
// which is the usual COMMAND.
constexpr int kUsageError = 2;
constexpr int kOtherSigner = 3;
constexpr int kNoJarSigner = 4;
constexpr int kNotStarted = 5;

// Returns the SHA-256 digest of the JAR signer's modulus, in lower-case hexadecimal. The tool
// passes the same digest to the kernel. Returns an empty text if the file cannot be opened, is not
// a package, or has no readable META-INF/MANIFEST.MF. Also returns an empty text if the package has
// no signature file, if the first signature file is unreadable or malformed, or if the signature of
// this signature file is missing or does not verify. A wrong digest in the signature file or in the
// manifest does not change the result.
std::string JarSigner(const char* file) {
  const ScopedFd fd(OpenForReading(file, O_CLOEXEC));
  if (fd.get() < 0) return {};
  const ApkTools::Apk apk(fd.get());
  if (!apk.IsApk() || apk.GetManufacturerKey().empty()) return {};
  std::vector<uint8_t> digest;
  ComputeSHA256Digest(apk.GetManufacturerKey(), digest);
  std::string digits;
  for (const uint8_t byte : digest) {
    char two[3];
    snprintf(two, sizeof(two), "%02x", static_cast<unsigned>(byte));
    digits += two;
  }
  return digits;
}

// True if `wanted` is one of the comma-separated parts of `words`.
bool IsAmong(std::string_view words, std::string_view wanted) {
  while (true) {
    const size_t comma = words.find(',');
    if (words.substr(0, comma) == wanted) return true;
    if (comma == std::string_view::npos) return false;
    words.remove_prefix(comma + 1);
  }
}

}  // namespace

int main(int argc, char* argv[]) {
  if (argc < 4) {
    fputs("usage: apktoolkit-bound DIGEST[,DIGEST]... COMMAND... FILE\n", stderr);
    return kUsageError;
  }
  const char* const file = argv[argc - 1];
  const std::string signer = JarSigner(file);
  if (signer.empty()) {
    fprintf(
        stderr,
        "apktoolkit-bound: %s cannot be opened, is not a package, or has no good JAR signature\n",
        file);
    return kNoJarSigner;
  }
  if (!IsAmong(argv[1], signer)) {
    fprintf(stderr,
            "apktoolkit-bound: %s: the JAR signer %s is not one of the package's signers %s\n",
            file, signer.c_str(), argv[1]);
    return kOtherSigner;
  }
  execv(argv[2], &argv[2]);
  fprintf(stderr, "apktoolkit-bound: cannot start %s: %s\n", argv[2], strerror(errno));
  return kNotStarted;
}
