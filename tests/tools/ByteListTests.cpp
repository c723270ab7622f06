#include <gtest/gtest.h>

#include <cstring>
#include <string>

#include "tessel/ReaderWriter.h"
#include "tools/BrickQueries.h"
#include "tools/ByteList.h"
#include "tools/ScratchFile.h"
#include "workspace/LiveObjects.h"

namespace {

class TextFile {
public:
    explicit TextFile(const std::string& text) : file_(tools::NewScratchFile(0))
    {
        file_->openWrite();
        file_->write(text.data(), static_cast<std::int32_t>(text.size()));
        file_->close();
    }
    ~TextFile() { tools::ReleaseHandle(&file_); }
    ReaderWriter* get() { return file_; }

private:
    ReaderWriter* file_;
};

class ByteList : public ::testing::Test {
protected:
    void TearDown() override { EXPECT_EQ(workspace::LiveObjectCount(), before_); }
    std::int64_t before_ = workspace::LiveObjectCount();
};

} // namespace

TEST_F(ByteList, ParsesFiveCharacterValues)
{
    TextFile file("0x00,0x03,0x0a,0xff");
    unsigned char out[8] = {};
    EXPECT_EQ(tools::ParseByteList(file.get(), out, 8), 4);
    EXPECT_EQ(out[0], 0);
    EXPECT_EQ(out[1], 3);
    EXPECT_EQ(out[2], 10);
    EXPECT_EQ(out[3], 255);
}

TEST_F(ByteList, StopsAtTheWantedCount)
{
    TextFile file("0x01,0x02,0x03");
    unsigned char out[3] = {0, 0, 0x55};
    EXPECT_EQ(tools::ParseByteList(file.get(), out, 2), 2);
    EXPECT_EQ(out[2], 0x55);
}

TEST_F(ByteList, ValuesOfOtherWidthsStayInStep)
{
    TextFile file("0x1,0x123,0x02\r\n");
    unsigned char out[4] = {};
    ASSERT_EQ(tools::ParseByteList(file.get(), out, 4), 3);
    EXPECT_EQ(out[0], 0x01);
    EXPECT_EQ(out[1], 0x23); // low 8 bits
    EXPECT_EQ(out[2], 0x02);
}

TEST_F(ByteList, FieldThatDoesNotParseStoresNothing)
{
    TextFile file("0x01,zz,0x02");
    unsigned char out[4] = {};
    ASSERT_EQ(tools::ParseByteList(file.get(), out, 4), 2);
    EXPECT_EQ(out[1], 0x02);
}

TEST_F(ByteList, NullOrEmptyFileGivesNothing)
{
    unsigned char out[4] = {};
    EXPECT_EQ(tools::ParseByteList(nullptr, out, 4), 0);
    TextFile empty("");
    EXPECT_EQ(tools::ParseByteList(empty.get(), out, 4), 0);
}

TEST_F(ByteList, ReadByteValueReadsAFieldOfAnyLength)
{
    std::string longField = "0x" + std::string(5000, '0') + "41";
    TextFile file(longField + ",0x7,garbage,");
    file.get()->openRead();
    EXPECT_EQ(tools::ReadByteValue(file.get()), 0x41);
    EXPECT_EQ(tools::ReadByteValue(file.get()), 0x07);
    EXPECT_EQ(tools::ReadByteValue(file.get()), 0);
    // At the end of the file a value reads as 0.
    EXPECT_EQ(tools::ReadByteValue(file.get()), 0);
    EXPECT_EQ(tools::ReadByteValue(file.get()), 0);
    file.get()->close();
}

TEST_F(ByteList, ReadWordTakesTheHighByteFirst)
{
    TextFile file("0x12,0x34,0xab");
    file.get()->openRead();
    EXPECT_EQ(tools::ReadWord(file.get()), 0x1234);
    // The missing low byte reads as 0.
    EXPECT_EQ(tools::ReadWord(file.get()), 0xab00);
    file.get()->close();
}
