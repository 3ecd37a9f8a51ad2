// sign/integrity.h: any texts in the integrity file. Each time the tool opens the integrity file,
// the file has the next text. The last text is a settled value (not ffffffff), so that every wait
// ends.
#include "sign/integrity.h"

#include <algorithm>
#include <string>

#include "fuzz/fuzz.h"
#include "support/phone.h"

namespace {

void CheckReading(const std::deque<std::string>& texts, uint32_t wait) {
  Phone phone;
  phone.integrity = texts;
  constexpr uint32_t kUntouched = 0x5a5a5a5a;
  uint32_t value = kUntouched;
  const uint32_t result = VeltTaskReadIntegrity(0, wait, &value);
  Require(result == 0 || result == kVeltFailure, "the result is 0 or kVeltFailure");
  Require(result != 0 || wait == 0 || value != 0xFFFFFFFF,
          "a waiting read returns a settled value");
  Require(result == 0 || wait != 0 || value == kUntouched,
          "a failed read without waiting keeps the value");
  Require(phone.events.size() <= 2 * texts.size(), "the tool reads each text at most once");
}

bool MaySign(const std::deque<std::string>& texts) {
  Phone phone;
  phone.integrity = texts;
  uint32_t value = 0;
  return VeltTaskReadIntegrity(0, 1, &value) == 0 && value != 0;
}

void CheckSigning(const std::deque<std::string>& texts) {
  const bool may_sign = MaySign(texts);
  Phone phone;
  phone.integrity = texts;
  const uint8_t payload[] = {0, 0};
  const bool told = VeltSignFd(0, payload) == 0;
  const bool is_signed =
      std::any_of(phone.events.begin(), phone.events.end(),
                  [](const std::string& event) { return event.rfind("sign ", 0) == 0; });
  Require(told == is_signed, "a file is signed if and only if success is reported");
  Require(told == may_sign, "a file is signed if and only if a settled value other than 0 is read");
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  FuzzedDataProvider input(data, size);
  std::deque<std::string> texts;
  while (input.remaining_bytes() > 0 && texts.size() < 8) {
    texts.push_back(input.ConsumeRandomLengthString(32));
  }
  texts.push_back("1f\n");
  CheckReading(texts, 0);
  CheckReading(texts, 1);
  CheckSigning(texts);
  return 0;
}
