// How what the signature protects (Protection) is drawn: one bar, and what its parts are.
#pragma once

#include <cstdint>
#include <vector>

#include "simulator/verdict/report.h"

namespace simulator {

struct DrawnPart {
  const char* code;     // of its look
  const char* name;     // in the legend
  const char* meaning;  // what is to be known of it
  bool has_entries;     // else it is what lies between them
  Share share;
  double percent;  // of all bytes
  double start;    // where it is drawn, in percent of the bar's width
  double width;    // a little more than `percent` for what could hardly be seen; 0: nothing there
};

// From what the signature protects best to what lies between the entries. Empty when the file has
// no entries.
std::vector<DrawnPart> DrawBar(const Protection& protection, uint64_t file_size);

}  // namespace simulator
