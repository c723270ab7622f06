// A scripted Onyx2 behind BrickAccess: memory, memory map, fixed answers and enumerations; one
// result file every execution empties and refills, as the session's is; every command recorded.
#pragma once

#include <algorithm>
#include <array>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <map>
#include <string>
#include <utility>
#include <vector>

#include "tessel/DirEnt.h"
#include "tessel/ReaderWriter.h"
#include "tools/BrickAccess.h"
#include "tools/BrickMemoryMap.h"
#include "tools/BrickQueries.h"
#include "tools/FileText.h"
#include "tools/ScratchFile.h"
#include "workspace/MemoryBlock.h"
#include "workspace/MemoryFile.h"

namespace toolstest {

inline constexpr tessel::Long kOk = 0;
inline constexpr tessel::Long kExecFailed = static_cast<tessel::Long>(0xE0050415u);

struct EnumItem {
    tessel::Long status;
    std::string name;
};

class FakeBrick final : public tools::BrickAccess {
public:
    FakeBrick() { resultEntry_->addRef(); }
    ~FakeBrick() override { resultEntry_->release(); }

    bool brickTypeFails = false;
    bool usb = false; // else a serial tower on COM1
    std::map<tessel::Short, tessel::Short> properties = {{4, 3},   {5, 5},   {6, 250}, {7, 50},
                                                         {11, 20}, {12, 40}, {13, 64}, {8, 2}};
    std::map<tessel::Short, tessel::Short> infos = {{1, 10}, {2, 8}, {3, 5}, {18, 6000}};
    std::array<std::uint8_t, 0x10000> memory{};
    tools::BrickMemoryMap map;
    std::vector<std::uint8_t> version = {0, 3, 0, 1, 0, 3, 0, 9};
    // Results of "get 0x%x,n" by address, for RunImmediate.
    std::map<std::uint16_t, tessel::Long> numbers = {{tools::kTxPowerAddress, 1},
                                                     {tools::kPowerDownAddress, 10 * 256},
                                                     {tools::kProgramSlotAddress, 0}};
    // Commands whose execution fails, by exact text.
    std::vector<std::string> failing;
    std::map<int, std::vector<EnumItem>> enums;
    // The enumeration of this type never reports "no more items"; its names carry the padding.
    int endlessEnum = -1;
    std::string endlessPadding;
    // What the brick was asked, in order.
    std::vector<std::string> commands;

    // Lays out a program in a slot: subroutine and task sizes in bytes (0: absent), each
    // filled with bytes counting up from fill.
    void LoadProgram(int slot, const std::vector<int>& subSizes, const std::vector<int>& taskSizes,
                     std::uint16_t base = 0x1000)
    {
        std::uint16_t address = base;
        for (int s = 1; s <= 5; ++s) {
            for (int i = 1; i <= 8; ++i) {
                map.words[tools::BrickMemoryMap::SubIndex(s, i)] = address;
                if (s == slot && i <= static_cast<int>(subSizes.size()))
                    address = Fill(address, subSizes[i - 1]);
            }
        }
        for (int s = 1; s <= 5; ++s) {
            for (int i = 1; i <= 10; ++i) {
                map.words[tools::BrickMemoryMap::TaskIndex(s, i)] = address;
                if (s == slot && i <= static_cast<int>(taskSizes.size()))
                    address = Fill(address, taskSizes[i - 1]);
            }
        }
        map.words[tools::BrickMemoryMap::kTasksEnd] = address;
        map.words[tools::BrickMemoryMap::kFreeStart] = address;
        map.words[tools::BrickMemoryMap::kFreeEnd] = 0x3000;
        numbers[tools::kProgramSlotAddress] = slot - 1;
    }

    // The brick's answer to "get start,count".
    std::string CodeBytes(std::uint16_t start, int count) const
    {
        std::string list;
        for (int i = 0; i < count; ++i)
            list += Hex(memory[(start + i) & 0xFFFF], i + 1 < count);
        return list;
    }

    tessel::Long Get(tessel::Long, tessel::Short property, tessel::Short* value, char* text,
                     tessel::Size size) override
    {
        if (property == tessel::PropBrickType) {
            if (brickTypeFails)
                return kExecFailed;
            *value = tessel::BrickOnyx2;
            Copy("Onyx2", text, size);
            return kOk;
        }
        if (property == tessel::PropPort) {
            *value = usb ? tessel::PortUsb : tessel::PortSerialIr;
            Copy(usb ? "KIVOTOWER1" : "COM1", text, size);
            return kOk;
        }
        return Lookup(properties, property, value);
    }

    tessel::Long Info(tessel::Short, tessel::Short infoId, tessel::Short* value) override
    {
        return Lookup(infos, infoId, value);
    }

    tessel::Long FindFirst(tessel::Short type, tessel::Short* item, char* name,
                           tessel::Size size) override
    {
        return Item(type, *item = 0, name, size);
    }

    tessel::Long FindNext(tessel::Short type, tessel::Short* item, char* name,
                          tessel::Size size) override
    {
        return Item(type, ++*item, name, size);
    }

    tessel::Long TranslateText(tessel::Short, std::int32_t, const char* text, ReaderWriter** code,
                               IError*, ReaderWriter*, ReaderWriter*) override
    {
        ReaderWriter* file = tools::NewScratchFile(tessel::FileCode);
        file->openWrite();
        file->write(text, static_cast<std::int32_t>(std::strlen(text)));
        file->close();
        if (code != nullptr)
            *code = file;
        else
            file->release();
        return kOk;
    }

    tessel::Long ExecCode(tessel::Long, ReaderWriter* code, tessel::Long* result,
                          ReaderWriter** resultFile, tessel::Callback, void*) override
    {
        std::string text;
        tools::AppendFileText(code, text);
        commands.push_back(text);
        ReaderWriter* file = nullptr;
        if (resultFile != nullptr) {
            // One result file for every execution, emptied first.
            file = resultEntry_->open(tessel::FileResult);
            file->openWrite();
            file->setSize(0);
            file->close();
            *resultFile = file;
        }
        if (Fails(text))
            return kExecFailed;
        std::string answer;
        tessel::Long number = 0;
        unsigned address = 0;
        int count = 0;
        if (text == "brick version?") {
            for (std::size_t i = 0; i < version.size(); ++i)
                answer += Hex(version[i], i + 1 < version.size());
        } else if (text == "get map") {
            for (int i = 0; i < tools::BrickMemoryMap::kWordCount; ++i) {
                answer += Hex(map.words[i] >> 8, true);
                answer += Hex(map.words[i] & 0xFF, i + 1 < tools::BrickMemoryMap::kWordCount);
            }
        } else if (std::sscanf(text.c_str(), "get 0x%x,%d", &address, &count) == 2) {
            answer = CodeBytes(static_cast<std::uint16_t>(address), count);
            number = memory[address & 0xFFFF];
        }
        if (result != nullptr)
            *result = number;
        if (file != nullptr) {
            file->openWrite();
            file->write(answer.data(), static_cast<std::int32_t>(answer.size()));
            file->close();
        }
        return kOk;
    }

    tessel::Long RunImmediate(tessel::Long, const char* text, tessel::Long* result) override
    {
        commands.push_back(text);
        if (Fails(text))
            return kExecFailed;
        unsigned address = 0;
        int count = 0;
        if (std::sscanf(text, "get 0x%x,%d", &address, &count) != 2)
            return kExecFailed;
        auto found = numbers.find(static_cast<std::uint16_t>(address));
        if (result != nullptr)
            *result = found != numbers.end() ? found->second : 0;
        return kOk;
    }

private:
    bool Fails(const std::string& text) const
    {
        return std::find(failing.begin(), failing.end(), text) != failing.end();
    }

    static tessel::Long Lookup(const std::map<tessel::Short, tessel::Short>& values,
                               tessel::Short key, tessel::Short* value)
    {
        auto found = values.find(key);
        if (found == values.end())
            return kExecFailed;
        *value = found->second;
        return kOk;
    }

    static std::string Hex(unsigned value, bool comma)
    {
        char text[8];
        std::snprintf(text, sizeof text, comma ? "0x%02x," : "0x%02x", value & 0xFF);
        return text;
    }

    static void Copy(const std::string& from, char* text, tessel::Size size)
    {
        if (text != nullptr && size > 0)
            std::snprintf(text, size, "%s", from.c_str());
    }

    tessel::Long Item(tessel::Short type, int index, char* name, tessel::Size size)
    {
        if (type == endlessEnum) {
            Copy("COM" + std::to_string(index + 1) + endlessPadding, name, size);
            return kOk;
        }
        const std::vector<EnumItem>& items = enums[type];
        if (index >= static_cast<int>(items.size()))
            return static_cast<tessel::Long>(tessel::kNoMoreItems);
        Copy(items[index].name, name, size);
        return items[index].status;
    }

    std::uint16_t Fill(std::uint16_t address, int size)
    {
        for (int i = 0; i < size; ++i)
            memory[(address + i) & 0xFFFF] = static_cast<std::uint8_t>((address + i) & 0xFF);
        return static_cast<std::uint16_t>(address + size);
    }

    DirEnt* resultEntry_ = new MemoryEntry(new MemoryBlock());
};

} // namespace toolstest
