#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "FakeBrick.h"
#include "tools/BrickQueries.h"
#include "tools/FileText.h"
#include "workspace/LiveObjects.h"

using toolstest::FakeBrick;

namespace {

constexpr tessel::Long kHandle = 7;

class BrickQueriesTest : public ::testing::Test {
protected:
    void TearDown() override
    {
        // Handles the queries gave out were all given back.
        EXPECT_EQ(workspace::LiveObjectCount(), before_);
    }

    FakeBrick brick;
    tools::BrickQueries queries{brick};
    // Taken after the fake made its own result file.
    std::int64_t before_ = workspace::LiveObjectCount();
};

using Strings = std::vector<std::string>;

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
    EXPECT_EQ(brick.commands, Strings{"brick version?"});
}

TEST_F(BrickQueriesTest, ShortVersionAnswerLeavesTheOutputs)
{
    brick.version = {0, 3, 0, 1, 0, 3, 0};
    tessel::Long rom = -1;
    char text[tools::kVersionTextSize] = "x";
    EXPECT_GE(queries.GetBrickVersion(kHandle, &rom, nullptr, text, sizeof text), 0);
    EXPECT_EQ(rom, -1);
    EXPECT_STREQ(text, "");
}

TEST_F(BrickQueriesTest, VersionFollowsTheBrickTypeQuery)
{
    brick.brickTypeFails = true;
    EXPECT_LT(queries.GetBrickVersion(kHandle, nullptr, nullptr, nullptr, 0), 0);
    EXPECT_TRUE(brick.commands.empty());
}

TEST_F(BrickQueriesTest, SingleValuesUseTheirAddresses)
{
    std::uint16_t value = 0;
    brick.numbers[tools::kProgramSlotAddress] = 0;
    EXPECT_GE(queries.GetProgramSlot(kHandle, &value), 0);
    EXPECT_EQ(value, 1);
    EXPECT_GE(queries.GetPowerDownTime(kHandle, &value), 0);
    EXPECT_EQ(value, 10);
    EXPECT_GE(queries.GetTxPower(kHandle, &value), 0);
    EXPECT_EQ(value, 1);
    EXPECT_GE(queries.GetTaskByte(kHandle, 2, 3, &value), 0);
    EXPECT_EQ(brick.commands,
              (Strings{"get 0xc924,1", "get 0xc8be,2", "get 0xc8b0,1", "get 0xc8fa,1"}));
}

TEST_F(BrickQueriesTest, FailedSingleValuesKeepTheirPresets)
{
    brick.failing = {"get 0xc8b0,1", "get 0xc924,1"};
    std::uint16_t power = 5;
    std::uint16_t slot = 5;
    EXPECT_LT(queries.GetTxPower(kHandle, &power), 0);
    EXPECT_EQ(power, 0xFFFF);
    EXPECT_LT(queries.GetProgramSlot(kHandle, &slot), 0);
    EXPECT_EQ(slot, 0);
    EXPECT_EQ(queries.GetTxPower(kHandle, nullptr),
              static_cast<tessel::Long>(tools::kArgumentError));
}

TEST_F(BrickQueriesTest, ArgumentErrorsContactNoBrick)
{
    tools::BrickMemoryMap map;
    std::uint16_t start = 1;
    std::uint16_t size = 1;
    const auto argument = static_cast<tessel::Long>(tools::kArgumentError);
    EXPECT_EQ(queries.GetTaskLocation(kHandle, map, 6, 1, &start, &size), argument);
    EXPECT_EQ(queries.GetTaskLocation(kHandle, map, 1, 0, &start, &size), argument);
    EXPECT_EQ(queries.GetTaskLocation(kHandle, map, 1, 11, &start, &size), argument);
    EXPECT_EQ(queries.GetTaskLocation(kHandle, map, 1, 1, nullptr, &size), argument);
    EXPECT_EQ(queries.GetSubLocation(kHandle, map, 0, 1, &start, &size), argument);
    EXPECT_EQ(queries.GetSubLocation(kHandle, map, 1, 9, &start, &size), argument);
    std::uint16_t value = 0;
    EXPECT_EQ(queries.GetTaskByte(kHandle, 1, 11, &value), argument);
    EXPECT_EQ(queries.GetMemoryMap(kHandle, nullptr), argument);
    EXPECT_TRUE(brick.commands.empty());
}

TEST_F(BrickQueriesTest, MemoryMapReadsAllWordsInOrder)
{
    brick.LoadProgram(2, {0, 12}, {12, 0, 20});
    tools::BrickMemoryMap map;
    EXPECT_GE(queries.GetMemoryMap(kHandle, &map), 0);
    for (int i = 0; i < tools::BrickMemoryMap::kWordCount; ++i)
        EXPECT_EQ(map.words[i], brick.map.words[i]) << "word " << i;
    std::uint16_t start = 0;
    std::uint16_t size = 0;
    EXPECT_GE(queries.GetTaskLocation(kHandle, map, 2, 3, &start, &size), 0);
    EXPECT_EQ(size, 20);
    EXPECT_EQ(start, map.words[tools::BrickMemoryMap::TaskIndex(2, 3)]);
    EXPECT_GE(queries.GetSubLocation(kHandle, map, 2, 2, &start, &size), 0);
    EXPECT_EQ(size, 12);
    std::uint16_t freeBytes = 0;
    EXPECT_GE(queries.GetFreeMemory(kHandle, map, &freeBytes), 0);
    EXPECT_EQ(freeBytes, 0x3000 - map.words[tools::BrickMemoryMap::kFreeStart]);
}

TEST_F(BrickQueriesTest, LastSubroutineOfSlotFiveIsClosedByWordForty)
{
    tools::BrickMemoryMap map;
    map.words[39] = 0x2000;
    map.words[40] = 0x2000;
    std::uint16_t start = 0;
    std::uint16_t size = 9;
    EXPECT_GE(queries.GetSubLocation(kHandle, map, 5, 8, &start, &size), 0);
    EXPECT_EQ(size, 0);
    map.words[89] = 0x2100;
    map.words[90] = 0x2140;
    EXPECT_GE(queries.GetTaskLocation(kHandle, map, 5, 10, &start, &size), 0);
    EXPECT_EQ(size, 0x40);
}

TEST_F(BrickQueriesTest, MemoryRangeOfThreeHundredBytesTakesThreeCommands)
{
    for (int i = 0; i < 300; ++i)
        brick.memory[0x2000 + i] = static_cast<std::uint8_t>(i * 7);
    ReaderWriter* file = nullptr;
    EXPECT_GE(queries.ReadMemoryRange(kHandle, 0x2000, 300, &file), 0);
    EXPECT_EQ(brick.commands, (Strings{"get 0x2000,128", "get 0x2080,128", "get 0x2100,44"}));
    std::string text;
    ASSERT_TRUE(tools::AppendFileText(file, text));
    EXPECT_EQ(text, brick.CodeBytes(0x2000, 300));
    tools::ReleaseHandle(&file);
    EXPECT_EQ(file, nullptr);
}

TEST_F(BrickQueriesTest, MemoryRangeStopsAfterAFailedChunk)
{
    brick.failing = {"get 0x2080,128"};
    ReaderWriter* file = nullptr;
    EXPECT_LT(queries.ReadMemoryRange(kHandle, 0x2000, 300, &file), 0);
    EXPECT_EQ(brick.commands, (Strings{"get 0x2000,128", "get 0x2080,128"}));
    std::string text;
    ASSERT_TRUE(tools::AppendFileText(file, text));
    EXPECT_EQ(text, brick.CodeBytes(0x2000, 128));
    tools::ReleaseHandle(&file);
}

TEST_F(BrickQueriesTest, EmptyRangeSucceedsWithAnEmptyFile)
{
    ReaderWriter* file = nullptr;
    EXPECT_GE(queries.ReadMemoryRange(kHandle, 0x2000, 0, &file), 0);
    ASSERT_NE(file, nullptr);
    EXPECT_EQ(file->size(), 0);
    EXPECT_TRUE(brick.commands.empty());
    tools::ReleaseHandle(&file);
}

TEST_F(BrickQueriesTest, RangeEndsAtTheTopOfMemory)
{
    ReaderWriter* file = nullptr;
    EXPECT_GE(queries.ReadMemoryRange(kHandle, 0xFFF0, 100, &file), 0);
    EXPECT_EQ(brick.commands, Strings{"get 0xfff0,16"});
    tools::ReleaseHandle(&file);
}

TEST_F(BrickQueriesTest, RoverLocationsComeFromBrickMemory)
{
    brick.brickType = tessel::BrickRover;
    brick.PutRoverPair(0x238 + 2, 0x0500, 0x0520);
    brick.PutRoverPair(0x232 + 3, 0x0400, 0x0401);
    brick.PutRoverPair(0x245, 0x0600, 0x0700);
    tools::BrickMemoryMap map;
    std::uint16_t start = 0;
    std::uint16_t size = 0;
    EXPECT_GE(queries.GetTaskLocation(kHandle, map, 1, 2, &start, &size), 0);
    EXPECT_EQ(start, 0x0500);
    EXPECT_EQ(size, 0x20);
    EXPECT_GE(queries.GetSubLocation(kHandle, map, 1, 3, &start, &size), 0);
    EXPECT_EQ(start, 0x0400);
    EXPECT_EQ(size, 1);
    std::uint16_t freeBytes = 0;
    EXPECT_GE(queries.GetFreeMemory(kHandle, map, &freeBytes), 0);
    EXPECT_EQ(freeBytes, 0x100 + 4);
    EXPECT_EQ(brick.commands, (Strings{"get 0x23a,4", "get 0x235,4", "get 0x245,4"}));
}

TEST_F(BrickQueriesTest, RoverRefusesOtherSlotsAndIndexes)
{
    brick.brickType = tessel::BrickRover;
    tools::BrickMemoryMap map;
    std::uint16_t start = 0;
    std::uint16_t size = 0;
    const auto argument = static_cast<tessel::Long>(tools::kArgumentError);
    EXPECT_EQ(queries.GetTaskLocation(kHandle, map, 1, 7, &start, &size), argument);
    EXPECT_EQ(queries.GetTaskLocation(kHandle, map, 2, 1, &start, &size), argument);
    EXPECT_EQ(queries.GetSubLocation(kHandle, map, 1, 4, &start, &size), argument);
    EXPECT_TRUE(brick.commands.empty());
}
