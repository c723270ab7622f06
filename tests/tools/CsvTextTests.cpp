#include <gtest/gtest.h>

#include <climits>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include "tools/CsvText.h"

namespace {

// Cuts every line off text with NextLine, as the listing passes do.
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

TEST(CsvNextLine, CutsAtCrLfAndMovesPastIt)
{
    char text[] = "250,main\r\n407";
    char* cursor = text;
    char* line = nullptr;
    EXPECT_TRUE(tools::NextLine(&cursor, &line));
    EXPECT_STREQ(line, "250,main");
    EXPECT_STREQ(cursor, "407");
    EXPECT_FALSE(tools::NextLine(&cursor, &line));
    EXPECT_STREQ(line, "407");
    // The remaining text is emptied in place.
    EXPECT_EQ(cursor[0], 0);
    EXPECT_EQ(text[10], 0);
    std::free(line);
}

TEST(CsvNextLine, TakesLoneLineFeedsFromTextHandles)
{
    EXPECT_EQ(AllLines("a,1\nb,2\r\nc"), (std::vector<std::string>{"a,1", "b,2", "c"}));
}

TEST(CsvNextLine, KeepsEmptyLinesAndStopsAtTheEnd)
{
    EXPECT_EQ(AllLines("\r\n\r\nx\r\n"), (std::vector<std::string>{"", "", "x"}));
}

TEST(CsvNextLine, KeepsALoneCarriageReturnInsideTheLine)
{
    EXPECT_EQ(AllLines("a\rb\r\n"), (std::vector<std::string>{"a\rb"}));
}

TEST(CsvTakeNumber, ReadsTheNumberAndDropsTheFirstField)
{
    char text[] = "231,99,1";
    EXPECT_EQ(tools::TakeNumber(text), 231);
    EXPECT_STREQ(text, "99,1");
    EXPECT_EQ(tools::TakeNumber(text), 99);
    EXPECT_EQ(tools::TakeNumber(text), 1);
    EXPECT_STREQ(text, "");
    EXPECT_EQ(tools::TakeNumber(text), 0);
}

TEST(CsvTakeNumber, GivesZeroForAFieldThatIsNoNumber)
{
    char text[] = "x,7";
    EXPECT_EQ(tools::TakeNumber(text), 0);
    EXPECT_STREQ(text, "7");
}

TEST(CsvTakeNumber, ClampsNumbersBeyondTheIntRange)
{
    char big[] = "99999999999999999999,1";
    EXPECT_EQ(tools::TakeNumber(big), INT_MAX);
    char small[] = "-99999999999999999999";
    EXPECT_EQ(tools::TakeNumber(small), INT_MIN);
}

TEST(CsvTakeField, EmptyTextGivesFalse)
{
    char text[] = "";
    char out[8] = "keep";
    EXPECT_FALSE(tools::TakeField(text, out, sizeof out));
    EXPECT_STREQ(out, "keep");
}

TEST(CsvTakeField, SplitsAtTheFirstComma)
{
    char text[] = "main,a,b";
    char out[8];
    EXPECT_TRUE(tools::TakeField(text, out, sizeof out));
    EXPECT_STREQ(out, "main");
    EXPECT_STREQ(text, "a,b");
    EXPECT_TRUE(tools::TakeField(text, out, sizeof out));
    EXPECT_TRUE(tools::TakeField(text, out, sizeof out));
    EXPECT_STREQ(out, "b");
    EXPECT_STREQ(text, "");
}

TEST(CsvTakeField, CutsALongFieldToTheBuffer)
{
    char text[] = "abcdefghijklmnop,rest";
    char out[6];
    std::memset(out, 'Z', sizeof out);
    EXPECT_TRUE(tools::TakeField(text, out, 5));
    EXPECT_STREQ(out, "abcd");
    EXPECT_EQ(out[5], 'Z');
    EXPECT_STREQ(text, "rest");
}
