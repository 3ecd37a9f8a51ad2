// Finds the function that a preloaded library replaces. A preloaded library, such as the stand-in
// for the kernel (kernel.cpp), is loaded before all libraries whose functions it replaces. It
// answers some calls itself, and passes all other calls on to the replaced function.
#pragma once

#include <dlfcn.h>

namespace simulator {

// The first function `name` in the libraries that are loaded after the calling library; null if
// none of them has this function. Without the calling library, the process would call the function
// that is returned here.
template <typename Function>
Function* NextFunction(const char* name) {
  return reinterpret_cast<Function*>(dlsym(RTLD_NEXT, name));
}

}  // namespace simulator
