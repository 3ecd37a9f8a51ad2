// Computes the parts of a bar that shows how much of the package the signature protects. Each part
// has an explanation.
#pragma once

#include <cstdint>
#include <vector>

#include "simulator/verdict/report.h"

namespace simulator {

struct DrawnPart {
  const char* code;     // the ID of its pattern in the page
  const char* name;     // its label in the page
  const char* meaning;  // an explanation
  bool has_entries;     // false for the bytes between the entries
  Share share;
  double percent;  // its bytes, in percent of the bytes of all parts
  double start;    // its left edge, in percent of the bar's width
  double width;    // in the same unit; large enough to be seen; 0: no bytes
};

// Returns the parts in the order of the bar, from the verified entries to the bytes between the
// entries. Returns no parts if `protection` counts no entries and has no missing names.
std::vector<DrawnPart> DrawBar(const Protection& protection, uint64_t file_size);

}  // namespace simulator
