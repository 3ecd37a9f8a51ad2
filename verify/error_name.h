// The names of error numbers, such as "ENOKEY" for 126. The C library has a function for that, but
// not yet at API level 27. Nothing is kept, and the texts live as long as the process.
#pragma once

#include <string_view>

// The name of the error number `error`, which may be any number; "-" where it has none.
std::string_view ErrorName(int error);
