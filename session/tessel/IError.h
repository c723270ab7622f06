// The error sink interface that translation fills with a position and a detail text.
//
// Part of the library boundary: the library calls these five operations through the
// virtual table in exactly this order, so the order is an ABI. There is deliberately no
// virtual destructor (the sink lives on the caller's stack and is never deleted through
// this interface).
#pragma once

#include <cstdint>

class IError {
public:
    virtual void Reset() = 0;
    virtual void SetError(std::int32_t value, std::int32_t position, const char* text) = 0;
    virtual std::int32_t GetValue() = 0;
    virtual std::int32_t GetPosition() = 0;
    virtual const char* GetText() = 0;

protected:
    IError() = default;
    IError(const IError&) = default;
    IError& operator=(const IError&) = default;
    ~IError() = default;
};
