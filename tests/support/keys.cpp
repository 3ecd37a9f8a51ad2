#include "support/keys.h"

#include <fcntl.h>
#include <openssl/pem.h>
#include <unistd.h>

#include <climits>
#include <cstdio>
#include <cstdlib>
#include <map>

namespace {

// On a phone, TEST_KEYS_DIR is relative to the program's directory. If the programs for each
// processor have a separate directory, TEST_KEYS_DIR is relative to the parent of that directory.
// (This function does not call readlink, because the linker wraps readlink in some tests.)
std::string KeysDirectory() {
  const std::string keys = TEST_KEYS_DIR;
  if (keys[0] == '/') return keys;
  char program[PATH_MAX] = {};
  if (readlinkat(AT_FDCWD, "/proc/self/exe", program, sizeof(program) - 1) < 0) return keys;
  std::string directory = program;
  directory.erase(directory.rfind('/'));
  if (access((directory + "/" + keys).c_str(), X_OK) != 0) directory.erase(directory.rfind('/'));
  return directory + "/" + keys;
}

}  // namespace

std::string TestKeyPath(const std::string& name) {
  static const std::string& directory = *new std::string(KeysDirectory());
  return directory + "/" + name + ".pem";
}

EVP_PKEY* TestKey(const std::string& name) {
  static auto& keys = *new std::map<std::string, EVP_PKEY*>;
  EVP_PKEY*& key = keys[name];
  if (key != nullptr) return key;
  FILE* file = fopen(TestKeyPath(name).c_str(), "r");
  key = file == nullptr ? nullptr : PEM_read_PrivateKey(file, nullptr, nullptr, nullptr);
  if (key == nullptr) {
    fprintf(stderr, "no test key %s\n", TestKeyPath(name).c_str());
    abort();
  }
  fclose(file);
  return key;
}

RSA* TestRsaKey(const std::string& name) { return EVP_PKEY_get0_RSA(TestKey(name)); }
