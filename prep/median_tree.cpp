#include "prep/median_tree.h"

namespace prep {

void MedianTree::insert(float value) {
    if (valueCount_ >= kCapacity)
        return;  // cannot happen with windows of up to 10 x 10
    ++valueCount_;
    if (nodeCount_ == 0) {
        nodes_[0] = {value, 1, kNone, kNone};
        nodeCount_ = 1;
        return;
    }
    int index = 0;
    for (;;) {
        Node& node = nodes_[index];
        if (value == node.value) {
            ++node.count;
            return;
        }
        // A NaN compares unequal and not less: it goes right and gets a node of its own.
        std::int8_t& link = value < node.value ? node.left : node.right;
        if (link == kNone) {
            link = static_cast<std::int8_t>(nodeCount_);
            nodes_[nodeCount_++] = {value, 1, kNone, kNone};
            return;
        }
        index = link;
    }
}

float MedianTree::median() const {
    if (valueCount_ == 0)
        return 0.0f;
    const int lowPosition = (valueCount_ + 1) / 2;
    const int highPosition = valueCount_ / 2 + 1;
    float low = 0.0f;
    // In-order walk with an explicit stack: the tree is at most kCapacity deep.
    std::int8_t stack[kCapacity];
    int depth = 0;
    int seen = 0;
    std::int8_t index = 0;
    while (index != kNone || depth > 0) {
        while (index != kNone) {
            stack[depth++] = index;
            index = nodes_[index].left;
        }
        const Node& node = nodes_[stack[--depth]];
        const int before = seen;
        seen += node.count;
        if (before < lowPosition && seen >= lowPosition)
            low = node.value;
        if (seen >= highPosition)
            return (low + node.value) * 0.5f;
        index = node.right;
    }
    return low;
}

} // namespace prep
