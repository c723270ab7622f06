// The interpreter against a fake brick: immediate commands, tasks, time, faults. What a script
// shows by the variables it leaves lives in language/.
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

Program Compile(const std::string& source, int sourceType = SourceScript)
{
    Translator translator;
    TranslateRequest request;
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
    void start(const std::string& source, int sourceType = SourceScript)
    {
        program = Compile(source, sourceType);
        host.load(&program);
        ASSERT_EQ(machine.startTask(0), 0);
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

TEST_F(MachineTest, ImmediateRequestsPassTheirOperandsAndAnswer)
{
    host.answerNumber = 7;
    host.answerText = "0x07";
    const ExecOutcome outcome = machine.execute(Compile("get 0xC924,2"));
    EXPECT_EQ(outcome.status, 0);
    EXPECT_EQ(outcome.answer.number, 7);
    EXPECT_EQ(outcome.answer.text, "0x07");
    EXPECT_EQ(host.requests, std::vector<int>{static_cast<int>(Request::GetMemory)});
    EXPECT_EQ(host.requestArgs, (std::vector<std::int32_t>{0xC924, 2}));
    host.inputs[1] = 321;
    EXPECT_EQ(machine.execute(Compile("poll input 2")).answer.number, 321);
    // A failed request stops the commands after it.
    host.requestStatus = DriverError(2);
    EXPECT_EQ(machine.execute(Compile("brick alive?\nsound 3")).status, DriverError(2));
    EXPECT_TRUE(host.sounds.empty());
}

TEST_F(MachineTest, BadImmediateCommandsAndMissingTasksAreRefused)
{
    const std::uint8_t wait[] = {0x26, 0x02, 0x0A, 0x00}; // program only
    EXPECT_EQ(machine.execute(wait, sizeof wait).status, BltError(10));
    const std::uint8_t junk[] = {0x7F, 0x00};
    EXPECT_EQ(machine.execute(junk, sizeof junk).status, BltError(6));
    const std::uint8_t cut[] = {0x21, 0x02};
    EXPECT_EQ(machine.execute(cut, sizeof cut).status, BltError(6));
    for (int task : {0, -1, 99}) {
        EXPECT_EQ(machine.startTask(task), DriverError(9)) << task;
    }
    EXPECT_EQ(machine.execute(Compile("start main")).status, DriverError(9));
}

TEST_F(MachineTest, WaitSleepsUntilItsTimeHasPassed)
{
    start("program P { var n  main { n = 1  wait 50  n = 2 } }");
    machine.advance(0);
    EXPECT_EQ(host.variables[0], 1);
    machine.advance(490);
    EXPECT_EQ(host.variables[0], 1);
    EXPECT_TRUE(machine.taskRunning(0));
    machine.advance(10);
    EXPECT_EQ(host.variables[0], 2);
    EXPECT_FALSE(machine.anyTaskRunning());
}

TEST_F(MachineTest, EndlessTasksTakeTurnsWithinTheBudget)
{
    start("program P { var a, b  task other { while (1) b += 1 }"
          "  main { start other  while (1) a += 1 } }");
    machine.advance(10, 1000);
    EXPECT_TRUE(machine.taskRunning(0));
    EXPECT_GT(host.variables[0], 0);
    EXPECT_LT(host.variables[0] + host.variables[1], 1000);
    machine.advance(10, 5000);
    EXPECT_GT(host.variables[0], 100);
    EXPECT_GT(host.variables[1], 100);
    EXPECT_EQ(machine.execute(Compile("clear tasks")).status, 0);
    EXPECT_FALSE(machine.anyTaskRunning());
}

TEST_F(MachineTest, CallsNestedTooDeepStopTheTaskWithAFault)
{
    // Opal lets a subroutine call itself; the brick's call stack ends it.
    start("sub 0\n call 0\nend\ntask 0\n call 0\nend\n", SourceOpal);
    runFor(100);
    EXPECT_FALSE(machine.anyTaskRunning());
    EXPECT_EQ(machine.lastFault(), DriverError(9));
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
