// Base64 (RFC 4648 section 4) as the manifest and the signature file write their digests.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

std::vector<uint8_t> Base64Decode(const std::string& text);
extern "C" int base64decode(const char* in, size_t length, uint8_t* out, size_t* out_length);
