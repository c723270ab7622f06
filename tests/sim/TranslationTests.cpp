// tslTranslate and tslValidate against a real workspace tree: sources read through handles,
// includes found under "/Script/Include/", the sink filled on failure, the scratch files beside
// the working files, and translated code that the simulated brick runs.
#include <fstream>
#include <sstream>

#include "SimHarness.h"

namespace simtest {
namespace {

std::string Resource(const std::string& path)
{
    std::stringstream content;
    content
        << std::ifstream(std::string(TESSEL_RESOURCE_DIR) + "/" + path, std::ios::binary).rdbuf();
    return content.str();
}

class Translation : public SimTest {
protected:
    // Translates text of a source type into object.txt (target type 4 or 7).
    Long translate(const std::string& text, std::int32_t sourceType = tessel::FileScript,
                   std::int32_t targetType = tessel::FileCode)
    {
        ws().write("/Script/Temp/source.txt", text, sourceType);
        ReaderWriter* source = ws().open("/Script/Temp/source.txt", sourceType);
        ReaderWriter* target = ws().open("/Script/Temp/object.txt", targetType);
        const Long result = api().translate(6, source, target, &sink_, nullptr, nullptr);
        source->release();
        target->release();
        return result;
    }

    ErrorSink sink_;
};

TEST_F(Translation, IncludesComeFromTheWorkspaceUnderTheirLowerCaseName)
{
    const std::string program =
        "program Macro2CSV{#include<Onyx2MLT.h>main{bb_PlayNote(440,50,60)}}";
    EXPECT_EQ(translate(program), Code(0xE0050892u)); // 146: no include directory yet
    EXPECT_STREQ(sink_.GetText(), "Onyx2MLT.h");
    EXPECT_GT(sink_.GetPosition(), 0);
    ws().add("/Script/Include/onyx2mlt.h");
    ws().write("/Script/Include/onyx2mlt.h", Resource("include/Onyx2MLT.h"));
    EXPECT_EQ(translate(program), 0) << sink_.GetText();
    // The translation's scratch files beside the working files.
    EXPECT_NE(ws().read("/Script/Temp/symtab.txt").find("Macro2CSV"), std::string::npos);
    EXPECT_NE(ws().read("/Script/Temp/context.txt").find("brick type 6"), std::string::npos);
    // The CSV listing target reaches the translator (its lines are the language tests' own).
    ASSERT_EQ(translate(program, tessel::FileScript, tessel::FileCsvListing), 0);
    EXPECT_EQ(ws().read("/Script/Temp/object.txt").rfind("250,main,Macro2CSV", 0), 0u);
}

TEST_F(Translation, ErrorsGoToTheSinkWithPositionAndDetail)
{
    const std::string program = "program P {\n    main {\n        count = 1\n    }\n}\n";
    EXPECT_EQ(translate(program), Code(0xE0050810u)); // 16: variable not declared
    EXPECT_EQ(sink_.GetPosition(), static_cast<std::int32_t>(program.find("count")));
    EXPECT_STREQ(sink_.GetText(), "count");
}

TEST_F(Translation, BadHandlesAndTypesAreRefusedAndValidateWritesNothing)
{
    ReaderWriter* source = ws().open("/Script/Temp/source.txt", 0);
    ReaderWriter* target = ws().open("/Script/Temp/object.txt", tessel::FileCode);
    EXPECT_EQ(api().translate(6, source, target, &sink_, nullptr, nullptr), Code(0xE0050C94u));
    source->setType(tessel::FileScript);
    target->setType(0);
    EXPECT_EQ(api().translate(6, source, target, &sink_, nullptr, nullptr), Code(0xE0050C96u));
    EXPECT_EQ(api().translate(6, nullptr, target, &sink_, nullptr, nullptr), kNullParameter);
    EXPECT_EQ(api().translate(6, source, nullptr, &sink_, nullptr, nullptr), kNullParameter);
    EXPECT_EQ(api().validate(6, nullptr, &sink_, nullptr, nullptr), kNullParameter);
    target->release();

    ws().write("/Script/Temp/object.txt", "untouched");
    ws().write("/Script/Temp/source.txt", "sound 4", tessel::FileScript);
    EXPECT_EQ(api().validate(6, source, &sink_, nullptr, nullptr), 0);
    ws().write("/Script/Temp/source.txt", "sound", tessel::FileScript);
    EXPECT_LT(api().validate(6, source, &sink_, nullptr, nullptr), 0);
    EXPECT_LT(api().validate(6, source, nullptr, nullptr, nullptr), 0); // no sink is fine
    source->release();
    EXPECT_EQ(ws().read("/Script/Temp/object.txt"), "untouched");
}

TEST_F(Translation, HostileSourcesFailWithACompilerCode)
{
    std::string binary;
    for (int i = 0; i < 70000; ++i) {
        binary += static_cast<char>(i * 131 % 256);
    }
    EXPECT_LT(translate(binary), 0);
    std::string nested = "program P { main { ";
    for (int i = 0; i < 5000; ++i) {
        nested += "if (1 < 2) { ";
    }
    EXPECT_LT(translate(nested), 0);
    EXPECT_LT(translate("#define A A A\nA"), 0);
    // Larger than the library reads at all: the same compiler code as an oversized script.
    EXPECT_EQ(translate(std::string(9u << 20, 'a')), Code(0xE0050898u));
}

// Also runs a translated immediate script, to read the version the new firmware reports.
TEST_F(Translation, FirmwareImagesDownloadInBootModeOnlyAndReplaceTheFirmware)
{
    useShipped("no-firmware.sim");
    const Long handle = open("KIVOTOWER1");
    const std::string image = Resource("firmware/Onyx2firm.kvo");
    for (bool bootMode : {false, true}) {
        if (bootMode) {
            ASSERT_EQ(run(handle, Immediate(kBootRom)), 0);
        }
        ASSERT_EQ(translate(image, tessel::FileFirmware), 0) << sink_.GetText();
        const std::string object = ws().read("/Script/Temp/object.txt");
        Long total = 0;
        for (std::size_t at = object.find("cmd"); at != std::string::npos;
             at = object.find("cmd", at + 3)) {
            ++total;
        }
        Recorder recorder;
        ReaderWriter* code = ws().open("/Script/Temp/object.txt", tessel::FileCode);
        const Long started = api().download(handle, code, &Recorder::Callback, &recorder);
        code->release();
        if (!bootMode) {
            EXPECT_EQ(started, Code(0xE005040Fu));
            continue;
        }
        ASSERT_EQ(started, 0);
        ASSERT_TRUE(recorder.waitForEnd(total));
        EXPECT_EQ(recorder.reports().back().status, 0);
    }
    ASSERT_EQ(run(handle, Immediate(kAlive)), 0);
    ASSERT_EQ(run(handle, Immediate(kBootFirmware)), 0);
    EXPECT_EQ(run(handle, Immediate(Sound(4))), 0);
    char text[tessel::kStatusTextSize];
    EXPECT_EQ(api().status(handle, tessel::StatusBrick, text, sizeof text), 1) << text;
    ASSERT_EQ(translate("brick version?"), 0);
    ReaderWriter* code = ws().open("/Script/Temp/object.txt", tessel::FileCode);
    ReaderWriter* result = ws().open("/Script/Temp/result.txt", tessel::FileResult);
    Long number = 0;
    EXPECT_EQ(api().exec(handle, code, &number, result, nullptr, nullptr), 0);
    EXPECT_EQ(Workspace::ReadHandle(result), kVersion309);
    result->release();
    code->release();
    EXPECT_EQ(translate(Resource("firmware/corrupt.kvo"), tessel::FileFirmware), Code(0xE0050415u));
}

} // namespace
} // namespace simtest
