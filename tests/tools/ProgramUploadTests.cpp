// Failure paths of the upload; the lines themselves are checked against the simulator.
#include <gtest/gtest.h>

#include <cstdio>
#include <string>

#include "FakeBrick.h"
#include "tools/BrickQueries.h"
#include "tools/ProgramUpload.h"

using toolstest::FakeBrick;

TEST(ProgramUpload, FailedRangeReadKeepsTheLinesBeforeAndSkipsTheSubroutines)
{
    FakeBrick brick;
    tools::BrickQueries queries(brick);
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

TEST(ProgramUpload, UnreadableSlotOrMapStopsBeforeAnyLine)
{
    FakeBrick brick;
    tools::BrickQueries queries(brick);
    tools::ProgramUpload upload(queries);
    std::string lines;
    brick.failing = {"get 0xc924,1"};
    EXPECT_EQ(upload.Run(1, lines).stop, tools::UploadStop::ProgramSlot);
    brick.failing = {"get map"};
    tools::UploadOutcome outcome = upload.Run(1, lines);
    EXPECT_EQ(outcome.stop, tools::UploadStop::MemoryMap);
    EXPECT_EQ(outcome.code, toolstest::kExecFailed);
    EXPECT_EQ(lines, "");
}
