// Registration of the signer with the process-authentication service.
#pragma once

#include "apk/apk.h"

// Calls ZuNewCertificate of libzu for `fd` if the file asks for a registration. Otherwise does
// nothing and logs nothing. Both descriptors stay open. Only the log reports the result.
//
// A package asks in its AndroidManifest.xml (Apk::IsSsPermissionRequired). If the package verified,
// its signer's key is registered under its package name. A plain JAR asks with a non-empty extended
// attribute "user.zu" on `zip_fd`. 128 bytes are then registered under the JAR's path: four SHA-256
// digests. The first is the digest of the path, and each later digest is the digest of the previous
// digest.
void ZuSign(ApkTools::Apk& apk, int zip_fd, int fd);
