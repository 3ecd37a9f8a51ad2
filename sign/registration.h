// Registration of the signer with the process-authentication service.
#pragma once

#include "apk/apk.h"

// Registers a certificate for `fd` through libzu if the file asks for it, and otherwise does
// nothing and logs nothing. Borrows both descriptors. Returns nothing; the log tells the result.
//
// A package asks by the secure-storage permission. If it verified, its signer's key is registered
// under its package name. A plain JAR asks by a non-empty extended attribute "user.zu" on `zip_fd`.
// Then 128 bytes are registered under its path: four chained SHA-256 digests, the first of it.
void ZuSign(ApkTools::Apk& apk, int zip_fd, int fd);
