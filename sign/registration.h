// Registration of a package's signer, or of a plain JAR, with the process-authentication service.
#pragma once

#include "apk/apk.h"

// If the file asks for a registration, calls ZuNewCertificate of libzu for `fd`. Exception: if the
// package failed the verification, or the JAR's path cannot be found, only logs an error. If the
// file asks for no registration, does nothing and logs nothing. `zip_fd` and `fd` stay open. Only
// the log reports the result.
//
// A package asks in its AndroidManifest.xml (Apk::IsSsPermissionRequired). The signer's key is
// registered under the package name. A plain JAR asks with a non-empty extended attribute "user.zu"
// on `zip_fd`. 128 bytes are then registered under the JAR's path: four SHA-256 digests. The first
// is the digest of the path, and each later digest is the digest of the previous digest.
void ZuSign(ApkTools::Apk& apk, int zip_fd, int fd);
