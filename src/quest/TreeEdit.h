#pragma once
// The two editing rules every list of the quest tree follows (levels, scenes, objects,
// areas, group states, contour points).
#include <algorithm>
#include <iterator>

namespace qe {

// Puts `node` directly behind `after`; at the front (the top of the picture) when `after`
// is null or not in the list.
template <class List, class Node>
void InsertBehind(List& list, typename List::value_type node, const Node* after)
{
    auto found = after ? std::find_if(list.begin(), list.end(), [after](const auto& p) { return p.get() == after; })
                       : list.end();
    list.insert(found == list.end() ? list.begin() : std::next(found), std::move(node));
}

// Erases every element that is `node`. The list's own reference is held until the walk is
// over, so the node outlives its removal.
template <class List, class Node>
void RemoveEvery(List& list, const Node& node)
{
    auto match = [&node](const auto& p) { return p.get() == &node; };
    auto found = std::find_if(list.begin(), list.end(), match);
    if (found == list.end())
        return;
    typename List::value_type hold = *found;
    std::erase_if(list, match);
}

} // namespace qe
