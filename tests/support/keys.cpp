#include "support/keys.h"

#include <openssl/pem.h>

#include <cstdio>
#include <cstdlib>
#include <map>

std::string TestKeyPath(const std::string& name) {
  return std::string(TEST_KEYS_DIR) + "/" + name + ".pem";
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
