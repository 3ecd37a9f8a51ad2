// apk/base64.h: decodes any text with Base64Decode. Also decodes the text with base64decode into a
// buffer of 0 to 63 bytes. Both results must agree with ReadBase64 (fuzz/models.h). base64decode
// must refuse a text whose bytes do not fit into the buffer.
#include "apk/base64.h"

#include "fuzz/fuzz.h"
#include "fuzz/models.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  if (size == 0) return 0;
  const std::string text(reinterpret_cast<const char*>(data) + 1, size - 1);
  const std::optional<std::vector<uint8_t>> expected = ReadBase64(text);
  Require(Base64Decode(text) == (expected.value_or(std::vector<uint8_t>())),
          "Base64Decode returns the bytes of ReadBase64, or none for a refused text");

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
  Require(expected == out, "an accepted text is base64 and has the bytes of ReadBase64");
  return 0;
}
