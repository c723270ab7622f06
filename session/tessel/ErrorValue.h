// Packed 32-bit error codes shared with the brick library.
//
// Layout (an external format: the library packs its own codes the same way):
//   bits 30-31 severity, bit 29 always set, bit 28 always clear,
//   bits 16-27 facility, bits 10-15 module, bits 0-9 code.
// A code is a failure exactly when it is negative read as std::int32_t.
//
// This header is part of the library boundary: the library receives ErrorValue
// objects by value from workspace handles, so the class is complete here and
// its virtual operations keep their order (destructor, clone, isSuccess,
// isInformation, isWarning, isError, succeeded, failed, isSystemCode,
// assignment, equality, packedCode). Do not reorder them.
#pragma once

#include <cstdint>
#include <new>

class ErrorValue {
public:
    explicit ErrorValue(std::uint32_t packedCode) { set(packedCode, nullptr); }

    ErrorValue(std::uint32_t severity, std::uint32_t facility, std::uint32_t module,
               std::uint32_t code)
    {
        std::uint32_t value = (facility & 0xFFFu) | (severity << 14);
        value = (value << 6) | (module & 63u);
        value = (value << 10) | (code & 0x3FFu);
        set(value, nullptr);
    }

    ErrorValue(const ErrorValue& other) { set(other.packed, other.nested); }

    virtual ~ErrorValue() { delete nested; }

    // A copy on the heap, or null when the heap is exhausted.
    virtual ErrorValue* clone() const { return new (std::nothrow) ErrorValue(*this); }

    virtual bool isSuccess() const { return severity() == 0; }
    virtual bool isInformation() const { return severity() == 1; }
    virtual bool isWarning() const { return severity() == 2; }
    virtual bool isError() const { return severity() == 3; }
    virtual bool succeeded() const { return isSuccess() || isInformation(); }
    virtual bool failed() const { return isWarning() || isError(); }
    // Bit 29 is set by normalisation, so no value built here is a system code.
    virtual bool isSystemCode() const { return (packed & 0x20000000u) == 0; }

    virtual ErrorValue& operator=(const ErrorValue& other)
    {
        if (this != &other) {
            delete nested;
            nested = nullptr;
            set(other.packed, other.nested);
        }
        return *this;
    }

    virtual bool operator==(const ErrorValue& other) const { return packed == other.packed; }

    virtual std::uint32_t packedCode() const { return packed; }

    std::uint32_t severity() const { return packed >> 30; }
    std::uint32_t facility() const { return (packed >> 16) & 0xFFFu; }
    std::uint32_t module() const { return (packed >> 10) & 63u; }
    std::uint32_t code() const { return packed & 0x3FFu; }

    // The nested cause, owned by this value; null for every value built by the constructors.
    const ErrorValue* nestedError() const { return nested; }

    // The packed code as the signed number that callers test by sign.
    std::int32_t asLong() const { return static_cast<std::int32_t>(packedCode()); }

private:
    static std::uint32_t normalise(std::uint32_t value)
    {
        return (value & 0xEFFFFFFFu) | 0x20000000u;
    }

    // A nested error that cannot be cloned is simply dropped.
    void set(std::uint32_t packedCode, const ErrorValue* nestedToCopy)
    {
        packed = normalise(packedCode);
        nested = nestedToCopy != nullptr ? nestedToCopy->clone() : nullptr;
    }

    std::uint32_t packed = 0;
    ErrorValue* nested = nullptr;
};

// The ReaderWriter facility (2, module 0). Codes 2 to 5 stay taken and are never returned.
inline const ErrorValue RwOk(0, 2, 0, 0);           // 0x20020000
inline const ErrorValue RwNotOpen(3, 2, 0, 1);      // 0xE0020001
inline const ErrorValue RwOutOfRange(3, 2, 0, 6);   // 0xE0020006
inline const ErrorValue RwNoMemory(3, 2, 0, 7);     // 0xE0020007
inline const ErrorValue RwSeekFailed(3, 2, 0, 8);   // 0xE0020008
