// The brick's program memory map as "get map" reports it: 94 unsigned 16-bit addresses.
#pragma once

#include <cstdint>

namespace tools {

struct BrickMemoryMap {
    static constexpr int kSlots = 5;
    static constexpr int kSubsPerSlot = 8;
    static constexpr int kTasksPerSlot = 10;

    // Words 0 to 39: subroutine starts, slot 1 subroutines 1 to 8, then slot 2, ...
    static constexpr int kFirstSub = 0;
    // Words 40 to 89: task starts, slot 1 tasks 1 to 10, then slot 2, ... Word 40 also
    // closes the last subroutine of slot 5.
    static constexpr int kFirstTask = kFirstSub + kSlots * kSubsPerSlot;
    // The first address after the last task, closing task 10 of slot 5.
    static constexpr int kTasksEnd = kFirstTask + kSlots * kTasksPerSlot;
    // Read with the others; nothing uses it.
    static constexpr int kUnused = kTasksEnd + 1;
    static constexpr int kFreeStart = kTasksEnd + 2;
    static constexpr int kFreeEnd = kTasksEnd + 3;
    static constexpr int kWordCount = kTasksEnd + 4;

    // Index of a subroutine's or task's start word; slot and index are 1-based and must
    // have been checked by the caller.
    static constexpr int SubIndex(int slot, int sub) { return kSubsPerSlot * (slot - 1) + sub - 1; }
    static constexpr int TaskIndex(int slot, int task)
    {
        return kFirstTask + kTasksPerSlot * (slot - 1) + task - 1;
    }

    // The size of the block starting at word k: the next word minus it (16-bit arithmetic).
    std::uint16_t SizeAt(int k) const
    {
        return static_cast<std::uint16_t>(words[k + 1] - words[k]);
    }

    std::uint16_t words[kWordCount] = {};
};

static_assert(BrickMemoryMap::kWordCount == 94);

} // namespace tools
