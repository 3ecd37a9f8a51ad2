// The page's template (page.mustache), which the build makes a part of the program.
#pragma once

extern const char kPageTemplate[];
