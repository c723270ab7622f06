// Firmware images: the shipped samples, checksums, and malformed records.
#include <gtest/gtest.h>

#include <fstream>
#include <sstream>
#include <string>

#include "Firmware.h"
#include "Program.h"
#include "Status.h"
#include "Translator.h"

using namespace tessel::lang;

namespace {

std::string ReadResource(const char* name)
{
    std::ifstream in(std::string(SIMLANG_RESOURCES_DIR) + "/firmware/" + name, std::ios::binary);
    std::ostringstream text;
    text << in.rdbuf();
    return text.str();
}

TranslateResult TranslateImage(const std::string& image, int target = TargetObject)
{
    Translator translator;
    TranslateRequest request;
    request.sourceType = SourceFirmware;
    request.targetType = target;
    request.source = image;
    return translator.translate(request);
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
    const std::string image = ReadResource("Onyx2firm.kvo");
    const TranslateResult result = TranslateImage(image);
    ASSERT_EQ(result.code, 0) << result.detail;
    Program program;
    ASSERT_EQ(ParseObject(result.output, program).code, 0);
    EXPECT_EQ(program.kind, ObjectKind::Firmware);
    EXPECT_EQ(program.firmwareVersion, 309);
    ASSERT_EQ(program.firmware.size(), 64u);
    EXPECT_EQ(program.commandCount, 64);
    EXPECT_EQ(program.firmware[1].address, 0x8020);
    EXPECT_EQ(program.firmware[1].data.size(), 32u);

    const std::string corrupt = ReadResource("corrupt.kvo");
    const TranslateResult bad = TranslateImage(corrupt);
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
    ASSERT_EQ(TranslateImage(good).code, 0);
    const std::size_t data = good.find("D 9000");
    for (std::size_t i = data + 7; i < data + 15; ++i) {
        std::string bad = good;
        bad[i] = bad[i] == '1' ? '2' : '1';
        EXPECT_EQ(TranslateImage(bad).code, DriverError(21)) << "digit " << i;
    }
}

TEST(FirmwareImage, MalformedRecordsAreSyntaxErrors)
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
        EXPECT_EQ(TranslateImage(image).code, CompilerError(1)) << image;
    }
    EXPECT_EQ(TranslateImage(Image({"V 0101", "E"}), TargetListing).code, LibraryError(150));
}

TEST(FirmwareImage, CommentsBlankLinesAndWindowsLineEndsAreAccepted)
{
    const std::string image = "# image\r\n\r\n" + SealRecord("V 0042") + "\r\n  " +
                              SealRecord("D 0010 ab") + "\r\n" + SealRecord("E") + "\r\n# end\r\n";
    const TranslateResult result = TranslateImage(image);
    ASSERT_EQ(result.code, 0) << result.detail;
    Program program;
    ASSERT_EQ(ParseObject(result.output, program).code, 0);
    EXPECT_EQ(program.firmwareVersion, 42);
    ASSERT_EQ(program.firmware.size(), 1u);
    EXPECT_EQ(program.firmware[0].data[0], 0xAB);
}

} // namespace
