// Numbers and lists as they stand in sentences.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

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

}  // namespace simulator
