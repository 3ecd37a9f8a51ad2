#include "simulator/program/state.h"

#include <openssl/sha.h>

#include <filesystem>
#include <fstream>
#include <vector>

namespace {

namespace fs = std::filesystem;

// Empty when the file cannot be read.
std::string DigestOf(const std::string& path) {
  std::ifstream file(path, std::ios::binary);
  if (!file) return {};
  SHA256_CTX context;
  SHA256_Init(&context);
  std::vector<char> buffer(1 << 16);
  do {
    file.read(buffer.data(), static_cast<std::streamsize>(buffer.size()));
    SHA256_Update(&context, buffer.data(), static_cast<size_t>(file.gcount()));
  } while (file);
  if (!file.eof()) return {};
  unsigned char digest[SHA256_DIGEST_LENGTH];
  SHA256_Final(digest, &context);
  std::string text;
  for (const unsigned char byte : digest) {
    text += "0123456789abcdef"[byte >> 4];
    text += "0123456789abcdef"[byte & 15];
  }
  return text;
}

}  // namespace

bool SignedBytes::Load() {
  if (directory_.empty()) return true;
  std::error_code error;
  fs::create_directories(directory_, error);
  for (fs::directory_iterator entry(directory_, error), end; entry != end; entry.increment(error)) {
    digests_.insert(entry->path().filename().string());
  }
  return !error;
}

bool SignedBytes::Holds(const std::string& path) const {
  return digests_.count(DigestOf(path)) > 0;
}

bool SignedBytes::Add(const std::string& path) {
  const std::string digest = DigestOf(path);
  if (digest.empty()) return true;  // gone since it was signed: nothing is left to trust
  digests_.insert(digest);
  if (directory_.empty()) return true;
  std::ofstream file(directory_ + "/" + digest);
  file << path << '\n';
  return static_cast<bool>(file.flush());
}
