// Brick queries: the brick library has no entry point for reading a brick's version,
// settings or memory, so each is a one-line script ("brick version?", "get map",
// "get 0x%x,1") translated and executed on the open brick, its answer taken from the
// execution's result number or from the text of its result file.
//
// Every operation takes the brick handle first and returns a packed code, negative on
// failure. Argument errors are reported without contacting the brick. Failed queries
// leave the outputs at their presets (0xFFFF for Tx power and free memory, 0 otherwise),
// and so do short answers, which are not failures.
#pragma once

#include <cstddef>
#include <cstdint>

#include "tessel/TesselApi.h"
#include "tools/BrickMemoryMap.h"

class ReaderWriter;

namespace tools {

class BrickAccess;

// ErrorValue(3, 5, 1, 100): an argument out of range or a missing output.
inline constexpr std::uint32_t kArgumentError = 0xE0050464u;

// Command texts and brick addresses of the queries.
inline constexpr const char* kVersionCommand = "brick version?";
inline constexpr const char* kMapCommand = "get map";
inline constexpr const char* kGetByteCommand = "get 0x%x,1";
inline constexpr const char* kGetWordCommand = "get 0x%x,2";
inline constexpr const char* kReadMemoryCommand = "get 0x%x,%d";
inline constexpr std::uint16_t kTxPowerAddress = 0xC8B0;
inline constexpr std::uint16_t kPowerDownAddress = 0xC8BE;
inline constexpr std::uint16_t kProgramSlotAddress = 0xC924;
inline constexpr std::uint16_t kTaskByteBase = 0xC8E3; // plus 10 times slot plus task
// A Rover keeps its program table in memory: two little-endian words at each address.
inline constexpr std::uint16_t kRoverTaskBase = 0x238; // plus the task number
inline constexpr std::uint16_t kRoverSubBase = 0x232;  // plus the subroutine number
inline constexpr std::uint16_t kRoverFreeMemory = 0x245;
inline constexpr int kRoverTasks = 6;
inline constexpr int kRoverSubs = 3;
// One memory read asks for at most this many bytes.
inline constexpr int kMemoryChunk = 128;
// "%04d.%04d", terminator included, for the largest digits a version answer can hold.
inline constexpr std::size_t kVersionTextSize = 16;

class BrickQueries {
public:
    explicit BrickQueries(BrickAccess& access) : access_(access) {}

    // rom and firmware from the eight digit bytes of "brick version?", text "%04d.%04d"
    // cut to textSize. Any output may be null; text is emptied first.
    tessel::Long GetBrickVersion(tessel::Long hBrick, tessel::Long* rom, tessel::Long* firmware,
                                 char* text, std::size_t textSize);
    tessel::Long GetTxPower(tessel::Long hBrick, std::uint16_t* value);
    tessel::Long GetPowerDownTime(tessel::Long hBrick, std::uint16_t* minutes);
    // 1-based.
    tessel::Long GetProgramSlot(tessel::Long hBrick, std::uint16_t* slot);
    tessel::Long GetTaskByte(tessel::Long hBrick, int slot, int task, std::uint16_t* value);
    tessel::Long GetMemoryMap(tessel::Long hBrick, BrickMemoryMap* map);
    tessel::Long GetFreeMemory(tessel::Long hBrick, const BrickMemoryMap& map,
                               std::uint16_t* bytes);
    // start and size are set to 0 once the arguments are accepted.
    tessel::Long GetTaskLocation(tessel::Long hBrick, const BrickMemoryMap& map, tessel::Short slot,
                                 tessel::Short task, std::uint16_t* start, std::uint16_t* size);
    tessel::Long GetSubLocation(tessel::Long hBrick, const BrickMemoryMap& map, tessel::Short slot,
                                tessel::Short sub, std::uint16_t* start, std::uint16_t* size);
    // The execution's result file goes to the caller, who releases it (also on failure).
    tessel::Long ReadMemory(tessel::Long hBrick, std::uint16_t address, int count,
                            ReaderWriter** resultFile);
    // A new file of its own (not the result working file, which each execution empties)
    // holding the range's bytes as one comma-separated list, read in chunks of at most
    // kMemoryChunk bytes; the range stops at the top of the address space and a length below
    // 1 is empty. The file goes to the caller, who releases it. Returns the code of
    // the last chunk read (success for an empty range); a failed chunk ends the walk.
    tessel::Long ReadMemoryRange(tessel::Long hBrick, std::uint16_t start, std::int32_t length,
                                 ReaderWriter** file);

private:
    tessel::Long BrickType(tessel::Long hBrick, tessel::Short* type);
    tessel::Long RunForNumber(tessel::Long hBrick, const char* format, std::uint16_t address,
                              tessel::Long* result);
    // RunForNumber whose answer, converted, lands in *value; *value is left as it was
    // when the query fails.
    tessel::Long RunForWord(tessel::Long hBrick, const char* format, std::uint16_t address,
                            std::uint16_t* value, tessel::Long (*convert)(tessel::Long));
    // What tells tasks and subroutines apart when locating one.
    struct PartKind {
        bool (*isArgument)(int slot, int number);
        int roverCount;
        std::uint16_t roverBase;
        int (*index)(int slot, int number);
    };
    tessel::Long PartLocation(const PartKind& kind, tessel::Long hBrick, const BrickMemoryMap& map,
                              tessel::Short slot, tessel::Short number, std::uint16_t* start,
                              std::uint16_t* size);
    tessel::Long TranslateAndRun(tessel::Long hBrick, tessel::Short brickType, const char* text,
                                 tessel::Long* result, ReaderWriter** resultFile);
    // ReadMemory of 4 bytes as two little-endian words; false when fewer came back.
    tessel::Long ReadRoverPair(tessel::Long hBrick, std::uint16_t address, std::uint16_t* first,
                               std::uint16_t* second, bool* complete);
    tessel::Long RoverLocation(tessel::Long hBrick, std::uint16_t address, std::uint16_t* start,
                               std::uint16_t* size);

    BrickAccess& access_;
};

// Releases *handle when both pointers are set and stores what release() returns.
void ReleaseHandle(ReaderWriter** handle);

} // namespace tools
