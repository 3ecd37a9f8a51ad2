// Chooses the files that the kernel is asked to sign, and the payload: each extracted native
// library whose bytes match the signed manifest, and the file itself. Results are the codes of
// sign/integrity.h. Both functions log each step and each refusal. They borrow the package and the
// descriptors.
//
// Payload of a package: a 16-bit length (32, host byte order) and the SHA-256 digest of the
// signer's key. Payload of a plain JAR: the 16-bit length 0, no data.
#pragma once

#include <cstdint>

#include "apk/apk.h"

// Signs the file behind `fd`: a good package, or a plain JAR that the kernel already trusts.
// `zip_fd` appears only in messages. Returns kVeltFailure if the file is not a zip archive, if the
// package did not verify, or if the kernel does not trust the JAR or refuses to sign.
uint32_t VeltSign(ApkTools::Apk& apk, int zip_fd, int fd);

// Signs the native libraries that were extracted beside the package `apk`. `fd` appears only in a
// message; `path` is unused, because the package knows its path. Returns kVeltFailure for anything
// but a good package, and otherwise 0, even if libraries could not be signed.
uint32_t VeltSignJni(ApkTools::Apk& apk, int fd, const char* path);
