// The error sink that a command handler builds on its stack and hands to the library's
// translation, which fills in a position and a detail text.
#pragma once

#include <cstdint>

#include "tessel/IError.h"

class ErrorSink final : public IError {
public:
    static constexpr int kTextSize = 256;

    ErrorSink() = default;

    void Reset() override;
    // A text longer than 255 characters is cut to 255; nothing is written past the buffer.
    void SetError(std::int32_t value, std::int32_t position, const char* text) override;
    std::int32_t GetValue() override { return value_; }
    std::int32_t GetPosition() override { return position_; }
    const char* GetText() override { return text_; }

private:
    std::int32_t value_ = 0;
    std::int32_t position_ = 0;
    char text_[kTextSize] = {};
};
