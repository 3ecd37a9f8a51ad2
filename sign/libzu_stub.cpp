// A libzu for a product that does not have the real libzu, which is not part of this project. It
// refuses every registration, and the tool logs each refusal.
#include "sign/libzu.h"

int ZuNewCertificate(int /*fd*/, const char* /*name*/, const unsigned char* /*data*/,
                     size_t /*length*/) {
  return -1;
}
