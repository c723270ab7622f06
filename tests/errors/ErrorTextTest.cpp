#include <gtest/gtest.h>

#include <cstring>
#include <string>

#include "errors/ErrorSink.h"
#include "errors/ErrorText.h"

namespace {

std::int32_t Code(std::uint32_t packed)
{
    return static_cast<std::int32_t>(packed);
}

std::string Text(std::uint32_t packed, IError* sink = nullptr)
{
    return GetErrorText(Code(packed), sink);
}

struct Example {
    std::uint32_t value;
    const char* text;
};

} // namespace

TEST(ErrorText, SuccessAndInformationAreOk)
{
    EXPECT_EQ(Text(0), "Ok");
    EXPECT_EQ(Text(0x60000000u), "Ok");
    EXPECT_EQ(Text(0x20020000u), "Ok");
}

TEST(ErrorText, CatalogueExamplesWithoutSink)
{
    const Example examples[] = {
        {0xE0050421u, "Error (0xe0050421) from Tessel driver: IDSTATUS_RESULT_NOTOWER"},
        {0xE1000204u, "Error (0xe1000204) from Wisp: Retry count exceeded"},
        {0xE0050C41u, "Error (0xe0050c41) from Tessel tsl: failed to link to Tessel.dll"},
        {0xA1000204u, "Error (0xa1000204) from Wisp: unknown"},
        {0xE0010001u, "Error (0xe0010001) from KivoError: "},
        {0xE0020001u, "Error (0xe0020001) from ReaderWriter: "},
        {0xE0000001u, "Error (0xe0000001): unknown"},
        {0xE0040001u, "Error (0xe0040001): unknown facility"},
        {0xE0070001u, "Error (0xe0070001): unknown facility"},
        {0xE0050001u, "Error (0xe0050001) from Tessel unknown module"},
        {0xE0050801u, "Error (0xe0050801) from Tessel compiler: syntax error"},
        {0xE0050814u,
         "Error (0xe0050814) from Tessel compiler: internal compiler error (invalid token): "},
        {0xE0060006u, "Error (0xe0060006) from BLT: Unknown opcode"},
        {0xE0050476u, "Error (0xe0050476) from Tessel driver: unknown"},
        {0xE0030007u, "Error (0xe0030007) from Opal: unknown opcode"},
        {0xE2000064u, "Error (0xe2000064) from Wisp USB Port: Unspecified USB problem"},
        {0xE0050C52u, "Error (0xe0050c52) from Tessel tsl: no more items found"},
        {0xE0050892u, "Error (0xe0050892) from Tessel compiler: failed to read include file"},
    };
    for (const Example& example : examples) {
        EXPECT_EQ(Text(example.value), example.text) << std::hex << example.value;
    }
}

TEST(ErrorText, DetailCodesTakeTheSinkTextInPlaceOfTheTable)
{
    ErrorSink withText;
    withText.SetError(1, 5, "unexpected '}'");
    ErrorSink empty;
    EXPECT_EQ(Text(0xE0050801u, &withText),
              "Error (0xe0050801) from Tessel compiler: unexpected '}'");
    EXPECT_EQ(Text(0xE0050801u, &empty), "Error (0xe0050801) from Tessel compiler: ");
    // A code without the detail mark ignores the sink.
    EXPECT_EQ(Text(0xE005081Au, &withText),
              "Error (0xe005081a) from Tessel compiler: no more tasks available in target PBrick");
    EXPECT_EQ(Text(0xE0050814u, &withText),
              "Error (0xe0050814) from Tessel compiler: internal compiler error (invalid token): "
              "unexpected '}'");
}

TEST(ErrorText, AppendedDetailOnlyForANonEmptySinkText)
{
    ErrorSink withText;
    withText.SetError(0, 0, "opcode 99");
    ErrorSink empty;
    EXPECT_EQ(Text(0xE0060006u, &withText),
              "Error (0xe0060006) from BLT: Unknown opcode: opcode 99");
    EXPECT_EQ(Text(0xE0060006u, &empty), "Error (0xe0060006) from BLT: Unknown opcode");
    EXPECT_EQ(Text(0xE0050C41u, &withText),
              "Error (0xe0050c41) from Tessel tsl: failed to link to Tessel.dll: opcode 99");
    // The communication stack's texts never take a detail.
    EXPECT_EQ(Text(0xE1000204u, &withText), "Error (0xe1000204) from Wisp: Retry count exceeded");
}

TEST(ErrorText, ALongDetailIsCutToTheBuffer)
{
    ErrorSink sink;
    const std::string detail(300, 'd');
    sink.SetError(0, 0, detail.c_str());
    const char* text = GetErrorText(Code(0xE0060006u), &sink);
    const std::string head = "Error (0xe0060006) from BLT: Unknown opcode: ";
    ASSERT_EQ(std::strlen(text), static_cast<std::size_t>(kErrorTextSize - 1));
    EXPECT_EQ(std::string(text).substr(0, head.size()), head);
}

TEST(ErrorText, EveryValueStaysWithinTheBuffer)
{
    ErrorSink sink;
    const std::string detail(255, 'z');
    sink.SetError(0, 0, detail.c_str());
    for (std::uint32_t facility = 0; facility < 600; facility += 1) {
        for (std::uint32_t module = 0; module < 4; ++module) {
            for (std::uint32_t code : {0u, 1u, 20u, 65u, 118u, 255u, 1023u}) {
                const std::uint32_t packed = 0xE0000000u | (facility << 16) | (module << 10) | code;
                const char* text = GetErrorText(Code(packed), &sink);
                ASSERT_LT(std::strlen(text), static_cast<std::size_t>(kErrorTextSize));
                ASSERT_EQ(std::strncmp(text, "Error (0x", 9), 0);
            }
        }
    }
}

TEST(StatusToError, MapsTheBrickStatusNumbers)
{
    const struct {
        std::int32_t status;
        std::uint32_t packed;
    } cases[] = {
        {0, 0xE0050425u},  {1, 0u},           {2, 0xE0050420u},  {3, 0xE0050401u},
        {4, 0xE0050421u},  {5, 0xE005040Bu},  {6, 0xE0050402u},  {7, 0xE0050422u},
        {8, 0xE0050424u},  {9, 0xE0050403u},  {10, 0xE0050404u}, {11, 0xE1000204u},
        {12, 0xE005040Au}, {13, 0xE0050420u}, {14, 0xE0050423u}, {15, 0xE0050420u},
        {99, 0xE0050420u}, {-1, 0xE0050420u},
    };
    for (const auto& entry : cases) {
        EXPECT_EQ(static_cast<std::uint32_t>(StatusToError(entry.status)), entry.packed)
            << entry.status;
    }
}

TEST(StatusToError, OnlyStatusOneSucceeds)
{
    for (std::int32_t status = -5; status < 40; ++status) {
        EXPECT_EQ(StatusToError(status) == 0, status == 1) << status;
    }
}
