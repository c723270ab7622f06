// The dialog's settings, read once from the settings file when the dialog is constructed.
#pragma once

#include <cstdint>

#include "tessel/TesselApi.h"

class BrickSession;

namespace app {

inline constexpr std::uint32_t kSettingSize = tessel::kPathSize; // paths, ports, texts
inline constexpr std::uint32_t kBooleanSize = 12;
inline constexpr const char* kTraceFileName = "tsltrace.txt";

struct DialogSettings {
    char firmwareFile[kSettingSize] = {}; // FIRMWARE / SOURCE
    char firmwareDir[kSettingSize] = {};  // PATHS / FIRMWARE
    char serialPort[kSettingSize] = {};   // PORTS / Serial
    char usbPort[kSettingSize] = {};      // PORTS / USB
    bool autoRun = false;                 // OPTIONS / AUTORUN
    bool autoClear = false;               // OPTIONS / AUTOCLEAR
    bool autoDownload = false;            // OPTIONS / AUTODOWNLOAD
    char logFile[kSettingSize] = {};      // DEBUG / LOGFILE
};

// Reads the dialog's keys in the order SOURCE, FIRMWARE, Serial, USB, AUTORUN, AUTOCLEAR,
// AUTODOWNLOAD, LOGFILE; missing values give the defaults ("" and false), long ones are cut
// to their buffers.
DialogSettings ReadDialogSettings(const char* settingsPath);

// True exactly when value equals "true" without regard to letter case.
bool IsTrueOption(const char* value);

// A decimal integer read from the start of value (leading blanks skipped, an optional
// sign), its low 16 bits taken as a signed number; 0 when no number starts the value.
std::int16_t ParseTraceOptions(const char* value);

// DEBUG / TRACE of the settings file, parsed as above.
std::int16_t ReadTraceOptions(const char* settingsPath);

// With non-zero options: writes the trace file header (skipped silently when the file
// cannot be created) and switches tracing on through the session's Set of property 15
// with brick handle 0. Nothing happens for 0. traceFile names the file to create; the
// header always names "tsltrace.txt".
void ApplyTraceOptions(BrickSession& session, std::int16_t options,
                       const char* traceFile = kTraceFileName);

} // namespace app
