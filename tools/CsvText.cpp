#include "tools/CsvText.h"

#include <cerrno>
#include <climits>
#include <cstdlib>
#include <cstring>

namespace tools {

namespace {

char* CopyOf(const char* text, std::size_t length)
{
    char* copy = static_cast<char*>(std::malloc(length + 1));
    if (copy != nullptr) {
        std::memcpy(copy, text, length);
        copy[length] = 0;
    }
    return copy;
}

// Moves the text after the first comma to the front; empties the text without a comma.
void DropFirstField(char* text)
{
    char* comma = std::strchr(text, ',');
    if (comma == nullptr) {
        text[0] = 0;
        return;
    }
    std::memmove(text, comma + 1, std::strlen(comma + 1) + 1);
}

} // namespace

bool NextLine(char** cursor, char** line)
{
    std::free(*line);
    *line = nullptr;
    char* text = *cursor;
    char* end = std::strchr(text, '\n');
    if (end == nullptr) {
        *line = CopyOf(text, std::strlen(text));
        text[0] = 0;
        return false;
    }
    std::size_t length = static_cast<std::size_t>(end - text);
    if (length > 0 && text[length - 1] == '\r') {
        --length;
    }
    *line = CopyOf(text, length);
    *cursor = end + 1;
    return true;
}

int TakeNumber(char* text)
{
    errno = 0;
    char* end = nullptr;
    long value = std::strtol(text, &end, 10);
    if (end == text) {
        value = 0;
    } else if (value > INT_MAX) {
        value = INT_MAX;
    } else if (value < INT_MIN) {
        value = INT_MIN;
    }
    DropFirstField(text);
    return static_cast<int>(value);
}

bool TakeField(char* text, char* out, std::size_t outSize)
{
    if (text[0] == 0) {
        return false;
    }
    const char* comma = std::strchr(text, ',');
    std::size_t length =
        comma != nullptr ? static_cast<std::size_t>(comma - text) : std::strlen(text);
    if (outSize > 0) {
        // Cut to the buffer, terminator included.
        std::size_t kept = length < outSize - 1 ? length : outSize - 1;
        std::memcpy(out, text, kept);
        out[kept] = 0;
    }
    DropFirstField(text);
    return true;
}

} // namespace tools
