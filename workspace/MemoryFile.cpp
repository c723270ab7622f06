#include "workspace/MemoryFile.h"

#include <algorithm>
#include <cstring>
#include <limits>
#include <new>

#include "workspace/MemoryBlock.h"

namespace {

constexpr unsigned char kCr = 13;
constexpr unsigned char kLf = 10;
constexpr unsigned char kCtrlZ = 26;

} // namespace

// ---- entries ----

MemoryEntry::MemoryEntry(MemoryBlock* block) : block_(block)
{
    if (block_ != nullptr) {
        block_->addRef();
    }
}

MemoryEntry::~MemoryEntry()
{
    if (block_ != nullptr) {
        block_->release();
    }
}

DirEnt* MemoryEntry::clone()
{
    return new (std::nothrow) MemoryEntry(block_);
}

ReaderWriter* MemoryEntry::open(std::int32_t type)
{
    if (block_ == nullptr) {
        return nullptr;
    }
    return new (std::nothrow) MemoryReaderWriter(this, block_, type);
}

TextMemoryEntry::TextMemoryEntry(MemoryBlock* block) : MemoryEntry(block) {}

DirEnt* TextMemoryEntry::clone()
{
    return new (std::nothrow) TextMemoryEntry(block_);
}

ReaderWriter* TextMemoryEntry::open(std::int32_t type)
{
    if (block_ == nullptr) {
        return nullptr;
    }
    return new (std::nothrow) TextMemoryReaderWriter(this, block_, type);
}

// ---- binary handle ----

MemoryReaderWriter::MemoryReaderWriter(DirEnt* entry, MemoryBlock* block, std::int32_t type)
    : ReaderWriter(entry, type), block_(block)
{
    if (block_ != nullptr) {
        block_->addRef();
    }
}

MemoryReaderWriter::~MemoryReaderWriter()
{
    // The block goes before the entry (which the base releases), the reverse of taking them.
    if (block_ != nullptr) {
        block_->release();
    }
}

ErrorValue MemoryReaderWriter::open(const char* mode)
{
    bool write = false;
    bool append = false;
    for (const char* letter = mode != nullptr ? mode : ""; *letter != '\0'; ++letter) {
        if (*letter == 'w') {
            write = true;
        } else if (*letter == 'a') {
            append = true;
        }
    }
    if (write && !append) {
        block_->setSize(0);
    }
    position_ = append ? block_->size() : 0;
    return RwOk;
}

ErrorValue MemoryReaderWriter::close()
{
    rewind();
    return RwOk;
}

std::int32_t MemoryReaderWriter::read(void* buffer, std::int32_t count)
{
    return block_->read(position_, buffer, count);
}

std::int32_t MemoryReaderWriter::write(const void* buffer, std::int32_t count)
{
    return block_->write(position_, buffer, count);
}

ErrorValue MemoryReaderWriter::seekBy(std::int32_t delta)
{
    const std::int64_t target = static_cast<std::int64_t>(position_) + delta;
    if (target < 0) {
        return RwOutOfRange;
    }
    // Backwards (or not at all) is always allowed from a position past a shortened end; only
    // a step forward must stay within the data.
    if (delta > 0 && target > size()) {
        return RwOutOfRange;
    }
    position_ = static_cast<std::int32_t>(target);
    return RwOk;
}

ErrorValue MemoryReaderWriter::rewind()
{
    position_ = 0;
    return RwOk;
}

std::int32_t MemoryReaderWriter::tell()
{
    return position_;
}

ErrorValue MemoryReaderWriter::seek(std::int32_t position)
{
    if (position < 0 || position > size()) {
        return RwOutOfRange;
    }
    position_ = position;
    return RwOk;
}

std::int32_t MemoryReaderWriter::size()
{
    return block_->size();
}

ErrorValue MemoryReaderWriter::setSize(std::int32_t length)
{
    if (length < 0) {
        return RwOutOfRange;
    }
    return block_->setSize(length) ? RwOk : RwNoMemory;
}

// ---- text handle ----

TextMemoryReaderWriter::TextMemoryReaderWriter(DirEnt* entry, MemoryBlock* block, std::int32_t type)
    : MemoryReaderWriter(entry, block, type)
{
}

std::int32_t TextMemoryReaderWriter::read(void* buffer, std::int32_t count)
{
    if (count < 1 || buffer == nullptr) {
        return 0;
    }
    // Works on the block's bytes directly, with the same result as taking them one by one
    // with getByte(): runs between CRs are copied whole.
    auto* out = static_cast<unsigned char*>(buffer);
    const unsigned char* data = block_->bytes();
    const std::int32_t length = block_->size();
    std::int32_t position = position_;
    if (position < 0 || position >= length) {
        return 0;
    }
    // The text ends at a Ctrl-Z, and the position stays on it, so later reads give 0 until
    // the caller moves past it. A byte handed out takes at most two stored bytes, so the
    // Ctrl-Z is looked for no further than that.
    const std::int64_t window = std::min<std::int64_t>(length - position, 2 * std::int64_t{count});
    const void* ctrlZ = std::memchr(data + position, kCtrlZ, static_cast<std::size_t>(window));
    const std::int32_t end =
        ctrlZ != nullptr
            ? static_cast<std::int32_t>(static_cast<const unsigned char*>(ctrlZ) - data)
            : position + static_cast<std::int32_t>(window);
    std::int32_t stored = 0;
    while (stored < count && position < end) {
        const auto available = static_cast<std::size_t>(std::min(end - position, count - stored));
        const void* cr = std::memchr(data + position, kCr, available);
        const std::size_t run = cr != nullptr
                                    ? static_cast<std::size_t>(
                                          static_cast<const unsigned char*>(cr) - (data + position))
                                    : available;
        std::memcpy(out + stored, data + position, run);
        stored += static_cast<std::int32_t>(run);
        position += static_cast<std::int32_t>(run);
        if (cr == nullptr) {
            break;
        }
        // CR LF becomes LF; a CR before anything else, or at the very end, stays a CR and
        // the byte after it is taken on its own.
        ++position;
        if (position < length && data[position] == kLf) {
            ++position;
            out[stored++] = kLf;
        } else {
            out[stored++] = kCr;
        }
    }
    position_ = position;
    return stored;
}

std::int32_t TextMemoryReaderWriter::write(const void* buffer, std::int32_t count)
{
    if (count < 1 || buffer == nullptr || position_ < 0) {
        return 0;
    }
    const auto* source = static_cast<const unsigned char*>(buffer);
    const std::int64_t lineEnds = std::count(source, source + count, kLf);
    const std::int64_t end = static_cast<std::int64_t>(position_) + count + lineEnds;
    // Growing once to the final length gives the same length, capacity and bytes as growing
    // at every byte; only when that fails does the byte-wise path find how much still fits.
    if (end > std::numeric_limits<std::int32_t>::max() ||
        (end > block_->size() && !block_->setSize(static_cast<std::int32_t>(end)))) {
        return writeByteByByte(source, count);
    }
    unsigned char* out = block_->bytes() + position_;
    const unsigned char* rest = source;
    const unsigned char* const sourceEnd = source + count;
    while (rest < sourceEnd) {
        const auto* lineEnd = static_cast<const unsigned char*>(
            std::memchr(rest, kLf, static_cast<std::size_t>(sourceEnd - rest)));
        const unsigned char* runEnd = lineEnd != nullptr ? lineEnd : sourceEnd;
        const auto run = static_cast<std::size_t>(runEnd - rest);
        std::memcpy(out, rest, run);
        out += run;
        rest = runEnd;
        if (lineEnd != nullptr) {
            *out++ = kCr;
            *out++ = kLf;
            ++rest;
        }
    }
    position_ = static_cast<std::int32_t>(end);
    return count;
}

std::int32_t TextMemoryReaderWriter::writeByteByByte(const unsigned char* source,
                                                     std::int32_t count)
{
    std::int32_t written = 0;
    for (; written < count; ++written) {
        const unsigned char c = source[written];
        // A CR already stored for an LF stays when the LF itself no longer fits.
        if (c == kLf && !block_->putByte(position_, kCr)) {
            break;
        }
        if (!block_->putByte(position_, c)) {
            break;
        }
    }
    return written;
}
