// The translator as a whole: how it reports, what it refuses, and hostile input.
#include <gtest/gtest.h>

#include <cstdint>
#include <string>
#include <vector>

#include "Program.h"
#include "Status.h"
#include "Translator.h"

using namespace tessel::lang;

namespace {

class RecordingDiagnostics : public Diagnostics {
public:
    void report(std::int32_t code, std::int32_t offset, const char* detail) override
    {
        ++reports;
        lastCode = code;
        lastOffset = offset;
        lastDetail = detail;
    }
    int reports = 0;
    std::int32_t lastCode = 0;
    std::int32_t lastOffset = -1;
    std::string lastDetail;
};

class MapIncludes : public IncludeReader {
public:
    bool readInclude(const std::string& name, std::string& text) override
    {
        asked.push_back(name);
        if (name == "notes.h") {
            text = "#define LA 440\n";
            return true;
        }
        return false;
    }
    std::vector<std::string> asked;
};

TranslateResult Translate(const std::string& source, int sourceType = SourceScript,
                          int target = TargetObject, int brickType = 6)
{
    Translator translator;
    TranslateRequest request;
    request.brickType = brickType;
    request.sourceType = sourceType;
    request.targetType = target;
    request.source = source;
    return translator.translate(request);
}

int CountCmd(const std::string& text)
{
    int count = 0;
    for (std::size_t at = text.find("cmd"); at != std::string::npos;
         at = text.find("cmd", at + 1)) {
        ++count;
    }
    return count;
}

// A long program of ordinary statements, about one statement a line, in ten tasks.
std::string LongProgram(int lines)
{
    const char* statements[] = {
        "  a = b + c * 3 - (a & 7)\n", "  if (a < b && c != 2) { b += 1 } else { c -= 1 }\n",
        "  repeat (3) sound 1\n", "  while (c > 10) c = c / 2\n", "  tone 440, 10\n"};
    std::string text = "program Long {\n var a, b, c\n";
    for (int task = 0, made = 2; task < 10 && made < lines - 2; ++task, made += 2) {
        text += task == 0 ? " main {\n" : " task t" + std::to_string(task) + " {\n";
        for (int i = 0; i < 900 && made < lines - 4; ++i, ++made) {
            text += statements[i % 5];
        }
        text += " }\n";
    }
    return text + "}\n";
}

TEST(Translator, ReportsAFailureOnceAndSuccessNotAtAll)
{
    RecordingDiagnostics diagnostics;
    Translator translator;
    TranslateRequest request;
    const std::string source = "program P { main { speed = 1 } }";
    request.source = source;
    request.diagnostics = &diagnostics;
    const TranslateResult result = translator.translate(request);
    EXPECT_EQ(static_cast<std::uint32_t>(result.code), 0xE0050810u);
    EXPECT_EQ(diagnostics.reports, 1);
    EXPECT_EQ(diagnostics.lastCode, result.code);
    EXPECT_EQ(diagnostics.lastOffset, static_cast<std::int32_t>(source.find("speed")));
    EXPECT_EQ(diagnostics.lastDetail, "speed");
    request.source = "sound 4";
    EXPECT_EQ(translator.translate(request).code, 0);
    EXPECT_EQ(diagnostics.reports, 1);
}

TEST(Translator, AsksForIncludesInLowerCaseAndNamesAMissingOneAsWritten)
{
    MapIncludes includes;
    Translator translator;
    TranslateRequest request;
    request.source = "#include <Notes.H>\nprogram P { main { tone LA, 10 } }";
    request.includes = &includes;
    EXPECT_EQ(translator.translate(request).code, 0);
    EXPECT_EQ(includes.asked, std::vector<std::string>{"notes.h"});
    request.source = "sound 1\n#include <Other.h>";
    const TranslateResult result = translator.translate(request);
    EXPECT_EQ(result.code, CompilerError(146));
    EXPECT_EQ(result.offset, 8);
    EXPECT_EQ(result.detail, "Other.h");
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
}

TEST(Translator, ObjectSourceIsUsedAsItIsAndWritingAndParsingAreInverse)
{
    const TranslateResult first = Translate("program P { var x  main { x = 3  sound 2 } }");
    ASSERT_EQ(first.code, 0);
    const TranslateResult again = Translate(first.output, SourceObject);
    ASSERT_EQ(again.code, 0) << again.detail;
    EXPECT_EQ(again.output, first.output);
    Program program;
    program.kind = ObjectKind::Program;
    program.routines.push_back(Routine{RoutineKind::Task, 0, {0x20, 0x01, 0x17}, 2});
    program.routines.push_back(Routine{RoutineKind::Sub, 3, {0x13}, 1});
    const std::string text = WriteObject(program);
    Program back;
    ASSERT_EQ(ParseObject(text, back).code, 0) << text;
    ASSERT_EQ(back.routines.size(), 2u);
    EXPECT_EQ(back.routines[0].code, program.routines[0].code);
    EXPECT_EQ(back.routines[1].number, 3);
    EXPECT_EQ(back.commandCount, 3);
    EXPECT_EQ(WriteObject(back), text);
}

TEST(Translator, LongScriptTranslatesAndOversizedSourceIsRefusedBeforeReading)
{
    const TranslateResult result = Translate(LongProgram(10000));
    ASSERT_EQ(result.code, 0) << result.detail << " at " << result.offset;
    EXPECT_GT(CountCmd(result.output), 10000);
    const std::string huge((4u << 20) + 1, ' ');
    for (int type = SourceScript; type <= SourceFirmware; ++type) {
        EXPECT_EQ(Translate(huge, type).code, CompilerError(152)) << type;
    }
}

TEST(Translator, DeepNestingFailsWithACodeInsteadOfExhaustingTheStack)
{
    EXPECT_EQ(Translate("program P { main " + std::string(200000, '{') + " } }").code,
              CompilerError(1)); // never closed: refused at the first brace before parsing
    EXPECT_EQ(Translate("program P { main { " + std::string(100000, '{') +
                        std::string(100000, '}') + " } }")
                  .code,
              CompilerError(2));
    EXPECT_EQ(Translate("program P { var x main { x = " + std::string(100000, '(') + "1" +
                        std::string(100000, ')') + " } }")
                  .code,
              CompilerError(2));
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
    const std::string sources[] = {
        "#define P(a,b) a+b\nprogram M { var x, y = 2 timer t event e\n"
        " sub s { x = P(x, 1) }\n task w { await e  send x }\n"
        " main { start w  repeat (3) { s() }  if (x > 2 || !(y == 2)) signal e  x = t } }",
        "task 0\nl:\n addv v0, #1\n jmpf v0, <, 10, l\n halt\nend\n",
        "20 04\n33 24 c9 01 00\n",
        "tobj 1 6 program\ntask 0\ncmd 20 01\ncmd 17\nend\n",
    };
    const int types[] = {SourceScript, SourceOpal, SourceRaw, SourceObject};
    const char replacements[] = {'(', ')', '{', '}', ',', '#', '0', 'x', ' ', '\n', '\0', '\xff'};
    for (int s = 0; s < 4; ++s) {
        for (std::size_t i = 0; i < sources[s].size(); ++i) {
            for (char r : replacements) {
                std::string mutated = sources[s];
                mutated[i] = r;
                for (int target : {TargetObject, TargetListing}) {
                    const TranslateResult result = Translate(mutated, types[s], target);
                    if (result.code >= 0 && target == TargetObject) {
                        Program program;
                        EXPECT_EQ(ParseObject(result.output, program).code, 0) << mutated;
                    }
                }
            }
        }
    }
}

TEST(Translator, EnumerationNamesEndWithNull)
{
    int type = 0;
    EXPECT_STREQ(SourceTypeName(0, &type), "Script");
    EXPECT_EQ(type, 1);
    EXPECT_STREQ(SourceTypeName(3, &type), "BIN");
    EXPECT_EQ(type, 4);
    EXPECT_EQ(SourceTypeName(5, &type), nullptr);
    EXPECT_STREQ(TargetTypeName(1, &type), "CSV");
    EXPECT_EQ(type, 7);
    EXPECT_EQ(TargetTypeName(2, nullptr), nullptr);
}

} // namespace
