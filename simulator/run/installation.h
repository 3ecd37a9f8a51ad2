// A package laid out as an installer does it: in a directory of its own, with its native libraries
// beside it. The directory is gone with this object.
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "simulator/run/process.h"

namespace simulator {

// Whose libraries are laid out.
enum class InstalledAbi {
  kPreferred,  // of 64-bit Arm, where the package has any; else of 32-bit Arm
  kAll,
  kArm64,
  kArm,
};

class Installation {
 public:
  Installation() = default;
  ~Installation();
  Installation(const Installation&) = delete;
  Installation& operator=(const Installation&) = delete;

  // Lays out the package at `file`. What is no archive, keeps its libraries, or has none to lay
  // out, stays where it is. None when that is done, else why it cannot be.
  std::optional<std::string> LayOut(const std::string& file, InstalledAbi abi,
                                    const Deadline& deadline);

  // Where the package lies now.
  const std::string& path() const { return path_; }
  // The library entries whose names an installer does not take, and those that it would take and
  // cannot extract.
  const std::vector<std::string>& left_out() const { return left_out_; }
  const std::vector<std::string>& not_extracted() const { return not_extracted_; }

 private:
  std::string directory_;
  std::string path_;
  std::vector<std::string> left_out_;
  std::vector<std::string> not_extracted_;
};

}  // namespace simulator
