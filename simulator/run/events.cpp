#include "simulator/run/events.h"

#include <cstring>

#include "simulator/phone/text.h"

namespace simulator {

Events ParseEvents(const std::string& journal) {
  Events events;
  for (const std::string& line : Split(journal, '\n')) {
    auto event = nlohmann::json::parse(line, nullptr, false);
    if (event.is_object()) events.push_back(std::move(event));
  }
  return events;
}

std::string TextOf(const nlohmann::json& event, const char* key) {
  const auto value = event.find(key);
  return value != event.end() && value->is_string() ? DecodeText(value->get<std::string>()) : "";
}

int64_t NumberOf(const nlohmann::json& event, const char* key) {
  const auto value = event.find(key);
  return value != event.end() && value->is_number_integer() ? value->get<int64_t>() : 0;
}

bool IsSuccess(const nlohmann::json& event) {
  const auto result = event.find("result");
  return result != event.end() && *result == 0;
}

bool IsOfTheRun(const nlohmann::json& event) {
  const std::string kind = TextOf(event, "event");
  return kind != "journal" && kind != "start" && kind != "attached" && kind != "verdict";
}

std::string DescribeErrno(int64_t error) {
  const char* const name = strerrorname_np(static_cast<int>(error));
  if (name == nullptr) return "error " + std::to_string(error);
  return std::string(name) + ": " + strerrordesc_np(static_cast<int>(error));
}

}  // namespace simulator
