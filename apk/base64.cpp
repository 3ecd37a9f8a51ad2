#include "apk/base64.h"

namespace {

// What a byte means, when it is not one of the values 0 to 63.
constexpr uint8_t kSkip = 64;
constexpr uint8_t kEnd = 65;
constexpr uint8_t kInvalid = 66;

struct Table {
  uint8_t meaning[256];
};

constexpr Table MakeTable() {
  constexpr char kAlphabet[] = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
  Table table = {};
  for (uint8_t& meaning : table.meaning) meaning = kInvalid;
  for (uint8_t value = 0; value < 64; ++value) {
    table.meaning[static_cast<uint8_t>(kAlphabet[value])] = value;
  }
  table.meaning[uint8_t{'\0'}] = table.meaning[uint8_t{'\n'}] = table.meaning[uint8_t{'\r'}] =
      kSkip;
  table.meaning[uint8_t{'='}] = kEnd;
  return table;
}

constexpr Table kTable = MakeTable();

}  // namespace

std::vector<uint8_t> Base64Decode(const std::string& text) {
  std::vector<uint8_t> bytes(text.size());
  size_t length = bytes.size();
  if (base64decode(text.data(), text.size(), bytes.data(), &length) != 0) length = 0;
  bytes.resize(length);
  return bytes;
}

int base64decode(const char* in, size_t length, uint8_t* out, size_t* out_length) {
  const size_t room = *out_length;
  size_t written = 0;
  uint32_t accumulator = 0;
  int collected = 0;
  for (size_t i = 0; i < length; ++i) {
    const uint8_t meaning = kTable.meaning[static_cast<uint8_t>(in[i])];
    if (meaning == kSkip) continue;
    if (meaning == kEnd) break;
    if (meaning == kInvalid) return 1;
    accumulator = (accumulator << 6) | meaning;
    if (++collected < 4) continue;
    if (room - written < 3) return 1;
    out[written++] = static_cast<uint8_t>(accumulator >> 16);
    out[written++] = static_cast<uint8_t>(accumulator >> 8);
    out[written++] = static_cast<uint8_t>(accumulator);
    collected = 0;
  }
  if (collected == 3) {
    if (room - written < 2) return 1;
    out[written++] = static_cast<uint8_t>(accumulator >> 10);
    out[written++] = static_cast<uint8_t>(accumulator >> 2);
  } else if (collected == 2) {
    if (room - written < 1) return 1;
    out[written++] = static_cast<uint8_t>(accumulator >> 4);
  }
  // Deliberate: a single value left over is 6 bits of no byte, and is dropped without an error.
  *out_length = written;
  return 0;
}
