// The command-line split on any line: never reads past the terminator, and what it returns is
// made of the line's own characters.
#include <cstdint>
#include <cstdlib>
#include <string>

#include "app/CommandLine.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    // An exact-length heap copy, so that a read past the terminator is an ASan report.
    auto* line = static_cast<char*>(std::malloc(size + 1));
    if (line == nullptr) {
        return 0;
    }
    for (std::size_t i = 0; i < size; ++i) {
        line[i] = static_cast<char>(data[i]);
    }
    line[size] = '\0';
    const std::string text(line);
    const app::CommandLineParts parts = app::SplitCommandLine(line);
    // The file to open is a tail of the line.
    if (!parts.currentFile.empty() && text.find(parts.currentFile) == std::string::npos) {
        std::abort();
    }
    if (parts.settingsPath.empty()) {
        std::abort();
    }
    app::SettingsPathFor(text);
    std::free(line);
    return 0;
}
