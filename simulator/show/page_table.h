// The page's table of files, the worst first. The reader can choose which files the table shows. If
// all files have a common directory other than "/", only the table's caption shows this directory.
#pragma once

#include <kainjow/mustache.hpp>
#include <string>
#include <vector>

#include "simulator/verdict/report.h"

namespace simulator {

class PageTable {
 public:
  // Adds the next file, in the order of the command line.
  void Add(const Report& report);

  // Sets the sections of the table: the directory, the choices and the rows.
  void Fill(kainjow::mustache::data* page) const;

 private:
  struct Row {
    size_t number;  // of the file, from 1
    std::string file;
    Verdict verdict;
    std::string reason;
    size_t warnings;
    std::string package_name;
    std::string signer;
  };

  kainjow::mustache::list Choices() const;
  std::vector<const Row*> WorstFirst() const;

  std::vector<Row> rows_;
};

// The deepest directory that all these paths begin with, with its "/" at the end. Empty if this
// directory is "/", or if the paths have no common directory.
std::string CommonDirectory(const std::vector<std::string>& files);

}  // namespace simulator
