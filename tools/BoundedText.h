// A text assembled piece by piece in a fixed buffer. Pieces that do not fit are cut at the
// buffer's end (terminator included); nothing is ever written past it, and once full every
// further piece is dropped.
#pragma once

#include <cstdarg>
#include <cstddef>
#include <cstdio>

namespace tools {

template <std::size_t Size> class BoundedText {
    static_assert(Size > 0);

public:
    void append(const char* format, ...) __attribute__((format(printf, 2, 3)))
    {
        va_list args;
        va_start(args, format);
        appendV(format, args);
        va_end(args);
    }

    void appendV(const char* format, va_list args)
    {
        std::size_t room = Size - length_;
        if (room <= 1) {
            return;
        }
        int n = std::vsnprintf(text_ + length_, room, format, args);
        if (n > 0) {
            length_ += static_cast<std::size_t>(n) < room ? static_cast<std::size_t>(n) : room - 1;
        }
    }

    void clear()
    {
        length_ = 0;
        text_[0] = 0;
    }

    const char* text() const { return text_; }
    std::size_t length() const { return length_; }
    bool full() const { return length_ + 1 >= Size; }
    static constexpr std::size_t capacity() { return Size; }

private:
    char text_[Size] = {};
    std::size_t length_ = 0;
};

} // namespace tools
