// What is worth knowing of a file although it changes nothing for the kernel.
#pragma once

#include <string>
#include <vector>

#include "simulator/package/facts.h"
#include "simulator/verdict/report.h"

namespace simulator {

// `own` is the file's own item; what its reason says already is not said twice.
std::vector<Reason> FindWarnings(const PackageFacts& facts, const Item& own,
                                 const std::vector<std::string>& not_laid_out);

}  // namespace simulator
