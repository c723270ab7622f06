// The CSV listing (file type 7): the translated code as records "<number>,<fields>", one a
// line ended by "\r\n".
//
//   250,<entry block>,<program>  the block to show first ("main"; "immediate" for commands)
//   251,<kind>,<name>            a declared name, numbered 1, 2, 3 ... in record order;
//                                kind 0 variable, 1 local, 2 timer, 3 counter
//   303,<block>,<task|sub|immediate>,<number>   a block begins
//   107,<offset>                 the source offset of the next command
//   307,<offset>                 a jump lands on the next command (code offset in the block)
//   231,<s>,<v>,<mnemonic>[,<plain operands>]          a command with one value operand
//   233,<s1>,<v1>,<s2>,<v2>,<mnemonic>[,<plain operands>]  a command with two
//   <opcode>,<mnemonic>[,<plain operands>]              a command without value operands,
//                                                       under its opcode byte in decimal
//   407                          the block ends
//
// A value operand is written as its source and value, except that an operand naming a
// declared name is written as source 99 with the name's number. Jump operands are written as
// the code offset they land on.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "Program.h"

namespace tessel::lang {

struct ListingInfo {
    std::string programName;
    struct Name {
        int kind = 0;
        std::string name;
    };
    std::vector<Name> names;                    // record 251, in order
    std::vector<int> globals, timers, counters; // index -> name number (0: unnamed)
    struct Block {
        std::string name;
        std::vector<int> locals;                 // local index -> name number
        std::vector<std::int32_t> sourceOffsets; // per command, in code order
    };
    std::vector<Block> blocks; // one per routine, or one for immediate commands
};

// info may carry fewer blocks than the program has routines (sources without names).
std::string WriteListing(const Program& program, const ListingInfo& info);

} // namespace tessel::lang
