// The translator: script (type 1), Opal assembler (2), RAW command bytes (3), object text (4,
// validated) and firmware images (5) into object text (target 4) or a CSV listing (target 7).
//
// Pure: it reads what it is given, reaches include files only through the IncludeReader and
// reports only through its result and the Diagnostics it was given, so it runs the same in the
// library, in tests and in benchmarks. Not thread-safe per object; separate Translator objects
// may run on separate threads.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

namespace tessel::lang {

enum SourceType : int {
    SourceScript = 1,
    SourceOpal = 2,
    SourceRaw = 3,
    SourceObject = 4,
    SourceFirmware = 5,
};

enum TargetType : int {
    TargetObject = 4,
    TargetListing = 7,
};

// Gives the text of an include file. The library answers from "/Script/Include/<name>" of the
// workspace; name is already lower-cased ("onyx2mlt.h").
class IncludeReader {
public:
    // False when the file is missing or unreadable (the translation then fails with 146).
    virtual bool readInclude(const std::string& lowerCasedName, std::string& text) = 0;

    virtual ~IncludeReader() = default;
};

// Receives the translation's failure; at most one report per translation.
class Diagnostics {
public:
    // code: packed (negative); offset: characters from the start of the source; detail: the
    // offending name or text, possibly empty, never null.
    virtual void report(std::int32_t code, std::int32_t offset, const char* detail) = 0;

    virtual ~Diagnostics() = default;
};

struct TranslateRequest {
    int brickType = 6;
    int sourceType = SourceScript;
    int targetType = TargetObject;
    std::string_view source;
    IncludeReader* includes = nullptr;  // null: every include fails with 146
    Diagnostics* diagnostics = nullptr; // may be null
};

struct TranslateResult {
    std::int32_t code = 0;   // 0, or a packed negative code
    std::int32_t offset = 0; // of the failure in the source
    std::string detail;      // of the failure
    std::string output;      // object text or listing; empty on failure
    std::string symbols; // symbol table of a script ("symtab.txt"); one "kind,number,name" a line
};

// Bounds that keep hostile sources from exhausting the stack, the heap or the clock.
struct TranslateLimits {
    std::size_t maxSourceBytes = 4u << 20; // longer: 152
    int maxIncludeDepth = 16;              // deeper: 3
    int maxMacroDepth = 32;                // deeper (recursive macros): 3
    long maxMacroExpansions = 100000;      // more: 3
    int maxNesting = 64;                   // blocks and expression depth beyond: 2
    std::size_t maxTokens = 2u << 20;      // more tokens after expansion: 3
};

class Translator {
public:
    explicit Translator(TranslateLimits limits = {}) : limits_(limits) {}

    // Never throws; a failure comes back in the result (and once through diagnostics).
    TranslateResult translate(const TranslateRequest& request);

private:
    TranslateLimits limits_;
};

// Names of the source and target types for the library's enumerations (1: "Script", "Opal",
// "RAW", "BIN", "Firmware"; 2: "BIN", "CSV"); null past the end. index counts from 0.
const char* SourceTypeName(int index, int* type);
const char* TargetTypeName(int index, int* type);

} // namespace tessel::lang
