// Registration of the signer with the process-authentication service.
#pragma once

#include "apk/apk.h"

// Registers a certificate for `fd` through libzu where that is asked for; every other file is left
// alone without a message. Both descriptors are borrowed; there is no result, the log tells.
//
// A package that asks for the secure-storage permission and verified: its signer's key under its
// package name. A plain JAR with a non-empty extended attribute "user.zu" on `zip_fd`: a 128-byte
// block of four chained SHA-256 digests, the first of the JAR's path, under that path.
void ZuSign(ApkTools::Apk& apk, int zip_fd, int fd);
