#pragma once
// The median of a small window: a binary search tree over a fixed pool of
// nodes, where an equal value raises the count of its node instead of taking a
// new one. Nothing is allocated; clear() empties the tree for the next window.
// Defined here so that the filter's inner loop can inline it.

#include <cstdint>

namespace prep {

class MedianTree {
public:
    static constexpr int kCapacity = 100; // values per window, repeats included

    void clear() {
        nodeCount_ = 0;
        valueCount_ = 0;
    }
    // At most kCapacity values between two clear() calls; more are ignored.
    void insert(float value);
    // (a + b) * 0.5 of the values at the sorted positions (N + 1) / 2 and
    // N / 2 + 1 (1-based): the middle value, or the mean of the middle two.
    // 0 for an empty tree.
    float median() const;
    int valueCount() const { return valueCount_; }

private:
    static constexpr std::int8_t kNone = -1;
    struct Node {
        float value;
        std::int8_t count;
        std::int8_t child[2]; // smaller values, then larger ones
    };
    Node nodes_[kCapacity];
    int nodeCount_ = 0;
    int valueCount_ = 0;
};

inline void MedianTree::insert(float value) {
    if (valueCount_ >= kCapacity)
        return;
    ++valueCount_;
    if (nodeCount_ == 0) {
        nodes_[0] = {value, 1, {kNone, kNone}};
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
        // The side as an index rather than a branch: the values of a noisy
        // window go either way at random. A NaN compares unequal and not less:
        // it goes right and gets a node of its own.
        std::int8_t& link = node.child[!(value < node.value)];
        if (link == kNone) {
            link = static_cast<std::int8_t>(nodeCount_);
            nodes_[nodeCount_++] = {value, 1, {kNone, kNone}};
            return;
        }
        index = link;
    }
}

inline float MedianTree::median() const {
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
            index = nodes_[index].child[0];
        }
        const Node& node = nodes_[stack[--depth]];
        const int before = seen;
        seen += node.count;
        if (before < lowPosition && seen >= lowPosition)
            low = node.value;
        if (seen >= highPosition)
            return (low + node.value) * 0.5f;
        index = node.child[1];
    }
    return low;
}

} // namespace prep
