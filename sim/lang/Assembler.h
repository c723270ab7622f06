// Opal (file type 2), the assembler of the brick's instructions, and RAW (file type 3), the
// same instructions written as hexadecimal bytes. See docs/script-language.md.
#pragma once

#include <string_view>

#include "Program.h"

namespace tessel::lang {

// Both throw Failure. Lines outside any "task n"/"sub n" ... "end" frame are immediate
// commands; a source holds either immediate commands or routines, not both.
Program Assemble(int brickType, std::string_view source);
Program AssembleRaw(int brickType, std::string_view source);

} // namespace tessel::lang
