#include "tools/InfoReport.h"

#include <cstdint>

#include "tessel/ErrorValue.h"
#include "tools/BrickAccess.h"
#include "tools/BrickMemoryMap.h"
#include "tools/BrickQueries.h"

namespace tools {

namespace {

struct PropertyPiece {
    tessel::Short property;
    const char* format;
};

constexpr PropertyPiece kPortPieces[] = {
    {tessel::PropExecRetries, "\tExecute retries: %d\t\t"},
    {tessel::PropDownloadRetries, "\tDownload retries: %d\r\n"},
    {tessel::PropReceiveTimeout, "\tReceive timeout: %d mS\t"},
    {tessel::PropCharTimeout, "\tInter-character timeout: %d mS\r\n"},
    {tessel::PropExecBlockSize, "\tExecute block size: %d\t"},
    {tessel::PropDownloadBlockSize, "\tDownload block size: %d\r\n"},
    {tessel::PropFirmwareBlockSize, "\tFirmware block size: %d\r\n"},
};

struct InfoPiece {
    tessel::Short id;
    const char* format;
};

constexpr InfoPiece kCapacityPieces[] = {
    {tessel::InfoProgramSlots, "\tProgram slots: %d\r\n"},
    {tessel::InfoProgramMemory, "\tMaximum programmable memory: %d\r\n"},
    {tessel::InfoTasks, "\tTasks: %d\r\n"},
    {tessel::InfoSubroutines, "\tUser subroutines: %d\r\n"},
    {tessel::InfoSubroutineNesting, "\tMaximum subroutine nesting: %d\r\n"},
    {tessel::InfoGlobalVariables, "\tGlobal variables: %d\r\n"},
    {tessel::InfoLocalVariables, "\tLocal variables (per task): %d\r\n"},
    {tessel::InfoOutputs, "\tOutputs: %d\t\t"},
    {tessel::InfoInputs, "\tInputs: %d\r\n"},
    {tessel::InfoTimers, "\tGlobal timers: %d\r\n"},
    {tessel::InfoCounters, "\tGlobal counters: %d\r\n"},
    {tessel::InfoEvents, "\tMaximum events: %d\r\n"},
    {tessel::InfoSemaphores, "\tMaximum semaphores: %d\r\n"},
};

// Why a COM port cannot be used, by the code field of its warning or error.
const char* PortMarker(std::uint32_t code)
{
    switch (code) {
    case 80:
        return "(o)"; // in use by another application
    case 81:
        return "(x)"; // hardware conflict
    case 82:
        return "(-)"; // no such port
    case 83:
        return "(m)"; // used by a serial mouse
    case 84:
        return "(h)"; // already held by a brick handle
    default:
        return nullptr;
    }
}

// Names from the library may come back without a terminator.
void Terminate(char* name, std::size_t size)
{
    name[size - 1] = 0;
}

} // namespace

bool InfoReport::Build(tessel::Long hBrick)
{
    report_.clear();
    AddActiveBrick(hBrick);
    AddActivePort(hBrick);
    AddSystem();
    return AddCapacities(hBrick);
}

void InfoReport::AddActiveBrick(tessel::Long hBrick)
{
    report_.append("Active PBrick information:\r\n");

    char version[kVersionTextSize] = {};
    if (queries_.GetBrickVersion(hBrick, nullptr, nullptr, version, sizeof version) >= 0 &&
        version[0] != 0) {
        report_.append("\tVersion (ROM.firmware): %s", version);
    }
    std::uint16_t txPower = 0;
    if (queries_.GetTxPower(hBrick, &txPower) >= 0) {
        report_.append(txPower == 0 ? "\tTx power low" : "\tTx power high");
    }
    std::uint16_t minutes = 0;
    if (queries_.GetPowerDownTime(hBrick, &minutes) >= 0) {
        report_.append("\tPower down time: %d minute(s)\r\n", static_cast<std::int16_t>(minutes));
    }
    BrickMemoryMap map;
    bool mapRead = queries_.GetMemoryMap(hBrick, &map) >= 0;
    if (mapRead) {
        std::uint16_t freeBytes = 0;
        if (queries_.GetFreeMemory(hBrick, map, &freeBytes) >= 0) {
            // A byte count: shown unsigned, since 32 KB or more of free memory is no
            // negative number.
            report_.append("\tFree RAM: %u bytes", static_cast<unsigned>(freeBytes));
        }
    }
    std::uint16_t slot = 0;
    if (queries_.GetProgramSlot(hBrick, &slot) >= 0) {
        report_.append("\tProgram slot: %d ", static_cast<std::int16_t>(slot));
    } else {
        slot = 0;
    }
    if (mapRead) {
        AddProgram(hBrick, slot, map);
    }
}

void InfoReport::AddProgram(tessel::Long hBrick, int slot, const BrickMemoryMap& map)
{
    BoundedText<64> tasks;
    tasks.append("tasks: ");
    int taskCount = 0;
    // What the located tasks and subroutines hold, their closing bytes left out.
    int locatedSize = 0;
    for (tessel::Short task = 1; task <= BrickMemoryMap::kTasksPerSlot; ++task) {
        std::uint16_t start = 0;
        std::uint16_t size = 0;
        if (queries_.GetTaskLocation(hBrick, map, static_cast<tessel::Short>(slot), task, &start,
                                     &size) >= 0 &&
            size > 0) {
            tasks.append("%d, ", task);
            ++taskCount;
            locatedSize += size;
        }
    }
    if (taskCount > 0) {
        report_.append("%s", tasks.text());
    }
    BoundedText<64> subs;
    subs.append("subs: ");
    int subCount = 0;
    for (tessel::Short sub = 1; sub <= BrickMemoryMap::kSubsPerSlot; ++sub) {
        std::uint16_t start = 0;
        std::uint16_t size = 0;
        if (queries_.GetSubLocation(hBrick, map, static_cast<tessel::Short>(slot), sub, &start,
                                    &size) >= 0 &&
            size > 1) {
            subs.append("%d, ", sub);
            ++subCount;
            locatedSize += size - 1;
        }
    }
    if (subCount > 0) {
        report_.append("%s", subs.text());
    }
    // Only an accepted slot (1 to 5) lists anything; the check keeps the map indexes below
    // in range whatever the brick answered.
    if ((taskCount == 0 && subCount == 0) || slot < 1 || slot > BrickMemoryMap::kSlots) {
        report_.append("\r\n");
        return;
    }
    // A Rover keeps its program table in memory and answers the map with zeros, so its size
    // is what was located rather than a difference of map words (which would come out as
    // -8 bytes).
    tessel::Short type = 0;
    char typeName[tessel::kBrickNameSize] = {};
    if (access_.Get(hBrick, tessel::PropBrickType, &type, typeName, sizeof typeName) >= 0 &&
        type == tessel::BrickRover) {
        report_.append("size: %d bytes\r\n", locatedSize);
        return;
    }
    // The subroutine area plus the task area of the slot, less its 8 closing bytes.
    const std::uint16_t* w = map.words;
    int subArea = static_cast<std::uint16_t>(w[8 * slot] - w[8 * (slot - 1)]);
    int taskArea = static_cast<std::uint16_t>(w[40 + 10 * slot] - w[40 + 10 * (slot - 1)]);
    report_.append("size: %d bytes\r\n", subArea + taskArea - 8);
}

void InfoReport::AddActivePort(tessel::Long hBrick)
{
    report_.append("\r\nActive Port information:\r\n");
    char port[kPortNameSize] = {};
    tessel::Short kind = 0;
    if (access_.Get(hBrick, tessel::PropPort, &kind, port, sizeof port) >= 0) {
        Terminate(port, sizeof port);
        report_.append("\tPort %s is ", port);
        if (kind == tessel::PortSerialIr) {
            report_.append("RS232 IR\r\n");
        } else if (kind == tessel::PortUsb) {
            report_.append("USB\r\n");
            tessel::Short range = 0;
            if (access_.Get(hBrick, tessel::PropRange, &range, nullptr, 0) >= 0) {
                report_.append("\tPort Tx Power: %d\r\n", range);
            }
        } else {
            report_.append("unknown\r\n");
        }
    }
    for (const PropertyPiece& piece : kPortPieces) {
        tessel::Short value = 0;
        if (access_.Get(hBrick, piece.property, &value, nullptr, 0) >= 0) {
            report_.append(piece.format, value);
        }
    }
}

void InfoReport::AddSystem()
{
    report_.append("\r\nSystem information:\r\n");
    report_.append("\tCOM ports: ");
    AddPortWalk(tessel::EnumComPorts, true);
    report_.append("\r\n");
    report_.append("\tUSB ports:\t");
    AddPortWalk(tessel::EnumUsbPorts, false);
    report_.append("\r\n");
    AddNameList(tessel::EnumBrickTypes, "\tRecognised PBrick types: ");
    AddNameList(tessel::EnumSourceTypes, "\tTranslation source types: ");
    AddNameList(tessel::EnumTargetTypes, "\tTranslation target types: ");
}

void InfoReport::AddPortWalk(tessel::EnumType type, bool withMarkers)
{
    char name[tessel::kPathSize] = {};
    tessel::Short item = 0;
    tessel::Long status = access_.FindFirst(type, &item, name, sizeof name);
    for (int count = 0; count < kMaxItems; ++count) {
        if (static_cast<std::uint32_t>(status) == tessel::kNoMoreItems) {
            return;
        }
        Terminate(name, sizeof name);
        report_.append("%s", name);
        if (withMarkers) {
            ErrorValue value(static_cast<std::uint32_t>(status));
            if (value.failed()) {
                if (const char* marker = PortMarker(value.code())) {
                    report_.append("%s", marker);
                } else {
                    report_.append("(%x)", static_cast<unsigned>(status));
                }
            }
            report_.append(", ");
        } else {
            report_.append("\r\n\t\t\t");
        }
        status = access_.FindNext(type, &item, name, sizeof name);
    }
}

void InfoReport::AddNameList(tessel::EnumType type, const char* heading)
{
    char name[tessel::kPathSize] = {};
    tessel::Short item = 0;
    if (access_.FindFirst(type, &item, name, sizeof name) >= 0) {
        Terminate(name, sizeof name);
        report_.append("%s%s", heading, name);
        for (int count = 1; count < kMaxItems; ++count) {
            if (access_.FindNext(type, &item, name, sizeof name) < 0) {
                break;
            }
            Terminate(name, sizeof name);
            report_.append(", %s", name);
        }
    }
    report_.append("\r\n");
}

bool InfoReport::AddCapacities(tessel::Long hBrick)
{
    char typeName[tessel::kBrickNameSize] = {};
    tessel::Short type = 0;
    if (access_.Get(hBrick, tessel::PropBrickType, &type, typeName, sizeof typeName) < 0) {
        return false;
    }
    Terminate(typeName, sizeof typeName);
    report_.append("\r\n");
    report_.append("General information for %s:\r\n", typeName);
    for (const InfoPiece& piece : kCapacityPieces) {
        tessel::Short value = 0;
        if (access_.Info(type, piece.id, &value) >= 0) {
            report_.append(piece.format, value);
        }
    }
    return true;
}

} // namespace tools
