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

// Of each file at most so many lines of a kind are shown. The rest are counted. If items are left
// out, the refused ones go first.
inline constexpr size_t kMostPageLines = 200;
// Of a text that came from a file at most so many bytes are shown, with "…" for the rest, before
// they are escaped.
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
