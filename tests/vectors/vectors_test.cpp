// rsa_pkcs1_verify on vectors in Project Wycheproof's format (rsa_signature_*_test.json): the
// project's own, and those of a folder that was named when the build was configured.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <nlohmann/json.hpp>

#include "crypto/rsa.h"
#include "support/certificate.h"
#include "support/process.h"

namespace {

using nlohmann::json;

// Where the tool's rules differ from the vectors': what carries one of these flags is invalid by
// the standard, and accepted on purpose.
constexpr const char* kAcceptedFlags[] = {"ShortPadding"};

// The digests that the tool knows; a signature over another is refused, however good it is.
constexpr const char* kDigests[] = {"MD5", "SHA-1", "SHA-256"};

struct Counts {
  int valid = 0, refused = 0, acceptable = 0, lenient = 0;
  // Signatures of another length than the modulus: the length is the caller's concern.
  int other_length = 0;
};

template <class Names>
bool Holds(const Names& names, const std::string& name) {
  return std::any_of(std::begin(names), std::end(names),
                     [&](const char* candidate) { return name == candidate; });
}

Bytes WithoutLeadingZeros(Bytes number) {
  number.erase(number.begin(),
               std::find_if(number.begin(), number.end(), [](uint8_t byte) { return byte != 0; }));
  return number;
}

class Key {
 public:
  // The older form of a group has "n" and "e" itself, the newer one in "publicKey".
  explicit Key(const json& group) {
    const bool is_newer = group.contains("publicKey") && group["publicKey"].is_object();
    const json& key = is_newer ? group["publicKey"] : group;
    modulus_ = WithoutLeadingZeros(FromHex(key.at(is_newer ? "modulus" : "n")));
    const Bytes exponent = WithoutLeadingZeros(FromHex(key.at(is_newer ? "publicExponent" : "e")));
    is_usable_ = exponent.size() <= 4;
    uint32_t value = 0;
    for (const uint8_t byte : exponent) value = value << 8 | byte;
    EXPECT_EQ(rsa_set_key(&context_, modulus_.data(), nullptr, value,
                          static_cast<uint32_t>(modulus_.size())),
              0);
  }

  size_t size() const { return modulus_.size(); }
  // Whether the exponent is one that the tool can hold.
  bool is_usable() const { return is_usable_; }
  bool Verifies(const Bytes& message, const Bytes& signature) {
    return rsa_pkcs1_verify(&context_, DigestOf(Digest::kSha1, message).data(),
                            DigestOf(Digest::kSha256, message).data(),
                            DigestOf(Digest::kMd5, message).data(), signature.data()) == 0;
  }

 private:
  Bytes modulus_;
  rsa_local context_;
  bool is_usable_ = false;
};

bool IsLenient(const json& test) {
  const json flags = test.value("flags", json::array());
  return std::any_of(flags.begin(), flags.end(),
                     [](const json& flag) { return Holds(kAcceptedFlags, flag); });
}

void Judge(Key& key, const std::string& sha, const json& test, Counts* counts) {
  const Bytes signature = FromHex(test.at("sig"));
  if (signature.size() != key.size()) {
    ++counts->other_length;
    return;
  }
  const std::string result = test.at("result");
  const bool verified = key.Verifies(FromHex(test.at("msg")), signature);
  const std::string name =
      "test " + std::to_string(test.at("tcId").get<int>()) + ": " + test.value("comment", "");
  if (IsLenient(test)) {
    EXPECT_TRUE(verified) << name;
    ++counts->lenient;
  } else if (result == "valid" && Holds(kDigests, sha)) {
    EXPECT_TRUE(verified) << name;
    ++counts->valid;
  } else if (result == "acceptable") {
    ++counts->acceptable;
  } else {
    EXPECT_FALSE(verified) << name;
    ++counts->refused;
  }
}

Counts JudgeFile(const std::string& path) {
  SCOPED_TRACE(path);
  std::ifstream file(path);
  const json vectors = json::parse(file, nullptr, false);
  EXPECT_TRUE(vectors.is_object()) << "no JSON";
  Counts counts;
  int tests = 0;
  for (const json& group : vectors.value("testGroups", json::array())) {
    Key key(group);
    for (const json& test : group.at("tests")) {
      ++tests;
      if (key.is_usable()) Judge(key, group.at("sha"), test, &counts);
    }
  }
  EXPECT_EQ(tests, vectors.value("numberOfTests", -1));
  return counts;
}

TEST(Vectors, OfThisProjectAreJudgedAsTheySay) {
  const Counts counts = JudgeFile(VECTORS_DIR "/rsa_signature_apktoolkit_test.json");
  EXPECT_EQ(counts.valid, 16);
  EXPECT_EQ(counts.refused, 127);
  EXPECT_EQ(counts.lenient, 9);
  EXPECT_EQ(counts.acceptable, 0);
  EXPECT_EQ(counts.other_length, 0);
}

TEST(Vectors, OfThisProjectAreWhatTheirRecipeMakes) {
  std::ifstream file(VECTORS_DIR "/rsa_signature_apktoolkit_test.json");
  const std::string committed{std::istreambuf_iterator<char>(file), {}};
  EXPECT_TRUE(RunProcess({VECTORS_DIR "/make_vectors"}).output == committed);
}

TEST(Vectors, OfWycheproofAreJudgedAsTheySay) {
  const std::string folder = WYCHEPROOF_DIR;
  if (folder.empty()) GTEST_SKIP() << "NOT RUN: configure with -DAPKTOOLKIT_WYCHEPROOF_DIR=FOLDER";
  int files = 0;
  Counts all;
  for (const auto& entry : std::filesystem::directory_iterator(folder)) {
    const std::string name = entry.path().filename().string();
    if (name.rfind("rsa_signature_", 0) != 0 || entry.path().extension() != ".json") continue;
    ++files;
    const Counts counts = JudgeFile(entry.path().string());
    all.valid += counts.valid;
    all.refused += counts.refused;
  }
  EXPECT_GT(files, 0) << "no rsa_signature_*_test.json in " << folder;
  EXPECT_GT(all.valid, 0);
  EXPECT_GT(all.refused, 0);
}

}  // namespace
