// Reading the events of a journal.
#pragma once

#include <cstdint>
#include <nlohmann/json.hpp>
#include <string>
#include <vector>

namespace simulator {

using Events = std::vector<nlohmann::json>;

// The events of a journal's lines. Lines that are not JSON come from elsewhere and do not count.
Events ParseEvents(const std::string& journal);

// The value of `event` under `key`: a text as its original bytes, or a number. Empty, or 0, when
// the key is missing.
std::string TextOf(const nlohmann::json& event, const char* key);
int64_t NumberOf(const nlohmann::json& event, const char* key);

// Whether the answer in `event`, of the kernel or libzu, is 0.
bool IsSuccess(const nlohmann::json& event);

// Whether `event` tells of the run. The others are there for the journal's own sake.
bool IsOfTheRun(const nlohmann::json& event);

// Such as "ENOKEY: Required key not available".
std::string DescribeErrno(int64_t error);

}  // namespace simulator
