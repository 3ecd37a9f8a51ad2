// The page's table for a file: the judgement of the tool, and the judgements of the phones'
// installer.
#pragma once

#include <kainjow/mustache.hpp>

#include "simulator/verdict/report.h"

namespace simulator {

// Sets the template's sections that make the table. The page has no table for the file if
// `report.chain` is empty and the installer's verifier was not asked about the file.
void AddJudgements(const Report& report, kainjow::mustache::data* file);

}  // namespace simulator
