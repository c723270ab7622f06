// What a simulated installation looks like: the ports with their towers and the bricks behind
// them, link timing and injected faults. Read from the file named by TESSEL_SIM, or built in.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace sim {

struct BrickSpec {
    std::string name;
    std::int16_t type = 6;       // brick type number 0..7
    bool alive = true;           // false: switched off or out of reach
    bool firmware = true;        // firmware present in RAM
    bool unlockFails = false;    // the firmware never starts ("boot firmware" fails)
    std::int32_t battery = 8200; // millivolts; below kLowBatteryMillivolts the brick refuses work
    std::int32_t memory = -1;    // program memory in bytes; -1: the brick type's capacity
    std::int32_t rom = 301;      // ROM version, four decimal digits
    std::int32_t firmwareVersion = 309;
    std::vector<std::int32_t> messages; // sent to the host when reception is switched on
};

enum class PortState { Ok, InUse, Conflict, Missing, SerialMouse };
enum class TowerState { Present, None, Dead };

struct PortSpec {
    std::string name;
    bool usb = false;
    PortState state = PortState::Ok;
    TowerState tower = TowerState::Present;
    bool longRange = false;        // USB towers only
    bool longRangeFails = false;   // it claims the long range, but setting it fails
    std::int32_t unplugAfter = -1; // USB: unplugged after this many packets; -1 never
    std::int32_t loss = 0;         // percent of packets lost on the infrared link
    bool statistics = true;        // false: the tower refuses to collect statistics
    std::string brick;             // name of the brick in front of the tower; "" none
};

constexpr std::int32_t kLowBatteryMillivolts = 6500;

struct Scenario {
    std::vector<PortSpec> ports;
    std::vector<BrickSpec> bricks;
    std::int32_t linkMillisPerCommand = 15; // 0: no simulated transmission time
    std::uint32_t seed = 1;                 // for the lost packets of a lossy link
    std::string source;                     // where it came from, for the trace
    std::string problem;                    // why a file was not used, or ""

    // A USB tower "KIVOTOWER1" (long range) and a serial tower on "COM1" with one Onyx2 with
    // firmware in front of both.
    static Scenario BuiltIn();

    // Parses scenario text; false with a message naming the line when it is malformed.
    static bool Parse(const std::string& text, Scenario& out, std::string& error);

    // The file named by TESSEL_SIM, else the built-in one. A file that cannot be read or parsed
    // gives the built-in scenario with `problem` saying why.
    static Scenario Load();

    const BrickSpec* findBrick(const std::string& name) const;
};

} // namespace sim
