#include "app/CommandLine.h"

#include <cstring>

#include "platform/ExecutablePath.h"

namespace app {

namespace {

constexpr const char* kDefaultSettingsFile = "Harbor.ini";

// Both separators count, so a program path written the Windows way splits the same.
bool IsSeparator(char c)
{
    return c == '/' || c == '\\';
}

} // namespace

std::string SettingsPathFor(const std::string& programPath)
{
    std::size_t nameStart = 0;
    for (std::size_t i = 0; i < programPath.size(); ++i) {
        if (IsSeparator(programPath[i])) {
            nameStart = i + 1;
        }
    }
    const std::size_t dot = programPath.rfind('.');
    // A leading "." makes a hidden file, not an extension.
    if (dot == std::string::npos || dot <= nameStart) {
        return programPath + ".ini";
    }
    return programPath.substr(0, dot + 1) + "ini";
}

CommandLineParts SplitCommandLine(const char* commandLine)
{
    CommandLineParts parts{kDefaultSettingsFile, {}};
    if (commandLine == nullptr) {
        return parts;
    }
    const std::string line(commandLine);
    if (line.size() <= 5 || line.front() != '"') {
        return parts;
    }
    const std::size_t closing = line.rfind('"');
    if (closing == 0) {
        return parts;
    }
    const std::string programPath = line.substr(1, closing - 1);
    // An empty quoted path names no program; "Harbor.ini" serves better than ".ini".
    if (!programPath.empty()) {
        parts.settingsPath = SettingsPathFor(programPath);
    }
    if (closing + 2 <= line.size()) {
        parts.currentFile = line.substr(closing + 2);
    }
    return parts;
}

std::string ComposeCommandLine(const std::string& executablePath, int argc, const char* const* argv)
{
    std::string line = "\"" + executablePath + "\"";
    for (int i = 1; i < argc && argv != nullptr; ++i) {
        if (argv[i] != nullptr) {
            line += ' ';
            line += argv[i];
        }
    }
    return line;
}

std::string ComposeCommandLine(int argc, const char* const* argv)
{
    return ComposeCommandLine(platform::ExecutablePath(), argc, argv);
}

} // namespace app
