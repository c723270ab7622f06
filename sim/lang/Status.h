// Packed result codes of the language side: facility 5, module 1 (driver), 2 (compiler) and
// 3 (library), severity 3. Built by hand rather than through ErrorValue so that the codes are
// usable in constant expressions; the layout is the boundary's.
#pragma once

#include <cstdint>

namespace tessel::lang {

constexpr std::int32_t PackedError(std::uint32_t facility, std::uint32_t module, std::uint32_t code)
{
    return static_cast<std::int32_t>(0xE0000000u | (facility << 16) | (module << 10) |
                                     (code & 0x3FFu));
}
constexpr std::int32_t DriverError(std::uint32_t code)
{
    return PackedError(5, 1, code);
}
constexpr std::int32_t CompilerError(std::uint32_t code)
{
    return PackedError(5, 2, code);
}
constexpr std::int32_t LibraryError(std::uint32_t code)
{
    return PackedError(5, 3, code);
}
constexpr std::int32_t BltError(std::uint32_t code)
{
    return PackedError(6, 0, code);
}

// The compiler codes this translator reports (texts in the client's catalogue).
enum CompilerCode : std::uint32_t {
    kSyntax = 1,               // detail: the offending text
    kParserStack = 2,          // blocks or expressions nested too deep
    kTranslationStack = 3,     // includes or macro expansions nested too deep
    kVariableNotDeclared = 16, // detail: the name
    kWritableExpected = 17,    // detail: the name assigned to
    kValueExpected = 18,
    kNameExpected = 22,     // detail: what stood there instead
    kNameDeclared = 23,     // detail: the name
    kTooManyVariables = 24, // detail: the name that did not fit
    kNameNotDeclared = 25,  // detail: the name
    kNoMoreTasks = 26,
    kNoMoreSubs = 27,
    kTaskUndefined = 28, // a program without main
    kNoRepeatTemp = 31,
    kNoMoreTimers = 33,
    kSubCallsSub = 34,          // detail: the called name
    kSubCallsItself = 35,       // detail: the name
    kTooManyEvents = 37,        // detail: the name
    kEventNotDeclared = 38,     // detail: the name
    kTooManyMacroParams = 39,   // detail: the macro's name
    kTooFewMacroParams = 40,    // detail: the macro's name
    kTooManyCounters = 42,      // detail: the name
    kLocalOutsideTask = 46,     // detail: the name
    kTooManySemaphores = 47,    // detail: the name
    kSemaphoreNotDeclared = 48, // detail: the name
    kNoExpressionTemp = 55,
    kNotALocal = 57,         // detail: the name
    kOutOfRange = 129,       // detail: the value or name
    kConstantExpected = 130, // detail: the offending text
    kImmediateOnly = 131,
    kProgramOnly = 132,
    kTaskExpected = 137,
    kBadGet = 139,
    kBadTarget = 145,     // brick type not supported for translation
    kIncludeFailed = 146, // detail: the include name
    kSourceRead = 152,    // source unreadable (too large)
};

// Driver codes used by the language side.
inline constexpr std::uint32_t kBadFirmwareChecksum = 21;
inline constexpr std::uint32_t kBadBrickResult = 9;

// Library codes used by the language side.
inline constexpr std::uint32_t kBadSourceType = 148;
inline constexpr std::uint32_t kBadTargetType = 150;
inline constexpr std::uint32_t kUnsupportedBrick = 152;

} // namespace tessel::lang
