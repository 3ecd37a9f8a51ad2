// A package laid out as an installer does it: in a directory of its own, with its native libraries
// beside it. The directory is gone with this object.
#pragma once

#include <optional>
#include <set>
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

// Which packages are laid out.
enum class InstallWhen {
  kAlone,   // those that have library entries, and none of the places where the tool looks for
            // them is there; not on a read-only file system
  kAlways,  // all
  kNever,
};

// The output has this in place of the directory of an installation, whose name differs in each run.
// A path of the kernel's begins with "/", so that none of a file begins like this.
inline constexpr char kInstalledDirectory[] = "<install>/";

class Installation {
 public:
  Installation() = default;
  ~Installation();
  Installation(const Installation&) = delete;
  Installation& operator=(const Installation&) = delete;

  // Lays out the package at `file`. A file that is not a package, keeps its libraries, or has none
  // to lay out, stays where it is; so does one that does not lie alone, where `when` asks for that.
  // None when that is done, else why it cannot be.
  std::optional<std::string> LayOut(const std::string& file, InstallWhen when, InstalledAbi abi,
                                    const Deadline& deadline);

  // Where the package lies now.
  const std::string& path() const { return path_; }
  // It was laid out, and does not lie where it was.
  bool is_done() const { return is_done_; }
  // A journal with kInstalledDirectory in place of this installation's own: so that it is the same
  // in each run.
  std::string WithStablePaths(const std::string& journal) const;
  // The library entries of processors that were not asked for.
  const std::set<std::string>& of_other_processors() const { return of_other_processors_; }
  // The library entries whose names an installer does not take, and those that it would take and
  // cannot extract.
  const std::vector<std::string>& left_out() const { return left_out_; }
  const std::vector<std::string>& not_extracted() const { return not_extracted_; }

 private:
  std::string directory_;
  std::string path_;
  bool is_done_ = false;
  std::set<std::string> of_other_processors_;
  std::vector<std::string> left_out_;
  std::vector<std::string> not_extracted_;
};

}  // namespace simulator
