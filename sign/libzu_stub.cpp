// A stub of libzu, for systems without the real libzu. The real libzu is not part of this project.
// The stub refuses every registration, and the tool logs each refusal.
#include "sign/libzu.h"

int ZuNewCertificate(int /*fd*/, const char* /*name*/, const unsigned char* /*data*/,
                     size_t /*length*/) {
  return -1;
}
