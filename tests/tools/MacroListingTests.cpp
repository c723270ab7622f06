#include <gtest/gtest.h>

#include <cstring>
#include <random>
#include <string>
#include <vector>

#include "tools/MacroListing.h"

namespace {

using Lines = std::vector<std::string>;

Lines Filter(const std::string& listing, std::size_t blockNameSize = 64)
{
    Lines lines;
    EXPECT_TRUE(tools::FilterMacroListing(
        listing.c_str(), blockNameSize,
        [&](const char* line, std::int32_t length) { lines.emplace_back(line, length); }));
    return lines;
}

const std::string kHead = "250,main\r\n251,0,count\r\n303,main\r\n";

struct FilterCase {
    const char* what;
    std::string listing;
    Lines expected;
    std::size_t blockNameSize = 64;
};

} // namespace

TEST(MacroListingFilter, Cases)
{
    std::string manyNames = "250,main\r\n";
    for (int i = 1; i <= 30; ++i)
        manyNames += "251,0,n" + std::to_string(i) + "\r\n";
    const FilterCase cases[] = {
        {"nine-record example",
         "250,main\r\n251,0,count\r\n303,main\r\n231,99,1,5\r\n233,99,1,99,1\r\n233,2,7,x\r\n"
         "12,3\r\n407\r\n9,9\r\n",
         {"231,count\r\n", "233,count,count\r\n", "233,2,7,x\r\n", "12,3\r\n"}},
        {"pairs naming nothing stay numeric",
         kHead + "231,99,0,5\r\n231,99,2,6\r\n407\r\n",
         {"231,99,0,5\r\n", "231,99,2,6\r\n"}},
        {"record of a number only", kHead + "12\r\n407\r\n", {"12,\r\n"}},
        {"block start matches by prefix",
         "250,main\r\n303,mainloop\r\n5,a\r\n407\r\n303,x\r\n6\r\n",
         {"5,a\r\n"}},
        {"hidden records", kHead + "107,a\r\n307,b\r\n6,c\r\n407\r\n", {"6,c\r\n"}},
        // The declaration is the last record: the first pass must see it, and the second too.
        {"last record without line end",
         "250,main\r\n303,main\r\n231,99,1,5\r\n251,0,count",
         {"231,count\r\n", "251,0,count\r\n"}},
        {"listing read through a text handle",
         "250,main\n251,0,count\n303,main\n231,99,1,5\n407\n",
         {"231,count\r\n"}},
        // The second pair is kept as written when it names nothing, and the line still ends.
        {"233 with a plain second pair",
         kHead + "233,99,1,2,5,setv\r\n233,99,1\r\n407\r\n",
         {"233,count,2,5,setv\r\n", "233,count,\r\n"}},
        {"names beyond the table",
         manyNames + "303,main\r\n231,99,24,0\r\n231,99,25,0\r\n407\r\n",
         {"231,n24\r\n", "231,99,25,0\r\n"}},
        {"long name and long first field",
         "250,main\r\n251," + std::string(40, 'f') +
             ",abcdefghijklmnop\r\n303,main\r\n231,99,1,0\r\n",
         {"231,abcdefghi\r\n"}},
        {"block name cut to its buffer", "250,mainblock\r\n303,mainzzz\r\n1,a\r\n", {"1,a\r\n"}, 5},
        {"no matching block", "250,main\r\n5,a\r\n407\r\n", {}},
        {"long line cut, keeping its line end",
         "250,main\r\n303,main\r\n17," + std::string(1000, 'q') + "\r\n",
         {"17," + std::string(tools::kListingLineSize - 6, 'q') + "\r\n"}},
    };
    for (const FilterCase& c : cases)
        EXPECT_EQ(Filter(c.listing, c.blockNameSize), c.expected) << c.what;
}

// Run under the sanitizers: random records of every kind, lengths and line ends.
TEST(MacroListingFilter, RandomListingsStayInBounds)
{
    std::mt19937 random(20261206u);
    const int numbers[] = {250, 251, 303, 407, 107, 307, 231, 233, 99, 0, 12, -5};
    const char alphabet[] = "abcmain0123456789,,,\r\n\n99 -x";
    for (int round = 0; round < 400; ++round) {
        std::string listing;
        int records = static_cast<int>(random() % 60);
        for (int r = 0; r < records; ++r) {
            listing += std::to_string(numbers[random() % 12]);
            for (int f = static_cast<int>(random() % 6); f > 0; --f) {
                listing += ",";
                int length = static_cast<int>(random() % (random() % 8 == 0 ? 400 : 12));
                for (int i = 0; i < length; ++i)
                    listing += alphabet[random() % (sizeof alphabet - 1)];
            }
            if (r + 1 < records || random() % 2 == 0)
                listing += (random() % 4 == 0) ? "\n" : "\r\n";
        }
        bool ok = tools::FilterMacroListing(
            listing.c_str(), 1 + random() % 30, [&](const char* line, std::int32_t length) {
                ASSERT_GE(length, 2);
                ASSERT_LE(static_cast<std::size_t>(length), tools::kListingLineSize - 1);
                ASSERT_EQ(static_cast<std::size_t>(length), std::strlen(line));
                EXPECT_EQ(std::string(line + length - 2), "\r\n");
            });
        ASSERT_TRUE(ok) << listing;
    }
}
