// The page's template (page.mustache), which the build makes a part of the program.
#pragma once

namespace simulator {

extern const char kPageTemplate[];

}  // namespace simulator
