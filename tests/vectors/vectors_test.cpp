// Tests rsa_pkcs1_verify on vectors in the format of Project Wycheproof's
// rsa_signature_*_test.json. Some vectors are this project's own. The others are Wycheproof's
// vectors for SHA-256 with keys of 2048 or 3072 bits. The CMake variable APKTOOLKIT_WYCHEPROOF_DIR
// can name a directory with more vectors.
#include <gtest/gtest.h>
#include <openssl/bn.h>
#include <openssl/nid.h>
#include <openssl/rsa.h>

#include <algorithm>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <nlohmann/json.hpp>

#include "crypto/rsa.h"
#include "support/certificate.h"
#include "support/files.h"
#include "support/process.h"

namespace {

using nlohmann::json;

// Flags of vectors whose result can differ from the tool's verdict. AcceptedShortPadding is this
// project's flag. It marks vectors that are invalid by RFC 8017, and that the tool accepts on
// purpose. WrongHash is Wycheproof's flag. It marks signatures that are made with another digest
// algorithm than that of their test group. The tool accepts each algorithm in kDigests, because the
// signature itself names its algorithm.
constexpr char kAcceptedShortPadding[] = "AcceptedShortPadding";
constexpr char kWrongHash[] = "WrongHash";

// The digest algorithms that the tool accepts. The tool refuses a signature with any other digest
// algorithm, even a good signature.
constexpr const char* kDigests[] = {"MD5", "SHA-1", "SHA-256"};

struct Counts {
  int valid = 0, wrong_hash = 0, lenient = 0, acceptable = 0;  // accepted vectors
  int refused = 0;
  // Signatures of another length than the modulus. They are not verified, because rsa_pkcs1_verify
  // always reads as many bytes as the modulus has.
  int other_length = 0;

  bool operator==(const Counts& other) const {
    return valid == other.valid && wrong_hash == other.wrong_hash && lenient == other.lenient &&
           acceptable == other.acceptable && refused == other.refused &&
           other_length == other.other_length;
  }
};

std::ostream& operator<<(std::ostream& out, const Counts& counts) {
  return out << counts.valid << " valid, " << counts.wrong_hash << " of a wrong hash, "
             << counts.lenient << " lenient, " << counts.acceptable << " acceptable, "
             << counts.refused << " refused, " << counts.other_length << " of another length";
}

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
  // In an older file, a test group has the modulus in "n" and the exponent in "e". In a newer
  // file, the group has both numbers in "publicKey".
  explicit Key(const json& group) {
    const bool is_newer = group.contains("publicKey") && group["publicKey"].is_object();
    const json& key = is_newer ? group["publicKey"] : group;
    modulus_ = WithoutLeadingZeros(FromHex(key.at(is_newer ? "modulus" : "n")));
    const Bytes exponent = WithoutLeadingZeros(FromHex(key.at(is_newer ? "publicExponent" : "e")));
    is_usable_ = exponent.size() <= 4;
    for (const uint8_t byte : exponent) exponent_ = exponent_ << 8 | byte;
    EXPECT_EQ(rsa_set_key(&context_, modulus_.data(), nullptr, exponent_,
                          static_cast<uint32_t>(modulus_.size())),
              0);
  }

  size_t size() const { return modulus_.size(); }
  // True if the exponent fits in the tool's 4 bytes.
  bool is_usable() const { return is_usable_; }
  bool Verifies(const Bytes& message, const Bytes& signature) const {
    return rsa_pkcs1_verify(&context_, DigestOf(Digest::kSha1, message).data(),
                            DigestOf(Digest::kSha256, message).data(),
                            DigestOf(Digest::kMd5, message).data(), signature.data()) == 0;
  }
  // True if libcrypto finds the signature good for any of the three digests.
  bool IsGoodForSomeDigest(const Bytes& message, const Bytes& signature) const {
    const bssl::UniquePtr<RSA> key(RSA_new());
    const bssl::UniquePtr<BIGNUM> e(BN_new());
    EXPECT_TRUE(BN_set_word(e.get(), exponent_));
    EXPECT_TRUE(RSA_set0_key(key.get(), BN_bin2bn(modulus_.data(), modulus_.size(), nullptr),
                             BN_dup(e.get()), nullptr));
    for (const auto& [nid, digest] :
         {std::pair(NID_md5, Digest::kMd5), std::pair(NID_sha1, Digest::kSha1),
          std::pair(NID_sha256, Digest::kSha256)}) {
      const Bytes hash = DigestOf(digest, message);
      if (RSA_verify(nid, hash.data(), hash.size(), signature.data(), signature.size(),
                     key.get()) == 1) {
        return true;
      }
    }
    return false;
  }

 private:
  Bytes modulus_;
  uint32_t exponent_ = 0;
  rsa_local context_;
  bool is_usable_ = false;
};

bool HasFlag(const json& test, const char* flag) {
  const json flags = test.value("flags", json::array());
  return std::find(flags.begin(), flags.end(), flag) != flags.end();
}

// Counts the vector. If the signature is as long as the modulus, also checks that the vector's
// result and flags allow the tool's verdict.
void Judge(const Key& key, const std::string& sha, const json& test, Counts* counts) {
  const Bytes message = FromHex(test.at("msg"));
  const Bytes signature = FromHex(test.at("sig"));
  if (signature.size() != key.size()) {
    ++counts->other_length;
    return;
  }
  const std::string result = test.at("result");
  const bool verified = key.Verifies(message, signature);
  int* accepted = nullptr;
  if (HasFlag(test, kAcceptedShortPadding)) {
    accepted = &counts->lenient;
  } else if (HasFlag(test, kWrongHash) && key.IsGoodForSomeDigest(message, signature)) {
    accepted = &counts->wrong_hash;
  } else if (result == "valid" && Holds(kDigests, sha)) {
    accepted = &counts->valid;
  } else if (result == "acceptable" && verified) {
    accepted = &counts->acceptable;
  }
  ++*(accepted != nullptr ? accepted : &counts->refused);
  EXPECT_EQ(verified, accepted != nullptr)
      << "test " << test.at("tcId") << ": " << test.value("comment", "");
}

// Judges the vectors of a file, and returns how many had each outcome. Leaves out the vectors of
// keys whose exponent does not fit in the tool's 4 bytes.
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

Counts Of(int valid, int wrong_hash, int lenient, int refused, int other_length) {
  Counts counts;
  counts.valid = valid;
  counts.wrong_hash = wrong_hash;
  counts.lenient = lenient;
  counts.refused = refused;
  counts.other_length = other_length;
  return counts;
}

TEST(Vectors, OwnVectorsGetTheExpectedVerdicts) {
  EXPECT_EQ(JudgeFile(VECTORS_DIR "/rsa_signature_apktoolkit_test.json"), Of(16, 0, 9, 127, 0));
}

TEST(Vectors, OwnVectorsAreTheOutputOfMakeVectors) {
  EXPECT_TRUE(RunProcess({VECTORS_DIR "/make_vectors"}).output ==
              ContentOf(VECTORS_DIR "/rsa_signature_apktoolkit_test.json"));
}

TEST(Vectors, WycheproofVectorsOf2048BitsGetTheExpectedVerdicts) {
  EXPECT_EQ(JudgeFile(VECTORS_DIR "/wycheproof_2048_sha256.json"), Of(9, 2, 0, 246, 2));
}

TEST(Vectors, WycheproofVectorsOf3072BitsGetTheExpectedVerdicts) {
  EXPECT_EQ(JudgeFile(VECTORS_DIR "/wycheproof_3072_sha256.json"), Of(8, 2, 0, 247, 2));
}

// The names, without extension, of the files rsa_signature_* in the configured directory. Empty if
// no directory is configured.
std::vector<std::string> NamesInTheDirectory() {
  std::vector<std::string> names;
  const std::filesystem::path directory = WYCHEPROOF_DIR;
  if (directory.empty()) return names;
  for (const auto& entry : std::filesystem::directory_iterator(directory)) {
    const std::string name = entry.path().stem();
    if (name.rfind("rsa_signature_", 0) == 0) names.push_back(name);
  }
  return names;
}

class VectorsOfTheDirectory : public testing::TestWithParam<std::string> {
 protected:
  const std::string file_ = WYCHEPROOF_DIR "/" + GetParam() + ".json";
};
GTEST_ALLOW_UNINSTANTIATED_PARAMETERIZED_TEST(VectorsOfTheDirectory);
INSTANTIATE_TEST_SUITE_P(Files, VectorsOfTheDirectory, testing::ValuesIn(NamesInTheDirectory()),
                         [](const auto& parameter) { return parameter.param; });

// This project's files wycheproof_*.json are shortened copies of Wycheproof's files. If a file of
// the directory has a shortened copy, take_wycheproof must print exactly this copy for the file.
TEST_P(VectorsOfTheDirectory, GetTheExpectedVerdictsAndMatchTheirCopies) {
  EXPECT_GT(JudgeFile(file_).refused, 0);
  std::string kept = GetParam() + ".json";
  kept.replace(0, strlen("rsa_signature_"), VECTORS_DIR "/wycheproof_");
  kept.erase(kept.rfind("_test"), strlen("_test"));
  if (std::filesystem::exists(kept)) {
    EXPECT_TRUE(RunProcess({VECTORS_DIR "/take_wycheproof", file_}).output == ContentOf(kept));
  }
}

}  // namespace
