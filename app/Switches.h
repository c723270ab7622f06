// The registration switches of the command line and Harbor's own options.
#pragma once

#include <string>
#include <vector>

namespace app {

enum class SwitchAction { Run, Register, Unregister };

// Scans the whole line, program path included: the text after each "-" or "/", to the end
// of the line, is compared with "UnregServer" and "RegServer" without regard to letter
// case. A switch therefore counts only as the last thing on the line.
SwitchAction FindRegistrationSwitch(const char* commandLine);

// Harbor's own options. They come first, before the file argument, and are taken off the
// arguments before the command-line split sees them; "--" ends them.
struct HarborOptions {
    bool headless = false;  // --headless
    std::string script;     // --script FILE: commands from FILE instead of stdin
    bool answerYes = false; // --answer yes|no: questions no command decides
    int timeoutMs = 30000;  // --timeout MS: waiting for a download or an execution
    bool fixedTime = false; // --fixed-time: elapsed times read 0
    bool quiet = false;     // --quiet: commands are not echoed
    bool help = false;      // --help
    // argv[0] followed by the arguments left after the options.
    std::vector<std::string> arguments;
};

// False with a one-line message for an unknown option or a missing or bad value.
bool ParseHarborOptions(int argc, const char* const* argv, HarborOptions& options,
                        std::string& error);

// The text --help prints.
const char* HarborUsage();

} // namespace app
