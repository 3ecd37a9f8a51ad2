// A run of the tool, taken apart: which error belongs to which file. Made from the journal's events
// and nothing else; texts of the tool's log are known here, and only here.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "simulator/run/events.h"

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

struct RunRecord {
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
};

RunRecord TakeApart(const Events& events);

// What stands between the two texts in `line`; none when it is not of this form. An empty `after`
// stands for all the rest.
std::optional<std::string> Between(const std::string& line, const std::string& before,
                                   const std::string& after);
