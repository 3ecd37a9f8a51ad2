// The report of a package that was signed without any warning.
#pragma once

#include <string>

#include "simulator/verdict/report.h"

namespace simulator {

inline Report GoodReport(const std::string& file) {
  Report report;
  report.file = file;
  report.verdict = Verdict::kSigned;
  report.items = {{ItemKind::kPackage, "package", "", ItemState::kDone, {}}};
  return report;
}

}  // namespace simulator
