// A run of the tool, taken apart: which error belongs to which file. Made from the journal's events
// and nothing else, but for what stands last in the record; texts of the tool's log are known here,
// and only here.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "simulator/run/events.h"

namespace simulator {

// One file that the tool took up, to have it signed.
struct Attempt {
  enum class Outcome {
    kBegun,  // and nothing came of it
    kSigned,
    kKernelRefused,
    kNotAsked,     // the tool may not sign: `integrity` tells
    kNotVerified,  // a library: `errors` tell
    kNotOpened,    // a library, after it was verified
  };

  std::string path;  // as log or kernel told; may be empty
  Outcome outcome = Outcome::kBegun;
  int64_t error = 0;                     // the kernel's errno, or that of opening
  std::string payload;                   // hexadecimal
  std::optional<std::string> integrity;  // the tool's own value, as it was read last; none: no file
  std::vector<std::string> errors;       // what was logged before, of this file
};

// Why a run tells nothing of the file.
struct Failure {
  enum class Kind {
    kNone,
    kNotStarted,
    kTimedOut,
    kStandInsMissing,
    kStateNotKept,
    kNotInstalled,
  };

  Kind kind = Kind::kNone;
  std::string detail;
};

struct RunRecord {
  Events events;  // all that happened, in order
  std::string file;
  std::string path;
  bool is_silent = true;  // the tool neither said nor did anything

  std::vector<std::string> opening_errors;  // before the first step
  bool is_dex_refused = false;
  std::vector<std::string> dex_errors;  // before it was
  std::vector<Attempt> libraries;       // in order
  std::optional<Attempt> own;           // the file itself, where the kernel was or should be asked
  std::optional<int64_t> verify_error;  // a plain JAR: 0, or why the kernel does not trust it
  bool is_jar = false;

  struct Registration {
    std::string name;
    int64_t result;
  };
  std::vector<Registration> registrations;
  bool is_key_refused_with_package = false;
  bool has_no_key_path = false;

  std::vector<std::string> other_errors;  // that belong to nothing of the above
  std::optional<int64_t> signal;          // that the tool was killed by
  int64_t status = 0;

  // What the simulator itself knows of the run.
  Failure failure;
  bool has_standard_input = true;         // the tool was started with one
  std::vector<std::string> not_laid_out;  // the files that --install left out
};

RunRecord TakeApart(const Events& events);

// What stands between the two texts in `line`; none when it is not of this form. An empty `after`
// stands for all the rest.
std::optional<std::string> Between(const std::string& line, const std::string& before,
                                   const std::string& after);

}  // namespace simulator
