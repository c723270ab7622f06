#include "errors/ErrorSink.h"

#include <cstring>

void ErrorSink::Reset()
{
    value_ = 0;
    position_ = 0;
}

void ErrorSink::SetError(std::int32_t value, std::int32_t position, const char* text)
{
    value_ = value;
    position_ = position;
    if (text == nullptr) {
        return;
    }
    // The library's text may be unterminated within any bound we know of: copy at most
    // 255 bytes and always terminate.
    std::size_t length = strnlen(text, kTextSize - 1);
    std::memcpy(text_, text, length);
    text_[length] = '\0';
}
