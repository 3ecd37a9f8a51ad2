// Asks the kernel to sign a package or a plain JAR, and the package's extracted native libraries
// whose bytes match the signed manifest. Results are the codes of sign/integrity.h. Both functions
// log each step and each refusal. They do not close the descriptors.
//
// Payload of a package and of its libraries: the 16-bit length 32 (host byte order), then the
// SHA-256 digest of the signer's RSA modulus. Payload of a plain JAR: the 16-bit length 0, no data.
#pragma once

#include <cstdint>

#include "apk/apk.h"

// Signs the file that is open as `fd` if `apk` is a good package (Apk::IsGoodApk), or a plain JAR
// that the kernel already trusts. `zip_fd` appears only in messages. Returns 0 if the kernel signed
// the file. Returns kVeltFailure if `apk` is not a zip archive, if the package did not verify, if
// the kernel does not trust the JAR, or if VeltSignFd fails.
uint32_t VeltSign(ApkTools::Apk& apk, int zip_fd, int fd);

// Signs the native libraries that were extracted beside the package `apk`. `fd` appears only in a
// message; `path` is not used, because `apk` has the package's path. Returns 0 for a good package,
// even if libraries could not be signed, and kVeltFailure for everything else.
uint32_t VeltSignJni(ApkTools::Apk& apk, int fd, const char* path);
