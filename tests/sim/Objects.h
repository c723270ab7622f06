// Object text for the simulated brick, written by hand so that these tests do not depend on the
// translator: one "cmd" line per instruction, bytes in hexadecimal (see sim/lang/Program.h).
#pragma once

#include <cstdint>
#include <cstdio>
#include <string>

namespace simtest {

inline std::string Immediate(const std::string& commands, int brickType = 6)
{
    return "tobj 1 " + std::to_string(brickType) + " immediate\n" + commands;
}

inline std::string Sound(int sound)
{
    char line[32];
    std::snprintf(line, sizeof line, "cmd 20 %02x\n", sound & 0xFF);
    return line;
}

inline std::string Get(std::uint16_t address, int count)
{
    char line[64];
    std::snprintf(line, sizeof line, "cmd 33 %02x %02x %02x %02x\n", address & 0xFF, address >> 8,
                  count & 0xFF, count >> 8);
    return line;
}

inline const char* kGetMap = "cmd 34\n";
inline const char* kVersion = "cmd 32\n";
inline const char* kAlive = "cmd 35\n";
inline const char* kBootRom = "cmd 36\n";
inline const char* kBootFirmware = "cmd 37\n";
inline const char* kClearTasks = "cmd 30\n";
inline const char* kStartMain = "cmd 14 00\n";

inline std::string SelectSlot(int slot)
{
    char line[32];
    std::snprintf(line, sizeof line, "cmd 39 %02x\n", slot);
    return line;
}

// main sends message `message` and ends: 4 + 1 bytes, two commands.
inline std::string MessageProgram(int message, int brickType = 6)
{
    char text[160];
    std::snprintf(text, sizeof text, "tobj 1 %d program\ntask 0\ncmd 27 02 %02x 00\ncmd 17\nend\n",
                  brickType, message);
    return text;
}

// A program of `commands` sound commands in main (2 bytes each) plus its end.
inline std::string SoundProgram(int commands, int brickType = 6)
{
    std::string text = "tobj 1 " + std::to_string(brickType) + " program\ntask 0\n";
    for (int i = 0; i < commands; ++i) {
        text += "cmd 20 01\n";
    }
    return text + "cmd 17\nend\n";
}

inline std::string Firmware(int version, int records)
{
    char header[64];
    std::snprintf(header, sizeof header, "tobj 1 6 firmware %04d\n", version);
    std::string text = header;
    for (int i = 0; i < records; ++i) {
        char line[64];
        std::snprintf(line, sizeof line, "cmd fw %04x 01 02 03 04\n", 0x1000 + 4 * i);
        text += line;
    }
    return text;
}

} // namespace simtest
