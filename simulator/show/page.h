// The page for a browser: one self-contained HTML document for all files of a run, without scripts
// and without anything from elsewhere. It says what the terminal says, in the same words, and
// shows which bytes of a package its signature protects. Whatever comes from a file is escaped, and
// there is only so much of it, be the file as large as it may.
#pragma once

#include <kainjow/mustache.hpp>
#include <string>
#include <string_view>
#include <vector>

#include "simulator/verdict/report.h"

namespace simulator {

// What each page begins with.
inline constexpr std::string_view kPageStart =
    "<!DOCTYPE html>\n<!-- A page of apktoolkit-sim -->\n";

// Of each file no more than so many lines of a kind are shown, and no more than so many bytes of
// any text that came from it. Lines that are left out are counted, and refusals go before the rest.
inline constexpr size_t kMostPageLines = 200;
inline constexpr size_t kMostPageText = 400;

// The page's template (page.mustache), which the build makes a part of the program.
extern const char kPageTemplate[];

class Page {
 public:
  // The next file, in the order of the command line.
  void Add(const Report& report);

  // The whole document, in UTF-8.
  std::string Html() const;

 private:
  kainjow::mustache::list files_;  // what the template shows of each
  std::vector<Verdict> verdicts_;
};

}  // namespace simulator
