// Finds the function that a stand-in replaces. A stand-in is a library that answers in place of the
// phone. It is loaded before all other libraries, and passes on the calls that do not concern the
// phone.
#pragma once

#include <dlfcn.h>

namespace simulator {

// The next function `name` after this library in the order of loading. The process would call this
// function without the stand-in.
template <typename Function>
Function* NextFunction(const char* name) {
  return reinterpret_cast<Function*>(dlsym(RTLD_NEXT, name));
}

}  // namespace simulator
