// What a journal says about one file: whether all that should be signed was signed. Judged from
// the events alone, so that anyone with a journal can do the same (docs/journal.md has the rules).
#pragma once

#include <cstdint>
#include <nlohmann/json.hpp>
#include <string>
#include <vector>

using Events = std::vector<nlohmann::json>;

enum class Signed { kNot, kAsPackage, kAsJar };

struct Verdict {
  std::string path;           // of the file, absolute
  Signed own = Signed::kNot;  // the file itself
  int libraries = 0;          // how many other files were signed
  int keys = 0;               // how many keys were registered
  // Why not all was signed, in the order in which the journal has it; empty when all was.
  std::vector<std::string> reasons;
};

// `events` are those of one run, from its "start" to its "exit".
Verdict Judge(const Events& events);

// What `event` has under `key`: a text as the bytes that it was, or a number. Empty, or 0, when it
// is not there.
std::string TextOf(const nlohmann::json& event, const char* key);
int64_t NumberOf(const nlohmann::json& event, const char* key);

// Such as "ENOKEY: Required key not available".
std::string DescribeErrno(int64_t error);
