// A temporary directory that holds a package with its native libraries beside it, as after an
// installation on a phone. "To lay out a package" means: to link or copy it into this directory,
// and to extract its libraries beside the link or the copy. The destructor removes the directory.
#pragma once

#include <optional>
#include <set>
#include <string>
#include <vector>

#include "simulator/run/process.h"

namespace simulator {

// The ABIs whose libraries are extracted.
enum class InstalledAbi {
  kPreferred,  // 64-bit Arm if the package has libraries for it, else 32-bit Arm
  kAll,
  kArm64,
  kArm,
};

// Which packages are laid out.
enum class InstallWhen {
  kAlone,   // packages beside which there are no libraries and no library directories of an
            // installer; but a package on a read-only file system is never laid out
  kAlways,  // all packages whose libraries an installer extracts
  kNever,
};

// The output shows this text instead of the installation's temporary directory, because the name of
// that directory differs in each run. In a journal, this text cannot be mistaken for the start of a
// path from the kernel, because such a path begins with "/".
inline constexpr char kInstalledDirectory[] = "<install>/";

class Installation {
 public:
  Installation() = default;
  ~Installation();
  Installation(const Installation&) = delete;
  Installation& operator=(const Installation&) = delete;

  // Lays out the package at `file`. Lays out nothing if the file cannot be opened or is not a
  // package. Also lays out nothing if the Android manifest keeps the libraries inside the package,
  // if the package has no libraries for `abi`, or if `when` excludes the package. None of these
  // cases is a failure. Returns the reason of a failure, else none.
  std::optional<std::string> LayOut(const std::string& file, InstallWhen when, InstalledAbi abi,
                                    const Deadline& deadline);

  // The path of the file for the tool: base.apk in the temporary directory, or `file` if is_done()
  // is false.
  const std::string& path() const { return path_; }
  // True if the package was laid out.
  bool is_done() const { return is_done_; }
  // The journal with kInstalledDirectory instead of the temporary directory. The paths in the
  // journal are then the same in each run.
  std::string WithStablePaths(const std::string& journal) const;
  // The entries of libraries that were not extracted, because they belong to an Arm ABI that was
  // not chosen.
  const std::set<std::string>& of_other_abis() const { return of_other_abis_; }
  // The library entries whose names no installer accepts.
  const std::vector<std::string>& left_out() const { return left_out_; }
  // The chosen library entries that cannot be extracted.
  const std::vector<std::string>& not_extracted() const { return not_extracted_; }

 private:
  std::string directory_;
  std::string path_;
  bool is_done_ = false;
  std::set<std::string> of_other_abis_;
  std::vector<std::string> left_out_;
  std::vector<std::string> not_extracted_;
};

}  // namespace simulator
