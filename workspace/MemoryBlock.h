// A reference-counted, growable byte buffer: the content of a memory file.
//
// Shared by every entry cloned from one memory entry and by every handle opened on them.
// The capacity grows in steps of 1024 bytes and never shrinks. Bytes in the buffer beyond the
// length keep what they held; freshly allocated capacity is zeroed, so they are never
// indeterminate.
//
// Every `position` argument is the caller's own position variable, read and advanced in place.
#pragma once

#include <cstdint>

class MemoryBlock final {
public:
    static constexpr std::int32_t kGrowthStep = 1024;

    // Count 0: each entry and handle that uses the block takes one reference.
    MemoryBlock();
    MemoryBlock(const MemoryBlock&) = delete;
    MemoryBlock& operator=(const MemoryBlock&) = delete;

    /* 0 */ virtual ~MemoryBlock();
    /* 1 */ virtual MemoryBlock* addRef();
    // Destroys the block when the count reaches 0 and then returns null.
    /* 2 */ virtual MemoryBlock* release();
    // Zeroes the bytes in use; the length stays.
    /* 3 */ virtual void clear();
    // False at or beyond the end (and for a negative position).
    /* 4 */ virtual bool getByte(std::int32_t& position, unsigned char& byte);
    // Grows the block to position + 1 first when needed; false when that fails.
    /* 5 */ virtual bool putByte(std::int32_t& position, unsigned char byte);
    // Bytes copied; 0 for a count below 1 or a position at or beyond the end.
    /* 6 */ virtual std::int32_t read(std::int32_t& position, void* buffer, std::int32_t count);
    // Bytes copied; when growing fails only the part up to the old length is written.
    /* 7 */ virtual std::int32_t write(std::int32_t& position, const void* buffer,
                                       std::int32_t count);
    // False, with nothing changed, for a negative length or when memory is exhausted.
    /* 8 */ virtual bool setSize(std::int32_t length);
    /* 9 */ virtual std::int32_t size();

    std::int32_t refCount() const { return refCount_; }
    std::int32_t capacity() const { return capacity_; }
    // The buffer itself, for the handles' byte loops; null while nothing is allocated.
    unsigned char* bytes() { return data_; }

private:
    std::int32_t refCount_ = 0;
    std::int32_t length_ = 0;
    unsigned char* data_ = nullptr;
    std::int32_t capacity_ = 0;
};
