// The packed codes this library answers with, one constant per fact, so that every entry point
// and the brick model agree on the numbers the client's catalogue and Trouble Shooter decode.
#pragma once

#include <cstdint>

namespace sim {

constexpr std::int32_t Pack(std::uint32_t severity, std::uint32_t facility, std::uint32_t module,
                            std::uint32_t code)
{
    return static_cast<std::int32_t>((severity << 30) | 0x20000000u | ((facility & 0xFFFu) << 16) |
                                     ((module & 63u) << 10) | (code & 0x3FFu));
}

constexpr std::int32_t Driver(std::uint32_t code)
{
    return Pack(3, 5, 1, code);
}
constexpr std::int32_t Compiler(std::uint32_t code)
{
    return Pack(3, 5, 2, code);
}
constexpr std::int32_t Tsl(std::uint32_t code)
{
    return Pack(3, 5, 3, code);
}

constexpr std::int32_t kOk = 0;

// Driver (facility 5, module 1).
constexpr std::int32_t kBadHandle = Driver(1);
constexpr std::int32_t kBrickNotAlive = Driver(2);
constexpr std::int32_t kBrickTypeMismatch = Driver(3);
constexpr std::int32_t kBadResult = Driver(9);
constexpr std::int32_t kDriverBusy = Driver(10);
constexpr std::int32_t kTowerNotAlive = Driver(11);
constexpr std::int32_t kNotInitialised = Driver(13);
constexpr std::int32_t kOutOfMemory = Driver(14);
constexpr std::int32_t kDownloadModeInactive = Driver(15);
constexpr std::int32_t kBadParameters = Driver(16);
constexpr std::int32_t kBrokenLink = Driver(17);
constexpr std::int32_t kLongRangeFailed = Driver(19);
constexpr std::int32_t kBadChecksum = Driver(21);
constexpr std::int32_t kNoTower = Driver(33);
constexpr std::int32_t kNoFirmware = Driver(34);
constexpr std::int32_t kUnlockFailed = Driver(35);
constexpr std::int32_t kLowBattery = Driver(36);
constexpr std::int32_t kNoMorePorts = Driver(68);
constexpr std::int32_t kComInUse = Driver(80);
constexpr std::int32_t kComConflict = Driver(81);
constexpr std::int32_t kComMissing = Driver(82);
constexpr std::int32_t kComSerialMouse = Driver(83);
constexpr std::int32_t kComHeld = Driver(84);
constexpr std::int32_t kUsbUnplugged = Driver(116);

// The library's own layer (facility 5, module 3).
constexpr std::int32_t kNItemNull = Tsl(81);
constexpr std::int32_t kNoMoreItems = Tsl(82);
constexpr std::int32_t kBadEnumType = Tsl(83);
constexpr std::int32_t kBadInfoId = Tsl(84);
constexpr std::int32_t kBadProperty = Tsl(97);
constexpr std::int32_t kCannotGet = Tsl(98);
constexpr std::int32_t kCannotSet = Tsl(99);
constexpr std::int32_t kNullParameter = Tsl(100);
constexpr std::int32_t kNullSource = Tsl(145);
constexpr std::int32_t kNullTarget = Tsl(146);
constexpr std::int32_t kBadSource = Tsl(147);
constexpr std::int32_t kBadSourceType = Tsl(148);
constexpr std::int32_t kBadTarget = Tsl(149);
constexpr std::int32_t kBadTargetType = Tsl(150);
constexpr std::int32_t kBadBrickType = Tsl(152);

// The communication stack (facility 256) and its USB port (512): whole values.
constexpr std::int32_t kWispMemoryOverflow = static_cast<std::int32_t>(0xE1000004u);
constexpr std::int32_t kWispNoDevices = static_cast<std::int32_t>(0xE1000104u);
constexpr std::int32_t kWispTimeout = static_cast<std::int32_t>(0xE1000105u);
constexpr std::int32_t kWispRetryExceeded = static_cast<std::int32_t>(0xE1000204u);
constexpr std::int32_t kWispStatsDisabled = static_cast<std::int32_t>(0xE1000206u);

// Status numbers of tslStatus; the client turns them into codes with its own table.
enum StatusNumber : std::int32_t {
    StatusDownloading = 0,
    StatusOk = 1,
    StatusInvalidHandle = 3,
    StatusNoTower = 4,
    StatusTowerNotAlive = 5,
    StatusBrickNotAlive = 6,
    StatusNoFirmware = 7,
    StatusLowBattery = 8,
    StatusTypeChanged = 9,
    StatusRetryExceeded = 11,
    StatusBusy = 12,
    StatusUnlockFailed = 14,
};

} // namespace sim
