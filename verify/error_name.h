// The names of error numbers, such as "ENOKEY" for 126. The C library of API level 27 has no
// function that returns these names. ErrorName() keeps no state, and its texts live as long as the
// process.
#pragma once

#include <string_view>

// The name of `error`, which may be any number; "-" if the number has no name.
std::string_view ErrorName(int error);
