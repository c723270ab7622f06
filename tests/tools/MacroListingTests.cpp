#include <gtest/gtest.h>

#include <cstring>
#include <random>
#include <string>
#include <vector>

#include "tools/MacroListing.h"

namespace {

std::vector<std::string> Filter(const std::string& listing, std::size_t blockNameSize = 64)
{
    std::vector<std::string> lines;
    bool ok = tools::FilterMacroListing(
        listing.c_str(), blockNameSize, [&](const char* line, std::int32_t length) {
            EXPECT_EQ(static_cast<std::size_t>(length), std::strlen(line));
            lines.emplace_back(line, length);
        });
    EXPECT_TRUE(ok);
    return lines;
}

using Lines = std::vector<std::string>;

} // namespace

TEST(MacroListingFilter, NineRecordExampleGivesItsFourLines)
{
    const std::string listing = "250,main\r\n251,0,count\r\n303,main\r\n231,99,1,5\r\n"
                                "233,99,1,99,1\r\n233,2,7,x\r\n12,3\r\n407\r\n9,9\r\n";
    EXPECT_EQ(Filter(listing),
              (Lines{"231,count\r\n", "233,count,count\r\n", "233,2,7,x\r\n", "12,3\r\n"}));
}

TEST(MacroListingFilter, PairBeyondTheNamesStaysNumeric)
{
    const std::string listing = "250,main\r\n251,0,count\r\n303,main\r\n231,99,0,5\r\n"
                                "231,99,2,6\r\n407\r\n";
    EXPECT_EQ(Filter(listing), (Lines{"231,99,0,5\r\n", "231,99,2,6\r\n"}));
}

TEST(MacroListingFilter, RecordWithOnlyANumberGetsAComma)
{
    EXPECT_EQ(Filter("250,main\r\n303,main\r\n12\r\n407\r\n"), (Lines{"12,\r\n"}));
}

TEST(MacroListingFilter, BlockStartMatchesByPrefix)
{
    EXPECT_EQ(Filter("250,main\r\n303,mainloop\r\n5,a\r\n407\r\n"), (Lines{"5,a\r\n"}));
    EXPECT_EQ(Filter("250,main\r\n303,other\r\n5,a\r\n407\r\n"), Lines{});
}

TEST(MacroListingFilter, HiddenRecordsAreNeverCopied)
{
    EXPECT_EQ(Filter("250,main\r\n303,main\r\n107,a\r\n307,b\r\n6,c\r\n407\r\n"),
              (Lines{"6,c\r\n"}));
}

TEST(MacroListingFilter, BothPassesSeeALastRecordWithoutLineEnd)
{
    // The declaration is the last record: the first pass must see it, and the second pass
    // must see it too, as a record inside the open block.
    EXPECT_EQ(Filter("250,main\r\n303,main\r\n231,99,1,5\r\n251,0,count"),
              (Lines{"231,count\r\n", "251,0,count\r\n"}));
}

TEST(MacroListingFilter, ListingReadThroughATextHandleSplitsAtLineFeeds)
{
    EXPECT_EQ(Filter("250,main\n251,0,count\n303,main\n231,99,1,5\n407\n"),
              (Lines{"231,count\r\n"}));
}

TEST(MacroListingFilter, SecondPairNamingNothingStillEndsTheLine)
{
    const std::string listing = "250,main\r\n251,0,count\r\n303,main\r\n233,99,1,5,7,x\r\n"
                                "233,99,1\r\n12,3\r\n407\r\n";
    EXPECT_EQ(Filter(listing), (Lines{"233,count,5,7,x\r\n", "233,count,\r\n", "12,3\r\n"}));
}

TEST(MacroListingFilter, NamesBeyondTheTableStayNumeric)
{
    std::string listing = "250,main\r\n";
    for (int i = 1; i <= 30; ++i) {
        listing += "251,0,n" + std::to_string(i) + "\r\n";
    }
    listing += "303,main\r\n231,99,24,0\r\n231,99,25,0\r\n407\r\n";
    EXPECT_EQ(Filter(listing), (Lines{"231,n24\r\n", "231,99,25,0\r\n"}));
}

TEST(MacroListingFilter, LongNamesAreCutToNineCharacters)
{
    EXPECT_EQ(Filter("250,main\r\n251,averyveryverylongfieldname_that_does_not_fit_anywhere,"
                     "abcdefghijklmnop\r\n303,main\r\n231,99,1,0\r\n407\r\n"),
              (Lines{"231,abcdefghi\r\n"}));
}

TEST(MacroListingFilter, BlockNameIsCutToItsBuffer)
{
    // A buffer of 5 keeps "main" of "mainblock", which then matches by prefix.
    EXPECT_EQ(Filter("250,mainblock\r\n303,mainzzz\r\n1,a\r\n407\r\n", 5), (Lines{"1,a\r\n"}));
}

TEST(MacroListingFilter, LongLinesAreCutButKeepTheirLineEnd)
{
    std::string listing = "250,main\r\n303,main\r\n17," + std::string(1000, 'q') + "\r\n407\r\n";
    Lines lines = Filter(listing);
    ASSERT_EQ(lines.size(), 1u);
    EXPECT_EQ(lines[0].size(), tools::kListingLineSize - 1);
    EXPECT_EQ(lines[0].substr(0, 3), "17,");
    EXPECT_EQ(lines[0].substr(lines[0].size() - 2), "\r\n");
}

TEST(MacroListingFilter, NoMatchingBlockGivesNothing)
{
    EXPECT_EQ(Filter("250,main\r\n5,a\r\n407\r\n"), Lines{});
    EXPECT_EQ(Filter(""), Lines{});
}

TEST(MacroListingFilter, RandomListingsStayInBounds)
{
    std::mt19937 random(20261206u);
    const int numbers[] = {250, 251, 303, 407, 107, 307, 231, 233, 99, 0, 12, -5};
    auto field = [&](int maxLength) {
        std::string text;
        int length = static_cast<int>(random() % static_cast<unsigned>(maxLength + 1));
        for (int i = 0; i < length; ++i) {
            const char alphabet[] = "abcmain0123456789,,,\r\n\n99 -x";
            text += alphabet[random() % (sizeof alphabet - 1)];
        }
        return text;
    };
    for (int round = 0; round < 400; ++round) {
        std::string listing;
        int records = static_cast<int>(random() % 60);
        for (int r = 0; r < records; ++r) {
            int number = numbers[random() % (sizeof numbers / sizeof numbers[0])];
            listing += std::to_string(number);
            int fields = static_cast<int>(random() % 6);
            for (int f = 0; f < fields; ++f) {
                listing += ",";
                listing +=
                    (random() % 3 == 0) ? std::string("99") : field(random() % 8 == 0 ? 400 : 12);
            }
            if (r + 1 < records || random() % 2 == 0) {
                listing += (random() % 4 == 0) ? "\n" : "\r\n";
            }
        }
        std::size_t blockNameSize = 1 + random() % 30;
        bool ok = tools::FilterMacroListing(
            listing.c_str(), blockNameSize, [&](const char* line, std::int32_t length) {
                ASSERT_GE(length, 2);
                ASSERT_LE(static_cast<std::size_t>(length), tools::kListingLineSize - 1);
                ASSERT_EQ(static_cast<std::size_t>(length), std::strlen(line));
                EXPECT_EQ(std::string(line + length - 2), "\r\n");
            });
        ASSERT_TRUE(ok) << listing;
    }
}
