// The interpreter against a fake brick: immediate commands, tasks, time, faults.
#include <gtest/gtest.h>

#include <string>

#include "Code.h"
#include "FakeHost.h"
#include "Machine.h"
#include "Program.h"
#include "Status.h"
#include "Translator.h"

using namespace tessel::lang;
using simlang_test::FakeHost;

namespace {

Program Compile(const std::string& source, int brickType = 6, int sourceType = SourceScript)
{
    Translator translator;
    TranslateRequest request;
    request.brickType = brickType;
    request.sourceType = sourceType;
    request.source = source;
    const TranslateResult result = translator.translate(request);
    EXPECT_EQ(result.code, 0) << result.detail << " at " << result.offset;
    Program program;
    EXPECT_EQ(ParseObject(result.output, program).code, 0);
    return program;
}

class MachineTest : public testing::Test {
protected:
    void load(const std::string& source, int brickType = 6)
    {
        program = Compile(source, brickType);
        host.load(&program);
    }
    void runFor(int milliseconds)
    {
        for (int t = 0; t < milliseconds; t += 10) {
            machine.advance(10);
        }
    }

    Program program;
    FakeHost host;
    Machine machine{6, host};
};

TEST_F(MachineTest, ImmediateRequestPassesItsOperandsAndAnswers)
{
    host.answerNumber = 7;
    host.answerText = "0x07";
    const ExecOutcome outcome = machine.execute(Compile("get 0xC924,2"));
    EXPECT_EQ(outcome.status, 0);
    EXPECT_EQ(outcome.answer.number, 7);
    EXPECT_EQ(outcome.answer.text, "0x07");
    ASSERT_EQ(host.requests.size(), 1u);
    EXPECT_EQ(host.requests[0], static_cast<int>(Request::GetMemory));
    EXPECT_EQ(host.requestArgs[0], 0xC924);
    EXPECT_EQ(host.requestArgs[1], 2);
}

TEST_F(MachineTest, FailedRequestStopsTheCommandsAfterIt)
{
    host.requestStatus = DriverError(2);
    const ExecOutcome outcome = machine.execute(Compile("brick alive?\nsound 3"));
    EXPECT_EQ(outcome.status, DriverError(2));
    EXPECT_TRUE(host.sounds.empty());
}

TEST_F(MachineTest, PollAnswersAValueAsTheResultNumber)
{
    host.inputs[1] = 321;
    EXPECT_EQ(machine.execute(Compile("poll input 2")).answer.number, 321);
}

TEST_F(MachineTest, ProgramOnlyInstructionIsRefusedAsImmediateCommand)
{
    const std::uint8_t wait[] = {0x26, 0x02, 0x0A, 0x00};
    EXPECT_EQ(machine.execute(wait, sizeof wait).status, BltError(10));
}

TEST_F(MachineTest, UndecodableBytesAreRefused)
{
    const std::uint8_t junk[] = {0x7F, 0x00};
    EXPECT_EQ(machine.execute(junk, sizeof junk).status, BltError(6));
    const std::uint8_t cut[] = {0x21, 0x02};
    EXPECT_EQ(machine.execute(cut, sizeof cut).status, BltError(6));
}

TEST_F(MachineTest, StartingAMissingTaskFails)
{
    EXPECT_EQ(machine.startTask(0), DriverError(9));
    EXPECT_EQ(machine.startTask(-1), DriverError(9));
    EXPECT_EQ(machine.startTask(99), DriverError(9));
    EXPECT_EQ(machine.execute(Compile("start main")).status, DriverError(9));
}

TEST_F(MachineTest, WaitSleepsUntilItsTimeHasPassed)
{
    load("program P { var n  main { n = 1  wait 50  n = 2 } }");
    ASSERT_EQ(machine.startTask(0), 0);
    machine.advance(0);
    EXPECT_EQ(host.variables[0], 1);
    machine.advance(490);
    EXPECT_EQ(host.variables[0], 1);
    EXPECT_TRUE(machine.taskRunning(0));
    machine.advance(10);
    EXPECT_EQ(host.variables[0], 2);
    EXPECT_FALSE(machine.anyTaskRunning());
}

TEST_F(MachineTest, EndlessLoopIsBoundedByTheBudget)
{
    load("program P { var n  main { while (1) n += 1 } }");
    ASSERT_EQ(machine.startTask(0), 0);
    machine.advance(10, 1000);
    EXPECT_TRUE(machine.taskRunning(0));
    EXPECT_GT(host.variables[0], 0);
    EXPECT_LT(host.variables[0], 1000);
    machine.stopAll();
    EXPECT_FALSE(machine.anyTaskRunning());
}

TEST_F(MachineTest, TasksTakeTurns)
{
    load("program P { var a, b  task other { while (1) b += 1 }"
         "  main { start other  while (1) a += 1 } }");
    ASSERT_EQ(machine.startTask(0), 0);
    machine.advance(10, 5000);
    EXPECT_GT(host.variables[0], 100);
    EXPECT_GT(host.variables[1], 100);
}

TEST_F(MachineTest, SubroutineReturnsToTheInstructionAfterTheCall)
{
    load("program P { var log  sub add { log = log * 10 + 2 }"
         "  main { log = 1  add()  log = log * 10 + 3  add() } }");
    ASSERT_EQ(machine.startTask(0), 0);
    runFor(100);
    EXPECT_EQ(host.variables[0], 1232);
}

TEST_F(MachineTest, CallsNestedTooDeepStopTheTaskWithAFault)
{
    // Opal lets a subroutine call itself; the brick's call stack ends it.
    program = Compile("sub 0\n call 0\nend\ntask 0\n call 0\nend\n", 6, SourceOpal);
    host.load(&program);
    ASSERT_EQ(machine.startTask(0), 0);
    runFor(100);
    EXPECT_FALSE(machine.anyTaskRunning());
    EXPECT_EQ(machine.lastFault(), DriverError(9));
}

TEST_F(MachineTest, ClearTasksStopsRunningTasks)
{
    load("program P { main { while (1) wait 1 } }");
    ASSERT_EQ(machine.startTask(0), 0);
    machine.advance(10);
    EXPECT_TRUE(machine.taskRunning(0));
    EXPECT_EQ(machine.execute(Compile("clear tasks")).status, 0);
    EXPECT_FALSE(machine.anyTaskRunning());
}

TEST_F(MachineTest, DivisionByZeroLeavesTheVariableUnchanged)
{
    load("program P { var a = 9, z, b = 4  main { a /= z  b %= z } }");
    ASSERT_EQ(machine.startTask(0), 0);
    runFor(50);
    EXPECT_EQ(host.variables[0], 9);
    EXPECT_EQ(host.variables[2], 4);
}

TEST_F(MachineTest, ArithmeticWrapsAtSixteenBits)
{
    load("program P { var a = 32767, b = 300  main { a += 1  b *= 300 } }");
    ASSERT_EQ(machine.startTask(0), 0);
    runFor(50);
    EXPECT_EQ(host.variables[0], -32768);
    EXPECT_EQ(host.variables[1], static_cast<std::int16_t>(90000 & 0xFFFF));
}

TEST_F(MachineTest, StoppedTaskGivesUpItsSemaphore)
{
    load("program P { semaphore s  var got"
         "  task holder { acquire s  while (1) wait 1 }"
         "  task taker { acquire s  got = 1 }"
         "  main { start holder  wait 2  start taker  wait 2  stop holder  wait 2 } }");
    ASSERT_EQ(machine.startTask(0), 0);
    runFor(30);
    EXPECT_EQ(host.variables[0], 0);
    runFor(100);
    EXPECT_EQ(host.variables[0], 1);
}

TEST_F(MachineTest, TimerCountsTenthsOfASecond)
{
    load("program P { timer t  var a  main { t = 0  wait 120  a = t } }");
    ASSERT_EQ(machine.startTask(0), 0);
    runFor(2000);
    EXPECT_EQ(host.variables[0], 12);
}

TEST_F(MachineTest, RestartingATaskBeginsItAgain)
{
    load("program P { var n  task ticker { n += 1  wait 1000 }"
         "  main { start ticker  wait 1  start ticker  wait 1 } }");
    ASSERT_EQ(machine.startTask(0), 0);
    runFor(100);
    EXPECT_EQ(host.variables[0], 2);
}

TEST(OpcodeTable, EveryRowDecodesWhatItEncodes)
{
    for (int byte = 0; byte < 256; ++byte) {
        const OpInfo* info = FindOp(static_cast<std::uint8_t>(byte));
        if (info == nullptr) {
            continue;
        }
        EXPECT_LT(byte, 0x60) << info->mnemonic;
        EXPECT_EQ(FindOp(info->mnemonic, std::string(info->mnemonic).size()), info);
        std::uint8_t code[16] = {static_cast<std::uint8_t>(byte)};
        int at = 1;
        for (const char* p = info->operands; *p != 0; ++p) {
            if (*p == 'v' || *p == 'd') {
                code[at] = static_cast<std::uint8_t>(Source::Variable);
                at += 3;
            } else {
                at += (*p == 'w' || *p == 'j') ? 2 : 1;
            }
        }
        ASSERT_EQ(at, info->size) << info->mnemonic;
        Instruction in;
        ASSERT_TRUE(Decode(code, static_cast<std::size_t>(at), 0, in)) << info->mnemonic;
        EXPECT_EQ(in.size, info->size);
        EXPECT_FALSE(Decode(code, static_cast<std::size_t>(at - 1), 0, in) && info->size > 1)
            << info->mnemonic << " decoded with its last byte missing";
    }
}

} // namespace
