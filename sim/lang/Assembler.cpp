#include "Assembler.h"

#include <cctype>
#include <cstdio>
#include <string>
#include <unordered_map>
#include <vector>

#include "Capacities.h"
#include "Code.h"
#include "Failure.h"

namespace tessel::lang {
namespace {

struct Line {
    std::string_view text; // comment and surrounding blanks removed
    std::int32_t offset = 0;
};

// Next line of source without its comment (";" or "//"); false at the end.
bool NextLine(std::string_view source, std::size_t& pos, Line& line)
{
    if (pos >= source.size()) {
        return false;
    }
    std::size_t end = source.find('\n', pos);
    if (end == std::string_view::npos) {
        end = source.size();
    }
    std::string_view text = source.substr(pos, end - pos);
    line.offset = static_cast<std::int32_t>(pos);
    pos = end + 1;
    for (std::size_t i = 0; i < text.size(); ++i) {
        const auto c = static_cast<unsigned char>(text[i]);
        if (c == ';' || (c == '/' && i + 1 < text.size() && text[i + 1] == '/')) {
            text = text.substr(0, i);
            break;
        }
        if (c < 0x20 && c != '\t' && c != '\r') {
            char detail[32];
            std::snprintf(detail, sizeof detail, "illegal character 0x%02x", c);
            Fail(kSyntax, line.offset + static_cast<std::int32_t>(i), detail);
        }
        if (c >= 0x7F) {
            char detail[32];
            std::snprintf(detail, sizeof detail, "illegal character 0x%02x", c);
            Fail(kSyntax, line.offset + static_cast<std::int32_t>(i), detail);
        }
    }
    std::size_t lead = 0;
    while (lead < text.size() && (text[lead] == ' ' || text[lead] == '\t')) {
        ++lead;
    }
    line.offset += static_cast<std::int32_t>(lead);
    text.remove_prefix(lead);
    while (!text.empty() && (text.back() == ' ' || text.back() == '\t' || text.back() == '\r')) {
        text.remove_suffix(1);
    }
    line.text = text;
    return true;
}

std::string_view Trim(std::string_view text)
{
    while (!text.empty() && (text.front() == ' ' || text.front() == '\t')) {
        text.remove_prefix(1);
    }
    while (!text.empty() && (text.back() == ' ' || text.back() == '\t')) {
        text.remove_suffix(1);
    }
    return text;
}

// Decimal or 0x hexadecimal, optionally negative; false when it is not a number or is too long.
bool ParseNumber(std::string_view text, long& value)
{
    bool negative = false;
    if (!text.empty() && text[0] == '-') {
        negative = true;
        text.remove_prefix(1);
    }
    int base = 10;
    if (text.size() > 2 && text[0] == '0' && (text[1] == 'x' || text[1] == 'X')) {
        base = 16;
        text.remove_prefix(2);
    }
    if (text.empty() || text.size() > 6) {
        return false;
    }
    value = 0;
    for (char c : text) {
        int digit = -1;
        if (c >= '0' && c <= '9') {
            digit = c - '0';
        } else if (base == 16 && (c | 0x20) >= 'a' && (c | 0x20) <= 'f') {
            digit = (c | 0x20) - 'a' + 10;
        }
        if (digit < 0) {
            return false;
        }
        value = value * base + digit;
    }
    if (negative) {
        value = -value;
    }
    return true;
}

[[noreturn]] void OutOfRange(std::int32_t offset, std::string_view text)
{
    Fail(kOutOfRange, offset, text);
}

long NumberIn(std::string_view text, long low, long high, std::int32_t offset)
{
    long value = 0;
    if (!ParseNumber(text, value)) {
        Fail(kSyntax, offset, text);
    }
    if (value < low || value > high) {
        OutOfRange(offset, text);
    }
    return value;
}

Operand ParseValue(std::string_view text, bool destination, std::int32_t offset)
{
    static constexpr struct {
        std::string_view prefix;
        Source source;
        long low, high;
    } kPrefixes[] = {{"rnd", Source::Random, 1, 32767}, {"in", Source::Input, 0, 15},
                     {"v", Source::Variable, 0, 255},   {"l", Source::Local, 0, 15},
                     {"t", Source::Timer, 0, 7},        {"c", Source::Counter, 0, 7}};
    Operand operand;
    std::string_view number = text;
    if (!text.empty() && text[0] == '#') {
        number.remove_prefix(1);
        operand.source = Source::Constant;
    } else if (!text.empty() && std::isalpha(static_cast<unsigned char>(text[0]))) {
        bool found = false;
        for (const auto& p : kPrefixes) {
            if (text.substr(0, p.prefix.size()) == p.prefix && text.size() > p.prefix.size() &&
                std::isdigit(static_cast<unsigned char>(text[p.prefix.size()]))) {
                operand.source = p.source;
                operand.value = static_cast<std::int16_t>(
                    NumberIn(text.substr(p.prefix.size()), p.low, p.high, offset));
                found = true;
                break;
            }
        }
        if (!found) {
            Fail(kSyntax, offset, text);
        }
        if (destination && !IsWritable(operand.source)) {
            Fail(kWritableExpected, offset, text);
        }
        return operand;
    }
    operand.source = Source::Constant;
    operand.value = static_cast<std::int16_t>(NumberIn(number, -32768, 65535, offset));
    if (destination) {
        Fail(kWritableExpected, offset, text);
    }
    return operand;
}

int ParseRelation(std::string_view text, std::int32_t offset)
{
    static constexpr std::string_view kRelations[] = {"<", ">", "<=", ">=", "==", "!="};
    for (int r = 0; r < 6; ++r) {
        if (kRelations[r] == text) {
            return r;
        }
    }
    return static_cast<int>(NumberIn(text, 0, 5, offset));
}

class Builder {
public:
    Builder(int brickType, bool raw) : caps_(CapacitiesOf(brickType)), raw_(raw)
    {
        program_.brickType = brickType;
    }

    Program run(std::string_view source)
    {
        std::size_t pos = 0;
        Line line;
        while (NextLine(source, pos, line)) {
            if (!line.text.empty()) {
                this->line(line);
            }
        }
        if (routine_ != nullptr) {
            Fail(kSyntax, static_cast<std::int32_t>(source.size()), "end");
        }
        program_.kind = program_.routines.empty() ? ObjectKind::Immediate : ObjectKind::Program;
        program_.commandCount = 0;
        for (const Routine& r : program_.routines) {
            program_.commandCount += r.commands;
        }
        program_.commandCount += static_cast<int>(program_.immediate.size());
        return std::move(program_);
    }

private:
    void line(const Line& line)
    {
        std::string_view text = line.text;
        std::size_t space = 0;
        while (space < text.size() && text[space] != ' ' && text[space] != '\t') {
            ++space;
        }
        const std::string_view head = text.substr(0, space);
        const std::string_view rest = Trim(text.substr(space));
        if (head == "task" || head == "sub") {
            if (routine_ != nullptr || !program_.immediate.empty()) {
                Fail(kSyntax, line.offset, head);
            }
            const bool task = head == "task";
            long number = 0;
            if (!ParseNumber(rest, number)) {
                Fail(kSyntax, line.offset, rest.empty() ? head : rest);
            }
            if (number < 0 || number >= (task ? caps_.tasks : caps_.subroutines)) {
                Fail(task ? kNoMoreTasks : kNoMoreSubs, line.offset, rest);
            }
            const RoutineKind kind = task ? RoutineKind::Task : RoutineKind::Sub;
            if (program_.find(kind, static_cast<int>(number)) != nullptr) {
                Fail(kNameDeclared, line.offset, rest);
            }
            program_.routines.push_back(Routine{kind, static_cast<int>(number), {}, 0});
            routine_ = &program_.routines.back();
            labels_.clear();
            fixups_.clear();
            return;
        }
        if (head == "end" && rest.empty()) {
            if (routine_ == nullptr) {
                Fail(kSyntax, line.offset, head);
            }
            for (const Fixup& f : fixups_) {
                const auto found = labels_.find(f.label);
                if (found == labels_.end()) {
                    Fail(kNameNotDeclared, f.offset, f.label);
                }
                const int delta = found->second - f.end;
                if (delta < -32768 || delta > 32767) {
                    Fail(kParserStack, f.offset, f.label);
                }
                routine_->code[f.at] = static_cast<std::uint8_t>(delta & 0xFF);
                routine_->code[f.at + 1] = static_cast<std::uint8_t>((delta >> 8) & 0xFF);
            }
            routine_ = nullptr;
            return;
        }
        if (!raw_ && !head.empty() && head.back() == ':' && rest.empty()) {
            if (routine_ == nullptr) {
                Fail(kSyntax, line.offset, head);
            }
            const std::string label(head.substr(0, head.size() - 1));
            if (label.empty() ||
                !labels_.emplace(label, static_cast<int>(routine_->code.size())).second) {
                Fail(kNameDeclared, line.offset, head);
            }
            return;
        }
        std::vector<std::uint8_t> bytes = raw_ ? rawBytes(line) : instruction(line, head, rest);
        const OpInfo* info = FindOp(bytes[0]);
        if (routine_ == nullptr && info->mode == OpMode::P) {
            Fail(kProgramOnly, line.offset, info->mnemonic);
        }
        if (routine_ != nullptr && info->mode == OpMode::I) {
            Fail(kImmediateOnly, line.offset, info->mnemonic);
        }
        if (routine_ == nullptr) {
            if (!program_.routines.empty()) {
                Fail(kSyntax, line.offset, head);
            }
            program_.immediate.push_back(std::move(bytes));
            return;
        }
        if (routine_->code.size() > 32767) {
            Fail(kParserStack, line.offset, head);
        }
        routine_->code.insert(routine_->code.end(), bytes.begin(), bytes.end());
        ++routine_->commands;
    }

    std::vector<std::uint8_t> rawBytes(const Line& line)
    {
        std::vector<std::uint8_t> bytes;
        std::string_view text = line.text;
        std::size_t i = 0;
        while (i < text.size()) {
            while (i < text.size() && (text[i] == ' ' || text[i] == '\t' || text[i] == ',')) {
                ++i;
            }
            const std::size_t start = i;
            while (i < text.size() && text[i] != ' ' && text[i] != '\t' && text[i] != ',') {
                ++i;
            }
            if (i == start) {
                break;
            }
            std::string_view field = text.substr(start, i - start);
            const auto at = line.offset + static_cast<std::int32_t>(start);
            if (field.size() > 2 && field[0] == '0' && (field[1] == 'x' || field[1] == 'X')) {
                field.remove_prefix(2);
            }
            long value = 0;
            if (field.size() > 2 || !ParseNumber(std::string("0x").append(field), value)) {
                Fail(kSyntax, at, text.substr(start, i - start));
            }
            bytes.push_back(static_cast<std::uint8_t>(value));
        }
        Instruction in;
        if (bytes.empty() || !Decode(bytes.data(), bytes.size(), 0, in) ||
            static_cast<std::size_t>(in.size) != bytes.size()) {
            Fail(kSyntax, line.offset, text.substr(0, 16));
        }
        return bytes;
    }

    std::vector<std::uint8_t> instruction(const Line& line, std::string_view mnemonic,
                                          std::string_view rest)
    {
        const OpInfo* info = FindOp(mnemonic.data(), mnemonic.size());
        if (info == nullptr) {
            Fail(kSyntax, line.offset, mnemonic);
        }
        std::vector<std::string_view> operands;
        std::vector<std::int32_t> offsets;
        std::size_t start = 0;
        const std::int32_t restOffset =
            line.offset + static_cast<std::int32_t>(rest.data() - line.text.data());
        while (!rest.empty() && start <= rest.size()) {
            std::size_t comma = rest.find(',', start);
            if (comma == std::string_view::npos) {
                comma = rest.size();
            }
            operands.push_back(Trim(rest.substr(start, comma - start)));
            offsets.push_back(restOffset + static_cast<std::int32_t>(start));
            start = comma + 1;
        }
        if (operands.size() != std::char_traits<char>::length(info->operands)) {
            Fail(kSyntax, line.offset, mnemonic);
        }
        std::vector<std::uint8_t> bytes;
        bytes.push_back(static_cast<std::uint8_t>(info->op));
        std::size_t k = 0;
        for (const char* letter = info->operands; *letter != 0; ++letter, ++k) {
            const std::string_view text = operands[k];
            const std::int32_t at = offsets[k];
            if (text.empty()) {
                Fail(kSyntax, at, mnemonic);
            }
            switch (*letter) {
            case 'v':
            case 'd': {
                const Operand operand = ParseValue(text, *letter == 'd', at);
                bytes.push_back(static_cast<std::uint8_t>(operand.source));
                bytes.push_back(static_cast<std::uint8_t>(operand.value & 0xFF));
                bytes.push_back(static_cast<std::uint8_t>((operand.value >> 8) & 0xFF));
                break;
            }
            case 'w': {
                const long value = NumberIn(text, 0, 0xFFFF, at);
                bytes.push_back(static_cast<std::uint8_t>(value & 0xFF));
                bytes.push_back(static_cast<std::uint8_t>((value >> 8) & 0xFF));
                break;
            }
            case 'r':
                bytes.push_back(static_cast<std::uint8_t>(ParseRelation(text, at)));
                break;
            case 'j': {
                if (routine_ == nullptr) {
                    Fail(kProgramOnly, line.offset, mnemonic);
                }
                const std::size_t base = routine_->code.size();
                fixups_.push_back({base + bytes.size(), static_cast<int>(base + info->size),
                                   std::string(text), at});
                bytes.push_back(0);
                bytes.push_back(0);
                break;
            }
            default:
                bytes.push_back(static_cast<std::uint8_t>(NumberIn(text, 0, 255, at)));
                break;
            }
        }
        return bytes;
    }

    struct Fixup {
        std::size_t at;
        int end;
        std::string label;
        std::int32_t offset;
    };

    const Capacities& caps_;
    bool raw_;
    Program program_;
    Routine* routine_ = nullptr;
    std::unordered_map<std::string, int> labels_;
    std::vector<Fixup> fixups_;
};

} // namespace

Program Assemble(int brickType, std::string_view source)
{
    return Builder(brickType, false).run(source);
}

Program AssembleRaw(int brickType, std::string_view source)
{
    return Builder(brickType, true).run(source);
}

} // namespace tessel::lang
