// Macro To CSV: wraps one macro call in a small program, translates it into the library's
// CSV listing and filters the listing down to the records of the program's main block.
#pragma once

#include <cstdint>

#include "tessel/TesselApi.h"

class BrickSession;
class IError;
class ReaderWriter;

namespace tools {

// Not a packed value: the listing could not be read or the result file not written.
inline constexpr std::int32_t kListingUnreadable = -999;

// The program that wraps the macro call; %s: the header name, then the macro call.
inline constexpr const char* kMacroProgram = "program Macro2CSV{#include<%s>main{%s}}";

// Overwrites the session's source working file with the wrapper program, translates it into
// the object working file as a CSV listing (type 7) and writes the filtered listing to the
// result working file, whose handle goes to *result (also when kListingUnreadable follows
// its opening); the caller releases it. Returns 0 on success, the runner's packed codes when
// a working file is missing or cannot be opened, the translation's code when it fails (sink
// then holds its position and detail), or kListingUnreadable.
std::int32_t MacroToCsv(BrickSession& session, tessel::Short brickType, const char* macroCall,
                        const char* headerName, ReaderWriter** result, IError* sink);

} // namespace tools
