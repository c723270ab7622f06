// Memory files: the block's growth, the handles' positioning and the text rules.
#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <limits>
#include <random>
#include <string>
#include <vector>

#include "WorkspaceFixture.h"
#include "workspace/MemoryBlock.h"
#include "workspace/MemoryFile.h"

namespace {

using workspace_test::WorkspaceTest;

// Holds one memory entry for the length of a test and gives its reference back at the end.
class MemoryFileTest : public WorkspaceTest {
protected:
    void SetUp() override
    {
        WorkspaceTest::SetUp();
        block_ = new MemoryBlock();
        entry_ = new MemoryEntry(block_);
        entry_->addRef();
        text_ = new TextMemoryEntry(new MemoryBlock());
        text_->addRef();
    }
    void TearDown() override
    {
        EXPECT_EQ(entry_->release(), nullptr);
        EXPECT_EQ(text_->release(), nullptr);
        WorkspaceTest::TearDown();
    }

    std::string contents(ReaderWriter* handle)
    {
        std::string bytes(static_cast<std::size_t>(handle->size()), '\0');
        std::int32_t position = 0;
        static_cast<MemoryReaderWriter*>(handle)->block()->read(
            position, bytes.data(), static_cast<std::int32_t>(bytes.size()));
        return bytes;
    }

    static std::int32_t put(ReaderWriter* handle, const std::string& bytes)
    {
        return handle->write(bytes.data(), static_cast<std::int32_t>(bytes.size()));
    }

    static std::string take(ReaderWriter* handle, std::int32_t count)
    {
        std::string bytes(static_cast<std::size_t>(count > 0 ? count : 0), '\0');
        const std::int32_t got = handle->read(bytes.data(), count);
        bytes.resize(static_cast<std::size_t>(got > 0 ? got : 0));
        return bytes;
    }

    MemoryBlock* block_ = nullptr;
    MemoryEntry* entry_ = nullptr;
    TextMemoryEntry* text_ = nullptr;
};

using MemoryBlockGrowth = MemoryFileTest;
using MemoryHandle = MemoryFileTest;
using TextMemoryHandle = MemoryFileTest;

// ---- block ----

TEST_F(MemoryBlockGrowth, CapacityGrowsInSteps)
{
    EXPECT_EQ(block_->capacity(), 0);
    EXPECT_EQ(block_->bytes(), nullptr);
    ASSERT_TRUE(block_->setSize(1500));
    EXPECT_EQ(block_->capacity(), 2048);
    ASSERT_TRUE(block_->setSize(2048));
    EXPECT_EQ(block_->capacity(), 2048);
    ASSERT_TRUE(block_->setSize(2049));
    EXPECT_EQ(block_->capacity(), 3072);
    unsigned char* buffer = block_->bytes();
    ASSERT_TRUE(block_->setSize(0));
    EXPECT_EQ(block_->capacity(), 3072);
    EXPECT_EQ(block_->bytes(), buffer);
    EXPECT_EQ(block_->size(), 0);
}

TEST_F(MemoryBlockGrowth, NegativeLengthIsRefusedAndChangesNothing)
{
    ASSERT_TRUE(block_->setSize(10));
    EXPECT_FALSE(block_->setSize(-1));
    EXPECT_FALSE(block_->setSize(std::numeric_limits<std::int32_t>::min()));
    EXPECT_EQ(block_->size(), 10);
    EXPECT_EQ(block_->capacity(), 1024);
}

TEST_F(MemoryBlockGrowth, ByteAccessStopsAtTheEndAndGrowsOnPut)
{
    std::int32_t position = 0;
    unsigned char byte = 'q';
    EXPECT_FALSE(block_->getByte(position, byte));
    EXPECT_EQ(byte, 'q');
    EXPECT_TRUE(block_->putByte(position, 'x'));
    EXPECT_EQ(position, 1);
    EXPECT_EQ(block_->size(), 1);
    position = 5;
    EXPECT_TRUE(block_->putByte(position, 'y'));
    EXPECT_EQ(block_->size(), 6);
    position = -1;
    EXPECT_FALSE(block_->getByte(position, byte));
    EXPECT_FALSE(block_->putByte(position, 'z'));
    EXPECT_EQ(position, -1);
    // The gap left by a put past the end holds zeros, never leftovers of the allocator.
    position = 1;
    for (int i = 1; i < 5; ++i) {
        ASSERT_TRUE(block_->getByte(position, byte));
        EXPECT_EQ(byte, 0);
    }
}

TEST_F(MemoryBlockGrowth, ReadAndWriteRefuseBadCountsAndPositions)
{
    std::int32_t position = 0;
    char buffer[4] = {'k', 'k', 'k', 'k'};
    EXPECT_EQ(block_->write(position, "abc", 0), 0);
    EXPECT_EQ(block_->write(position, "abc", -3), 0);
    EXPECT_EQ(block_->write(position, nullptr, 3), 0);
    EXPECT_EQ(block_->size(), 0);
    EXPECT_EQ(block_->write(position, "abc", 3), 3);
    position = -2;
    EXPECT_EQ(block_->read(position, buffer, 4), 0);
    EXPECT_EQ(block_->write(position, "zz", 2), 0);
    position = 3;
    EXPECT_EQ(block_->read(position, buffer, 4), 0);
    position = 1;
    EXPECT_EQ(block_->read(position, buffer, 0), 0);
    EXPECT_EQ(block_->read(position, buffer, 4), 2);
    EXPECT_EQ(std::string(buffer, 2), "bc");
    EXPECT_EQ(buffer[2], 'k');
    // A write whose end would pass the 32-bit range keeps to the present length.
    position = 2;
    EXPECT_EQ(block_->write(position, "XYZ", std::numeric_limits<std::int32_t>::max()), 1);
    EXPECT_EQ(block_->size(), 3);
}

TEST_F(MemoryBlockGrowth, ClearZeroesTheBytesInUse)
{
    std::int32_t position = 0;
    block_->clear();
    block_->write(position, "abc", 3);
    block_->clear();
    EXPECT_EQ(block_->size(), 3);
    position = 0;
    char out[3] = {1, 1, 1};
    ASSERT_EQ(block_->read(position, out, 3), 3);
    EXPECT_EQ(std::memcmp(out, "\0\0\0", 3), 0);
}

// ---- binary handle ----

TEST_F(MemoryHandle, OpenModesTruncateAppendOrRewind)
{
    ReaderWriter* handle = entry_->open(7);
    ASSERT_NE(handle, nullptr);
    EXPECT_EQ(handle->refCount(), 1);
    EXPECT_EQ(handle->type(), 7);
    EXPECT_EQ(put(handle, "hello"), 5);

    for (const char* mode : {"r", "rb", "r+", "rt", "r+b"}) {
        handle->seek(3);
        EXPECT_EQ(handle->open(mode), RwOk) << mode;
        EXPECT_EQ(handle->tell(), 0) << mode;
        EXPECT_EQ(handle->size(), 5) << mode;
    }
    for (const char* mode : {"a", "wa", "a+", "ab"}) {
        handle->rewind();
        EXPECT_EQ(handle->open(mode), RwOk) << mode;
        EXPECT_EQ(handle->tell(), 5) << mode;
        EXPECT_EQ(contents(handle), "hello") << mode;
    }
    EXPECT_EQ(handle->open(nullptr), RwOk);
    EXPECT_EQ(handle->size(), 5);
    EXPECT_EQ(handle->openWrite(), RwOk);
    EXPECT_EQ(handle->size(), 0);
    EXPECT_EQ(handle->tell(), 0);
    put(handle, "abc");
    EXPECT_EQ(handle->openRead(), RwOk);
    EXPECT_EQ(take(handle, 10), "abc");
    EXPECT_EQ(handle->release(), nullptr);
}

TEST_F(MemoryHandle, SeeksStayWithinTheData)
{
    ReaderWriter* handle = entry_->open(0);
    put(handle, "0123456789");
    EXPECT_EQ(handle->seek(handle->size()), RwOk);
    EXPECT_EQ(handle->tell(), 10);
    EXPECT_EQ(handle->seek(11), RwOutOfRange);
    EXPECT_EQ(handle->seek(-1), RwOutOfRange);
    EXPECT_EQ(handle->tell(), 10);
    EXPECT_EQ(handle->rewind(), RwOk);
    EXPECT_EQ(handle->seekBy(-1), RwOutOfRange);
    EXPECT_EQ(handle->tell(), 0);
    EXPECT_EQ(handle->seekBy(0), RwOk);
    EXPECT_EQ(handle->seekBy(10), RwOk);
    EXPECT_EQ(handle->seekBy(1), RwOutOfRange);
    EXPECT_EQ(handle->tell(), 10);
    EXPECT_EQ(handle->seekBy(-4), RwOk);
    EXPECT_EQ(handle->tell(), 6);
    // Extreme offsets must not wrap around into a valid-looking position.
    EXPECT_EQ(handle->seekBy(std::numeric_limits<std::int32_t>::max()), RwOutOfRange);
    EXPECT_EQ(handle->seekBy(std::numeric_limits<std::int32_t>::min()), RwOutOfRange);
    EXPECT_EQ(handle->tell(), 6);
    handle->release();
}

TEST_F(MemoryHandle, NegativeSetSizeIsRefusedAndChangesNothing)
{
    ReaderWriter* handle = entry_->open(0);
    put(handle, "abcdef");
    handle->seek(2);
    EXPECT_EQ(handle->setSize(-1), RwOutOfRange);
    EXPECT_EQ(handle->size(), 6);
    EXPECT_EQ(handle->tell(), 2);
    EXPECT_EQ(contents(handle), "abcdef");
    handle->release();
}

TEST_F(MemoryHandle, ShorteningKeepsThePositionAndTheBytesBeyond)
{
    ReaderWriter* handle = entry_->open(0);
    put(handle, "abcdef");
    EXPECT_EQ(handle->setSize(2), RwOk);
    EXPECT_EQ(handle->tell(), 6);
    EXPECT_EQ(take(handle, 4), "");
    // Writing on from the old position brings the hidden bytes back, as the buffer kept them.
    EXPECT_EQ(put(handle, "X"), 1);
    EXPECT_EQ(contents(handle), "abcdefX");
    // Stepping back from past a shortened end is allowed; forward is not.
    handle->setSize(2);
    EXPECT_EQ(handle->seekBy(0), RwOk);
    EXPECT_EQ(handle->seekBy(1), RwOutOfRange);
    EXPECT_EQ(handle->seekBy(-1), RwOk);
    EXPECT_EQ(handle->tell(), 6);
    handle->release();
}

TEST_F(MemoryHandle, CountsOfZeroOrLessTransferNothing)
{
    ReaderWriter* handle = entry_->open(0);
    put(handle, "abc");
    handle->rewind();
    char buffer[2] = {'k', 'k'};
    for (std::int32_t count : {0, -1, std::numeric_limits<std::int32_t>::min()}) {
        EXPECT_EQ(handle->read(buffer, count), 0);
        EXPECT_EQ(handle->write("zz", count), 0);
    }
    EXPECT_EQ(handle->tell(), 0);
    EXPECT_EQ(buffer[0], 'k');
    EXPECT_EQ(contents(handle), "abc");
    handle->release();
}

TEST_F(MemoryHandle, ReadsPastTheEndReturnZero)
{
    ReaderWriter* handle = entry_->open(0);
    put(handle, "abc");
    handle->seek(1);
    char buffer[8] = {};
    EXPECT_EQ(handle->read(buffer, 8), 2);
    EXPECT_EQ(handle->read(buffer, 8), 0);
    EXPECT_EQ(handle->tell(), 3);
    handle->release();
}

TEST_F(MemoryHandle, BinaryWriteKeepsLineEndsAsTheyAre)
{
    ReaderWriter* handle = entry_->open(0);
    EXPECT_EQ(put(handle, "a\nb"), 3);
    EXPECT_EQ(handle->size(), 3);
    EXPECT_EQ(contents(handle), "a\nb");
    handle->release();
}

TEST_F(MemoryHandle, HandlesAndClonesShareTheBytesWithOwnPositions)
{
    ReaderWriter* first = entry_->open(1);
    ReaderWriter* second = entry_->open(2);
    put(first, "shared");
    EXPECT_EQ(second->tell(), 0);
    EXPECT_EQ(take(second, 3), "sha");
    EXPECT_EQ(first->tell(), 6);

    DirEnt* clone = entry_->clone();
    ASSERT_NE(clone, nullptr);
    EXPECT_EQ(clone->refCount(), 0);
    EXPECT_EQ(clone->parent(), nullptr);
    clone->addRef();
    ReaderWriter* third = clone->open(3);
    ASSERT_NE(dynamic_cast<MemoryReaderWriter*>(third), nullptr);
    EXPECT_EQ(dynamic_cast<TextMemoryReaderWriter*>(third), nullptr);
    EXPECT_EQ(take(third, 10), "shared");
    put(third, "!");
    EXPECT_EQ(contents(first), "shared!");

    // The bytes outlive the entry they were written through while a clone still holds them.
    EXPECT_EQ(clone->release(), clone) << "the open handle keeps the clone";
    EXPECT_EQ(third->release(), nullptr);
    EXPECT_EQ(first->release(), nullptr);
    EXPECT_EQ(second->release(), nullptr);
    ReaderWriter* later = entry_->open(0);
    EXPECT_EQ(take(later, 10), "shared!");
    later->release();
}

TEST_F(MemoryHandle, CloseRewindsAndKeepsTheBytes)
{
    ReaderWriter* handle = entry_->open(0);
    handle->openWrite();
    put(handle, "kept");
    EXPECT_EQ(handle->close(), RwOk);
    EXPECT_EQ(handle->tell(), 0);
    EXPECT_EQ(take(handle, 10), "kept");
    EXPECT_EQ(handle->close(), RwOk) << "memory handles have no closed state";
    handle->release();
}

TEST_F(MemoryHandle, EntryAndHandleNamesWithoutParent)
{
    ReaderWriter* handle = entry_->open(0);
    EXPECT_STREQ(entry_->fileName(), "");
    EXPECT_STREQ(handle->fileName(), "");
    EXPECT_EQ(entry_->name(), nullptr);
    EXPECT_EQ(handle->name(), nullptr);
    EXPECT_EQ(handle->dirEnt(), entry_);
    EXPECT_EQ(handle->setType(9), 9);
    EXPECT_EQ(handle->type(), 9);
    char* path = handle->path();
    ASSERT_NE(path, nullptr);
    EXPECT_STREQ(path, "") << "the topmost entry's path is empty";
    std::free(path);
    EXPECT_FALSE(entry_->isDirectory());
    EXPECT_EQ(entry_->open(0)->release(), nullptr);
    handle->release();
}

TEST_F(MemoryHandle, HandleHoldsTheEntryAndTheBlock)
{
    const std::int64_t before = live();
    auto* block = new MemoryBlock();
    auto* entry = new MemoryEntry(block);
    EXPECT_EQ(block->refCount(), 1);
    ReaderWriter* handle = entry->open(0);
    EXPECT_EQ(entry->refCount(), 1);
    EXPECT_EQ(block->refCount(), 2);
    EXPECT_EQ(live(), before + 3) << "entry, handle and block";
    // The handle's reference is the entry's last: both go with it, block included.
    EXPECT_EQ(handle->release(), nullptr);
    EXPECT_EQ(live(), before);
}

// ---- text handle ----

TEST_F(TextMemoryHandle, LineEndIsStoredAsCrLfAndReadBackAsLf)
{
    ReaderWriter* handle = text_->open(0);
    ASSERT_NE(dynamic_cast<TextMemoryReaderWriter*>(handle), nullptr);
    EXPECT_EQ(put(handle, "a\nb"), 3);
    EXPECT_EQ(handle->size(), 4);
    EXPECT_EQ(handle->tell(), 4);
    EXPECT_EQ(contents(handle), "a\r\nb");
    handle->rewind();
    EXPECT_EQ(take(handle, 10), "a\nb");
    EXPECT_EQ(handle->tell(), 4);
    handle->release();
}

TEST_F(TextMemoryHandle, LoneCarriageReturnsStay)
{
    ReaderWriter* handle = text_->open(0);
    put(handle, "x\ry");
    EXPECT_EQ(contents(handle), "x\ry");
    handle->rewind();
    EXPECT_EQ(take(handle, 10), "x\ry");
    handle->openWrite();
    put(handle, "x\r");
    handle->rewind();
    EXPECT_EQ(take(handle, 10), "x\r");
    handle->openWrite();
    put(handle, "\r\r\n");
    EXPECT_EQ(contents(handle), "\r\r\r\n");
    handle->rewind();
    EXPECT_EQ(take(handle, 10), "\r\r\n");
    handle->release();
}

TEST_F(TextMemoryHandle, ReadsOneCharacterAtATimeAcrossLineEnds)
{
    ReaderWriter* handle = text_->open(0);
    put(handle, "a\n\nb\r");
    handle->rewind();
    std::string seen;
    std::vector<std::int32_t> positions;
    for (std::string one = take(handle, 1); !one.empty(); one = take(handle, 1)) {
        seen += one;
        positions.push_back(handle->tell());
    }
    EXPECT_EQ(seen, "a\n\nb\r");
    EXPECT_EQ(positions, (std::vector<std::int32_t>{1, 3, 5, 6, 7}));
    handle->release();
}

TEST_F(TextMemoryHandle, CtrlZEndsTheTextUntilThePositionMovesPast)
{
    ReaderWriter* handle = text_->open(0);
    put(handle, std::string("ab\x1A"
                            "cd"));
    handle->rewind();
    EXPECT_EQ(take(handle, 10), "ab");
    EXPECT_EQ(handle->tell(), 2);
    EXPECT_EQ(take(handle, 10), "");
    EXPECT_EQ(handle->tell(), 2);
    EXPECT_EQ(handle->seekBy(1), RwOk);
    EXPECT_EQ(take(handle, 10), "cd");
    handle->release();
}

TEST_F(TextMemoryHandle, CountsOfZeroOrLessTransferNothing)
{
    ReaderWriter* handle = text_->open(0);
    put(handle, "a\nb");
    handle->rewind();
    char buffer[4] = {'k', 'k', 'k', 'k'};
    EXPECT_EQ(handle->read(buffer, 0), 0);
    EXPECT_EQ(handle->read(buffer, -5), 0);
    EXPECT_EQ(handle->write("\n\n", 0), 0);
    EXPECT_EQ(handle->write("\n\n", -1), 0);
    EXPECT_EQ(handle->read(nullptr, 4), 0);
    EXPECT_EQ(handle->write(nullptr, 4), 0);
    EXPECT_EQ(buffer[0], 'k');
    EXPECT_EQ(handle->tell(), 0);
    EXPECT_EQ(handle->size(), 4);
    handle->release();
}

TEST_F(TextMemoryHandle, ReadFillsNoMoreThanTheCount)
{
    ReaderWriter* handle = text_->open(0);
    put(handle, "\n\n\n\n");
    handle->rewind();
    char buffer[4] = {'k', 'k', 'k', 'k'};
    EXPECT_EQ(handle->read(buffer, 3), 3);
    EXPECT_EQ(std::string(buffer, 4), "\n\n\nk");
    EXPECT_EQ(handle->tell(), 6);
    handle->release();
}

TEST_F(TextMemoryHandle, OverwritingInsideTheTextKeepsTheRest)
{
    ReaderWriter* handle = text_->open(0);
    put(handle, "abcdef");
    handle->seek(1);
    EXPECT_EQ(put(handle, "\n"), 1);
    EXPECT_EQ(contents(handle), "a\r\ndef");
    EXPECT_EQ(handle->size(), 6);
    handle->seek(5);
    EXPECT_EQ(put(handle, "\nZ"), 2);
    EXPECT_EQ(contents(handle), "a\r\nde\r\nZ");
    handle->release();
}

TEST_F(TextMemoryHandle, CloneOfTextEntryIsTextAndSharesTheBytes)
{
    DirEnt* clone = text_->clone();
    ASSERT_NE(dynamic_cast<TextMemoryEntry*>(clone), nullptr);
    clone->addRef();
    ReaderWriter* writer = text_->open(0);
    ReaderWriter* reader = clone->open(0);
    ASSERT_NE(dynamic_cast<TextMemoryReaderWriter*>(reader), nullptr);
    put(writer, "x\ny");
    EXPECT_EQ(take(reader, 10), "x\ny");
    reader->release();
    writer->release();
    EXPECT_EQ(clone->release(), nullptr);
}

// The text handle works on the block directly; a plain model of the rules, taken one byte at a
// time, must agree with it on any mix of bytes, counts and positions.
struct TextModel {
    std::string stored;
    std::int32_t position = 0;

    std::int32_t write(const std::string& source)
    {
        for (char c : source) {
            if (c == '\n') {
                putByte('\r');
            }
            putByte(c);
        }
        return static_cast<std::int32_t>(source.size());
    }
    void putByte(char c)
    {
        if (position >= static_cast<std::int32_t>(stored.size())) {
            stored.resize(static_cast<std::size_t>(position) + 1, '\0');
        }
        stored[static_cast<std::size_t>(position++)] = c;
    }
    std::string read(std::int32_t count)
    {
        std::string out;
        const auto length = static_cast<std::int32_t>(stored.size());
        while (static_cast<std::int32_t>(out.size()) < count && position < length) {
            const char c = stored[static_cast<std::size_t>(position++)];
            if (c == '\r') {
                if (position < length && stored[static_cast<std::size_t>(position)] == '\n') {
                    ++position;
                    out += '\n';
                } else {
                    out += '\r';
                }
            } else if (c == '\x1A') {
                --position;
                break;
            } else {
                out += c;
            }
        }
        return out;
    }
};

TEST_F(TextMemoryHandle, AgreesWithTheByteWiseRulesOnRandomText)
{
    std::mt19937 random(20261206);
    const char alphabet[] = {'a', 'b', '\n', '\r', '\x1A', '\0'};
    ReaderWriter* handle = text_->open(0);
    TextModel model;
    for (int round = 0; round < 3000; ++round) {
        const int action = static_cast<int>(random() % 4);
        if (action == 0) {
            std::string source(random() % 40, 'a');
            for (char& c : source) {
                c = alphabet[random() % sizeof alphabet];
            }
            ASSERT_EQ(put(handle, source), model.write(source)) << round;
        } else if (action == 1) {
            const auto count = static_cast<std::int32_t>(random() % 40);
            ASSERT_EQ(take(handle, count), model.read(count)) << round;
        } else {
            const auto target = static_cast<std::int32_t>(random() % (model.stored.size() + 1));
            ASSERT_EQ(handle->seek(target), RwOk);
            model.position = target;
        }
        ASSERT_EQ(handle->tell(), model.position) << round;
        ASSERT_EQ(contents(handle), model.stored) << round;
    }
    handle->release();
}

TEST_F(TextMemoryHandle, LargeWriteGrowsToTheSameCapacityAsByteWiseGrowth)
{
    ReaderWriter* handle = text_->open(0);
    const std::string line = "0123456789abcdef0123456789abcdef\n"; // 33 source, 34 stored
    std::string source;
    for (int i = 0; i < 1000; ++i) {
        source += line;
    }
    ASSERT_EQ(put(handle, source), 33000);
    EXPECT_EQ(handle->size(), 34000);
    auto* block = static_cast<MemoryReaderWriter*>(handle)->block();
    EXPECT_EQ(block->capacity(), 34816) << "34000 rounded up to whole kilobytes";
    handle->rewind();
    std::string back(40000, '\0');
    ASSERT_EQ(handle->read(back.data(), 40000), 33000);
    back.resize(33000);
    EXPECT_EQ(back, source);
    handle->release();
}

} // namespace
