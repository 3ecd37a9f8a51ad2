// The page's table of judgements on a file: that of the tool, and those of the phones' installer.
#pragma once

#include <kainjow/mustache.hpp>

#include "simulator/verdict/report.h"

namespace simulator {

// Sets the sections of the table. It is empty for a file that is not a package.
void AddJudgements(const Report& report, kainjow::mustache::data* file);

}  // namespace simulator
