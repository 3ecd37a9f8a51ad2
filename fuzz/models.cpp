#include "fuzz/models.h"

#include <algorithm>
#include <cstring>

namespace {

using namespace std::string_literals;

// Reads the sections of a manifest from the text. At() returns NUL for a position past the end.
class Reader {
 public:
  explicit Reader(const std::string& text) : text_(text) {}

  ManifestModel Read() {
    while (ReadSection()) {
    }
    return std::move(model_);
  }

 private:
  enum class After { kAttribute, kSection, kEnd };

  char At(size_t position) const { return position < text_.size() ? text_[position] : '\0'; }
  static bool IsBreak(char c) { return c == '\r' || c == '\n'; }
  bool End(bool valid) {
    model_.valid = valid;
    return false;
  }

  // Appends the next section to the model. Returns false, and appends nothing, if the text is
  // malformed or ends before the section does.
  bool ReadSection() {
    std::map<std::string, std::string> section;
    position_ = std::min(text_.find_first_not_of(" \r\n", position_), text_.size());
    while (true) {
      if (position_ >= text_.size()) return End(true);
      const size_t colon = text_.find_first_of(":\0"s, position_);
      if (At(colon) == '\0') return End(false);
      const std::string name = text_.substr(position_, colon - position_);
      if (At(colon + 1) != ' ' && !IsBreak(At(colon + 1))) return End(false);

      std::string value;
      const After after = ReadValue(colon, value);
      if (after == After::kEnd) return End(true);
      if (!name.empty() && !value.empty()) section[name] = value;
      if (after == After::kAttribute) continue;
      model_.sections.push_back(section);
      return true;
    }
  }

  // Reads the value after the colon, with its continuation lines. Returns what follows the value.
  After ReadValue(size_t colon, std::string& value) {
    position_ = colon + 2;
    bool has_text = At(colon + 1) == ' ';
    while (true) {
      if (has_text) {
        const size_t end = std::min(text_.find_first_of("\r\n\0"s, position_), text_.size());
        value += text_.substr(position_, end - position_);
        position_ = end;
      }
      if (position_ >= text_.size()) return After::kEnd;
      const char line_end = At(position_++);
      if (IsBreak(At(position_)) && At(position_) != line_end) ++position_;
      if (IsBreak(At(position_))) return After::kSection;
      if (At(position_) != ' ') return After::kAttribute;
      has_text = true;
      if (++position_ >= text_.size()) return After::kEnd;
    }
  }

  const std::string& text_;
  size_t position_ = 0;
  ManifestModel model_;
};

}  // namespace

ManifestModel ReadManifest(const std::string& text) { return Reader(text).Read(); }

std::optional<std::vector<uint8_t>> ReadBase64(const std::string& text) {
  constexpr char kAlphabet[] = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
  std::string bits;
  for (const char c : text.substr(0, text.find('='))) {
    if (c == '\0' || c == '\r' || c == '\n') continue;
    const void* const found = memchr(kAlphabet, c, 64);
    if (found == nullptr) return std::nullopt;
    const auto value = static_cast<const char*>(found) - kAlphabet;
    for (int bit = 5; bit >= 0; --bit) bits += (value >> bit & 1) != 0 ? '1' : '0';
  }
  std::vector<uint8_t> bytes;
  for (size_t at = 0; at + 8 <= bits.size(); at += 8) {
    bytes.push_back(static_cast<uint8_t>(std::stoi(bits.substr(at, 8), nullptr, 2)));
  }
  return bytes;
}
