#include "tools/ProgramUpload.h"

#include <cstdio>

#include "tools/BrickMemoryMap.h"
#include "tools/BrickQueries.h"
#include "tools/FileText.h"

namespace tools {

namespace {

std::string Head(const char* format, int a, int b, int c = 0)
{
    char head[64];
    std::snprintf(head, sizeof head, format, a, b, c);
    return head;
}

} // namespace

tessel::Long ProgramUpload::AppendLine(tessel::Long hBrick, std::int32_t start, std::int32_t length,
                                       const std::string& head, std::string& lines)
{
    ReaderWriter* range = nullptr;
    tessel::Long status =
        queries_.ReadMemoryRange(hBrick, static_cast<std::uint16_t>(start), length, &range);
    std::string bytes;
    if (status >= 0 && AppendFileText(range, bytes)) {
        lines += head;
        lines += bytes;
        lines += "\r\n";
    }
    ReleaseHandle(&range);
    return status;
}

tessel::Long ProgramUpload::AppendTaskLine(tessel::Long hBrick, int task, std::int32_t start,
                                           std::int32_t size, std::int32_t taskByte,
                                           std::string& lines)
{
    return AppendLine(hBrick, start, size, Head(kTaskLineFormat, task - 1, size, taskByte), lines);
}

tessel::Long ProgramUpload::AppendSubLine(tessel::Long hBrick, int sub, std::int32_t start,
                                          std::int32_t size, std::string& lines)
{
    return AppendLine(hBrick, start, size - 1, Head(kSubLineFormat, sub - 1, size - 1), lines);
}

UploadOutcome ProgramUpload::Run(tessel::Long hBrick, std::string& lines)
{
    UploadOutcome outcome;
    std::uint16_t slot = 0;
    tessel::Long status = queries_.GetProgramSlot(hBrick, &slot);
    if (status < 0) {
        return {UploadStop::ProgramSlot, status};
    }
    BrickMemoryMap map;
    status = queries_.GetMemoryMap(hBrick, &map);
    if (status < 0) {
        return {UploadStop::MemoryMap, status};
    }
    auto slotNumber = static_cast<tessel::Short>(slot);
    for (tessel::Short task = 1; task <= BrickMemoryMap::kTasksPerSlot; ++task) {
        std::uint16_t start = 0;
        std::uint16_t size = 0;
        if (queries_.GetTaskLocation(hBrick, map, slotNumber, task, &start, &size) < 0) {
            return outcome;
        }
        if (size == 0) {
            continue;
        }
        std::uint16_t taskByte = 0;
        queries_.GetTaskByte(hBrick, slotNumber, task, &taskByte);
        if (AppendTaskLine(hBrick, task, start, size, taskByte, lines) < 0) {
            return outcome;
        }
    }
    for (tessel::Short sub = 1; sub <= BrickMemoryMap::kSubsPerSlot; ++sub) {
        std::uint16_t start = 0;
        std::uint16_t size = 0;
        if (queries_.GetSubLocation(hBrick, map, slotNumber, sub, &start, &size) < 0) {
            return outcome;
        }
        if (size > 1 && AppendSubLine(hBrick, sub, start, size, lines) < 0) {
            return outcome;
        }
    }
    return outcome;
}

} // namespace tools
