#include "simulator/show/page_fields.h"

#include <utility>

#include "simulator/show/terminal.h"

namespace simulator {

kainjow::mustache::data Shown(std::string_view bytes) { return Printable(bytes, {false, true}); }

std::string Short(std::string_view bytes, size_t most) {
  constexpr size_t kLongestCharacter = 4;
  if (bytes.size() <= most) return std::string(bytes);
  size_t size = most;
  const auto is_inside = [bytes](size_t at) {
    return (static_cast<unsigned char>(bytes[at]) & 0xc0U) == 0x80;
  };
  while (size + kLongestCharacter > most + 1 && is_inside(size)) --size;
  return std::string(bytes.substr(0, size)) + "…";
}

Reason Short(Reason reason) {
  reason.detail = Short(reason.detail);
  return reason;
}

Item Short(Item item) {
  item.name = Short(item.name);
  item.reason = Short(std::move(item.reason));
  return item;
}

kainjow::mustache::list OneIf(bool condition) {
  return condition ? kainjow::mustache::list{kainjow::mustache::data()} : kainjow::mustache::list();
}

std::string Grouped(uint64_t number) {
  std::string text = std::to_string(number);
  for (size_t at = text.size(); at > 3; at -= 3) text.insert(at - 3, ",");
  return text;
}

}  // namespace simulator
