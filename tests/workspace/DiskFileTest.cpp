// Disk files through real temporary files.
#include <gtest/gtest.h>

#include <cstdio>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <random>
#include <string>

#include "WorkspaceFixture.h"
#include "workspace/DiskFile.h"

namespace {

namespace fs = std::filesystem;
using workspace_test::WorkspaceTest;

class DiskFileTest : public WorkspaceTest {
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
        fs::permissions(folder_, fs::perms::owner_all, ignored);
        fs::remove_all(folder_, ignored);
        WorkspaceTest::TearDown();
    }

    std::string hostPath(const char* name) const { return (folder_ / name).string(); }

    void writeHost(const char* name, const std::string& bytes) const
    {
        std::ofstream out(folder_ / name, std::ios::binary | std::ios::trunc);
        out << bytes;
    }

    std::string readHost(const char* name) const
    {
        std::ifstream in(folder_ / name, std::ios::binary);
        return std::string(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
    }

    // A held entry on a host file, and a handle on it; both are given back by release().
    ReaderWriter* openHandle(const char* name, DirEnt** entryOut = nullptr)
    {
        auto* entry = new DiskEntry(hostPath(name).c_str());
        entry->addRef();
        ReaderWriter* handle = entry->open(4);
        entry->release(); // the handle's own reference keeps it
        if (entryOut != nullptr) {
            *entryOut = entry;
        }
        return handle;
    }

    static std::string take(ReaderWriter* handle, std::int32_t count)
    {
        std::string bytes(static_cast<std::size_t>(count), '\0');
        const std::int32_t got = handle->read(bytes.data(), count);
        bytes.resize(static_cast<std::size_t>(got > 0 ? got : 0));
        return bytes;
    }

    fs::path folder_;
};

using DiskHandle = DiskFileTest;
using DiskHandleClosed = DiskFileTest;
using DiskEntryCopy = DiskFileTest;

TEST_F(DiskHandleClosed, MissingFileGivesNotOpenAndEveryOperationSaysSo)
{
    ReaderWriter* handle = openHandle("absent.txt");
    ASSERT_NE(handle, nullptr);
    EXPECT_EQ(handle->openRead(), RwNotOpen);
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
    EXPECT_FALSE(fs::exists(hostPath("absent.txt"))) << "reading must not create the file";
    handle->release();
}

TEST_F(DiskHandleClosed, DirectoryIsNotAFile)
{
    fs::create_directory(folder_ / "sub");
    ReaderWriter* handle = openHandle("sub");
    for (const char* mode : {"r", "w", "a", "r+"}) {
        EXPECT_EQ(handle->open(mode), RwNotOpen) << mode;
        EXPECT_EQ(handle->read(nullptr, 0), 0);
    }
    EXPECT_TRUE(fs::is_directory(folder_ / "sub"));
    handle->release();
}

TEST_F(DiskHandleClosed, UnreadableFileGivesNotOpen)
{
    writeHost("secret.txt", "hidden");
    fs::permissions(folder_ / "secret.txt", fs::perms::none);
    if (std::FILE* probe = std::fopen(hostPath("secret.txt").c_str(), "rb")) {
        std::fclose(probe);
        GTEST_SKIP() << "this user reads files without read permission (root)";
    }
    ReaderWriter* handle = openHandle("secret.txt");
    EXPECT_EQ(handle->openRead(), RwNotOpen);
    EXPECT_EQ(handle->size(), -1);
    handle->release();
}

TEST_F(DiskHandleClosed, BadModesAndPathsGiveNotOpen)
{
    writeHost("plain.txt", "abc");
    ReaderWriter* handle = openHandle("plain.txt");
    EXPECT_EQ(handle->open(nullptr), RwNotOpen);
    EXPECT_EQ(handle->open(""), RwNotOpen);
    EXPECT_EQ(handle->open("rbbbbbbbbbbbbbb"), RwNotOpen) << "15 letters do not fit the buffer";
    EXPECT_EQ(handle->open("r,ccs=UTF-8"), RwNotOpen);
    EXPECT_EQ(handle->open("rbbbbbbbbbbbbb"), RwOk) << "14 letters do";
    EXPECT_EQ(take(handle, 10), "abc");
    handle->release();

    auto* nameless = new DiskEntry(nullptr);
    EXPECT_STREQ(nameless->fileName(), "");
    ReaderWriter* none = nameless->open(0);
    EXPECT_EQ(none->openRead(), RwNotOpen);
    none->release();

    auto* deep = new DiskEntry(hostPath("missing-folder/file.txt").c_str());
    ReaderWriter* nowhere = deep->open(0);
    EXPECT_EQ(nowhere->openWrite(), RwNotOpen);
    nowhere->release();
}

TEST_F(DiskHandle, WriteEmptiesAndAppendKeeps)
{
    writeHost("data.txt", "old content");
    ReaderWriter* handle = openHandle("data.txt");
    EXPECT_EQ(handle->openWrite(), RwOk);
    EXPECT_EQ(handle->close(), RwOk);
    EXPECT_EQ(readHost("data.txt"), "");

    writeHost("data.txt", "head");
    EXPECT_EQ(handle->open("a"), RwOk);
    EXPECT_EQ(handle->write("tail", 4), 4);
    EXPECT_EQ(handle->close(), RwOk);
    EXPECT_EQ(readHost("data.txt"), "headtail");
    handle->release();
}

TEST_F(DiskHandle, BytesPassUnchangedBothWays)
{
    ReaderWriter* handle = openHandle("bytes.bin");
    ASSERT_EQ(handle->openWrite(), RwOk);
    EXPECT_EQ(handle->write("a\nb", 3), 3);
    const std::string binary("\r\n\x1A\0\xFF", 5);
    EXPECT_EQ(handle->write(binary.data(), 5), 5);
    EXPECT_EQ(handle->write("x", 0), 0);
    EXPECT_EQ(handle->write("x", -1), 0);
    handle->close();
    EXPECT_EQ(readHost("bytes.bin"), "a\nb" + binary);

    ASSERT_EQ(handle->openRead(), RwOk);
    EXPECT_EQ(take(handle, 100), "a\nb" + binary);
    EXPECT_EQ(take(handle, 100), "") << "reads past the end give 0";
    handle->release();
}

TEST_F(DiskHandle, SizeLeavesThePositionWhereItWas)
{
    writeHost("hundred.bin", std::string(100, 'h'));
    ReaderWriter* handle = openHandle("hundred.bin");
    ASSERT_EQ(handle->openRead(), RwOk);
    EXPECT_EQ(handle->seek(10), RwOk);
    EXPECT_EQ(handle->size(), 100);
    EXPECT_EQ(handle->tell(), 10);
    EXPECT_EQ(handle->seekBy(5), RwOk);
    EXPECT_EQ(handle->tell(), 15);
    EXPECT_EQ(handle->rewind(), RwOk);
    EXPECT_EQ(handle->tell(), 0);
    EXPECT_EQ(handle->seek(-1), RwSeekFailed);
    EXPECT_EQ(handle->seekBy(-1), RwSeekFailed);
    handle->release();
}

TEST_F(DiskHandle, SetSizeLeavesTheHostFileAlone)
{
    writeHost("fixed.txt", "twelve bytes");
    ReaderWriter* handle = openHandle("fixed.txt");
    ASSERT_EQ(handle->open("r+"), RwOk);
    EXPECT_EQ(handle->setSize(0), RwOk);
    EXPECT_EQ(handle->setSize(-1), RwOutOfRange);
    EXPECT_EQ(handle->size(), 12);
    handle->close();
    EXPECT_EQ(readHost("fixed.txt"), "twelve bytes");
    handle->release();
}

TEST_F(DiskHandle, CloseTwiceReportsTheSecond)
{
    writeHost("twice.txt", "x");
    ReaderWriter* handle = openHandle("twice.txt");
    ASSERT_EQ(handle->openRead(), RwOk);
    EXPECT_EQ(handle->close(), RwOk);
    EXPECT_EQ(handle->close(), RwNotOpen);
    handle->release();
}

TEST_F(DiskHandle, ReopeningClosesTheEarlierStreamFirst)
{
    ReaderWriter* handle = openHandle("reopen.txt");
    ASSERT_EQ(handle->openWrite(), RwOk);
    EXPECT_EQ(handle->write("abc", 3), 3);
    // The bytes sit in the first stream's buffer; only closing that stream writes them out.
    ASSERT_EQ(handle->openRead(), RwOk);
    EXPECT_EQ(take(handle, 10), "abc");
    handle->release();
}

TEST_F(DiskHandle, ReadAndWriteMayAlternateOnAnUpdateStream)
{
    writeHost("update.txt", "abcdef");
    ReaderWriter* handle = openHandle("update.txt");
    ASSERT_EQ(handle->open("r+"), RwOk);
    EXPECT_EQ(take(handle, 2), "ab");
    EXPECT_EQ(handle->write("XY", 2), 2);
    EXPECT_EQ(take(handle, 2), "ef");
    handle->close();
    EXPECT_EQ(readHost("update.txt"), "abXYef");
    handle->release();
}

TEST_F(DiskHandle, DestroyingAnOpenHandleFlushesAndCloses)
{
    ReaderWriter* handle = openHandle("flushed.txt");
    ASSERT_EQ(handle->openWrite(), RwOk);
    handle->write("end", 3);
    EXPECT_EQ(handle->release(), nullptr);
    EXPECT_EQ(readHost("flushed.txt"), "end");
}

TEST_F(DiskEntryCopy, CloneNamesTheSameHostFile)
{
    writeHost("same.txt", "");
    DirEnt* entry = nullptr;
    ReaderWriter* first = openHandle("same.txt", &entry);
    EXPECT_EQ(std::string(entry->fileName()), hostPath("same.txt"));
    EXPECT_EQ(std::string(first->fileName()), hostPath("same.txt"));
    DirEnt* clone = entry->clone();
    ASSERT_NE(clone, nullptr);
    ASSERT_NE(dynamic_cast<DiskEntry*>(clone), nullptr);
    EXPECT_EQ(clone->refCount(), 0);
    EXPECT_NE(clone->fileName(), entry->fileName()) << "the clone keeps its own copy";
    EXPECT_STREQ(clone->fileName(), entry->fileName());
    ReaderWriter* second = clone->open(0);
    ASSERT_EQ(first->openWrite(), RwOk);
    first->write("via first", 9);
    first->close();
    ASSERT_EQ(second->openRead(), RwOk);
    EXPECT_EQ(take(second, 20), "via first");
    second->release();
    first->release();
}

TEST_F(DiskEntryCopy, EntryIsAFileWithoutHandleState)
{
    auto* entry = new DiskEntry("/nonexistent/place");
    entry->addRef();
    EXPECT_FALSE(entry->isDirectory());
    EXPECT_EQ(entry->name(), nullptr);
    ReaderWriter* handle = entry->open(2);
    ASSERT_NE(dynamic_cast<DiskReaderWriter*>(handle), nullptr);
    EXPECT_FALSE(static_cast<DiskReaderWriter*>(handle)->isOpen());
    EXPECT_EQ(handle->type(), 2);
    EXPECT_EQ(entry->refCount(), 2);
    handle->release();
    EXPECT_EQ(entry->release(), nullptr);
}

} // namespace
