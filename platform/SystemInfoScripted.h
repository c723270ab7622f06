// A SystemInfo that answers from fields a test sets, so that report lines can be compared
// exactly. Each query can be made to fail.
#pragma once

#include <cstdio>

#include "platform/SystemInfo.h"

namespace platform {

class ScriptedSystemInfo final : public SystemInfo {
public:
    LocalTime now{2026, 12, 6, 9, 5, 7};
    std::uint32_t ticks = 0;
    // Added to ticks after each TickCount, so that a test sees time pass.
    std::uint32_t tickStep = 0;
    const char* computerName = "BENCH-PC"; // null: the query fails
    const char* userName = "tester";       // null: the query fails
    ProcessorInfo processor{586, 1};
    bool hasExtendedRecord = false;
    bool hasBasicRecord = false;
    VersionRecord version{};
    const char* productTypeText = nullptr; // null: no registry value
    bool hasKernelRecord = true;
    KernelRecord kernel{"Linux", "6.1.0-test", "x86_64"};

    int versionQueries = 0; // VersionRecordOf calls, extended or not

    LocalTime Now() override { return now; }
    std::uint32_t TickCount() override
    {
        const std::uint32_t value = ticks;
        ticks += tickStep;
        return value;
    }
    bool ComputerName(char* buffer, std::uint32_t size) override
    {
        return Copy(computerName, buffer, size);
    }
    bool UserName(char* buffer, std::uint32_t size) override
    {
        return Copy(userName, buffer, size);
    }
    ProcessorInfo Processor() override { return processor; }
    bool VersionRecordOf(VersionRecord* record, bool extended) override
    {
        ++versionQueries;
        if (record == nullptr || !(extended ? hasExtendedRecord : hasBasicRecord)) {
            return false;
        }
        *record = version;
        if (!extended) {
            // The basic record ends before the extended fields.
            record->servicePackMajor = 0;
            record->servicePackMinor = 0;
            record->suiteMask = 0;
            record->productType = 0;
        }
        return true;
    }
    bool ProductTypeText(char* buffer, std::uint32_t size) override
    {
        return Copy(productTypeText, buffer, size);
    }
    bool KernelRecordOf(KernelRecord* record) override
    {
        if (record == nullptr || !hasKernelRecord) {
            return false;
        }
        *record = kernel;
        return true;
    }

private:
    static bool Copy(const char* text, char* buffer, std::uint32_t size)
    {
        if (text == nullptr || buffer == nullptr || size == 0) {
            return false;
        }
        std::snprintf(buffer, size, "%s", text);
        return true;
    }
};

} // namespace platform
