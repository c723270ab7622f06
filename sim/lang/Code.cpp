#include "Code.h"

#include <cstring>

namespace tessel::lang {
namespace {

constexpr int SizeOf(const char* operands)
{
    int size = 1;
    for (const char* p = operands; *p != 0; ++p) {
        switch (*p) {
        case 'v':
        case 'd':
            size += 3;
            break;
        case 'w':
        case 'j':
            size += 2;
            break;
        default:
            size += 1;
            break;
        }
    }
    return size;
}

constexpr OpInfo kOps[] = {
#define TSL_OPCODE(name, byte, mnemonic, operands, mode)                                           \
    {Op::name, mnemonic, operands, OpMode::mode, SizeOf(operands)},
#include "Opcodes.def"
#undef TSL_OPCODE
};

// Byte to row, built once at compile time; opcodes are below 0x60.
struct ByteIndex {
    signed char row[256];
    constexpr ByteIndex() : row()
    {
        for (int i = 0; i < 256; ++i) {
            row[i] = -1;
        }
        for (int i = 0; i < static_cast<int>(sizeof(kOps) / sizeof(kOps[0])); ++i) {
            row[static_cast<std::uint8_t>(kOps[i].op)] = static_cast<signed char>(i);
        }
    }
};
constexpr ByteIndex kIndex;

} // namespace

const OpInfo* FindOp(std::uint8_t byte)
{
    const int row = kIndex.row[byte];
    return row < 0 ? nullptr : &kOps[row];
}

const OpInfo* FindOp(const char* mnemonic, std::size_t length)
{
    for (const OpInfo& info : kOps) {
        if (std::strlen(info.mnemonic) == length &&
            std::memcmp(info.mnemonic, mnemonic, length) == 0) {
            return &info;
        }
    }
    return nullptr;
}

bool IsValidSource(std::uint8_t source)
{
    switch (static_cast<Source>(source)) {
    case Source::Variable:
    case Source::Timer:
    case Source::Constant:
    case Source::Local:
    case Source::Random:
    case Source::Counter:
    case Source::Input:
        return true;
    }
    return false;
}

bool IsWritable(Source source)
{
    return source == Source::Variable || source == Source::Timer || source == Source::Local ||
           source == Source::Counter;
}

bool Decode(const std::uint8_t* code, std::size_t size, std::size_t offset, Instruction& out)
{
    out = Instruction{};
    if (code == nullptr || offset >= size) {
        return false;
    }
    const OpInfo* info = FindOp(code[offset]);
    if (info == nullptr || size - offset < static_cast<std::size_t>(info->size)) {
        return false;
    }
    std::size_t at = offset + 1;
    for (const char* p = info->operands; *p != 0; ++p) {
        switch (*p) {
        case 'v':
        case 'd': {
            if (!IsValidSource(code[at])) {
                return false;
            }
            Operand& operand = out.values[out.valueCount++];
            operand.source = static_cast<Source>(code[at]);
            operand.value = static_cast<std::int16_t>(code[at + 1] | (code[at + 2] << 8));
            if (*p == 'd' && !IsWritable(operand.source)) {
                return false;
            }
            at += 3;
            break;
        }
        case 'w':
            out.plain[out.plainCount++] = code[at] | (code[at + 1] << 8);
            at += 2;
            break;
        case 'j':
            out.plain[out.plainCount++] = static_cast<std::int16_t>(code[at] | (code[at + 1] << 8));
            at += 2;
            break;
        case 'r':
            if (code[at] > static_cast<std::uint8_t>(Relation::NotEqual)) {
                return false;
            }
            out.plain[out.plainCount++] = code[at];
            at += 1;
            break;
        default:
            out.plain[out.plainCount++] = code[at];
            at += 1;
            break;
        }
    }
    out.info = info;
    out.size = info->size;
    return true;
}

} // namespace tessel::lang
