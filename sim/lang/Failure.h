// How the translator's parts give up: they throw a Failure, and Translator::translate (the only
// entry) catches it and turns it into a packed code with position and detail. Nothing throws
// past translate().
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "Status.h"

namespace tessel::lang {

struct Failure {
    std::int32_t code = 0; // packed
    std::int32_t offset = 0;
    std::string detail;
};

[[noreturn]] inline void Fail(std::uint32_t compilerCode, std::int32_t offset,
                              std::string_view detail = {})
{
    // Details name one thing; a runaway token (a binary blob) is cut to something readable.
    throw Failure{CompilerError(compilerCode), offset, std::string(detail.substr(0, 64))};
}

[[noreturn]] inline void FailPacked(std::int32_t packed, std::int32_t offset,
                                    std::string_view detail = {})
{
    throw Failure{packed, offset, std::string(detail.substr(0, 64))};
}

} // namespace tessel::lang
