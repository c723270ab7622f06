// The object text (file type 4) and the program it describes.
//
// Object text, one item a line ("\n" or "\r\n"):
//
//   tobj 1 <brick type> immediate|program|firmware [<firmware version>]
//   task <n>                  a routine begins: task n (0 is main) ...
//   sub <n>                   ... or subroutine n
//   cmd <hh> <hh> ...         one instruction, its code bytes in hexadecimal
//   cmd fw <aaaa> <hh> ...    firmware: bytes for address aaaa (hexadecimal)
//   end                       the routine ends
//
// Every command (an instruction or a firmware record) is one line with the word "cmd", and
// "cmd" occurs nowhere else, so counting "cmd" counts the commands to send. Immediate objects
// hold instructions outside any routine; program objects hold routines only; firmware objects
// hold "cmd fw" lines only and name the version the image installs (four decimal digits).
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace tessel::lang {

enum class ObjectKind { Immediate, Program, Firmware };
enum class RoutineKind { Task, Sub };

struct Routine {
    RoutineKind kind = RoutineKind::Task;
    int number = 0;                 // task 0 is main
    std::vector<std::uint8_t> code; // the instructions, back to back
    int commands = 0;               // instructions in code
};

struct FirmwareRecord {
    std::uint16_t address = 0;
    std::vector<std::uint8_t> data;
};

struct Program {
    ObjectKind kind = ObjectKind::Immediate;
    int brickType = 6;
    std::vector<Routine> routines;                    // program objects, in object order
    std::vector<std::vector<std::uint8_t>> immediate; // immediate objects: one per command
    std::vector<FirmwareRecord> firmware;             // firmware objects
    int firmwareVersion = 0;                          // firmware objects: 0 to 9999
    int commandCount = 0;                             // "cmd" lines

    const Routine* find(RoutineKind routineKind, int number) const;
};

struct ParseResult {
    std::int32_t code = 0;   // 0, or packed (compiler code 1 for malformed text)
    std::int32_t offset = 0; // of the fault in the text
    std::string detail;
};

// Reads object text. Checks the form, that every instruction decodes whole (Code.h) with its
// jumps landing on an instruction of the same routine, that no routine appears twice, and that
// routine numbers lie within the capacities of the object's brick type.
ParseResult ParseObject(std::string_view text, Program& out);

// Writes a program as object text (the inverse of ParseObject).
std::string WriteObject(const Program& program);

} // namespace tessel::lang
