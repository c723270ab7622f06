// The brick queries and the upload's failure paths against the scripted brick; the lines of
// a good upload are checked against the simulator.
#include <gtest/gtest.h>

#include <cstdio>
#include <string>
#include <vector>

#include "FakeBrick.h"
#include "tools/BrickQueries.h"
#include "tools/FileText.h"
#include "tools/ProgramUpload.h"
#include "workspace/LiveObjects.h"

using toolstest::FakeBrick;

namespace {

constexpr tessel::Long kHandle = 7;
const auto kArgument = static_cast<tessel::Long>(tools::kArgumentError);
using Strings = std::vector<std::string>;

class BrickQueriesTest : public ::testing::Test {
protected:
    // Every handle a query gave out was given back.
    void TearDown() override { EXPECT_EQ(workspace::LiveObjectCount(), before_); }

    FakeBrick brick;
    tools::BrickQueries queries{brick};
    std::int64_t before_ = workspace::LiveObjectCount(); // after the fake's own result file
};

} // namespace

TEST_F(BrickQueriesTest, VersionDigitsGiveRomFirmwareAndText)
{
    tessel::Long rom = 0;
    tessel::Long firmware = 0;
    char text[tools::kVersionTextSize] = "x";
    EXPECT_GE(queries.GetBrickVersion(kHandle, &rom, &firmware, text, sizeof text), 0);
    EXPECT_EQ(rom, 301);
    EXPECT_EQ(firmware, 309);
    EXPECT_STREQ(text, "0301.0309");
    // A short answer leaves the outputs.
    brick.version.pop_back();
    rom = -1;
    EXPECT_GE(queries.GetBrickVersion(kHandle, &rom, nullptr, text, sizeof text), 0);
    EXPECT_EQ(rom, -1);
    EXPECT_STREQ(text, "");
}

TEST_F(BrickQueriesTest, SingleValuesUseTheirAddressesAndArgumentErrorsContactNoBrick)
{
    tools::BrickMemoryMap map;
    std::uint16_t start = 0, size = 0, value = 0;
    EXPECT_EQ(queries.GetTaskLocation(kHandle, map, 6, 1, &start, &size), kArgument);
    EXPECT_EQ(queries.GetTaskLocation(kHandle, map, 1, 0, &start, &size), kArgument);
    EXPECT_EQ(queries.GetTaskLocation(kHandle, map, 1, 1, nullptr, &size), kArgument);
    EXPECT_EQ(queries.GetSubLocation(kHandle, map, 1, 9, &start, &size), kArgument);
    EXPECT_EQ(queries.GetTaskByte(kHandle, 1, 11, &value), kArgument);
    EXPECT_EQ(queries.GetTxPower(kHandle, nullptr), kArgument);
    EXPECT_EQ(queries.GetMemoryMap(kHandle, nullptr), kArgument);
    EXPECT_TRUE(brick.commands.empty());

    std::uint16_t slot = 0, minutes = 0, power = 0;
    EXPECT_GE(queries.GetProgramSlot(kHandle, &slot), 0);
    EXPECT_GE(queries.GetPowerDownTime(kHandle, &minutes), 0);
    EXPECT_GE(queries.GetTaskByte(kHandle, 2, 3, &value), 0);
    EXPECT_EQ(slot, 1);
    EXPECT_EQ(minutes, 10);
    EXPECT_EQ(brick.commands, (Strings{"get 0xc924,1", "get 0xc8be,2", "get 0xc8fa,1"}));
    brick.failing = {"get 0xc8b0,1"};
    EXPECT_LT(queries.GetTxPower(kHandle, &power), 0);
    EXPECT_EQ(power, 0xFFFF); // the preset is kept
}

TEST_F(BrickQueriesTest, MemoryMapLocationsAndFreeMemory)
{
    brick.LoadProgram(2, {0, 12}, {12, 0, 20});
    tools::BrickMemoryMap map;
    EXPECT_GE(queries.GetMemoryMap(kHandle, &map), 0);
    for (int i = 0; i < tools::BrickMemoryMap::kWordCount; ++i)
        EXPECT_EQ(map.words[i], brick.map.words[i]) << "word " << i;
    std::uint16_t start = 0, size = 0, freeBytes = 0;
    EXPECT_GE(queries.GetTaskLocation(kHandle, map, 2, 3, &start, &size), 0);
    EXPECT_EQ(start, map.words[tools::BrickMemoryMap::TaskIndex(2, 3)]);
    EXPECT_EQ(size, 20);
    EXPECT_GE(queries.GetSubLocation(kHandle, map, 2, 2, &start, &size), 0);
    EXPECT_EQ(size, 12);
    EXPECT_GE(queries.GetFreeMemory(kHandle, map, &freeBytes), 0);
    EXPECT_EQ(freeBytes, 0x3000 - map.words[tools::BrickMemoryMap::kFreeStart]);
    // Word 40 closes the last subroutine of slot 5.
    map.words[39] = map.words[40];
    EXPECT_GE(queries.GetSubLocation(kHandle, map, 5, 8, &start, &size), 0);
    EXPECT_EQ(size, 0);
}

// The fake empties its one result file on every execution, as the session does, so a range
// collected there would keep only its last chunk.
TEST_F(BrickQueriesTest, MemoryRangeIsReadInChunksOf128AndStopsAtAFailureOrTheTop)
{
    for (int i = 0; i < 300; ++i)
        brick.memory[0x2000 + i] = static_cast<std::uint8_t>(i * 7);
    ReaderWriter* file = nullptr;
    EXPECT_GE(queries.ReadMemoryRange(kHandle, 0x2000, 300, &file), 0);
    EXPECT_EQ(brick.commands, (Strings{"get 0x2000,128", "get 0x2080,128", "get 0x2100,44"}));
    std::string text;
    EXPECT_TRUE(tools::AppendFileText(file, text));
    EXPECT_EQ(text, brick.CodeBytes(0x2000, 300));
    tools::ReleaseHandle(&file);

    brick.failing = {"get 0x2080,128"};
    EXPECT_LT(queries.ReadMemoryRange(kHandle, 0x2000, 300, &file), 0);
    text.clear();
    EXPECT_TRUE(tools::AppendFileText(file, text));
    EXPECT_EQ(text, brick.CodeBytes(0x2000, 128));
    tools::ReleaseHandle(&file);

    brick.commands.clear();
    EXPECT_GE(queries.ReadMemoryRange(kHandle, 0xFFF0, 100, &file), 0);
    EXPECT_EQ(brick.commands, Strings{"get 0xfff0,16"});
    tools::ReleaseHandle(&file);
}

TEST_F(BrickQueriesTest, AFailedUploadReadKeepsTheLinesBeforeAndSkipsTheSubroutines)
{
    tools::ProgramUpload upload(queries);
    brick.LoadProgram(1, {5}, {4, 4});
    const std::uint16_t task1 = brick.map.words[tools::BrickMemoryMap::TaskIndex(1, 1)];
    char failing[32];
    std::snprintf(failing, sizeof failing, "get 0x%x,4",
                  brick.map.words[tools::BrickMemoryMap::TaskIndex(1, 2)]);
    brick.failing = {failing};
    std::string lines;
    EXPECT_EQ(upload.Run(1, lines).stop, tools::UploadStop::None);
    EXPECT_EQ(lines, "task,0,4,0," + brick.CodeBytes(task1, 4) + "\r\n");
}
