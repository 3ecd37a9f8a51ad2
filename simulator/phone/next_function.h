// Finds the function that a stand-in replaces. A stand-in is a library that answers in place of the
// phone. It is loaded before all other libraries, and passes on the calls that do not concern the
// phone.
#pragma once

#include <dlfcn.h>

namespace simulator {

// The first function `name` in the libraries that are loaded after the stand-in; null if none of
// them has this function. Without the stand-in, the process would call this function.
template <typename Function>
Function* NextFunction(const char* name) {
  return reinterpret_cast<Function*>(dlsym(RTLD_NEXT, name));
}

}  // namespace simulator
