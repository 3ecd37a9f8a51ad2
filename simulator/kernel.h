// The kernel stand-in: a library that is loaded before all others and takes the place of those C
// library functions through which the tool meets the kernel's integrity feature. What does not
// concern that feature goes on to the function that was meant, unchanged.
#pragma once

#include <dlfcn.h>

#include "simulator/stand_in.h"

// The function `name` that the process would call without this library.
template <typename Function>
Function* Meant(const char* name) {
  return reinterpret_cast<Function*>(dlsym(RTLD_NEXT, name));
}
