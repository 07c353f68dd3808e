#pragma once
// The median of a small window: a binary search tree over a fixed pool of
// nodes, where an equal value raises the count of its node instead of taking a
// new one. Nothing is allocated; clear() empties the tree for the next window.

#include <cstdint>

namespace prep {

class MedianTree {
public:
    static constexpr int kCapacity = 100;  // values per window, repeats included

    void clear() {
        nodeCount_ = 0;
        valueCount_ = 0;
    }
    // At most kCapacity values between two clear() calls.
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
        std::int8_t left;
        std::int8_t right;
    };
    Node nodes_[kCapacity];
    int nodeCount_ = 0;
    int valueCount_ = 0;
};

} // namespace prep
