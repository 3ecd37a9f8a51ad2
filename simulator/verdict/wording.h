// The wording of numbers, lists and keys in sentences.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "simulator/verdict/report.h"

namespace simulator {

// A number with its noun: "1 entry", "2 entries".
inline std::string Counted(uint64_t count, const char* one, const char* many) {
  return std::to_string(count) + " " + (count == 1 ? one : many);
}

// The words as one text: "v1, v2".
inline std::string Joined(const std::vector<std::string>& words) {
  std::string text;
  for (const std::string& word : words) text += (text.empty() ? "" : ", ") + word;
  return text;
}

// The number of entries, and the name of the first one: "3 entries: a, ...". `names` must not be
// empty.
inline std::string CountedNames(const std::vector<std::string>& names) {
  return Counted(names.size(), "entry", "entries") + ": " + names[0] +
         (names.size() > 1 ? ", ..." : "");
}

// The range in words: "API 27 and later".
std::string LevelText(const LevelRange& levels);

// Names the phones about which apksig (the platform's verifier) was asked, and the signature
// schemes that these phones verify: "phones of API 27 and later install it, verified by v2, v3".
// Empty if some of these phones do not install the package, or if apksig gave no judgement.
std::string TakersText(const Judgement& judgement);

// The JAR signer's key as text: its algorithm and, if known, its size in bits, such as "RSA-2048".
// Both come from report.key, or from report.signer if report.key is not set. Empty if neither
// report.key nor report.signer is set.
inline std::string KeyName(const Report& report) {
  const PublicKey shown = report.signer ? report.signer->key : PublicKey();
  const std::string algorithm = report.key ? "RSA" : shown.algorithm;
  const int bits = report.key ? report.key->bits : shown.bits;
  return bits == 0 ? algorithm : algorithm + "-" + std::to_string(bits);
}

}  // namespace simulator
