// The script language (file type 1): a program with tasks and subroutines, or a list of
// immediate commands. See docs/script-language.md.
#pragma once

#include <string>
#include <vector>

#include "Capacities.h"
#include "Lexer.h"
#include "Listing.h"
#include "Program.h"
#include "Translator.h"

namespace tessel::lang {

struct CompiledScript {
    Program program;
    ListingInfo listing;
    std::string symbols;
};

// Throws Failure; tokens come from Lexer::run and end with an End token.
CompiledScript CompileScript(int brickType, const TranslateLimits& limits,
                             const std::vector<Token>& tokens);

} // namespace tessel::lang
