// One-shot digests by the platform's crypto library.
#pragma once

#include <cstdint>
#include <vector>

void ComputeMD5Digest(const std::vector<uint8_t>& in, std::vector<uint8_t>& out);
void ComputeSHA1Digest(const std::vector<uint8_t>& in, std::vector<uint8_t>& out);
void ComputeSHA256Digest(const std::vector<uint8_t>& in, std::vector<uint8_t>& out);
