// The stand-in for libzu, the closed process-authentication library. A build with the simulator
// links the tool against the stand-in in place of libzu.
#include "sign/libzu.h"

#include <string_view>

#include "simulator/phone/descriptors.h"
#include "simulator/phone/stand_in.h"

namespace simulator {

namespace {

// The result if no phone is simulated. A workstation has no service to register with.
constexpr int kNoService = -1;

}  // namespace

STAND_IN int ZuNewCertificate(int fd, const char* name, const unsigned char* data, size_t length) {
  if (ThisPhone().journal.empty()) return kNoService;
  const ErrnoKeeper keeper;
  const int result = ThisPhone().zu_result;
  const std::string_view bytes(reinterpret_cast<const char*>(data), length);
  Event event("register");
  event.Number("fd", fd).Text("path", PathOf(fd)).Text("name", name == nullptr ? "" : name);
  Record(event.Hex("data", data == nullptr ? "" : bytes).Number("result", result));
  return result;
}

}  // namespace simulator
