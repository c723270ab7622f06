#include <gtest/gtest.h>

#include <climits>
#include <cstdlib>
#include <string>
#include <vector>

#include "tools/CsvText.h"

namespace {

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
