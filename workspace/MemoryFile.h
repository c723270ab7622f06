// Memory files of the script workspace: entries that hold a MemoryBlock and the handles that
// read and write it.
//
// Every entry cloned from one memory entry, and every handle opened on any of them, shares one
// block: they see the same bytes, while each handle keeps its own position. Memory handles have
// no open or closed state: open() only positions (and for writing truncates), close() only
// rewinds.
//
// The text kind stores a line end as CR LF and reads CR LF back as LF; a stored Ctrl-Z ends the
// text for reading. Its positions and sizes count stored bytes.
#pragma once

#include <cstdint>

#include "tessel/DirEnt.h"
#include "tessel/ReaderWriter.h"

class MemoryBlock;

class MemoryEntry : public DirEnt {
public:
    // Count 0, no parent; takes one reference of the block (a null block gives an entry that
    // cannot be opened).
    explicit MemoryEntry(MemoryBlock* block);
    ~MemoryEntry() override;

    // A new MemoryEntry over the same block; null when memory is exhausted.
    DirEnt* clone() override;
    // A new MemoryReaderWriter (count 1) on this entry; null when memory is exhausted.
    ReaderWriter* open(std::int32_t type) override;

    MemoryBlock* block() const { return block_; }

protected:
    MemoryBlock* block_ = nullptr;
};

class TextMemoryEntry : public MemoryEntry {
public:
    explicit TextMemoryEntry(MemoryBlock* block);

    // A new TextMemoryEntry over the same block; null when memory is exhausted.
    DirEnt* clone() override;
    // A new TextMemoryReaderWriter (count 1) on this entry; null when memory is exhausted.
    ReaderWriter* open(std::int32_t type) override;
};

class MemoryReaderWriter : public ReaderWriter {
public:
    // Count 1, position 0; takes one reference of the entry and one of the block, which must
    // not be null (the entries open no handle without one).
    MemoryReaderWriter(DirEnt* entry, MemoryBlock* block, std::int32_t type);
    // Releases the block, then (in the base) the entry.
    ~MemoryReaderWriter() override;

    // "r" rewinds, "w" truncates and rewinds, "a" (also "wa") keeps the bytes and moves to the
    // end; other letters are ignored. Always RwOk.
    ErrorValue open(const char* mode) override;
    // Rewinds; the bytes stay.
    ErrorValue close() override;
    std::int32_t read(void* buffer, std::int32_t count) override;
    std::int32_t write(const void* buffer, std::int32_t count) override;
    // RwOutOfRange, position unchanged, when the target lies outside 0..size().
    ErrorValue seekBy(std::int32_t delta) override;
    ErrorValue rewind() override;
    std::int32_t tell() override;
    ErrorValue seek(std::int32_t position) override;
    std::int32_t size() override;
    // RwOutOfRange for a negative length, RwNoMemory when growing fails; the position stays.
    ErrorValue setSize(std::int32_t length) override;

    MemoryBlock* block() const { return block_; }

protected:
    MemoryBlock* block_ = nullptr;
    std::int32_t position_ = 0;
};

class TextMemoryReaderWriter : public MemoryReaderWriter {
public:
    TextMemoryReaderWriter(DirEnt* entry, MemoryBlock* block, std::int32_t type);

    // Stored CR LF comes out as LF; a lone CR stays; a Ctrl-Z ends the text and the position
    // stays on it. Returns the bytes placed in buffer.
    std::int32_t read(void* buffer, std::int32_t count) override;
    // LF is stored as CR LF. Returns the source bytes fully stored (an LF counts once); stops
    // at the first byte that cannot be stored.
    std::int32_t write(const void* buffer, std::int32_t count) override;

private:
    std::int32_t writeByteByByte(const unsigned char* source, std::int32_t count);
};
