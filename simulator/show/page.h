// The page for a browser: one self-contained HTML document for all files of a run, without scripts
// and without anything from elsewhere. It says what the terminal says, in the same words, and
// shows which bytes of a package its signature protects. Whatever comes from a file is escaped, and
// there is only so much of it, be the file as large as it may.
#pragma once

#include <ctime>
#include <kainjow/mustache.hpp>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "simulator/show/page_fields.h"
#include "simulator/show/page_table.h"
#include "simulator/verdict/report.h"

namespace simulator {

// What each page begins with.
inline constexpr std::string_view kPageStart =
    "<!DOCTYPE html>\n<!-- A page of apktoolkit-sim -->\n";

// The page's template (page.mustache), which the build makes a part of the program.
extern const char kPageTemplate[];

// The facts of the whole run.
struct PageRun {
  std::time_t begun = 0;  // when it began
  std::string tool;       // the program that --tool names; empty: the tool of this version
};

class Page {
 public:
  explicit Page(PageRun run) : run_(std::move(run)) {}

  // The next file, in the order of the command line.
  void Add(const Report& report);

  // The whole document, in UTF-8. `unseen` is set if the run was interrupted, and counts the files
  // that it did not come to.
  std::string Html(std::optional<size_t> unseen = {}) const;

 private:
  PageRun run_;
  PageTable table_;
  kainjow::mustache::list files_;  // what the template shows of each
  std::vector<Verdict> verdicts_;
};

}  // namespace simulator
