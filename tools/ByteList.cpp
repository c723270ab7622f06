#include "tools/ByteList.h"

#include <cstdlib>

#include "tessel/ReaderWriter.h"

namespace tools {

namespace {

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

bool IsBlank(char c)
{
    return c == ' ' || c == '\t' || c == '\r' || c == '\n';
}

} // namespace

void HexByteField::feed(char c)
{
    switch (state_) {
    case State::Blank:
        if (IsBlank(c)) {
            return;
        }
        state_ = c == '0' ? State::Zero : State::Done;
        return;
    case State::Zero:
        state_ = (c == 'x' || c == 'X') ? State::Digits : State::Done;
        return;
    case State::Digits: {
        int digit = HexDigit(c);
        if (digit < 0) {
            state_ = State::Done;
            return;
        }
        // Only the low 8 bits are kept, and they depend only on the low bits so far.
        value_ = static_cast<std::uint8_t>((value_ << 4) | digit);
        ++digits_;
        return;
    }
    case State::Done:
        return;
    }
}

int ParseByteList(ReaderWriter* file, unsigned char* out, int max)
{
    if (file == nullptr || out == nullptr || max <= 0) {
        return 0;
    }
    if (!(file->openRead() == RwOk)) {
        return 0;
    }
    std::int32_t size = file->size();
    if (size <= 0) {
        file->close();
        return 0;
    }
    char* text = static_cast<char*>(std::malloc(static_cast<std::size_t>(size)));
    if (text == nullptr) {
        file->close();
        return 0;
    }
    std::int32_t length = file->read(text, size);
    file->close();

    int stored = 0;
    HexByteField field;
    for (std::int32_t i = 0; i <= length && stored < max; ++i) {
        if (i == length || text[i] == ',') {
            if (field.parsed()) {
                out[stored++] = field.value();
            }
            field = HexByteField();
        } else {
            field.feed(text[i]);
        }
    }
    std::free(text);
    return stored;
}

std::uint8_t ReadByteValue(ReaderWriter* file)
{
    HexByteField field;
    char c = 0;
    while (file->read(&c, 1) == 1 && c != ',') {
        field.feed(c);
    }
    return field.parsed() ? field.value() : 0;
}

std::uint16_t ReadWord(ReaderWriter* file)
{
    std::uint16_t high = ReadByteValue(file);
    std::uint16_t low = ReadByteValue(file);
    return static_cast<std::uint16_t>(high * 256 + low);
}

} // namespace tools
