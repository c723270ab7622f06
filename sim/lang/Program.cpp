#include "Program.h"

#include <cstdio>

#include "Capacities.h"
#include "Code.h"
#include "Status.h"

namespace tessel::lang {
namespace {

bool IsBlank(char c)
{
    return c == ' ' || c == '\t' || c == '\r';
}

int HexDigit(char c)
{
    if (c >= '0' && c <= '9') {
        return c - '0';
    }
    if (c >= 'a' && c <= 'f') {
        return c - 'a' + 10;
    }
    if (c >= 'A' && c <= 'F') {
        return c - 'A' + 10;
    }
    return -1;
}

// Splits one line into words; offsets are kept for error positions.
struct Word {
    std::string_view text;
    std::size_t offset = 0;
};

class LineReader {
public:
    explicit LineReader(std::string_view text) : text_(text) {}

    // Next line that holds a word; false at the end.
    bool next(std::vector<Word>& words, std::size_t& lineOffset)
    {
        while (pos_ < text_.size()) {
            lineOffset = pos_;
            std::size_t end = text_.find('\n', pos_);
            if (end == std::string_view::npos) {
                end = text_.size();
            }
            words.clear();
            std::size_t i = pos_;
            while (i < end) {
                while (i < end && IsBlank(text_[i])) {
                    ++i;
                }
                const std::size_t start = i;
                while (i < end && !IsBlank(text_[i])) {
                    ++i;
                }
                if (i > start) {
                    words.push_back({text_.substr(start, i - start), start});
                }
            }
            pos_ = end + 1;
            if (!words.empty()) {
                return true;
            }
        }
        return false;
    }

private:
    std::string_view text_;
    std::size_t pos_ = 0;
};

bool ParseDecimal(std::string_view text, int& value)
{
    if (text.empty() || text.size() > 6) {
        return false;
    }
    value = 0;
    for (char c : text) {
        if (c < '0' || c > '9') {
            return false;
        }
        value = value * 10 + (c - '0');
    }
    return true;
}

bool ParseHex(std::string_view text, int maxDigits, int& value)
{
    if (text.size() > 2 && text[0] == '0' && (text[1] == 'x' || text[1] == 'X')) {
        text.remove_prefix(2);
    }
    if (text.empty() || static_cast<int>(text.size()) > maxDigits) {
        return false;
    }
    value = 0;
    for (char c : text) {
        const int digit = HexDigit(c);
        if (digit < 0) {
            return false;
        }
        value = value * 16 + digit;
    }
    return true;
}

ParseResult Fail(std::size_t offset, std::string_view detail, std::uint32_t code = kSyntax)
{
    ParseResult result;
    result.code = CompilerError(code);
    result.offset = static_cast<std::int32_t>(offset);
    result.detail.assign(detail.substr(0, 200));
    return result;
}

// Checks that code decodes whole and that every jump lands on an instruction start (or the
// end). Returns the offset into code of the first fault, or -1.
long CheckCode(const std::vector<std::uint8_t>& code, bool immediate, std::uint32_t& why)
{
    std::vector<bool> starts(code.size() + 1, false);
    std::vector<std::size_t> targets;
    std::size_t at = 0;
    Instruction in;
    while (at < code.size()) {
        if (!Decode(code.data(), code.size(), at, in)) {
            why = kSyntax;
            return static_cast<long>(at);
        }
        const OpMode mode = in.info->mode;
        if (immediate ? mode == OpMode::P : mode == OpMode::I) {
            why = immediate ? kProgramOnly : kImmediateOnly;
            return static_cast<long>(at);
        }
        starts[at] = true;
        const char* letters = in.info->operands;
        int plain = 0;
        for (const char* p = letters; *p != 0; ++p) {
            if (*p == 'v' || *p == 'd') {
                continue;
            }
            if (*p == 'j') {
                const long target = static_cast<long>(at + in.size) + in.plain[plain];
                if (target < 0 || target > static_cast<long>(code.size())) {
                    why = kSyntax;
                    return static_cast<long>(at);
                }
                targets.push_back(static_cast<std::size_t>(target));
            }
            ++plain;
        }
        at += in.size;
    }
    starts[code.size()] = true;
    for (std::size_t target : targets) {
        if (!starts[target]) {
            why = kSyntax;
            return static_cast<long>(target);
        }
    }
    return -1;
}

} // namespace

const Routine* Program::find(RoutineKind routineKind, int number) const
{
    for (const Routine& routine : routines) {
        if (routine.kind == routineKind && routine.number == number) {
            return &routine;
        }
    }
    return nullptr;
}

ParseResult ParseObject(std::string_view text, Program& out)
{
    out = Program{};
    LineReader reader(text);
    std::vector<Word> words;
    std::size_t lineOffset = 0;
    if (!reader.next(words, lineOffset)) {
        return Fail(0, "empty object");
    }
    if (words.size() < 4 || words[0].text != "tobj" || words[1].text != "1") {
        return Fail(words[0].offset, words[0].text);
    }
    int brickType = 0;
    if (!ParseDecimal(words[2].text, brickType) || brickType > 7) {
        return Fail(words[2].offset, words[2].text);
    }
    out.brickType = brickType;
    const Capacities& caps = CapacitiesOf(brickType);
    if (!caps.supported) {
        return Fail(words[2].offset, words[2].text, kBadTarget);
    }
    if (words[3].text == "immediate" && words.size() == 4) {
        out.kind = ObjectKind::Immediate;
    } else if (words[3].text == "program" && words.size() == 4) {
        out.kind = ObjectKind::Program;
    } else if (words[3].text == "firmware" && words.size() == 5 &&
               ParseDecimal(words[4].text, out.firmwareVersion) && out.firmwareVersion <= 9999) {
        out.kind = ObjectKind::Firmware;
    } else {
        return Fail(words[3].offset, words[3].text);
    }

    Routine* open = nullptr;
    std::size_t openOffset = 0;
    while (reader.next(words, lineOffset)) {
        const std::string_view head = words[0].text;
        if (head == "task" || head == "sub") {
            int number = 0;
            const bool isTask = head == "task";
            if (out.kind != ObjectKind::Program || open != nullptr || words.size() != 2) {
                return Fail(words[0].offset, head);
            }
            if (!ParseDecimal(words[1].text, number) ||
                number >= (isTask ? caps.tasks : caps.subroutines)) {
                return Fail(words[1].offset, words[1].text, isTask ? kNoMoreTasks : kNoMoreSubs);
            }
            const RoutineKind kind = isTask ? RoutineKind::Task : RoutineKind::Sub;
            if (out.find(kind, number) != nullptr) {
                return Fail(words[0].offset, words[1].text, kNameDeclared);
            }
            out.routines.push_back(Routine{kind, number, {}, 0});
            open = &out.routines.back();
            openOffset = words[0].offset;
        } else if (head == "end") {
            if (open == nullptr || words.size() != 1) {
                return Fail(words[0].offset, head);
            }
            std::uint32_t why = 0;
            const long fault = CheckCode(open->code, false, why);
            if (fault >= 0) {
                return Fail(openOffset, "bad code", why);
            }
            open = nullptr;
        } else if (head == "cmd") {
            ++out.commandCount;
            if (out.kind == ObjectKind::Firmware) {
                int address = 0;
                if (words.size() < 3 || words[1].text != "fw" ||
                    !ParseHex(words[2].text, 4, address)) {
                    return Fail(words[0].offset, words.size() > 1 ? words[1].text : head);
                }
                FirmwareRecord record;
                record.address = static_cast<std::uint16_t>(address);
                for (std::size_t i = 3; i < words.size(); ++i) {
                    int byte = 0;
                    if (!ParseHex(words[i].text, 2, byte)) {
                        return Fail(words[i].offset, words[i].text);
                    }
                    record.data.push_back(static_cast<std::uint8_t>(byte));
                }
                out.firmware.push_back(std::move(record));
                continue;
            }
            if (words.size() < 2) {
                return Fail(words[0].offset, head);
            }
            std::vector<std::uint8_t> bytes;
            bytes.reserve(words.size() - 1);
            for (std::size_t i = 1; i < words.size(); ++i) {
                int byte = 0;
                if (!ParseHex(words[i].text, 2, byte)) {
                    return Fail(words[i].offset, words[i].text);
                }
                bytes.push_back(static_cast<std::uint8_t>(byte));
            }
            Instruction in;
            if (!Decode(bytes.data(), bytes.size(), 0, in) ||
                static_cast<std::size_t>(in.size) != bytes.size()) {
                return Fail(words[1].offset, words[1].text);
            }
            if (out.kind == ObjectKind::Immediate) {
                std::uint32_t why = 0;
                if (CheckCode(bytes, true, why) >= 0) {
                    return Fail(words[1].offset, in.info->mnemonic, why);
                }
                out.immediate.push_back(std::move(bytes));
            } else {
                if (open == nullptr) {
                    return Fail(words[0].offset, head);
                }
                open->code.insert(open->code.end(), bytes.begin(), bytes.end());
                ++open->commands;
            }
        } else {
            return Fail(words[0].offset, head);
        }
    }
    if (open != nullptr) {
        return Fail(text.size(), "end");
    }
    return ParseResult{};
}

std::string WriteObject(const Program& program)
{
    std::size_t estimate = 64;
    for (const Routine& routine : program.routines) {
        estimate += routine.code.size() * 3 + static_cast<std::size_t>(routine.commands) * 5 + 24;
    }
    for (const auto& command : program.immediate) {
        estimate += command.size() * 3 + 5;
    }
    for (const FirmwareRecord& record : program.firmware) {
        estimate += record.data.size() * 3 + 16;
    }
    std::string text;
    text.reserve(estimate);
    char line[64];
    static const char* const kKinds[] = {"immediate", "program", "firmware"};
    std::snprintf(line, sizeof line, "tobj 1 %d %s", program.brickType,
                  kKinds[static_cast<int>(program.kind)]);
    text += line;
    if (program.kind == ObjectKind::Firmware) {
        std::snprintf(line, sizeof line, " %d", program.firmwareVersion);
        text += line;
    }
    text += '\n';
    auto bytesLine = [&text](const std::uint8_t* bytes, std::size_t count) {
        static const char kHex[] = "0123456789abcdef";
        for (std::size_t i = 0; i < count; ++i) {
            text += ' ';
            text += kHex[bytes[i] >> 4];
            text += kHex[bytes[i] & 15];
        }
        text += '\n';
    };
    for (const auto& command : program.immediate) {
        text += "cmd";
        bytesLine(command.data(), command.size());
    }
    for (const Routine& routine : program.routines) {
        std::snprintf(line, sizeof line, "%s %d\n",
                      routine.kind == RoutineKind::Task ? "task" : "sub", routine.number);
        text += line;
        std::size_t at = 0;
        Instruction in;
        while (at < routine.code.size()) {
            std::size_t size = routine.code.size() - at;
            if (Decode(routine.code.data(), routine.code.size(), at, in)) {
                size = static_cast<std::size_t>(in.size);
            }
            text += "cmd";
            bytesLine(routine.code.data() + at, size);
            at += size;
        }
        text += "end\n";
    }
    for (const FirmwareRecord& record : program.firmware) {
        std::snprintf(line, sizeof line, "cmd fw %04x", record.address);
        text += line;
        bytesLine(record.data.data(), record.data.size());
    }
    return text;
}

} // namespace tessel::lang
