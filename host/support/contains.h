/**
 * Whether something is in a list.
 */
#ifndef VORNHOST_SUPPORT_CONTAINS_H
#define VORNHOST_SUPPORT_CONTAINS_H

#include <algorithm>
#include <iterator>

namespace vornhost {

template <typename List, typename Value>
bool Contains(const List& list, const Value& value)
{
    return std::find(std::begin(list), std::end(list), value) != std::end(list);
}

} // namespace vornhost

#endif
