// The diagnostic log and the system report of a Trouble Shooter run.
#include "troubleshooter/TroubleShooter.h"

#include <strings.h>

#include <cstdarg>
#include <cstdio>

#include "errors/ErrorText.h"
#include "troubleshooter/BrickCalls.h"

namespace {

// Composed log lines: a label (a port name of up to 259 characters and its words) and a
// catalogue text of up to 255 fit with room to spare; anything longer is cut at the bound.
constexpr int kLineSize = 1024;
constexpr int kLabelSize = 512;
// The operating-system line and its name part.
constexpr int kOsLineSize = 256;

// The name of an NT-family system by its major and minor version.
const char* NtFamilyName(std::uint32_t major, std::uint32_t minor)
{
    if (major <= 4) {
        return "Windows NT";
    }
    if (major == 5) {
        return "Windows 2000";
    }
    if (major == 6) {
        static constexpr const char* kSixes[] = {"Windows Vista", "Windows 7", "Windows 8"};
        return minor < 3 ? kSixes[minor] : "Windows 8.1";
    }
    // Later systems all report 10 (Windows 11 included); anything between is not a known one.
    return major >= 10 ? "Windows 10" : "Windows NT";
}

// The edition word of an NT-family system; "" when none applies or none can be read.
const char* NtEdition(platform::SystemInfo& system, const platform::VersionRecord& record,
                      bool extended)
{
    if (extended) {
        switch (record.productType) {
        case 1:
            return "Professional";
        case 3:
            return "Server";
        default:
            return "";
        }
    }
    char productType[80] = {};
    if (!system.ProductTypeText(productType, sizeof productType)) {
        return "";
    }
    if (strcasecmp(productType, "WINNT") == 0) {
        return "Workstation";
    }
    if (strcasecmp(productType, "SERVERNT") == 0) {
        return "Server";
    }
    return "";
}

} // namespace

TroubleShooter::TroubleShooter(BrickCalls* session, tessel::Long* handleSlot, const char* logPath,
                               platform::SystemInfo* system)
    : session_(session), handleSlot_(handleSlot), system_(system != nullptr ? system : &hostSystem_)
{
    if (logPath == nullptr || logPath[0] == '\0') {
        return;
    }
    // A longer path is cut; the cut name is then simply a file that cannot be opened or a
    // different one, never a write past the buffer.
    std::snprintf(logName_, sizeof logName_, "%s", logPath);
    std::FILE* file = std::fopen(logName_, "w");
    if (file == nullptr) {
        return;
    }
    const platform::LocalTime now = system_->Now();
    std::fprintf(file, "Marl 2.0 Diagnostic Trouble Shooter\n");
    std::fprintf(file, "\tDate: \t%02d/%02d/%d\n", now.month, now.day, now.year);
    std::fprintf(file, "\tTime: \t%02d:%02d:%02d\n\n", now.hour, now.minute, now.second);
    std::fclose(file);
}

void TroubleShooter::CloseLog()
{
    if (logName_[0] == '\0') {
        return;
    }
    const platform::LocalTime now = system_->Now();
    LogText("\nTrouble Shooter closed\n");
    LogFormat("\tTime: \t%02d:%02d:%02d\n", now.hour, now.minute, now.second);
}

void TroubleShooter::LogText(const char* text)
{
    if (logName_[0] == '\0' || text == nullptr) {
        return;
    }
    std::FILE* file = std::fopen(logName_, "a");
    if (file == nullptr) {
        return;
    }
    std::fputs(text, file);
    std::fclose(file);
}

void TroubleShooter::LogFormat(const char* format, ...)
{
    if (logName_[0] == '\0') {
        return;
    }
    char line[kLineSize];
    va_list arguments;
    va_start(arguments, format);
    std::vsnprintf(line, sizeof line, format, arguments);
    va_end(arguments);
    LogText(line);
}

std::int32_t TroubleShooter::LogStep(const char* label, std::int32_t value)
{
    if (logName_[0] == '\0') {
        return value;
    }
    if (value >= 0) {
        LogFormat("\t%s ok\n", label);
    } else {
        LogFormat("\t%s failed:\n\t\t%s\n", label, GetErrorText(value, nullptr));
    }
    return value;
}

std::int32_t TroubleShooter::BeginSection(const char* heading)
{
    LogText(heading);
    if (session_ != nullptr && handleSlot_ != nullptr) {
        return 0;
    }
    LogText("Failed - NULL pPBrick\n");
    return static_cast<std::int32_t>(kInvalidHandle);
}

std::int32_t TroubleShooter::CreatePort(const char* name)
{
    const tessel::Long created =
        session_ != nullptr && handleSlot_ != nullptr ? session_->Create(name) : 0;
    if (created != 0) {
        LogFormat("\tCreate port %s ok\n", name);
        *handleSlot_ = created;
        return 0;
    }
    char label[kLabelSize];
    std::snprintf(label, sizeof label, "Create port %s", name);
    return LogStep(label, static_cast<std::int32_t>(kInvalidHandle));
}

void TroubleShooter::WriteSystemReport()
{
    char name[256];
    if (system_->ComputerName(name, sizeof name)) {
        LogFormat("Computer: %s\n", name);
    }
    if (system_->UserName(name, sizeof name)) {
        LogFormat("User name: %s\n", name);
    }
    const platform::ProcessorInfo processor = system_->Processor();
    LogFormat("Processor Type: %u (%u)\n", processor.type, processor.count);
    WriteOsVersion();
}

void TroubleShooter::WriteOsVersion()
{
    platform::VersionRecord record{};
    bool extended = system_->VersionRecordOf(&record, true);
    if (!extended) {
        record = platform::VersionRecord{};
        if (!system_->VersionRecordOf(&record, false)) {
            // No Windows record at all: tell what the kernel says of itself.
            platform::KernelRecord kernel{};
            if (system_->KernelRecordOf(&kernel)) {
                LogFormat("%s version %s (%s)\n", kernel.name, kernel.release, kernel.machine);
            }
            return;
        }
    }
    // The service-pack text may come without its terminator; it ends within its field.
    record.csdVersion[sizeof record.csdVersion - 1] = '\0';
    const int major = static_cast<int>(record.majorVersion);
    const int minor = static_cast<int>(record.minorVersion);

    char line[kOsLineSize];
    switch (record.platformId) {
    case 0:
        std::snprintf(line, sizeof line, "Win32s");
        break;
    case 1: {
        const bool later = major > 4 || (major == 4 && minor > 0);
        // This family keeps its minor version in bits 16-23 of the build number.
        std::snprintf(line, sizeof line, "%s version %d.%d %s (Build %d)",
                      later ? "Windows 98" : "Windows 95", major,
                      static_cast<int>((record.buildNumber >> 16) & 0xFFu), record.csdVersion,
                      static_cast<int>(record.buildNumber & 0xFFFFu));
        break;
    }
    case 2: {
        // The longest family name and edition word take 25 characters.
        char name[64];
        std::snprintf(name, sizeof name, "%s%s",
                      NtFamilyName(record.majorVersion, record.minorVersion),
                      NtEdition(*system_, record, extended));
        std::snprintf(line, sizeof line, "%s version %d.%d %s (Build %d)\n", name, major, minor,
                      record.csdVersion, static_cast<int>(record.buildNumber & 0xFFFFu));
        break;
    }
    default:
        std::snprintf(line, sizeof line, "Unknown OS");
        break;
    }
    LogFormat("%s\n", line);
}
