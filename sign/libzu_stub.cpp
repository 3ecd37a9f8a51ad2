// libzu for a product without the closed library. It refuses every registration, and the tool logs
// each refusal.
#include "sign/libzu.h"

int ZuNewCertificate(int /*fd*/, const char* /*name*/, const unsigned char* /*data*/,
                     size_t /*length*/) {
  return -1;
}
