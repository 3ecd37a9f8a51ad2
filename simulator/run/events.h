// Reading the events of a journal.
#pragma once

#include <cstdint>
#include <nlohmann/json.hpp>
#include <string>
#include <vector>

namespace simulator {

using Events = std::vector<nlohmann::json>;

// The events of a journal's lines. Lines that are not JSON objects are not events and are skipped.
Events ParseEvents(const std::string& journal);

// The text of `event` under `key`, decoded to the bytes that were recorded (docs/journal.md,
// Texts). Empty if the event has no such text.
std::string TextOf(const nlohmann::json& event, const char* key);
// The integer of `event` under `key`; 0 if the event has no such integer.
int64_t NumberOf(const nlohmann::json& event, const char* key);

// True if the kernel's answer in `event` is 0. For libzu's answer, use IsZuSuccess (sign/libzu.h).
bool IsSuccess(const nlohmann::json& event);

// True if `event` describes what the tool did. False for the events "journal", "start", "attached"
// and "verdict", which the simulator adds.
bool IsOfTheRun(const nlohmann::json& event);

// Returns a text such as "ENOKEY: Required key not available".
std::string DescribeErrno(int64_t error);

}  // namespace simulator
