// Calls to the platform's resource library. The library has two generations. The newer one returns
// texts as views. Only this file depends on the difference.
#pragma once

#include <cstddef>

namespace simulator {

// Returns the length, in bytes, of the UTF-8 string with the number `index` in `pool`. Returns 0 if
// this string cannot be read. `Pool` is android::ResStringPool. The first overload is for the older
// generation, whose string8At() has a parameter for the length.
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
