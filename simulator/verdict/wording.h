// Numbers, lists and keys as they stand in sentences.
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

// Such as "v1, v2".
inline std::string Joined(const std::vector<std::string>& words) {
  std::string text;
  for (const std::string& word : words) text += (text.empty() ? "" : ", ") + word;
  return text;
}

// The number of the names with their noun, and the first of them: "3 entries: a, ...".
inline std::string CountedNames(const std::vector<std::string>& names) {
  return Counted(names.size(), "entry", "entries") + ": " + names[0] +
         (names.size() > 1 ? ", ..." : "");
}

// Such as "API 27 and later".
std::string LevelText(const LevelRange& levels);

// Which phones take the package, and by which schemes they know its signer: "phones of API 27 and
// later take it, by v2, v3". Empty unless all of those that were asked do.
std::string TakersText(const Judgement& judgement);

// Such as "RSA-2048", of the JAR signer: as the tool reads the key, else as the certificate shows
// it. Empty when nobody does.
inline std::string KeyName(const Report& report) {
  const PublicKey shown = report.signer ? report.signer->key : PublicKey();
  const std::string algorithm = report.key ? "RSA" : shown.algorithm;
  const int bits = report.key ? report.key->bits : shown.bits;
  return bits == 0 ? algorithm : algorithm + "-" + std::to_string(bits);
}

}  // namespace simulator
