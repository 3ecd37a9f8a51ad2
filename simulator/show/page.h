// The page for a browser: one self-contained HTML document for all files of a run. It has no
// scripts and loads nothing. It names a verdict with the same words as the output on a terminal. It
// also shows which bytes of a package are protected by the signature. All texts from a file are
// escaped. The length and the number of these texts are limited.
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

// The beginning of each page.
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

  // Adds the next file, in the order of the command line.
  void Add(const Report& report);

  // The whole document, in UTF-8. `unseen` is set if the run was interrupted, and is the number of
  // files that the run did not reach.
  std::string Html(std::optional<size_t> unseen = {}) const;

 private:
  PageRun run_;
  PageTable table_;
  kainjow::mustache::list files_;  // the fields of the template for each file
  std::vector<Verdict> verdicts_;
};

}  // namespace simulator
