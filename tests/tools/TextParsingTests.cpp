// The byte lists the brick answers with and the CSV fields of a listing.
#include <gtest/gtest.h>

#include <climits>
#include <cstdlib>
#include <string>
#include <vector>

#include "tessel/ReaderWriter.h"
#include "tools/BrickQueries.h"
#include "tools/ByteList.h"
#include "tools/CsvText.h"
#include "tools/ScratchFile.h"
#include "workspace/LiveObjects.h"

namespace {

ReaderWriter* FileOf(const std::string& text)
{
    ReaderWriter* file = tools::NewScratchFile(0);
    file->openWrite();
    file->write(text.data(), static_cast<std::int32_t>(text.size()));
    file->close();
    return file;
}

std::vector<std::string> AllLines(std::string text)
{
    std::vector<char> buffer(text.begin(), text.end());
    buffer.push_back(0);
    char* cursor = buffer.data();
    char* line = nullptr;
    std::vector<std::string> lines;
    while (cursor[0] != 0) {
        tools::NextLine(&cursor, &line);
        lines.emplace_back(line);
    }
    std::free(line);
    return lines;
}

} // namespace

TEST(ByteList, ParseKeepsValuesOfAnyWidthInStep)
{
    const std::int64_t before = workspace::LiveObjectCount();
    ReaderWriter* file = FileOf("0x00,0xff,0x1,0x123,zz,0x0a\r\n");
    unsigned char out[8] = {};
    ASSERT_EQ(tools::ParseByteList(file, out, 8), 5);
    EXPECT_EQ(std::string(reinterpret_cast<char*>(out), 5), std::string("\x00\xff\x01\x23\x0a", 5));
    EXPECT_EQ(tools::ParseByteList(file, out, 2), 2);
    EXPECT_EQ(tools::ParseByteList(nullptr, out, 2), 0);
    tools::ReleaseHandle(&file);
    EXPECT_EQ(workspace::LiveObjectCount(), before);
}

TEST(ByteList, ReadByteValueReadsAFieldOfAnyLengthAndZeroAtTheEnd)
{
    ReaderWriter* file = FileOf("0x" + std::string(5000, '0') + "41,garbage,0x12,0x34,0xab");
    file->openRead();
    EXPECT_EQ(tools::ReadByteValue(file), 0x41);
    EXPECT_EQ(tools::ReadByteValue(file), 0);
    EXPECT_EQ(tools::ReadWord(file), 0x1234);
    // The missing low byte reads as 0.
    EXPECT_EQ(tools::ReadWord(file), 0xab00);
    tools::ReleaseHandle(&file);
}

TEST(CsvText, NextLineSplitsAtCrLfAndLoneLfAndEmptiesTheLastLineInPlace)
{
    EXPECT_EQ(AllLines("a,1\nb,2\r\n\r\nc\rd"),
              (std::vector<std::string>{"a,1", "b,2", "", "c\rd"}));
    char text[] = "x\r\ny";
    char* cursor = text;
    char* line = nullptr;
    EXPECT_TRUE(tools::NextLine(&cursor, &line));
    EXPECT_FALSE(tools::NextLine(&cursor, &line));
    EXPECT_STREQ(line, "y");
    EXPECT_EQ(text[3], 0);
    std::free(line);
}

TEST(CsvText, TakeNumberReadsDropsAndClamps)
{
    char text[] = "231,x,99999999999999999999";
    EXPECT_EQ(tools::TakeNumber(text), 231);
    EXPECT_EQ(tools::TakeNumber(text), 0);
    EXPECT_EQ(tools::TakeNumber(text), INT_MAX);
    EXPECT_STREQ(text, "");
}

TEST(CsvText, TakeFieldCutsToItsBuffer)
{
    char text[] = "abcdefgh,rest";
    char out[6] = "ZZZZZ";
    EXPECT_TRUE(tools::TakeField(text, out, 5));
    EXPECT_STREQ(out, "abcd");
    EXPECT_EQ(out[5], 0);
    EXPECT_STREQ(text, "rest");
    EXPECT_TRUE(tools::TakeField(text, out, sizeof out));
    EXPECT_FALSE(tools::TakeField(text, out, sizeof out));
}
