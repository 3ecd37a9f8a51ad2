// Computes a bar that shows how much of the package the signature protects (Protection), with an
// explanation of each part of the bar.
#pragma once

#include <cstdint>
#include <vector>

#include "simulator/verdict/report.h"

namespace simulator {

struct DrawnPart {
  const char* code;     // the ID of its pattern in the page
  const char* name;     // in the legend
  const char* meaning;  // an explanation
  bool has_entries;     // false for the bytes between the entries
  Share share;
  double percent;  // of all bytes
  double start;    // where it is drawn, in percent of the bar's width
  double width;    // in the same unit; large enough to be seen; 0: no bytes
};

// Returns the parts in the order of the bar, from the verified entries to the bytes between the
// entries. Empty if the file has no entries.
std::vector<DrawnPart> DrawBar(const Protection& protection, uint64_t file_size);

}  // namespace simulator
