// Signing archives as packages have been signed since Android 7: a block between the entries and
// the central directory that vouches for all bytes of the file but its own (APK Signature Scheme
// v2). What lies in META-INF is to it an entry like others.
#pragma once

#include <string>

#include "support/bytes.h"

// The archive, which has no such block and no comment, with one by the RSA test key `key` in it.
Bytes AddSigningBlock(const Bytes& archive, const std::string& key);
