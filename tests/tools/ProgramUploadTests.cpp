#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "FakeBrick.h"
#include "tools/BrickQueries.h"
#include "tools/ProgramUpload.h"
#include "workspace/LiveObjects.h"

using toolstest::FakeBrick;

namespace {

constexpr tessel::Long kHandle = 9;

class ProgramUploadTest : public ::testing::Test {
protected:
    void TearDown() override { EXPECT_EQ(workspace::LiveObjectCount(), before_); }

    std::string Run(tools::UploadStop expected = tools::UploadStop::None)
    {
        std::string lines;
        EXPECT_EQ(upload.Run(kHandle, lines).stop, expected);
        return lines;
    }

    std::uint16_t Start(int index) const { return brick.map.words[index]; }

    FakeBrick brick;
    tools::BrickQueries queries{brick};
    tools::ProgramUpload upload{queries};
    std::int64_t before_ = workspace::LiveObjectCount();
};

int CountValues(const std::string& list)
{
    int count = list.empty() ? 0 : 1;
    for (char c : list)
        count += c == ',';
    return count;
}

} // namespace

TEST_F(ProgramUploadTest, TasksThenSubroutinesWithTheirBytes)
{
    brick.LoadProgram(2, {0, 12}, {12, 0, 200});
    brick.numbers[static_cast<std::uint16_t>(tools::kTaskByteBase + 20 + 1)] = 1;
    brick.numbers[static_cast<std::uint16_t>(tools::kTaskByteBase + 20 + 3)] = 2;
    const std::uint16_t task1 = Start(tools::BrickMemoryMap::TaskIndex(2, 1));
    const std::uint16_t task3 = Start(tools::BrickMemoryMap::TaskIndex(2, 3));
    const std::uint16_t sub2 = Start(tools::BrickMemoryMap::SubIndex(2, 2));
    EXPECT_EQ(Run(), "task,0,12,1," + brick.CodeBytes(task1, 12) + "\r\n" + "task,2,200,2," +
                         brick.CodeBytes(task3, 200) + "\r\n" + "sub,1,11,0," +
                         brick.CodeBytes(sub2, 11) + "\r\n");
    EXPECT_EQ(CountValues(brick.CodeBytes(task1, 12)), 12);
    EXPECT_EQ(CountValues(brick.CodeBytes(sub2, 11)), 11);
}

TEST_F(ProgramUploadTest, EmptySlotGivesAnEmptyText)
{
    brick.LoadProgram(1, {}, {});
    EXPECT_EQ(Run(), "");
}

TEST_F(ProgramUploadTest, SubroutineOfOneByteIsNotListed)
{
    brick.LoadProgram(1, {1, 2}, {});
    const std::uint16_t sub2 = Start(tools::BrickMemoryMap::SubIndex(1, 2));
    EXPECT_EQ(Run(), "sub,1,1,0," + brick.CodeBytes(sub2, 1) + "\r\n");
}

TEST_F(ProgramUploadTest, FailedRangeReadKeepsTheLinesBefore)
{
    brick.LoadProgram(1, {5}, {4, 4});
    const std::uint16_t task1 = Start(tools::BrickMemoryMap::TaskIndex(1, 1));
    const std::uint16_t task2 = Start(tools::BrickMemoryMap::TaskIndex(1, 2));
    char failing[32];
    std::snprintf(failing, sizeof failing, "get 0x%x,4", task2);
    brick.failing = {failing};
    // The failed task ends the task walk and skips the subroutines.
    EXPECT_EQ(Run(), "task,0,4,0," + brick.CodeBytes(task1, 4) + "\r\n");
}

TEST_F(ProgramUploadTest, UnreadableSlotOrMapStopsBeforeAnyLine)
{
    brick.failing = {"get 0xc924,1"};
    EXPECT_EQ(Run(tools::UploadStop::ProgramSlot), "");
    brick.failing = {"get map"};
    EXPECT_EQ(Run(tools::UploadStop::MemoryMap), "");
}

TEST_F(ProgramUploadTest, RoverListsOnlyTasksOfSlotOne)
{
    brick.brickType = tessel::BrickRover;
    brick.numbers[tools::kProgramSlotAddress] = 0;
    // The task table: cell 0x238 + t holds the start of task t, the next cell closes it.
    const std::uint16_t starts[] = {0x0610, 0x0613, 0x0616, 0x0616, 0x0616, 0x0616, 0x0616};
    for (int task = 1; task <= 7; ++task)
        brick.roverCells[static_cast<std::uint16_t>(tools::kRoverTaskBase + task)] =
            starts[task - 1];
    brick.PutRoverPair(static_cast<std::uint16_t>(tools::kRoverSubBase + 1), 0x0700, 0x0705);
    const std::string lines = Run();
    EXPECT_EQ(lines, "task,0,3,0," + brick.CodeBytes(0x0610, 3) + "\r\n" + "task,1,3,0," +
                         brick.CodeBytes(0x0613, 3) + "\r\n")
        << lines.substr(0, 200);
    // Task 7 is an argument error: no subroutine is asked for.
    for (const std::string& command : brick.commands)
        EXPECT_NE(command, "get 0x233,4");
}

TEST_F(ProgramUploadTest, RoverInAnotherSlotStaysEmpty)
{
    brick.brickType = tessel::BrickRover;
    brick.numbers[tools::kProgramSlotAddress] = 1;
    EXPECT_EQ(Run(), "");
}
