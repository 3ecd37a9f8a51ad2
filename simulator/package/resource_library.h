// Questions of the simulator to the platform's resource library. Two generations of it are in
// use: the later one gives texts as views. Only this file sees the difference.
#pragma once

#include <cstddef>

namespace simulator {

// The bytes of the UTF-8 string `index` of `pool`, an android::ResStringPool; 0 if it cannot be
// read. The first is for the older generation, which alone takes the address of a length.
template <typename Pool>
auto StringLength(const Pool& pool, size_t index)
    -> decltype(pool.string8At(index, static_cast<size_t*>(nullptr)), size_t()) {
  size_t length = 0;
  return pool.string8At(index, &length) != nullptr ? length : 0;
}
template <typename Pool>
auto StringLength(const Pool& pool, size_t index) -> decltype(pool.string8At(index)->size()) {
  const auto text = pool.string8At(index);
  return text.has_value() ? text->size() : 0;
}

}  // namespace simulator
