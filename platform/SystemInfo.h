// What the Trouble Shooter's system report and the dialog's timing ask of the machine: local
// time, a millisecond tick count, computer and user names, the processor, and the operating
// system. HostSystemInfo asks the running system; ScriptedSystemInfo (SystemInfoScripted.h)
// answers from fields a test sets.
#pragma once

#include <cstdint>

namespace platform {

struct LocalTime {
    int year = 0;   // four digits
    int month = 0;  // 1-12
    int day = 0;    // 1-31
    int hour = 0;   // 0-23
    int minute = 0; // 0-59
    int second = 0; // 0-60
};

struct ProcessorInfo {
    // The processor type number as Windows reports it (386, 486, 586, 2200 IA-64, 8664 x64);
    // 0 when the machine is of no type that numbering knows.
    std::uint32_t type = 0;
    std::uint32_t count = 0;
};

// The operating-system version record of the Windows shape. The extended form adds the
// service pack numbers, suite mask and product type (1 workstation, 2 domain controller,
// 3 server).
struct VersionRecord {
    std::uint32_t majorVersion = 0;
    std::uint32_t minorVersion = 0;
    std::uint32_t buildNumber = 0;
    std::uint32_t platformId = 0; // 0 Win32s, 1 Windows 95 family, 2 NT family
    char csdVersion[128] = {};    // service-pack text
    std::uint16_t servicePackMajor = 0;
    std::uint16_t servicePackMinor = 0;
    std::uint16_t suiteMask = 0;
    std::uint8_t productType = 0;
};

// What uname reports; each text is terminated within its buffer.
struct KernelRecord {
    char name[65] = {};    // kernel name, "Linux"
    char release[65] = {}; // kernel release, "6.1.0-18-amd64"
    char machine[65] = {}; // hardware name, "x86_64"
};

class SystemInfo {
public:
    virtual ~SystemInfo() = default;

    virtual LocalTime Now() = 0;
    // Milliseconds since an arbitrary start; wraps after 49.7 days, as callers expect.
    virtual std::uint32_t TickCount() = 0;
    // Each writes at most size - 1 characters and a terminator; false leaves buffer unset.
    virtual bool ComputerName(char* buffer, std::uint32_t size) = 0;
    virtual bool UserName(char* buffer, std::uint32_t size) = 0;
    virtual ProcessorInfo Processor() = 0;
    // The version record; extended asks for the extended form. False when the system keeps
    // no record of that form (on Linux: never one).
    virtual bool VersionRecordOf(VersionRecord* record, bool extended) = 0;
    // The NT product type text kept in the registry ("WINNT", "SERVERNT", ...), for systems
    // whose record lacks the product type. False when there is none to read.
    virtual bool ProductTypeText(char* buffer, std::uint32_t size) = 0;
    // The kernel's own description; false when the system gives none.
    virtual bool KernelRecordOf(KernelRecord* record) = 0;
};

// The running machine. Keeps no state, so any number of them may exist.
class HostSystemInfo final : public SystemInfo {
public:
    LocalTime Now() override;
    std::uint32_t TickCount() override;
    bool ComputerName(char* buffer, std::uint32_t size) override;
    bool UserName(char* buffer, std::uint32_t size) override;
    ProcessorInfo Processor() override;
    bool VersionRecordOf(VersionRecord* record, bool extended) override;
    bool ProductTypeText(char* buffer, std::uint32_t size) override;
    bool KernelRecordOf(KernelRecord* record) override;

    // The Windows processor type number for a uname machine name; 0 for one it lacks.
    static std::uint32_t ProcessorTypeOf(const char* machine);
};

} // namespace platform
