// The brick's code bytes: opcodes (from Opcodes.def), operand sources, relations, and the
// one decoder that the interpreter, the object validator and the listing writer share.
#pragma once

#include <cstddef>
#include <cstdint>

namespace tessel::lang {

enum class Op : std::uint8_t {
#define TSL_OPCODE(name, byte, mnemonic, operands, mode) name = byte,
#include "Opcodes.def"
#undef TSL_OPCODE
};

// Where a value operand takes its value from.
enum class Source : std::uint8_t {
    Variable = 0, // global variable, value = index
    Timer = 1,    // timer, value = index; reads 1/10 s since its reset
    Constant = 2, // the value itself (signed 16-bit)
    Local = 3,    // variable of the running task, value = index
    Random = 4,   // a random number from 0 to value
    Counter = 5,  // counter, value = index
    Input = 9,    // input port, value = index (0-based)
};

// Only in CSV listings: an operand naming the value-th declared name (record 251).
inline constexpr int kListingNameSource = 99;

enum class Relation : std::uint8_t {
    Less = 0,
    Greater = 1,
    LessEqual = 2,
    GreaterEqual = 3,
    Equal = 4,
    NotEqual = 5,
};

enum class OpMode : std::uint8_t { A, P, I }; // anywhere, program only, immediate only

struct OpInfo {
    Op op;
    const char* mnemonic;
    const char* operands; // letters of Opcodes.def
    OpMode mode;
    int size; // encoded bytes, opcode included
};

// The row of an opcode byte, or null for a byte that is no opcode.
const OpInfo* FindOp(std::uint8_t byte);
// The row of a mnemonic (exact, lower case), or null.
const OpInfo* FindOp(const char* mnemonic, std::size_t length);

bool IsWritable(Source source);
bool IsValidSource(std::uint8_t source);

struct Operand {
    Source source = Source::Constant;
    std::int16_t value = 0;
};

// One decoded instruction. Values in the order of the operand letters.
struct Instruction {
    const OpInfo* info = nullptr;
    Operand values[4]; // v and d letters, in order
    int valueCount = 0;
    std::int32_t plain[4]; // b, w, r and j letters, in order (j as signed offset)
    int plainCount = 0;
    int size = 0; // bytes taken
};

// Decodes the instruction at code[offset]; false when the byte is no opcode, the instruction
// runs past size, or an operand source is unknown.
bool Decode(const std::uint8_t* code, std::size_t size, std::size_t offset, Instruction& out);

} // namespace tessel::lang
