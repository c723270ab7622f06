#include "Listing.h"

#include <cstdio>
#include <unordered_set>

#include "Code.h"

namespace tessel::lang {
namespace {

void Append(std::string& out, const char* format, int a, int b = 0)
{
    char buffer[48];
    std::snprintf(buffer, sizeof buffer, format, a, b);
    out += buffer;
}

int NameOf(const std::vector<int>& table, int index)
{
    return index >= 0 && static_cast<std::size_t>(index) < table.size()
               ? table[static_cast<std::size_t>(index)]
               : 0;
}

void WriteBlock(std::string& out, const char* name, const char* kind, int number,
                const std::uint8_t* code, std::size_t size, const ListingInfo& info,
                const ListingInfo::Block* block)
{
    out += "303,";
    out += name;
    out += ',';
    out += kind;
    Append(out, ",%d\r\n", number);

    // Jump targets first, so that a 307 record can precede the command it lands on.
    std::unordered_set<std::size_t> targets;
    Instruction in;
    for (std::size_t at = 0; at < size && Decode(code, size, at, in); at += in.size) {
        const char* letters = in.info->operands;
        for (int p = 0; *letters != 0; ++letters) {
            if (*letters == 'v' || *letters == 'd') {
                continue;
            }
            if (*letters == 'j') {
                targets.insert(at + in.size + static_cast<std::size_t>(in.plain[p]));
            }
            ++p;
        }
    }

    std::size_t index = 0;
    for (std::size_t at = 0; at < size; at += in.size, ++index) {
        if (!Decode(code, size, at, in)) {
            break; // validated code never gets here; a listing shows what decodes
        }
        if (block != nullptr && index < block->sourceOffsets.size()) {
            Append(out, "107,%d\r\n", block->sourceOffsets[index]);
        }
        if (targets.count(at) != 0) {
            Append(out, "307,%d\r\n", static_cast<int>(at));
        }
        if (in.valueCount == 0) {
            Append(out, "%d,", static_cast<int>(in.info->op));
        } else {
            out += in.valueCount == 1 ? "231" : "233";
            for (int v = 0; v < in.valueCount && v < 2; ++v) {
                const Operand& operand = in.values[v];
                int named = 0;
                if (operand.source == Source::Variable) {
                    named = NameOf(info.globals, operand.value);
                } else if (operand.source == Source::Timer) {
                    named = NameOf(info.timers, operand.value);
                } else if (operand.source == Source::Counter) {
                    named = NameOf(info.counters, operand.value);
                } else if (operand.source == Source::Local && block != nullptr) {
                    named = NameOf(block->locals, operand.value);
                }
                if (named > 0) {
                    Append(out, ",99,%d", named);
                } else {
                    Append(out, ",%d,%d", static_cast<int>(operand.source), operand.value);
                }
            }
            out += ',';
        }
        out += in.info->mnemonic;
        const char* letters = in.info->operands;
        for (int p = 0; *letters != 0; ++letters) {
            if (*letters == 'v' || *letters == 'd') {
                continue;
            }
            const int value =
                *letters == 'j' ? static_cast<int>(at + in.size) + in.plain[p] : in.plain[p];
            Append(out, ",%d", value);
            ++p;
        }
        out += "\r\n";
    }
    out += "407\r\n";
}

} // namespace

std::string WriteListing(const Program& program, const ListingInfo& info)
{
    std::string out;
    const bool immediate = program.kind != ObjectKind::Program;
    out += "250,";
    out += immediate ? "immediate" : "main";
    out += ',';
    out += info.programName;
    out += "\r\n";
    for (const ListingInfo::Name& name : info.names) {
        Append(out, "251,%d,", name.kind);
        out += name.name;
        out += "\r\n";
    }
    if (immediate) {
        std::vector<std::uint8_t> code;
        for (const auto& command : program.immediate) {
            code.insert(code.end(), command.begin(), command.end());
        }
        WriteBlock(out, "immediate", "immediate", 0, code.data(), code.size(), info,
                   info.blocks.empty() ? nullptr : &info.blocks[0]);
        return out;
    }
    for (std::size_t r = 0; r < program.routines.size(); ++r) {
        const Routine& routine = program.routines[r];
        const ListingInfo::Block* block = r < info.blocks.size() ? &info.blocks[r] : nullptr;
        std::string fallback;
        if (block == nullptr || block->name.empty()) {
            char buffer[24];
            std::snprintf(buffer, sizeof buffer, "%s%d",
                          routine.kind == RoutineKind::Task ? "task" : "sub", routine.number);
            fallback = routine.kind == RoutineKind::Task && routine.number == 0 ? "main" : buffer;
        }
        WriteBlock(out, fallback.empty() ? block->name.c_str() : fallback.c_str(),
                   routine.kind == RoutineKind::Task ? "task" : "sub", routine.number,
                   routine.code.data(), routine.code.size(), info, block);
    }
    return out;
}

} // namespace tessel::lang
