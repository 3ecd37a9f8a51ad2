// Reading the events of a journal.
#pragma once

#include <cstdint>
#include <nlohmann/json.hpp>
#include <string>
#include <vector>

namespace simulator {

using Events = std::vector<nlohmann::json>;

// The events of a journal's lines. Lines that are no JSON are not ours and do not count.
Events ParseEvents(const std::string& journal);

// What `event` has under `key`: a text as the bytes that it was, or a number. Empty, or 0, when it
// is not there.
std::string TextOf(const nlohmann::json& event, const char* key);
int64_t NumberOf(const nlohmann::json& event, const char* key);

// Whether the answer in `event`, of the kernel or libzu, is 0.
bool IsSuccess(const nlohmann::json& event);

// Whether `event` tells of the run. The others are there for the journal's own sake.
bool IsOfTheRun(const nlohmann::json& event);

// Such as "ENOKEY: Required key not available".
std::string DescribeErrno(int64_t error);

}  // namespace simulator
