// What the kernel is asked to sign, and with which payload: the package's extracted native
// libraries, each only after its bytes were found to match the signed manifest, and the file
// itself. Results are the codes of sign/integrity.h. Both functions log what they do and why they
// refuse; they only borrow the package and the descriptors.
//
// Payload of a package: a 16-bit length (32, host byte order) and the SHA-256 digest of the
// signer's key. Payload of a plain JAR: the 16-bit length 0, no data.
#pragma once

#include <cstdint>

#include "apk/apk.h"

// Signs the file behind `fd`: a good package, or a plain JAR that the kernel already trusts.
// `zip_fd` serves in messages only. Returns kVeltFailure for a file that is not a zip archive, and
// for a package that did not verify.
uint32_t VeltSign(ApkTools::Apk& apk, int zip_fd, int fd);

// Signs the native libraries that were extracted beside the package `apk`. `fd` serves in a message
// only, and `path` not at all: the package knows its own. Returns kVeltFailure for anything but a
// good package, and otherwise 0, however many libraries could not be signed.
uint32_t VeltSignJni(ApkTools::Apk& apk, int fd, const char* path);
