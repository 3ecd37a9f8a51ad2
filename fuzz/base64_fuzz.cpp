// apk/base64.h: decodes any text into a buffer of 0 to 63 bytes. A second decoder, which first
// collects all bits, must agree.
#include "apk/base64.h"

#include "fuzz/fuzz.h"
#include "fuzz/models.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  if (size == 0) return 0;
  const std::string text(reinterpret_cast<const char*>(data) + 1, size - 1);
  const std::optional<std::vector<uint8_t>> expected = ReadBase64(text);
  Require(Base64Decode(text) == (expected.value_or(std::vector<uint8_t>())),
          "both decoders return the same bytes");

  const size_t room = data[0] % 64;
  std::vector<uint8_t> out(room);
  size_t length = room;
  const int result = base64decode(text.data(), text.size(), out.data(), &length);
  Require(result == 0 || result == 1, "base64decode returns 0 or 1");
  if (result != 0) {
    Require(length == room, "a failure does not change the length");
    Require(!expected || expected->size() > room, "a refused text is not base64 or does not fit");
    return 0;
  }
  out.resize(length);
  Require(expected == out, "both decoders return the same bytes if they fit");
  return 0;
}
