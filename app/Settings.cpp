#include "app/Settings.h"

#include <cctype>
#include <cstdio>

#include "platform/Profile.h"
#include "session/BrickSession.h"

namespace app {

namespace {

bool ReadBoolean(const char* section, const char* key, const char* settingsPath)
{
    char value[kBooleanSize] = {};
    platform::ReadProfileString(section, key, "FALSE", value, sizeof value, settingsPath);
    return IsTrueOption(value);
}

} // namespace

bool IsTrueOption(const char* value)
{
    if (value == nullptr) {
        return false;
    }
    const char* expected = "true";
    for (; *value != '\0' && *expected != '\0'; ++value, ++expected) {
        if (std::tolower(static_cast<unsigned char>(*value)) != *expected) {
            return false;
        }
    }
    return *value == '\0' && *expected == '\0';
}

DialogSettings ReadDialogSettings(const char* settingsPath)
{
    DialogSettings settings;
    platform::ReadProfileString("FIRMWARE", "SOURCE", "", settings.firmwareFile,
                                sizeof settings.firmwareFile, settingsPath);
    platform::ReadProfileString("PATHS", "FIRMWARE", "", settings.firmwareDir,
                                sizeof settings.firmwareDir, settingsPath);
    platform::ReadProfileString("PORTS", "Serial", "", settings.serialPort,
                                sizeof settings.serialPort, settingsPath);
    platform::ReadProfileString("PORTS", "USB", "", settings.usbPort, sizeof settings.usbPort,
                                settingsPath);
    settings.autoRun = ReadBoolean("OPTIONS", "AUTORUN", settingsPath);
    settings.autoClear = ReadBoolean("OPTIONS", "AUTOCLEAR", settingsPath);
    settings.autoDownload = ReadBoolean("OPTIONS", "AUTODOWNLOAD", settingsPath);
    platform::ReadProfileString("DEBUG", "LOGFILE", "", settings.logFile, sizeof settings.logFile,
                                settingsPath);
    return settings;
}

std::int16_t ParseTraceOptions(const char* value)
{
    if (value == nullptr) {
        return 0;
    }
    while (std::isspace(static_cast<unsigned char>(*value))) {
        ++value;
    }
    bool negative = false;
    if (*value == '+' || *value == '-') {
        negative = *value == '-';
        ++value;
    }
    // Arithmetic modulo 2^16 keeps exactly the low 16 bits of any number, however long,
    // where a wider integer would overflow.
    std::uint16_t low = 0;
    for (; *value >= '0' && *value <= '9'; ++value) {
        low = static_cast<std::uint16_t>(low * 10u + static_cast<unsigned>(*value - '0'));
    }
    if (negative) {
        low = static_cast<std::uint16_t>(0u - low);
    }
    return static_cast<std::int16_t>(low);
}

std::int16_t ReadTraceOptions(const char* settingsPath)
{
    char value[kBooleanSize] = {};
    platform::ReadProfileString("DEBUG", "TRACE", "0", value, sizeof value, settingsPath);
    return ParseTraceOptions(value);
}

void ApplyTraceOptions(BrickSession& session, std::int16_t options, const char* traceFile)
{
    if (options == 0) {
        return;
    }
    if (std::FILE* file = std::fopen(traceFile, "w")) {
        std::fprintf(file, "Trace file \"%s\", options: %d\n\n", kTraceFileName, options);
        std::fclose(file);
    }
    session.Set(0, tessel::PropTrace, options);
}

} // namespace app
