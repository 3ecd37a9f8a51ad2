// Appends little-endian numbers, which zip archives and compiled XML use.
#pragma once

#include <cstdint>

#include "support/der.h"

inline void Put16(Bytes& out, uint16_t value) {
  out.push_back(static_cast<uint8_t>(value & 0xff));
  out.push_back(static_cast<uint8_t>(value >> 8));
}

inline void Put32(Bytes& out, uint32_t value) {
  Put16(out, static_cast<uint16_t>(value & 0xffff));
  Put16(out, static_cast<uint16_t>(value >> 16));
}
