// Whole files, and the names behind descriptors.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

bool ReadFile(const std::string& path, std::vector<uint8_t>& out);
std::string GetFilenameByFd(int fd);
std::vector<uint8_t> StringToVector(const std::string& s);
