#include <gtest/gtest.h>

#include "tessel/ErrorValue.h"

TEST(ErrorValuePacking, BuildsTheDocumentedCodes)
{
    EXPECT_EQ(ErrorValue(3, 5, 3, 65).packedCode(), 0xE0050C41u);
    EXPECT_EQ(ErrorValue(0, 2, 0, 0).packedCode(), 0x20020000u);
    EXPECT_EQ(RwOk.packedCode(), 0x20020000u);
    EXPECT_EQ(RwNotOpen.packedCode(), 0xE0020001u);
    EXPECT_EQ(RwOutOfRange.packedCode(), 0xE0020006u);
    EXPECT_EQ(RwNoMemory.packedCode(), 0xE0020007u);
    EXPECT_EQ(RwSeekFailed.packedCode(), 0xE0020008u);
}

TEST(ErrorValuePacking, MasksOversizedFieldsInsteadOfRejectingThem)
{
    EXPECT_EQ(ErrorValue(0, 0x1FFF, 0, 0).facility(), 0xFFFu);
    EXPECT_EQ(ErrorValue(0, 0, 64, 0).module(), 0u);
    EXPECT_EQ(ErrorValue(0, 0, 0, 1024).code(), 0u);
    EXPECT_EQ(ErrorValue(7, 0, 0, 0).packedCode(), 0xE0000000u);
}

TEST(ErrorValuePacking, NormalisesRawCodes)
{
    EXPECT_EQ(ErrorValue(0x10000000u).packedCode(), 0x20000000u);
    EXPECT_EQ(ErrorValue(0u).packedCode(), 0x20000000u);
    EXPECT_TRUE(ErrorValue(0u).succeeded());
    EXPECT_FALSE(ErrorValue(0xC0000000u).isSystemCode());
    EXPECT_FALSE(ErrorValue(0u).isSystemCode());
}

TEST(ErrorValueFields, TakeAPackedCodeApart)
{
    const ErrorValue value(0xE0050C41u);
    EXPECT_EQ(value.severity(), 3u);
    EXPECT_EQ(value.facility(), 5u);
    EXPECT_EQ(value.module(), 3u);
    EXPECT_EQ(value.code(), 65u);
    EXPECT_TRUE(value.failed());
    EXPECT_FALSE(value.succeeded());
    EXPECT_TRUE(value.isError());
    EXPECT_LT(value.asLong(), 0);
}

TEST(ErrorValueFields, SeverityDecidesTheSign)
{
    for (std::uint32_t severity = 0; severity < 4; ++severity) {
        const ErrorValue value(severity, 1, 2, 3);
        EXPECT_EQ(value.failed(), value.asLong() < 0) << severity;
        EXPECT_EQ(value.succeeded(), !value.failed()) << severity;
    }
    EXPECT_TRUE(ErrorValue(1, 0, 0, 0).isInformation());
    EXPECT_TRUE(ErrorValue(2, 0, 0, 0).isWarning());
}

TEST(ErrorValueCopies, CopyAndAssignmentKeepCodeAndIgnoreNestedForEquality)
{
    const ErrorValue original(3, 2, 0, 6);
    ErrorValue copy(original);
    EXPECT_TRUE(copy == original);
    ErrorValue other(0, 2, 0, 0);
    other = original;
    EXPECT_TRUE(other == original);
    other = other; // self-assignment keeps everything
    EXPECT_EQ(other.packedCode(), 0xE0020006u);
    EXPECT_EQ(other.nestedError(), nullptr);
    ErrorValue* clone = original.clone();
    ASSERT_NE(clone, nullptr);
    EXPECT_TRUE(*clone == original);
    delete clone;
}
