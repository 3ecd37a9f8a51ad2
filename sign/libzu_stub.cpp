// libzu for a product without the closed library: every registration is refused, and the tool's log
// says so.
#include "sign/libzu.h"

int ZuNewCertificate(int /*fd*/, const char* /*name*/, const unsigned char* /*data*/,
                     size_t /*length*/) {
  return -1;
}
