#include "simulator/phone/settings.h"

#include <cstdlib>

#include "simulator/phone/text.h"

namespace simulator {

namespace {

constexpr char kJournal[] = "APKTOOLKIT_SIM_JOURNAL";       // a path
constexpr char kIntegrity[] = "APKTOOLKIT_SIM_INTEGRITY";   // texts, separated by commas
constexpr char kTrust[] = "APKTOOLKIT_SIM_TRUST";           // DEVICE:INODE, separated by commas
constexpr char kSignErrno[] = "APKTOOLKIT_SIM_SIGN_ERRNO";  // decimal, like the next two
constexpr char kVerifyErrno[] = "APKTOOLKIT_SIM_VERIFY_ERRNO";
constexpr char kZuResult[] = "APKTOOLKIT_SIM_ZU_RESULT";

int Number(const char* name, int otherwise);
FileId ParseFileId(const std::string& text);
std::string Assignment(const char* name, const std::string& value);

}  // namespace

PhoneSettings SettingsFromEnvironment() {
  PhoneSettings phone;
  if (const char* path = getenv(kJournal)) phone.journal = path;
  if (const char* texts = getenv(kIntegrity)) phone.integrity = Split(texts, ',');
  if (const char* ids = getenv(kTrust)) {
    for (const std::string& id : Split(ids, ',')) phone.trusted.push_back(ParseFileId(id));
  }
  phone.sign_errno = Number(kSignErrno, phone.sign_errno);
  phone.verify_errno = Number(kVerifyErrno, phone.verify_errno);
  phone.zu_result = Number(kZuResult, phone.zu_result);
  return phone;
}

std::vector<std::string> SettingsToEnvironment(const PhoneSettings& phone) {
  std::string integrity;
  for (const std::string& text : phone.integrity) {
    integrity += (&text == phone.integrity.data() ? "" : ",") + text;
  }
  std::string trust;
  for (const FileId& id : phone.trusted) {
    trust +=
        (trust.empty() ? "" : ",") + std::to_string(id.device) + ":" + std::to_string(id.inode);
  }
  return {Assignment(kJournal, phone.journal),
          Assignment(kIntegrity, integrity),
          Assignment(kTrust, trust),
          Assignment(kSignErrno, std::to_string(phone.sign_errno)),
          Assignment(kVerifyErrno, std::to_string(phone.verify_errno)),
          Assignment(kZuResult, std::to_string(phone.zu_result))};
}

namespace {

int Number(const char* name, int otherwise) {
  const char* text = getenv(name);
  return text == nullptr ? otherwise : static_cast<int>(strtol(text, nullptr, 10));
}

// If the text has no inode number, the result has inode 0, which no file has.
FileId ParseFileId(const std::string& text) {
  const size_t colon = text.find(':');
  if (colon == std::string::npos) return {0, 0};
  return {static_cast<dev_t>(strtoull(text.c_str(), nullptr, 10)),
          static_cast<ino_t>(strtoull(text.c_str() + colon + 1, nullptr, 10))};
}

std::string Assignment(const char* name, const std::string& value) {
  return std::string(name) + "=" + value;
}

}  // namespace

}  // namespace simulator
