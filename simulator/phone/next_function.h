// How a stand-in that is loaded before all other libraries hands on what does not concern it.
#pragma once

#include <dlfcn.h>

namespace simulator {

// The next function `name` behind this library in the order of loading: the one that the process
// would call without the stand-in.
template <typename Function>
Function* NextFunction(const char* name) {
  return reinterpret_cast<Function*>(dlsym(RTLD_NEXT, name));
}

}  // namespace simulator
