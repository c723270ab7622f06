#include <gmock/gmock.h>

#include "SessionFixture.h"
#include "errors/ErrorSink.h"
#include "errors/ErrorText.h"

using tessel::Long;

namespace {

constexpr Long kTranslateError = static_cast<Long>(0xE0050C10u);

int TSL_STDCALL SomeCallback(Long, void*, Long, ReaderWriter*)
{
    return 1;
}

class ScriptRunner : public SessionTest, public ::testing::WithParamInterface<bool> {
protected:
    // Memory or disk working files, by the test's parameter.
    BrickSession& openMode() { return GetParam() ? open() : openDisk(); }
};

INSTANTIATE_TEST_SUITE_P(WorkingFiles, ScriptRunner, ::testing::Values(true, false),
                         [](const ::testing::TestParamInfo<bool>& mode) {
                             return mode.param ? "Memory" : "Disk";
                         });

TEST_P(ScriptRunner, TranslateTextTranslatesIntoTheObjectFile)
{
    BrickSession& s = openMode();
    ASSERT_EQ(
        s.TranslateText(6, 1, "a much longer script text", nullptr, nullptr, nullptr, nullptr), 0);
    lib().results[tessel::SlotTranslate] = 0x2005;
    ErrorSink sink;
    ReaderWriter* extra1 = s.resultEntry()->open(0);
    ReaderWriter* extra2 = s.firmwareEntry()->open(0);
    ReaderWriter* code = nullptr;
    EXPECT_EQ(s.TranslateText(5, 2, "short", &code, &sink, extra1, extra2), 0x2005);
    ASSERT_NE(code, nullptr);
    EXPECT_EQ(code->dirEnt(), s.objectEntry());
    EXPECT_EQ(code->type(), 4);
    EXPECT_EQ(contentOf(code), "cmd short");
    const RecordedCall& call = lib().calls[tessel::SlotTranslate];
    EXPECT_EQ(call.numbers[0], 5);
    EXPECT_EQ(call.pointers[2], static_cast<IError*>(&sink));
    EXPECT_EQ(call.pointers[3], extra1);
    EXPECT_EQ(call.pointers[4], extra2);
    EXPECT_EQ(lib().sourceType, 2);
    EXPECT_EQ(lib().targetType, 4);
    EXPECT_STREQ(lib().sourceText, "short"); // the shorter text replaced the longer
    for (ReaderWriter* handle : {code, extra1, extra2}) {
        BrickSession::ReleaseReaderWriter(&handle);
    }

    // A listing: plain text into the object file opened as CSV, without extra files.
    ReaderWriter* listing = nullptr;
    EXPECT_EQ(s.TranslateToCsv(4, "macro", &listing, nullptr), 0x2005);
    ASSERT_NE(listing, nullptr);
    EXPECT_EQ(listing->dirEnt(), s.objectEntry());
    EXPECT_EQ(listing->type(), 7);
    EXPECT_EQ(lib().sourceType, 1);
    EXPECT_EQ(lib().targetType, 7);
    EXPECT_EQ(call.numbers[0], 4);
    EXPECT_EQ(call.pointers[3], nullptr);
    BrickSession::ReleaseReaderWriter(&listing);
}

TEST_P(ScriptRunner, FailedTranslationReturnsTheLibraryCodeAndNoHandle)
{
    BrickSession& s = openMode();
    lib().results[tessel::SlotTranslate] = kTranslateError;
    lib().errorPosition = 42;
    ErrorSink sink;
    ReaderWriter* code = reinterpret_cast<ReaderWriter*>(0x1);
    const std::int64_t live = workspace::LiveObjectCount();
    EXPECT_EQ(s.TranslateText(6, 1, "bad", &code, &sink, nullptr, nullptr), kTranslateError);
    EXPECT_EQ(code, nullptr);
    EXPECT_EQ(sink.GetPosition(), 42);
    EXPECT_EQ(sink.GetValue(), kTranslateError);
    EXPECT_EQ(workspace::LiveObjectCount(), live);

    code = reinterpret_cast<ReaderWriter*>(0x1);
    const std::string missing = dir.path() + "missing.onyx2";
    EXPECT_EQ(s.CompileFile(6, 1, missing.c_str(), &code, nullptr, nullptr, nullptr),
              kTranslateError);
    EXPECT_EQ(code, nullptr);
    EXPECT_FALSE(std::filesystem::exists(missing));

    EXPECT_EQ(s.RunImmediate(8, "sound 4", nullptr), kTranslateError);
    EXPECT_EQ(lib().calls[tessel::SlotExec].count, 0);
}

// Code needs no translation: the file itself comes back, and its commands are counted.
TEST_P(ScriptRunner, CodeTypeReturnsTheFileItselfUntranslated)
{
    BrickSession& s = openMode();
    const struct {
        const char* text;
        std::int32_t size;
        std::int32_t commands;
    } cases[] = {{"", 0, 0}, {"cmd 1,2;cmd 3", 13, 2}, {"cmdcmdcm d c md", 15, 2}};
    for (const auto& c : cases) {
        SCOPED_TRACE(c.text);
        ReaderWriter* code = nullptr;
        ASSERT_EQ(s.TranslateText(6, 4, c.text, &code, nullptr, nullptr, nullptr), 0);
        ASSERT_NE(code, nullptr);
        EXPECT_EQ(code->dirEnt(), s.sourceEntry());
        EXPECT_EQ(contentOf(code), c.text);
        EXPECT_EQ(BrickSession::ContentSize(code), c.size);
        EXPECT_EQ(BrickSession::CountCommands(code), c.commands);
        BrickSession::ReleaseReaderWriter(&code);
        EXPECT_EQ(code, nullptr);
    }
    // Without a place to put the handle it is released, not leaked (checked at tear-down).
    EXPECT_EQ(s.TranslateText(6, 4, "cmd", nullptr, nullptr, nullptr, nullptr), 0);

    const std::string host = dir.write("prog.bin", "cmd a cmd b cmd c");
    ReaderWriter* code = nullptr;
    EXPECT_EQ(s.CompileFile(6, 4, host.c_str(), &code, nullptr, nullptr, nullptr), 0);
    ASSERT_NE(code, nullptr);
    EXPECT_EQ(std::string(code->dirEnt()->fileName()), host);
    EXPECT_EQ(BrickSession::CountCommands(code), 3);
    EXPECT_EQ(lib().calls[tessel::SlotTranslate].count, 0);
    BrickSession::ReleaseReaderWriter(&code);
}

TEST_P(ScriptRunner, CompileFileThenTranslateTextThenCompileFile)
{
    BrickSession& s = openMode();
    const std::string first = dir.write("First.onyx2", "first file");
    const std::string second = dir.write("second.onyx2", "second file");

    ReaderWriter* code = nullptr;
    ASSERT_EQ(s.CompileFile(6, 1, first.c_str(), &code, nullptr, nullptr, nullptr), 0);
    EXPECT_EQ(code->dirEnt(), s.objectEntry());
    EXPECT_STREQ(lib().sourceText, "first file");
    EXPECT_EQ(std::string(find("/Script/Temp/source.txt")->fileName()), first);
    BrickSession::ReleaseReaderWriter(&code);

    ASSERT_EQ(s.TranslateText(6, 1, "editor text", &code, nullptr, nullptr, nullptr), 0);
    EXPECT_STREQ(lib().sourceText, "editor text");
    EXPECT_EQ(contentOf(code), "cmd editor text");
    EXPECT_EQ(find("/Script/Temp/source.txt"), s.sourceEntry());
    BrickSession::ReleaseReaderWriter(&code);

    ASSERT_EQ(s.CompileFile(6, 1, second.c_str(), nullptr, nullptr, nullptr, nullptr), 0);
    EXPECT_STREQ(lib().sourceText, "second file");
    EXPECT_EQ(std::string(find("/Script/Temp/source.txt")->fileName()), second);

    ASSERT_EQ(s.TranslateText(6, 4, "cmd direct", &code, nullptr, nullptr, nullptr), 0);
    EXPECT_EQ(code->dirEnt(), s.sourceEntry());
    EXPECT_EQ(contentOf(code), "cmd direct");
    BrickSession::ReleaseReaderWriter(&code);
    // The host files were only linked, never written.
    EXPECT_EQ(dir.read("First.onyx2"), "first file");
    EXPECT_EQ(dir.read("second.onyx2"), "second file");
}

TEST_P(ScriptRunner, CompileFirmwareTranslatesTheImageForOnyx2)
{
    BrickSession& s = openMode();
    const std::string image = dir.write("Firm0309.kvo", "S0 firmware image");
    ReaderWriter* code = nullptr;
    lib().results[tessel::SlotTranslate] = 0x10;
    EXPECT_EQ(s.CompileFirmware(image.c_str(), &code), 0x10);
    ASSERT_NE(code, nullptr);
    EXPECT_EQ(code->dirEnt(), s.firmwareEntry());
    const RecordedCall& call = lib().calls[tessel::SlotTranslate];
    EXPECT_EQ(call.numbers[0], 6);
    EXPECT_NE(call.pointers[2], nullptr);
    EXPECT_EQ(call.pointers[3], nullptr);
    EXPECT_EQ(lib().sourceType, 5);
    EXPECT_EQ(lib().targetType, 4);
    EXPECT_STREQ(lib().sourceText, "S0 firmware image");
    EXPECT_EQ(std::string(find("/Script/Firmware/Onyx2firm.kvo")->fileName()), image);
    BrickSession::ReleaseReaderWriter(&code);

    // A second image replaces the link.
    const std::string other = dir.write("other.kvo", "other");
    lib().results[tessel::SlotTranslate] = kTranslateError;
    EXPECT_EQ(s.CompileFirmware(other.c_str(), &code), kTranslateError);
    EXPECT_EQ(code, nullptr);
    EXPECT_EQ(std::string(find("/Script/Firmware/Onyx2firm.kvo")->fileName()), other);
}

TEST_P(ScriptRunner, ExecCodePassesItsArgumentsAndEmptiesTheResultFileFirst)
{
    BrickSession& s = openMode();
    ReaderWriter* code = nullptr;
    ASSERT_EQ(s.TranslateText(6, 1, "sound 3", &code, nullptr, nullptr, nullptr), 0);
    lib().results[tessel::SlotExec] = 0x55;
    lib().resultNumber = -9;
    Long result = 0;
    int context = 0;
    EXPECT_EQ(s.ExecCode(17, code, &result, nullptr, SomeCallback, &context), 0x55);
    const RecordedCall& call = lib().calls[tessel::SlotExec];
    EXPECT_EQ(call.numbers[0], 17);
    EXPECT_EQ(call.pointers[0], code);
    EXPECT_EQ(call.pointers[1], &result);
    EXPECT_EQ(call.pointers[2], nullptr); // no result file asked for
    EXPECT_EQ(call.pointers[3], reinterpret_cast<const void*>(&SomeCallback));
    EXPECT_EQ(call.pointers[4], &context);
    EXPECT_EQ(result, -9);
    EXPECT_STREQ(lib().codeText, "cmd sound 3");
    BrickSession::ReleaseReaderWriter(&code);

    // The result file reaches the library empty every time, and the caller receives it
    // whatever the result.
    const struct {
        const char* answer;
        Long result;
    } runs[] = {{"first answer, long", 0}, {"second", kTranslateError}};
    for (const auto& run : runs) {
        SCOPED_TRACE(run.answer);
        std::snprintf(lib().resultText, sizeof lib().resultText, "%s", run.answer);
        lib().results[tessel::SlotExec] = run.result;
        ReaderWriter* resultFile = nullptr;
        EXPECT_EQ(s.ExecCode(1, nullptr, nullptr, &resultFile, nullptr, nullptr), run.result);
        EXPECT_EQ(lib().resultSizeOnEntry, 0);
        ASSERT_NE(resultFile, nullptr);
        EXPECT_EQ(resultFile->dirEnt(), s.resultEntry());
        EXPECT_EQ(resultFile->type(), 0);
        EXPECT_EQ(contentOf(resultFile), run.answer);
        BrickSession::ReleaseReaderWriter(&resultFile);
    }
}

TEST_P(ScriptRunner, RunImmediateTranslatesForOnyx2AndExecutes)
{
    BrickSession& s = openMode();
    lib().results[tessel::SlotExec] = 0x21;
    lib().resultNumber = 1234;
    Long result = 0;
    EXPECT_EQ(s.RunImmediate(8, "get 0x10,1", &result), 0x21);
    EXPECT_EQ(result, 1234);
    EXPECT_EQ(lib().calls[tessel::SlotTranslate].numbers[0], 6);
    EXPECT_EQ(lib().sourceType, 1);
    EXPECT_STREQ(lib().codeText, "cmd get 0x10,1");
    EXPECT_EQ(lib().calls[tessel::SlotExec].numbers[0], 8);
    EXPECT_EQ(lib().calls[tessel::SlotExec].pointers[2], nullptr);
}

class ScriptRunnerFiles : public SessionTest {};

TEST_F(ScriptRunnerFiles, SizesAndCountsOfOddFilesAndHandles)
{
    BrickSession& s = open();
    ReaderWriter* handle = s.CreateMemoryFile("bytes.bin", "/Extra/")->open(4);
    ASSERT_EQ(handle->openWrite(), RwOk);
    handle->write("cmd\0cmd cmd", 11);
    handle->close();
    EXPECT_EQ(BrickSession::ContentSize(handle), 11);
    EXPECT_EQ(BrickSession::CountCommands(handle), 1); // counting stops at the zero byte
    BrickSession::ReleaseReaderWriter(&handle);

    handle = s.MountDiskFile("absent.bin", dir.path().c_str(), "/Extra/")->open(4);
    EXPECT_EQ(BrickSession::ContentSize(handle), 0);
    EXPECT_EQ(BrickSession::CountCommands(handle), 0);
    BrickSession::ReleaseReaderWriter(&handle);

    EXPECT_EQ(BrickSession::ContentSize(nullptr), 0);
    EXPECT_EQ(BrickSession::CountCommands(nullptr), 0);
    BrickSession::ReleaseReaderWriter(nullptr);

    // Release keeps a handle others still hold.
    handle = s.sourceEntry()->open(1);
    handle->addRef();
    ReaderWriter* mine = handle;
    BrickSession::ReleaseReaderWriter(&mine);
    EXPECT_EQ(mine, handle);
    BrickSession::ReleaseReaderWriter(&mine);
    EXPECT_EQ(mine, nullptr);
}

// The codes the runner builds are the ones the catalogue explains.
TEST(ScriptRunnerCodes, EachCodeHasItsCatalogueText)
{
    const struct {
        std::uint32_t code;
        const char* text;
    } codes[] = {
        {BrickSession::kNullRoot, "illegal NULL root in tessel"},
        {BrickSession::kInsertFailed, "Insert DirEnt failed in tessel"},
        {BrickSession::kCreateFailed, "ReaderWriter Create failed in tessel"},
        {BrickSession::kNullSourcePath, "illegal NULL source path"},
        {BrickSession::kNullResultPath, "illegal NULL result path"},
        {BrickSession::kNullFirmwarePath, "illegal NULL firmware path"},
        {BrickSession::kNullTempPath, "illegal NULL temp path"},
        {tessel::kLinkFailed, "failed to link to Tessel.dll"},
    };
    for (const auto& entry : codes) {
        EXPECT_EQ(ErrorValue(entry.code).packedCode(), entry.code);
        EXPECT_THAT(GetErrorText(static_cast<tessel::Long>(entry.code), nullptr),
                    ::testing::HasSubstr(entry.text));
    }
}

} // namespace
