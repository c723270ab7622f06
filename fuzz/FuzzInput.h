// A small reader over the fuzzer's bytes: takes numbers and byte runs off the front, and gives
// zeros once the input is used up, so every target can walk its input without bounds checks.
#pragma once
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>

namespace fuzz {

class Input {
public:
    Input(const std::uint8_t* data, std::size_t size) : data_(data), size_(size) {}

    bool empty() const { return used_ >= size_; }
    std::size_t remaining() const { return size_ - used_; }

    std::uint8_t byte() { return used_ < size_ ? data_[used_++] : 0; }

    template <typename T> T number()
    {
        T value{};
        std::uint8_t raw[sizeof(T)] = {};
        for (auto& b : raw) {
            b = byte();
        }
        std::memcpy(&value, raw, sizeof(T));
        return value;
    }

    // Up to maxLength bytes; the length is read first.
    std::string text(std::size_t maxLength)
    {
        const std::size_t wanted = byte() % (maxLength + 1);
        const std::size_t n = wanted < remaining() ? wanted : remaining();
        std::string out(reinterpret_cast<const char*>(data_ + used_), n);
        used_ += n;
        return out;
    }

    // Whatever is left.
    std::string rest()
    {
        std::string out(reinterpret_cast<const char*>(data_ + used_), remaining());
        used_ = size_;
        return out;
    }

private:
    const std::uint8_t* data_;
    std::size_t size_;
    std::size_t used_ = 0;
};

} // namespace fuzz
