// Disk files through real temporary files.
#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <iterator>
#include <random>
#include <string>

#include "WorkspaceFixture.h"
#include "workspace/DiskFile.h"

namespace {

namespace fs = std::filesystem;
using workspace_test::Take;
using workspace_test::WorkspaceTest;

class DiskFile : public WorkspaceTest {
protected:
    void SetUp() override
    {
        WorkspaceTest::SetUp();
        std::random_device seed;
        folder_ = fs::temp_directory_path() /
                  ("harbor-disk-" + std::to_string(seed()) + "-" + std::to_string(seed()));
        fs::create_directories(folder_);
    }
    void TearDown() override
    {
        std::error_code ignored;
        fs::remove_all(folder_, ignored);
        WorkspaceTest::TearDown();
    }

    std::string hostPath(const char* name) const { return (folder_ / name).string(); }
    void writeHost(const char* name, const std::string& bytes) const
    {
        std::ofstream(folder_ / name, std::ios::binary | std::ios::trunc) << bytes;
    }
    std::string readHost(const char* name) const
    {
        std::ifstream in(folder_ / name, std::ios::binary);
        return std::string(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
    }
    // A handle on a new entry for the host file; the handle's reference is the entry's only one.
    ReaderWriter* openHandle(const std::string& path) const
    {
        return (new DiskEntry(path.c_str()))->open(4);
    }
    ReaderWriter* openHandle(const char* name) const { return openHandle(hostPath(name)); }

    fs::path folder_;
};

TEST_F(DiskFile, HandleThatCannotOpenSaysSoInEveryOperation)
{
    fs::create_directory(folder_ / "sub");
    writeHost("plain.txt", "abc");
    struct Case {
        std::string path;
        const char* mode;
    };
    const Case cases[] = {
        {hostPath("absent.txt"), "r"},
        {hostPath("sub"), "r"}, // a directory is not a file, in any mode
        {hostPath("sub"), "w"},
        {hostPath("sub"), "r+"},
        {hostPath("missing-folder/file.txt"), "w"},
        {"", "r"},
        {hostPath("plain.txt"), nullptr},
        {hostPath("plain.txt"), ""},
        {hostPath("plain.txt"), "rbbbbbbbbbbbbbb"}, // 15 letters do not fit the buffer
        {hostPath("plain.txt"), "r,ccs=UTF-8"},     // would make a wide stream
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.path + " mode " + (c.mode != nullptr ? c.mode : "<null>"));
        ReaderWriter* handle = openHandle(c.path);
        ASSERT_NE(handle, nullptr);
        EXPECT_FALSE(static_cast<DiskReaderWriter*>(handle)->isOpen());
        EXPECT_EQ(handle->open(c.mode), RwNotOpen);
        char buffer[4] = {};
        EXPECT_EQ(handle->read(buffer, 4), 0);
        EXPECT_EQ(handle->write("abcd", 4), -1);
        EXPECT_EQ(handle->write("abcd", 0), -1);
        EXPECT_EQ(handle->tell(), -1);
        EXPECT_EQ(handle->size(), -1);
        EXPECT_EQ(handle->close(), RwNotOpen);
        EXPECT_EQ(handle->seek(0), RwNotOpen);
        EXPECT_EQ(handle->seekBy(1), RwNotOpen);
        EXPECT_EQ(handle->rewind(), RwNotOpen);
        handle->release();
    }
    EXPECT_FALSE(fs::exists(hostPath("absent.txt"))) << "reading must not create the file";
    EXPECT_TRUE(fs::is_directory(folder_ / "sub"));
    EXPECT_EQ(readHost("plain.txt"), "abc");
    ReaderWriter* handle = openHandle("plain.txt");
    EXPECT_EQ(handle->open("rbbbbbbbbbbbbb"), RwOk) << "14 letters fit";
    EXPECT_EQ(Take(handle, 10), "abc");
    handle->release();
}

TEST_F(DiskFile, BytesPassUnchangedAndWriteEmptiesWhileAppendKeeps)
{
    writeHost("data.bin", "old content");
    ReaderWriter* handle = openHandle("data.bin");
    ASSERT_EQ(handle->openWrite(), RwOk);
    const std::string binary("a\nb\r\n\x1A\0\xFF", 8);
    EXPECT_EQ(handle->write(binary.data(), 8), 8);
    EXPECT_EQ(handle->write("x", 0), 0);
    EXPECT_EQ(handle->write("x", -1), 0);
    EXPECT_EQ(handle->close(), RwOk);
    EXPECT_EQ(handle->close(), RwNotOpen) << "the second close is reported";
    EXPECT_EQ(readHost("data.bin"), binary);
    ASSERT_EQ(handle->openRead(), RwOk);
    EXPECT_EQ(Take(handle, 100), binary);
    EXPECT_EQ(Take(handle, 100), "") << "past the end";

    writeHost("data.bin", "head");
    EXPECT_EQ(handle->open("a"), RwOk);
    EXPECT_EQ(handle->write("tail", 4), 4);
    handle->close();
    EXPECT_EQ(readHost("data.bin"), "headtail");
    handle->release();
}

TEST_F(DiskFile, SizeAndSeeksKeepTheHostFileAndPosition)
{
    writeHost("hundred.bin", std::string(100, 'h'));
    ReaderWriter* handle = openHandle("hundred.bin");
    ASSERT_EQ(handle->open("r+"), RwOk);
    EXPECT_EQ(handle->seek(10), RwOk);
    EXPECT_EQ(handle->size(), 100);
    EXPECT_EQ(handle->tell(), 10) << "size leaves the position where it was";
    EXPECT_EQ(handle->seekBy(5), RwOk);
    EXPECT_EQ(handle->tell(), 15);
    EXPECT_EQ(handle->seek(-1), RwSeekFailed);
    EXPECT_EQ(handle->seekBy(-100), RwSeekFailed);
    EXPECT_EQ(handle->setSize(0), RwOk);
    EXPECT_EQ(handle->setSize(-1), RwOutOfRange);
    EXPECT_EQ(handle->size(), 100) << "the host file keeps its length";
    EXPECT_EQ(handle->rewind(), RwOk);
    EXPECT_EQ(handle->tell(), 0);
    handle->release();
}

// A stream open for update must be repositioned between a read and a write; the handle does it.
TEST_F(DiskFile, ReadAndWriteMayAlternateOnAnUpdateStream)
{
    writeHost("update.txt", "abcdef");
    ReaderWriter* handle = openHandle("update.txt");
    ASSERT_EQ(handle->open("r+"), RwOk);
    EXPECT_EQ(Take(handle, 2), "ab");
    EXPECT_EQ(handle->write("XY", 2), 2);
    EXPECT_EQ(Take(handle, 2), "ef");
    handle->close();
    EXPECT_EQ(readHost("update.txt"), "abXYef");
    handle->release();
}

TEST_F(DiskFile, ReopeningOrReleasingClosesTheEarlierStreamFirst)
{
    ReaderWriter* handle = openHandle("reopen.txt");
    ASSERT_EQ(handle->openWrite(), RwOk);
    EXPECT_EQ(handle->write("abc", 3), 3);
    // The bytes sit in the first stream's buffer; only closing that stream writes them out.
    ASSERT_EQ(handle->openRead(), RwOk);
    EXPECT_EQ(Take(handle, 10), "abc");
    handle->release();

    ReaderWriter* unclosed = openHandle("flushed.txt");
    ASSERT_EQ(unclosed->openWrite(), RwOk);
    unclosed->write("end", 3);
    EXPECT_EQ(unclosed->release(), nullptr);
    EXPECT_EQ(readHost("flushed.txt"), "end");
}

TEST_F(DiskFile, CloneNamesTheSameHostFileWithItsOwnCopy)
{
    ReaderWriter* first = openHandle("same.txt");
    DirEnt* entry = first->dirEnt();
    EXPECT_EQ(std::string(first->fileName()), hostPath("same.txt"));
    DirEnt* clone = entry->clone();
    ASSERT_NE(dynamic_cast<DiskEntry*>(clone), nullptr);
    EXPECT_EQ(clone->refCount(), 0);
    EXPECT_NE(clone->fileName(), entry->fileName());
    EXPECT_STREQ(clone->fileName(), entry->fileName());
    ReaderWriter* second = clone->open(0);
    ASSERT_EQ(first->openWrite(), RwOk);
    first->write("via first", 9);
    first->close();
    ASSERT_EQ(second->openRead(), RwOk);
    EXPECT_EQ(Take(second, 20), "via first");
    second->release();
    first->release();
}

} // namespace
