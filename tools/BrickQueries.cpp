#include "tools/BrickQueries.h"

#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "tessel/ReaderWriter.h"
#include "tools/BrickAccess.h"
#include "tools/ByteList.h"
#include "tools/ScratchFile.h"

namespace tools {

namespace {

constexpr tessel::Long Argument()
{
    return static_cast<tessel::Long>(kArgumentError);
}

// Room for "get 0x%x,%d" with any address and count.
constexpr std::size_t kCommandSize = 32;

bool IsTaskArgument(int slot, int task)
{
    return slot >= 1 && slot <= BrickMemoryMap::kSlots && task >= 1 &&
           task <= BrickMemoryMap::kTasksPerSlot;
}

bool IsSubArgument(int slot, int sub)
{
    return slot >= 1 && slot <= BrickMemoryMap::kSlots && sub >= 1 &&
           sub <= BrickMemoryMap::kSubsPerSlot;
}

// Blanks and line ends after a chunk's last value would otherwise sit between two values
// once chunks are joined.
std::int32_t TrimmedLength(const char* text, std::int32_t length)
{
    while (length > 0 &&
           (text[length - 1] == '\r' || text[length - 1] == '\n' || text[length - 1] == ' ' ||
            text[length - 1] == '\t' || text[length - 1] == 0)) {
        --length;
    }
    return length;
}

// Appends the text of a chunk's result file to the range file; true when something was
// written.
bool AppendChunk(ReaderWriter* chunk, ReaderWriter* range, bool first)
{
    if (!(chunk->openRead() == RwOk)) {
        return false;
    }
    std::int32_t size = chunk->size();
    if (size <= 0) {
        chunk->close();
        return false;
    }
    char* text = static_cast<char*>(std::malloc(static_cast<std::size_t>(size)));
    if (text == nullptr) {
        chunk->close();
        return false;
    }
    std::int32_t length = TrimmedLength(text, chunk->read(text, size));
    chunk->close();
    if (length > 0) {
        if (!first) {
            range->write(",", 1);
        }
        range->write(text, length);
    }
    std::free(text);
    return length > 0;
}

} // namespace

void ReleaseHandle(ReaderWriter** handle)
{
    if (handle != nullptr && *handle != nullptr) {
        *handle = (*handle)->release();
    }
}

tessel::Long BrickQueries::BrickType(tessel::Long hBrick, tessel::Short* type)
{
    char name[tessel::kBrickNameSize] = {};
    *type = 0;
    return access_.Get(hBrick, tessel::PropBrickType, type, name, sizeof name);
}

tessel::Long BrickQueries::TranslateAndRun(tessel::Long hBrick, tessel::Short brickType,
                                           const char* text, tessel::Long* result,
                                           ReaderWriter** resultFile)
{
    ReaderWriter* code = nullptr;
    tessel::Long status = access_.TranslateText(brickType, tessel::FileScript, text, &code, nullptr,
                                                nullptr, nullptr);
    if (status < 0) {
        ReleaseHandle(&code);
        return status;
    }
    status = access_.ExecCode(hBrick, code, result, resultFile, nullptr, nullptr);
    ReleaseHandle(&code);
    return status;
}

tessel::Long BrickQueries::RunForNumber(tessel::Long hBrick, const char* format,
                                        std::uint16_t address, tessel::Long* result)
{
    char command[kCommandSize];
    std::snprintf(command, sizeof command, format, static_cast<unsigned>(address));
    *result = 0;
    return access_.RunImmediate(hBrick, command, result);
}

tessel::Long BrickQueries::GetBrickVersion(tessel::Long hBrick, tessel::Long* rom,
                                           tessel::Long* firmware, char* text, std::size_t textSize)
{
    if (text != nullptr && textSize > 0) {
        text[0] = 0;
    }
    tessel::Short type = 0;
    tessel::Long status = BrickType(hBrick, &type);
    if (status < 0) {
        return status;
    }
    ReaderWriter* resultFile = nullptr;
    status = TranslateAndRun(hBrick, type, kVersionCommand, nullptr, &resultFile);
    if (status >= 0) {
        unsigned char digits[8] = {};
        if (ParseByteList(resultFile, digits, 8) == 8) {
            tessel::Long romValue = digits[0] * 1000 + digits[1] * 100 + digits[2] * 10 + digits[3];
            tessel::Long firmwareValue =
                digits[4] * 1000 + digits[5] * 100 + digits[6] * 10 + digits[7];
            if (rom != nullptr) {
                *rom = romValue;
            }
            if (firmware != nullptr) {
                *firmware = firmwareValue;
            }
            if (text != nullptr && textSize > 0) {
                std::snprintf(text, textSize, "%04d.%04d", static_cast<int>(romValue),
                              static_cast<int>(firmwareValue));
            }
        }
    }
    ReleaseHandle(&resultFile);
    return status;
}

tessel::Long BrickQueries::GetTxPower(tessel::Long hBrick, std::uint16_t* value)
{
    if (value == nullptr) {
        return Argument();
    }
    *value = 0xFFFF;
    return RunForWord(hBrick, kGetByteCommand, kTxPowerAddress, value,
                      [](tessel::Long result) { return result; });
}

tessel::Long BrickQueries::GetPowerDownTime(tessel::Long hBrick, std::uint16_t* minutes)
{
    if (minutes == nullptr) {
        return Argument();
    }
    *minutes = 0;
    return RunForWord(hBrick, kGetWordCommand, kPowerDownAddress, minutes,
                      [](tessel::Long result) { return result / 256; });
}

tessel::Long BrickQueries::GetProgramSlot(tessel::Long hBrick, std::uint16_t* slot)
{
    if (slot == nullptr) {
        return Argument();
    }
    *slot = 0;
    return RunForWord(hBrick, kGetByteCommand, kProgramSlotAddress, slot,
                      [](tessel::Long result) { return result + 1; });
}

tessel::Long BrickQueries::GetTaskByte(tessel::Long hBrick, int slot, int task,
                                       std::uint16_t* value)
{
    if (value == nullptr || !IsTaskArgument(slot, task)) {
        return Argument();
    }
    *value = 0;
    auto address = static_cast<std::uint16_t>(kTaskByteBase + 10 * slot + task);
    return RunForWord(hBrick, kGetByteCommand, address, value,
                      [](tessel::Long result) { return result; });
}

tessel::Long BrickQueries::RunForWord(tessel::Long hBrick, const char* format,
                                      std::uint16_t address, std::uint16_t* value,
                                      tessel::Long (*convert)(tessel::Long))
{
    tessel::Long result = 0;
    tessel::Long status = RunForNumber(hBrick, format, address, &result);
    if (status >= 0) {
        *value = static_cast<std::uint16_t>(convert(result));
    }
    return status;
}

tessel::Long BrickQueries::GetMemoryMap(tessel::Long hBrick, BrickMemoryMap* map)
{
    if (map == nullptr) {
        return Argument();
    }
    tessel::Long unused = 0;
    ReaderWriter* resultFile = nullptr;
    tessel::Long status =
        TranslateAndRun(hBrick, tessel::BrickOnyx2, kMapCommand, &unused, &resultFile);
    if (status >= 0 && resultFile != nullptr) {
        resultFile->rewind();
        resultFile->openRead();
        // Subroutine starts of the five slots, task starts, then the four closing words:
        // the file lists them in word order.
        for (std::uint16_t& word : map->words) {
            word = ReadWord(resultFile);
        }
        resultFile->close();
    }
    ReleaseHandle(&resultFile);
    return status;
}

tessel::Long BrickQueries::ReadRoverPair(tessel::Long hBrick, std::uint16_t address,
                                         std::uint16_t* first, std::uint16_t* second,
                                         bool* complete)
{
    *complete = false;
    ReaderWriter* file = nullptr;
    tessel::Long status = ReadMemory(hBrick, address, 4, &file);
    if (status >= 0) {
        unsigned char b[4] = {};
        if (ParseByteList(file, b, 4) == 4) {
            *first = static_cast<std::uint16_t>(b[0] + 256 * b[1]);
            *second = static_cast<std::uint16_t>(b[2] + 256 * b[3]);
            *complete = true;
        }
    }
    ReleaseHandle(&file);
    return status;
}

tessel::Long BrickQueries::RoverLocation(tessel::Long hBrick, std::uint16_t address,
                                         std::uint16_t* start, std::uint16_t* size)
{
    std::uint16_t first = 0;
    std::uint16_t second = 0;
    bool complete = false;
    tessel::Long status = ReadRoverPair(hBrick, address, &first, &second, &complete);
    if (status < 0) {
        return status;
    }
    if (complete) {
        *start = first;
        *size = static_cast<std::uint16_t>(second - first);
    }
    return 0;
}

tessel::Long BrickQueries::GetFreeMemory(tessel::Long hBrick, const BrickMemoryMap& map,
                                         std::uint16_t* bytes)
{
    if (bytes == nullptr) {
        return Argument();
    }
    *bytes = 0xFFFF;
    tessel::Short type = 0;
    tessel::Long status = BrickType(hBrick, &type);
    if (status < 0) {
        return status;
    }
    if (type == tessel::BrickRover) {
        std::uint16_t first = 0;
        std::uint16_t second = 0;
        bool complete = false;
        status = ReadRoverPair(hBrick, kRoverFreeMemory, &first, &second, &complete);
        if (status >= 0 && complete) {
            *bytes = static_cast<std::uint16_t>(second - first + 4);
        }
        return status;
    }
    *bytes = static_cast<std::uint16_t>(map.words[BrickMemoryMap::kFreeEnd] -
                                        map.words[BrickMemoryMap::kFreeStart]);
    return status;
}

tessel::Long BrickQueries::GetTaskLocation(tessel::Long hBrick, const BrickMemoryMap& map,
                                           tessel::Short slot, tessel::Short task,
                                           std::uint16_t* start, std::uint16_t* size)
{
    static constexpr PartKind kTask = {IsTaskArgument, kRoverTasks, kRoverTaskBase,
                                       BrickMemoryMap::TaskIndex};
    return PartLocation(kTask, hBrick, map, slot, task, start, size);
}

tessel::Long BrickQueries::GetSubLocation(tessel::Long hBrick, const BrickMemoryMap& map,
                                          tessel::Short slot, tessel::Short sub,
                                          std::uint16_t* start, std::uint16_t* size)
{
    static constexpr PartKind kSub = {IsSubArgument, kRoverSubs, kRoverSubBase,
                                      BrickMemoryMap::SubIndex};
    return PartLocation(kSub, hBrick, map, slot, sub, start, size);
}

tessel::Long BrickQueries::PartLocation(const PartKind& kind, tessel::Long hBrick,
                                        const BrickMemoryMap& map, tessel::Short slot,
                                        tessel::Short number, std::uint16_t* start,
                                        std::uint16_t* size)
{
    if (start == nullptr || size == nullptr || !kind.isArgument(slot, number)) {
        return Argument();
    }
    *start = 0;
    *size = 0;
    tessel::Short type = 0;
    tessel::Long status = BrickType(hBrick, &type);
    if (status < 0) {
        return status;
    }
    // The rover keeps one slot and lists its parts' locations in a table of its own.
    if (type == tessel::BrickRover) {
        if (slot != 1 || number > kind.roverCount) {
            return Argument();
        }
        return RoverLocation(hBrick, static_cast<std::uint16_t>(kind.roverBase + number), start,
                             size);
    }
    int k = kind.index(slot, number);
    *start = map.words[k];
    *size = map.SizeAt(k);
    return 0;
}

tessel::Long BrickQueries::ReadMemory(tessel::Long hBrick, std::uint16_t address, int count,
                                      ReaderWriter** resultFile)
{
    if (resultFile == nullptr) {
        return Argument();
    }
    *resultFile = nullptr;
    tessel::Short type = 0;
    tessel::Long status = BrickType(hBrick, &type);
    if (status < 0) {
        return status;
    }
    char command[kCommandSize];
    std::snprintf(command, sizeof command, kReadMemoryCommand, static_cast<unsigned>(address),
                  count);
    return TranslateAndRun(hBrick, type, command, nullptr, resultFile);
}

tessel::Long BrickQueries::ReadMemoryRange(tessel::Long hBrick, std::uint16_t start,
                                           std::int32_t length, ReaderWriter** file)
{
    if (file == nullptr) {
        return Argument();
    }
    *file = NewScratchFile(tessel::FileResult);
    if (*file == nullptr) {
        return static_cast<tessel::Long>(kScratchFileFailed);
    }
    (*file)->openWrite();
    // The range ends at the top of the 16-bit address space; a negative length is empty.
    std::int32_t position = start;
    std::int32_t end = position + (length > 0 ? length : 0);
    if (end > 0x10000) {
        end = 0x10000;
    }
    tessel::Long status = 0;
    bool first = true;
    while (position < end) {
        int chunk = end - position < kMemoryChunk ? end - position : kMemoryChunk;
        ReaderWriter* chunkFile = nullptr;
        status = ReadMemory(hBrick, static_cast<std::uint16_t>(position), chunk, &chunkFile);
        if (status >= 0 && chunkFile != nullptr && AppendChunk(chunkFile, *file, first)) {
            first = false;
        }
        ReleaseHandle(&chunkFile);
        if (status < 0) {
            break;
        }
        position += chunk;
    }
    (*file)->close();
    return status;
}

} // namespace tools
