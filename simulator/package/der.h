// Taking DER apart with the platform's crypto library, whose reader never leaves its bytes.
#pragma once

#include <openssl/bytestring.h>

#include <string>
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

// An object identifier's contents as numbers between dots; empty when they are none.
std::string OidText(const CBS& contents);

// The name, as the JDK has it, of a signature algorithm whose AlgorithmIdentifier has these
// contents, such as "SHA256withRSA"; of another, the object identifier.
std::string SignatureAlgorithmName(CBS algorithm);

// The name of a digest algorithm, such as "SHA-256"; of another, the object identifier.
std::string DigestName(CBS algorithm);

}  // namespace simulator
