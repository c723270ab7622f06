// Splitting the program's command line into the settings file path and a file to open.
#pragma once

#include <string>

namespace app {

struct CommandLineParts {
    std::string settingsPath; // "Harbor.ini" (no directory) when no program path was found
    std::string currentFile;  // "" when the line names no file
};

// The line starts with the program path in double quotes; the closing quote is the LAST
// double quote of the whole line, so a quoted file argument ends up inside the program
// path. The file name starts two characters after that quote (one separator skipped).
// The settings path is the program path with the extension of its file name replaced by
// "ini", or ".ini" appended when the file name has none; a "." in a directory name is
// not an extension.
CommandLineParts SplitCommandLine(const char* commandLine);

// The settings path for a program path, as above.
std::string SettingsPathFor(const std::string& programPath);

// The command line as the split expects it on Linux: the absolute path of the running
// executable in double quotes, then the arguments (argv[1] on) joined by blanks.
std::string ComposeCommandLine(const std::string& executablePath, int argc,
                               const char* const* argv);

// The same for the running process.
std::string ComposeCommandLine(int argc, const char* const* argv);

} // namespace app
