#include "support/expected_timeline.h"

#include <openssl/sha.h>

#include <nlohmann/json.hpp>

#include "support/package.h"

namespace {

using nlohmann::json;

std::string Line(const json& event) { return event.dump() + "\n"; }

}  // namespace

std::string Log(int priority, const std::string& text) {
  return Line({{"event", "log"}, {"priority", priority}, {"tag", "ApkToolkit"}, {"text", text}});
}

std::string Integrity(const std::string& text) {
  return Line({{"event", "integrity"}, {"pid", 0}, {"text", text}});
}

std::string IntegrityMissing() {
  return Line({{"event", "integrity"}, {"pid", 0}, {"text", nullptr}});
}

std::string Sign(int fd, const std::string& path, const Bytes& payload, int refusal) {
  return Line({{"event", "sign"},
               {"fd", fd},
               {"path", path},
               {"payload", Hex(payload)},
               {"result", refusal == 0 ? 0 : -1},
               {"errno", refusal}});
}

std::string Verify(int fd, const std::string& path, int refusal) {
  return Line({{"event", "verify"},
               {"fd", fd},
               {"path", path},
               {"result", refusal == 0 ? 0 : -1},
               {"errno", refusal}});
}

std::string Register(int fd, const std::string& path, const std::string& name, const Bytes& data,
                     int result) {
  return Line({{"event", "register"},
               {"fd", fd},
               {"path", path},
               {"name", name},
               {"data", Hex(data)},
               {"result", result}});
}

std::string StandardOutput(const std::string& text) {
  return Line({{"event", "stdout"}, {"text", text}});
}

std::string Exit(int status) { return Line({{"event", "exit"}, {"status", status}}); }

std::string Timeline(std::initializer_list<std::string> parts) {
  std::string timeline;
  for (const std::string& part : parts) timeline += part;
  return timeline;
}

Bytes PackagePayload(const std::string& key) {
  const Bytes modulus = ModulusOf(key);
  Bytes payload(2 + SHA256_DIGEST_LENGTH);
  payload[0] = SHA256_DIGEST_LENGTH;
  SHA256(modulus.data(), modulus.size(), payload.data() + 2);
  return payload;
}

std::string LibraryStep(std::initializer_list<std::string> libraries) {
  return Log(4, "VeltSignJni starts: 3.\n") + Timeline(libraries) +
         Log(4, "VeltSignJni finished: 0.\n");
}

std::string SignedLibrary(const std::string& path, const Bytes& payload) {
  return Log(4, "VeltSignOat: Apk case.\n") + Integrity("1f") + Sign(4, path, payload);
}

std::string PackageStep(const std::string& path, const Bytes& payload) {
  return Log(4, "VeltSign starts: zip_fd = 3, fd = 3.\n") + Log(4, "VeltSignOat: Apk case.\n") +
         Integrity("1f") + Sign(3, path, payload) + Log(4, "VeltSign finished: 0.\n");
}

std::string NothingSigned(const std::string& path) {
  return Timeline({Log(4, "VeltSignJni starts: 3.\n"),
                   Log(6, "VeltSignJni: malformed apk: " + path + "\n"),
                   Log(4, "VeltSign starts: zip_fd = 3, fd = 3.\n"),
                   Log(4, "VeltSignOat: Apk case.\n"), Log(4, "VeltSign finished: 65536.\n")});
}
