// Memory files: the block's growth, the handles' positioning and the text rules.
#include <gtest/gtest.h>

#include <cstdint>
#include <limits>
#include <random>
#include <string>
#include <vector>

#include "WorkspaceFixture.h"
#include "workspace/MemoryBlock.h"
#include "workspace/MemoryFile.h"

namespace {

using workspace_test::Put;
using workspace_test::Take;
using workspace_test::WorkspaceTest;
constexpr std::int32_t kMax = std::numeric_limits<std::int32_t>::max();
constexpr std::int32_t kMin = std::numeric_limits<std::int32_t>::min();

// A binary and a text entry, held for the length of a test.
class MemoryFile : public WorkspaceTest {
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

    // The stored bytes, whatever the handle's kind.
    static std::string stored(ReaderWriter* handle)
    {
        std::string bytes(static_cast<std::size_t>(handle->size()), '\0');
        std::int32_t position = 0;
        static_cast<MemoryReaderWriter*>(handle)->block()->read(position, bytes.data(),
                                                                handle->size());
        return bytes;
    }

    MemoryBlock* block_ = nullptr;
    MemoryEntry* entry_ = nullptr;
    TextMemoryEntry* text_ = nullptr;
};

// ---- block ----

TEST_F(MemoryFile, BlockGrowsInKilobyteStepsAndNeverShrinks)
{
    EXPECT_EQ(block_->bytes(), nullptr);
    for (auto [length, capacity] : {std::pair{1500, 2048}, {2048, 2048}, {2049, 3072}, {0, 3072}}) {
        ASSERT_TRUE(block_->setSize(length)) << length;
        EXPECT_EQ(block_->capacity(), capacity) << length;
    }
    ASSERT_TRUE(block_->setSize(10));
    EXPECT_FALSE(block_->setSize(-1));
    EXPECT_FALSE(block_->setSize(kMin));
    EXPECT_EQ(block_->size(), 10);
    std::int32_t position = 0;
    block_->write(position, "abc", 3);
    block_->clear();
    EXPECT_EQ(block_->size(), 10);
    char out[3] = {1, 1, 1};
    position = 0;
    ASSERT_EQ(block_->read(position, out, 3), 3);
    EXPECT_EQ(std::string(out, 3), std::string(3, '\0'));
}

TEST_F(MemoryFile, BlockByteAccessRefusesBadPositionsAndZeroesGaps)
{
    std::int32_t position = 0;
    unsigned char byte = 'q';
    EXPECT_FALSE(block_->getByte(position, byte));
    EXPECT_EQ(byte, 'q');
    position = 5;
    EXPECT_TRUE(block_->putByte(position, 'y'));
    EXPECT_EQ(position, 6);
    EXPECT_EQ(block_->size(), 6);
    position = -1;
    EXPECT_FALSE(block_->getByte(position, byte));
    EXPECT_FALSE(block_->putByte(position, 'z'));
    char buffer[4] = {'k', 'k', 'k', 'k'};
    EXPECT_EQ(block_->read(position, buffer, 4), 0);
    EXPECT_EQ(block_->write(position, "zz", 2), 0);
    EXPECT_EQ(position, -1);
    // The gap left by a put past the end holds zeros, never leftovers of the allocator.
    position = 0;
    EXPECT_EQ(block_->read(position, buffer, 4), 4);
    EXPECT_EQ(std::string(buffer, 4), std::string(4, '\0'));
    EXPECT_EQ(block_->write(position, nullptr, 3), 0);
    EXPECT_EQ(block_->read(position, nullptr, 3), 0);
    // A write whose end would pass the 32-bit range keeps to the present length.
    position = 5;
    EXPECT_EQ(block_->write(position, "XYZ", kMax), 1);
    EXPECT_EQ(block_->size(), 6);
}

// ---- handles, both kinds ----

TEST_F(MemoryFile, OpenModesTruncateAppendOrRewind)
{
    struct Case {
        const char* mode;
        std::int32_t position;
        std::int32_t size;
    };
    const Case cases[] = {{"r", 0, 5},  {"rb", 0, 5}, {"r+b", 0, 5}, {nullptr, 0, 5}, {"a", 5, 5},
                          {"wa", 5, 5}, {"a+", 5, 5}, {"w", 0, 0},   {"w+b", 0, 0}};
    ReaderWriter* handle = entry_->open(7);
    ASSERT_NE(handle, nullptr);
    EXPECT_EQ(handle->type(), 7);
    for (const Case& c : cases) {
        SCOPED_TRACE(c.mode != nullptr ? c.mode : "<null>");
        handle->openWrite();
        Put(handle, "hello");
        handle->seek(3);
        EXPECT_EQ(handle->open(c.mode), RwOk);
        EXPECT_EQ(handle->tell(), c.position);
        EXPECT_EQ(handle->size(), c.size);
    }
    Put(handle, "abc");
    EXPECT_EQ(handle->close(), RwOk);
    EXPECT_EQ(handle->tell(), 0) << "close only rewinds";
    EXPECT_EQ(handle->openRead(), RwOk);
    EXPECT_EQ(Take(handle, 10), "abc");
    EXPECT_EQ(handle->release(), nullptr);
}

TEST_F(MemoryFile, SeeksStayWithinTheData)
{
    ReaderWriter* handle = entry_->open(0);
    Put(handle, "0123456789");
    struct Case {
        bool relative;
        std::int32_t offset;
        ErrorValue result;
        std::int32_t position;
    };
    const Case cases[] = {
        {false, 10, RwOk, 10},         {false, 11, RwOutOfRange, 10}, {false, -1, RwOutOfRange, 10},
        {false, 0, RwOk, 0},           {true, -1, RwOutOfRange, 0},   {true, 10, RwOk, 10},
        {true, 1, RwOutOfRange, 10},   {true, -4, RwOk, 6},           {true, kMax, RwOutOfRange, 6},
        {true, kMin, RwOutOfRange, 6}, // extreme offsets must not wrap to a valid position
    };
    for (const Case& c : cases) {
        SCOPED_TRACE((c.relative ? "seekBy " : "seek ") + std::to_string(c.offset));
        EXPECT_EQ(c.relative ? handle->seekBy(c.offset) : handle->seek(c.offset), c.result);
        EXPECT_EQ(handle->tell(), c.position);
    }
    EXPECT_EQ(handle->read(nullptr, 4), 0);
    char buffer[8];
    EXPECT_EQ(handle->read(buffer, 8), 4);
    EXPECT_EQ(handle->read(buffer, 8), 0) << "past the end";
    handle->release();
}

TEST_F(MemoryFile, SetSizeRefusesNegativeAndShorteningKeepsPositionAndHiddenBytes)
{
    ReaderWriter* handle = entry_->open(0);
    Put(handle, "abcdef");
    EXPECT_EQ(handle->setSize(-1), RwOutOfRange);
    EXPECT_EQ(stored(handle), "abcdef");
    EXPECT_EQ(handle->setSize(2), RwOk);
    EXPECT_EQ(handle->tell(), 6);
    EXPECT_EQ(Take(handle, 4), "");
    // Stepping back from past a shortened end is allowed; forward is not.
    EXPECT_EQ(handle->seekBy(1), RwOutOfRange);
    EXPECT_EQ(handle->seekBy(-1), RwOk);
    EXPECT_EQ(handle->tell(), 5);
    // Writing on from there brings the hidden bytes back, as the buffer kept them.
    EXPECT_EQ(Put(handle, "X"), 1);
    EXPECT_EQ(stored(handle), "abcdeX");
    handle->release();
}

TEST_F(MemoryFile, CountsOfZeroOrLessTransferNothingOnEitherKind)
{
    for (DirEnt* entry : {static_cast<DirEnt*>(entry_), static_cast<DirEnt*>(text_)}) {
        ReaderWriter* handle = entry->open(0);
        Put(handle, "a\nb");
        handle->rewind();
        const std::string before = stored(handle);
        char buffer[2] = {'k', 'k'};
        for (std::int32_t count : {0, -1, kMin}) {
            SCOPED_TRACE(count);
            EXPECT_EQ(handle->read(buffer, count), 0);
            EXPECT_EQ(handle->write("\n\n", count), 0);
        }
        EXPECT_EQ(handle->write(nullptr, 4), 0);
        EXPECT_EQ(buffer[0], 'k');
        EXPECT_EQ(handle->tell(), 0);
        EXPECT_EQ(stored(handle), before);
        handle->release();
    }
}

TEST_F(MemoryFile, HandlesAndClonesShareTheBytesWithOwnPositions)
{
    ReaderWriter* first = entry_->open(1);
    ReaderWriter* second = entry_->open(2);
    Put(first, "shared");
    EXPECT_EQ(Take(second, 3), "sha");
    EXPECT_EQ(first->tell(), 6);

    DirEnt* clone = entry_->clone();
    ASSERT_NE(clone, nullptr);
    EXPECT_EQ(clone->refCount(), 0);
    clone->addRef();
    ReaderWriter* third = clone->open(3);
    EXPECT_EQ(dynamic_cast<TextMemoryReaderWriter*>(third), nullptr) << "binary stays binary";
    EXPECT_EQ(Take(third, 10), "shared");
    Put(third, "!");
    EXPECT_EQ(stored(first), "shared!");
    EXPECT_EQ(clone->release(), clone) << "the open handle keeps the clone";
    EXPECT_EQ(third->release(), nullptr);
    first->release();
    second->release();
    ReaderWriter* later = entry_->open(0);
    EXPECT_EQ(Take(later, 10), "shared!") << "the bytes outlive the clone they were written by";
    later->release();

    DirEnt* textClone = text_->clone()->addRef();
    ASSERT_NE(dynamic_cast<TextMemoryEntry*>(textClone), nullptr);
    ReaderWriter* writer = text_->open(0);
    ReaderWriter* reader = textClone->open(0);
    Put(writer, "x\ny");
    EXPECT_EQ(Take(reader, 10), "x\ny");
    reader->release();
    writer->release();
    EXPECT_EQ(textClone->release(), nullptr);
}

// ---- text ----

// Only LF gains a CR; a lone CR stays, also at the very end; only a CR right before LF pairs.
TEST_F(MemoryFile, TextStoresLfAsCrLfAndReadingStopsAtCtrlZ)
{
    const std::string written = "a\nx\ry\r\r\nb\x1A"
                                "c\r";
    const std::string expected = "a\r\nx\ry\r\r\r\nb\x1A"
                                 "c\r";
    ReaderWriter* handle = text_->open(0);
    ReaderWriter* binary = entry_->open(0);
    EXPECT_EQ(Put(handle, written), static_cast<std::int32_t>(written.size()));
    EXPECT_EQ(stored(handle), expected);
    EXPECT_EQ(handle->tell(), static_cast<std::int32_t>(expected.size()));
    Put(binary, written);
    EXPECT_EQ(stored(binary), written) << "binary files keep every byte";
    binary->release();
    handle->rewind();
    EXPECT_EQ(Take(handle, 40), "a\nx\ry\r\r\nb");
    // The position stays on the Ctrl-Z until the caller moves past it.
    EXPECT_EQ(handle->tell(), 11);
    EXPECT_EQ(Take(handle, 10), "");
    EXPECT_EQ(handle->seekBy(1), RwOk);
    EXPECT_EQ(Take(handle, 10), "c\r");
    handle->release();
}

// The text handle works on the block directly; a plain model of the rules, taken one byte at a
// time, must agree with it on any mix of bytes, counts and positions.
struct TextModel {
    std::string stored;
    std::int32_t position = 0;

    void putByte(char c)
    {
        if (position >= static_cast<std::int32_t>(stored.size())) {
            stored.resize(static_cast<std::size_t>(position) + 1, '\0');
        }
        stored[static_cast<std::size_t>(position++)] = c;
    }
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
    std::string read(std::int32_t count)
    {
        std::string out;
        const auto length = static_cast<std::int32_t>(stored.size());
        while (static_cast<std::int32_t>(out.size()) < count && position < length) {
            const char c = stored[static_cast<std::size_t>(position++)];
            if (c == '\x1A') {
                --position;
                break;
            }
            if (c == '\r' && position < length &&
                stored[static_cast<std::size_t>(position)] == '\n') {
                ++position;
                out += '\n';
            } else {
                out += c;
            }
        }
        return out;
    }
};

TEST_F(MemoryFile, TextAgreesWithTheByteWiseRulesOnRandomText)
{
    std::mt19937 random(20261206);
    const char alphabet[] = {'a', 'b', '\n', '\r', '\x1A', '\0'};
    ReaderWriter* handle = text_->open(0);
    TextModel model;
    for (int round = 0; round < 3000; ++round) {
        SCOPED_TRACE(round);
        const int action = static_cast<int>(random() % 4);
        if (action == 0) {
            std::string source(random() % 40, 'a');
            for (char& c : source) {
                c = alphabet[random() % sizeof alphabet];
            }
            ASSERT_EQ(Put(handle, source), model.write(source));
        } else if (action == 1) {
            const auto count = static_cast<std::int32_t>(random() % 40);
            ASSERT_EQ(Take(handle, count), model.read(count));
        } else {
            const auto target = static_cast<std::int32_t>(random() % (model.stored.size() + 1));
            ASSERT_EQ(handle->seek(target), RwOk);
            model.position = target;
        }
        ASSERT_EQ(handle->tell(), model.position);
        ASSERT_EQ(stored(handle), model.stored);
    }
    handle->release();
}

TEST_F(MemoryFile, LargeTextWriteGrowsToTheSameCapacityAsByteWiseGrowth)
{
    ReaderWriter* handle = text_->open(0);
    std::string source;
    for (int i = 0; i < 1000; ++i) {
        source += "0123456789abcdef0123456789abcdef\n"; // 33 given, 34 stored
    }
    ASSERT_EQ(Put(handle, source), 33000);
    EXPECT_EQ(handle->size(), 34000);
    EXPECT_EQ(static_cast<MemoryReaderWriter*>(handle)->block()->capacity(), 34816);
    handle->rewind();
    EXPECT_EQ(Take(handle, 40000), source);
    handle->release();
}

} // namespace
