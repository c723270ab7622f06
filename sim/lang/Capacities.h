// What each brick type can hold, one row per brick type 0 to 7. The library answers tslInfo
// from this table and the compiler refuses programs that do not fit it, so the two can never
// disagree.
#pragma once

#include <cstdint>

namespace tessel::lang {

struct Capacities {
    bool supported;            // a brick type that scripts can be translated for
    std::int16_t tasks;        // id 1, main included
    std::int16_t subroutines;  // id 2
    std::int16_t programSlots; // id 3
    std::int16_t globals;      // id 4, temporaries of expressions and repeat loops included
    std::int16_t locals;       // id 5, per task
    std::int16_t outputs;      // id 6
    std::int16_t inputs;       // id 7
    std::int16_t nesting;      // id 8: subroutine calls deep; 1 means subs call no subs
    std::int16_t timers;       // id 11
    std::int16_t counters;     // id 13
    std::int16_t events;       // id 14
    std::int16_t semaphores;   // id 15
    std::int16_t memory;       // id 18: bytes of program memory over all slots
};

// Indexed by brick type: 0 none, 1 unknown, 2 Helmsman, 3 Onyx without firmware, 4 Onyx,
// 5 Rover, 6 Onyx2, 7 MiniRover. A brick without firmware keeps its hardware's figures.
inline constexpr Capacities kCapacities[8] = {
    {false, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0},
    {false, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0},
    {true, 6, 3, 1, 10, 8, 2, 2, 2, 1, 1, 15, 0, 1024},
    {true, 10, 8, 5, 32, 0, 3, 3, 1, 4, 0, 0, 0, 6000},
    {true, 10, 8, 5, 32, 0, 3, 3, 1, 4, 0, 0, 0, 6000},
    {true, 6, 3, 1, 16, 0, 3, 3, 1, 1, 0, 8, 0, 1500},
    {true, 10, 8, 5, 32, 16, 3, 3, 1, 4, 3, 16, 4, 6000},
    {true, 4, 2, 1, 8, 0, 2, 2, 1, 1, 0, 4, 0, 1024},
};

// The row of a brick type; types outside 0 to 7 get the row of type 0.
inline const Capacities& CapacitiesOf(int brickType)
{
    return brickType >= 0 && brickType < 8 ? kCapacities[brickType] : kCapacities[0];
}

// One tslInfo figure; false for an id that names no figure (the library answers code 84).
inline bool InfoFigure(int brickType, int infoId, std::int16_t& value)
{
    const Capacities& c = CapacitiesOf(brickType);
    switch (infoId) {
    case 1:
        value = c.tasks;
        return true;
    case 2:
        value = c.subroutines;
        return true;
    case 3:
        value = c.programSlots;
        return true;
    case 4:
        value = c.globals;
        return true;
    case 5:
        value = c.locals;
        return true;
    case 6:
        value = c.outputs;
        return true;
    case 7:
        value = c.inputs;
        return true;
    case 8:
        value = c.nesting;
        return true;
    case 11:
        value = c.timers;
        return true;
    case 13:
        value = c.counters;
        return true;
    case 14:
        value = c.events;
        return true;
    case 15:
        value = c.semaphores;
        return true;
    case 18:
        value = c.memory;
        return true;
    default:
        return false;
    }
}

} // namespace tessel::lang
