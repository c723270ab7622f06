#include <gtest/gtest.h>

#include <string>

#include "tessel/ReaderWriter.h"
#include "tools/BrickQueries.h"
#include "tools/ByteList.h"
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
