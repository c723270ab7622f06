// The running machine as a POSIX system reports it.
#include "platform/SystemInfo.h"

#include <pwd.h>
#include <sys/utsname.h>
#include <unistd.h>

#include <chrono>
#include <cstdio>
#include <cstring>
#include <ctime>
#include <thread>
#include <vector>

namespace platform {

namespace {

// Copies text cut to the buffer, terminator included; false when there is no room at all.
bool CopyBounded(const char* text, char* buffer, std::uint32_t size)
{
    if (buffer == nullptr || size == 0 || text == nullptr) {
        return false;
    }
    std::snprintf(buffer, size, "%s", text);
    return true;
}

} // namespace

LocalTime HostSystemInfo::Now()
{
    const std::time_t now = std::time(nullptr);
    std::tm parts{};
    LocalTime time;
    if (localtime_r(&now, &parts) == nullptr) {
        return time;
    }
    time.year = parts.tm_year + 1900;
    time.month = parts.tm_mon + 1;
    time.day = parts.tm_mday;
    time.hour = parts.tm_hour;
    time.minute = parts.tm_min;
    time.second = parts.tm_sec;
    return time;
}

std::uint32_t HostSystemInfo::TickCount()
{
    const auto since = std::chrono::steady_clock::now().time_since_epoch();
    const auto ms = std::chrono::duration_cast<std::chrono::milliseconds>(since).count();
    // Only the low 32 bits: the tick count wraps, and callers subtract modulo 2^32.
    return static_cast<std::uint32_t>(static_cast<std::uint64_t>(ms));
}

bool HostSystemInfo::ComputerName(char* buffer, std::uint32_t size)
{
    char name[256] = {};
    if (gethostname(name, sizeof name - 1) != 0) {
        return false;
    }
    return CopyBounded(name, buffer, size);
}

bool HostSystemInfo::UserName(char* buffer, std::uint32_t size)
{
    long suggested = sysconf(_SC_GETPW_R_SIZE_MAX);
    std::vector<char> scratch(suggested > 0 ? static_cast<std::size_t>(suggested) : 16384);
    passwd entry{};
    passwd* found = nullptr;
    if (getpwuid_r(geteuid(), &entry, scratch.data(), scratch.size(), &found) == 0 &&
        found != nullptr && found->pw_name != nullptr) {
        return CopyBounded(found->pw_name, buffer, size);
    }
    return false;
}

ProcessorInfo HostSystemInfo::Processor()
{
    ProcessorInfo info;
    const long online = sysconf(_SC_NPROCESSORS_ONLN);
    info.count =
        online > 0 ? static_cast<std::uint32_t>(online) : std::thread::hardware_concurrency();
    utsname names{};
    if (uname(&names) == 0) {
        info.type = ProcessorTypeOf(names.machine);
    }
    return info;
}

std::uint32_t HostSystemInfo::ProcessorTypeOf(const char* machine)
{
    struct Pair {
        const char* machine;
        std::uint32_t type;
    };
    // Windows numbers its processor types by family; only the families it names map.
    static constexpr Pair kTypes[] = {
        {"x86_64", 8664}, {"amd64", 8664}, {"i686", 586},  {"i586", 586},
        {"i486", 486},    {"i386", 386},   {"ia64", 2200},
    };
    if (machine == nullptr) {
        return 0;
    }
    for (const Pair& pair : kTypes) {
        if (std::strcmp(pair.machine, machine) == 0) {
            return pair.type;
        }
    }
    return 0;
}

bool HostSystemInfo::VersionRecordOf(VersionRecord* record, bool extended)
{
    // No record of the Windows shape exists here; the kernel record tells the truth instead.
    return false;
}

bool HostSystemInfo::ProductTypeText(char* buffer, std::uint32_t size)
{
    return false;
}

bool HostSystemInfo::KernelRecordOf(KernelRecord* record)
{
    utsname names{};
    if (record == nullptr || uname(&names) != 0) {
        return false;
    }
    std::snprintf(record->name, sizeof record->name, "%s", names.sysname);
    std::snprintf(record->release, sizeof record->release, "%s", names.release);
    std::snprintf(record->machine, sizeof record->machine, "%s", names.machine);
    return true;
}

} // namespace platform
