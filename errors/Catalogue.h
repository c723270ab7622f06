// The text tables of the message catalogue, one per facility (and per module of the brick
// library). Every lookup of a number a table does not list gives "unknown".
#pragma once

#include <cstdint>

namespace catalogue {

struct Entry {
    std::uint32_t number;
    const char* text;
};

// Compiler codes whose text is replaced by the sink's detail when a sink is given.
struct CompilerEntry {
    std::uint32_t number;
    bool detail;
    const char* text;
};

const char* OpalText(std::uint32_t code);
const char* BltText(std::uint32_t code);
const char* DriverText(std::uint32_t code);
// detail receives whether the code is one of the detail codes.
const char* CompilerText(std::uint32_t code, bool* detail);
const char* LibraryText(std::uint32_t code);
const char* WispText(std::uint32_t value);
const char* WispUsbText(std::uint32_t value);

inline constexpr const char* kUnknown = "unknown";
inline constexpr std::uint32_t kInvalidTokenCode = 20;

} // namespace catalogue
