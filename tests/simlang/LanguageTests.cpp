// The translator as a whole (how it reports, what it refuses, hostile input), firmware images,
// and the interpreter against a fake brick. What a script shows by its effects lives in the
// script files under language/, limits/ and errors/.
#include <gtest/gtest.h>

#include <cstdint>
#include <fstream>
#include <sstream>
#include <string>
#include <tuple>
#include <vector>

#include "Code.h"
#include "FakeHost.h"
#include "Firmware.h"
#include "Machine.h"
#include "Program.h"
#include "Status.h"
#include "Translator.h"

using namespace tessel::lang;
using simlang_test::FakeHost;

namespace {

TranslateResult Translate(const std::string& source, int sourceType = SourceScript,
                          int target = TargetObject, int brickType = 6)
{
    TranslateRequest request;
    request.brickType = brickType;
    request.sourceType = sourceType;
    request.targetType = target;
    request.source = source;
    return Translator().translate(request);
}

// Translates and reads the object back; both must succeed.
Program Compile(const std::string& source, int sourceType = SourceScript)
{
    const TranslateResult result = Translate(source, sourceType);
    EXPECT_EQ(result.code, 0) << result.detail << " at " << result.offset;
    Program program;
    EXPECT_EQ(ParseObject(result.output, program).code, 0) << result.output;
    return program;
}

using Report = std::tuple<std::int32_t, std::int32_t, std::string>; // code, offset, detail

class RecordingDiagnostics : public Diagnostics {
public:
    void report(std::int32_t code, std::int32_t offset, const char* detail) override
    {
        reports.emplace_back(code, offset, detail);
    }
    std::vector<Report> reports;
};

TEST(Translator, ReportsAFailureOnceAndSuccessNotAtAll)
{
    RecordingDiagnostics diagnostics;
    Translator translator;
    TranslateRequest request;
    const std::string source = "program P { main { speed = 1 } }";
    request.source = source;
    request.diagnostics = &diagnostics;
    EXPECT_EQ(static_cast<std::uint32_t>(translator.translate(request).code), 0xE0050810u);
    request.source = "sound 4";
    EXPECT_EQ(translator.translate(request).code, 0);
    const auto speed = static_cast<std::int32_t>(source.find("speed"));
    EXPECT_EQ(diagnostics.reports, (std::vector<Report>{{CompilerError(16), speed, "speed"}}));
}

TEST(Translator, UnknownTypesAndBrickTypesWithoutALanguageAreRefused)
{
    EXPECT_EQ(Translate("sound 1", 9).code, LibraryError(148));
    EXPECT_EQ(Translate("sound 1", 0).code, LibraryError(148));
    EXPECT_EQ(Translate("sound 1", SourceScript, 5).code, LibraryError(150));
    EXPECT_EQ(Translate("sound 1", SourceOpal, 0).code, LibraryError(150));
    for (int type = -1; type <= 8; ++type) {
        EXPECT_EQ(Translate("sound 1", SourceScript, TargetObject, type).code,
                  type >= 2 && type <= 7 ? 0 : CompilerError(145))
            << type;
    }
    int id = 0;
    EXPECT_STREQ(SourceTypeName(0, &id), "Script");
    EXPECT_EQ(id, 1);
    EXPECT_STREQ(SourceTypeName(3, &id), "BIN");
    EXPECT_EQ(id, 4);
    EXPECT_EQ(SourceTypeName(5, &id), nullptr);
    EXPECT_STREQ(TargetTypeName(1, &id), "CSV");
    EXPECT_EQ(id, 7);
    EXPECT_EQ(TargetTypeName(2, nullptr), nullptr);
}

TEST(Translator, ObjectSourceIsUsedAsItIsSoWritingAndParsingAreInverse)
{
    const TranslateResult first =
        Translate("program P { var x  sub s { x = 1 }  main { x = 3  s()  sound 2 } }");
    ASSERT_EQ(first.code, 0);
    ASSERT_NE(first.output.find("sub"), std::string::npos) << first.output;
    const TranslateResult again = Translate(first.output, SourceObject);
    ASSERT_EQ(again.code, 0) << again.detail;
    EXPECT_EQ(again.output, first.output);
}

TEST(Translator, LongScriptTranslatesAndOversizedSourceIsRefusedBeforeReading)
{
    // About one statement a line, 900 a task, in ten tasks.
    const char* statements[] = {
        "  a = b + c * 3 - (a & 7)\n", "  if (a < b && c != 2) { b += 1 } else { c -= 1 }\n",
        "  repeat (3) sound 1\n", "  while (c > 10) c = c / 2\n", "  tone 440, 10\n"};
    std::string text = "program Long {\n var a, b, c\n";
    for (int task = 0; task < 10; ++task) {
        text += task == 0 ? " main {\n" : " task t" + std::to_string(task) + " {\n";
        for (int i = 0; i < 900; ++i) {
            text += statements[i % 5];
        }
        text += " }\n";
    }
    const Program program = Compile(text + "}\n");
    EXPECT_GT(program.commandCount, 10000);
    const std::string huge((4u << 20) + 1, ' ');
    for (int type = SourceScript; type <= SourceFirmware; ++type) {
        EXPECT_EQ(Translate(huge, type).code, CompilerError(152)) << type;
    }
}

TEST(Translator, DeepNestingFailsWithACodeInsteadOfExhaustingTheStack)
{
    EXPECT_EQ(Translate("program P { main " + std::string(200000, '{') + " } }").code,
              CompilerError(1)); // never closed: refused at the first brace before parsing
    EXPECT_EQ(Translate("program P { var x main { x = " + std::string(100000, '-') + "x } }").code,
              CompilerError(2));
    std::string chain = "program P { var x main { x = x";
    for (int i = 0; i < 5000; ++i) {
        chain += " + x";
    }
    EXPECT_EQ(Translate(chain + " } }").code, CompilerError(2));
}

TEST(Translator, BinaryInputOfEveryTypeFailsCleanly)
{
    std::uint32_t seed = 12345;
    for (int round = 0; round < 20; ++round) {
        std::string junk(4096, '\0');
        for (char& c : junk) {
            seed = seed * 1103515245u + 12345u;
            c = static_cast<char>(seed >> 24);
        }
        for (int type = SourceScript; type <= SourceFirmware; ++type) {
            const TranslateResult result = Translate(junk, type);
            EXPECT_LT(result.code, 0) << "type " << type;
            EXPECT_GE(result.offset, 0);
            EXPECT_LE(result.offset, static_cast<std::int32_t>(junk.size()));
            EXPECT_LT(result.detail.size(), 256u);
        }
    }
}

// Every one-byte change of valid sources must end in a code or an object that reads back.
TEST(Translator, MutatedSourcesNeverBreakTheTranslator)
{
    const std::pair<int, std::string> sources[] = {
        {SourceScript, "#define P(a,b) a+b\nprogram M { var x, y = 2 timer t event e\n"
                       " sub s { x = P(x, 1) }\n task w { await e  send x }\n main { start w"
                       "  repeat (3) { s() }  if (x > 2 || !(y == 2)) signal e  x = t } }"},
        {SourceOpal, "task 0\nl:\n addv v0, #1\n jmpf v0, <, 10, l\n halt\nend\n"},
        {SourceRaw, "20 04\n33 24 c9 01 00\n"},
        {SourceObject, "tobj 1 6 program\ntask 0\ncmd 20 01\ncmd 17\nend\n"},
    };
    const char replacements[] = {'(', ')', '{', '}', ',', '#', '0', 'x', ' ', '\n', '\0', '\xff'};
    for (const auto& [type, source] : sources) {
        for (std::size_t i = 0; i < source.size(); ++i) {
            for (char r : replacements) {
                std::string mutated = source;
                mutated[i] = r;
                const TranslateResult result = Translate(mutated, type);
                if (result.code >= 0) {
                    Program program;
                    EXPECT_EQ(ParseObject(result.output, program).code, 0) << mutated;
                }
                Translate(mutated, type, TargetListing);
            }
        }
    }
}

std::string ReadFirmware(const char* name)
{
    std::ostringstream text;
    text << std::ifstream(std::string(SIMLANG_RESOURCES_DIR) + "/firmware/" + name,
                          std::ios::binary)
                .rdbuf();
    return text.str();
}

std::string Image(std::initializer_list<const char*> records)
{
    std::string text;
    for (const char* record : records) {
        text += SealRecord(record) + "\n";
    }
    return text;
}

TEST(FirmwareImage, ShippedImagesTranslateOrFailAtTheCorruptRecord)
{
    const Program program = Compile(ReadFirmware("Onyx2firm.kvo"), SourceFirmware);
    EXPECT_EQ(program.kind, ObjectKind::Firmware);
    EXPECT_EQ(program.firmwareVersion, 309);
    ASSERT_EQ(program.firmware.size(), 64u);
    EXPECT_EQ(program.commandCount, 64);
    EXPECT_EQ(program.firmware[1].address, 0x8020);
    EXPECT_EQ(program.firmware[1].data.size(), 32u);

    const std::string corrupt = ReadFirmware("corrupt.kvo");
    const TranslateResult bad = Translate(corrupt, SourceFirmware);
    EXPECT_EQ(static_cast<std::uint32_t>(bad.code), 0xE0050415u);
    EXPECT_EQ(corrupt.compare(static_cast<std::size_t>(bad.offset), 7, "D 8220 "), 0)
        << "offset " << bad.offset;
    EXPECT_TRUE(bad.output.empty());
}

TEST(FirmwareImage, ChecksumIsTheCharacterSumAndEveryDigitCounts)
{
    EXPECT_EQ(RecordChecksum("V 0309"), 0x42);
    EXPECT_EQ(SealRecord("E"), "E *45");
    const std::string good = Image({"V 0101", "D 9000 00112233", "E"});
    ASSERT_EQ(Translate(good, SourceFirmware).code, 0);
    const std::size_t data = good.find("D 9000");
    for (std::size_t i = data + 7; i < data + 15; ++i) {
        std::string bad = good;
        bad[i] = bad[i] == '1' ? '2' : '1';
        EXPECT_EQ(Translate(bad, SourceFirmware).code, DriverError(21)) << "digit " << i;
    }
}

TEST(FirmwareImage, MalformedRecordsAreSyntaxErrorsAndWindowsLinesAreFine)
{
    const std::string images[] = {
        Image({"D 9000 00", "E"}), // no version
        Image({"V 0101", "D 9000 001", "E"}),
        Image({"V 0101", "D 900 0011", "E"}),
        Image({"V 101", "E"}),
        Image({"V 0101", "V 0102", "E"}),
        Image({"V 0101", "E", "D 9000 00"}),
        Image({"V 0101", "D FFFF 0011", "E"}),
        Image({"V 0101"}), // no end
        "V 0101\nE\n",     // no checksums
        "",
    };
    for (const std::string& image : images) {
        EXPECT_EQ(Translate(image, SourceFirmware).code, CompilerError(1)) << image;
    }
    EXPECT_EQ(Translate(Image({"V 0101", "E"}), SourceFirmware, TargetListing).code,
              LibraryError(150));
    const Program program =
        Compile("# image\r\n\r\n" + SealRecord("V 0042") + "\r\n  " + SealRecord("D 0010 ab") +
                    "\r\n" + SealRecord("E") + "\r\n# end\r\n",
                SourceFirmware);
    EXPECT_EQ(program.firmwareVersion, 42);
    ASSERT_EQ(program.firmware.size(), 1u);
    EXPECT_EQ(program.firmware[0].data[0], 0xAB);
}

class MachineTest : public testing::Test {
protected:
    void start(const std::string& source, int sourceType = SourceScript)
    {
        program = Compile(source, sourceType);
        host.load(&program);
        ASSERT_EQ(machine.startTask(0), 0);
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
    for (int t = 0; t < 100; t += 10) {
        machine.advance(10);
    }
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
