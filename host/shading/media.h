// SPDX-License-Identifier: Apache-2.0
/// The media that a ray is in.
#pragma once

#include <cstdint>

namespace zsi::host {

/// Nested media along a ray, innermost last. An instance's medium is entered where a ray goes
/// through its front and left where it goes through its back; media may end in another order than
/// they began (overlapping glass). Outside of all of them the index is 1.
class MediumStack {
public:
    float current() const { return count_ ? entries_[count_ - 1].ior : 1.0f; }

    /// The index that remains when the ray leaves `instance`.
    float without(std::uint32_t instance) const
    {
        if (count_ == 0 || entries_[count_ - 1].instance != instance)
            return current();
        return count_ > 1 ? entries_[count_ - 2].ior : 1.0f;
    }

    /// A full stack forgets its outermost medium.
    void enter(std::uint32_t instance, float ior)
    {
        if (count_ == kDepth)
            erase(0);
        entries_[count_++] = {instance, ior};
    }

    void leave(std::uint32_t instance)
    {
        for (int i = count_; i-- > 0;)
            if (entries_[i].instance == instance)
                return erase(i);
    }

private:
    static constexpr int kDepth = 8;
    struct Entry {
        std::uint32_t instance;
        float ior;
    };

    void erase(int at)
    {
        for (int i = at; i + 1 < count_; ++i)
            entries_[i] = entries_[i + 1];
        --count_;
    }

    Entry entries_[kDepth] = {};
    int count_ = 0;
};

} // namespace zsi::host
