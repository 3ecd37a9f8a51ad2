// Converts untrusted bytes to a CBS, libcrypto's reader, and a CBS back to bytes. A CBS never reads
// beyond the end of its bytes.
#pragma once

#include <openssl/bytestring.h>

#include <string_view>

namespace simulator {

inline CBS ToCbs(std::string_view bytes) {
  CBS cbs;
  CBS_init(&cbs, reinterpret_cast<const uint8_t*>(bytes.data()), bytes.size());
  return cbs;
}

inline std::string_view ToView(const CBS& cbs) {
  return {reinterpret_cast<const char*>(CBS_data(&cbs)), CBS_len(&cbs)};
}

}  // namespace simulator
