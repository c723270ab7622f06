// An open handle on a workspace file, through which bytes are read and written.
//
// Part of the library boundary. The brick library calls these operations through the
// virtual table, so their order below is an ABI shared with every library build:
// never reorder, insert or remove a virtual operation. Data members keep their order too.
//
// A handle starts with count 1, the reference of whoever opened it, and holds one
// reference of its entry for its whole life. addRef() and release() are not in the table;
// they are plain inline operations, so a library module can use them too.
#pragma once

#include <cstdint>

#include "ErrorValue.h"

class DirEnt;

class ReaderWriter {
public:
    ReaderWriter(const ReaderWriter&) = delete;
    ReaderWriter& operator=(const ReaderWriter&) = delete;

    ReaderWriter* addRef()
    {
        ++refCount_;
        return this;
    }

    // Destroys the handle when the count reaches 0 and then returns null.
    ReaderWriter* release()
    {
        if (--refCount_ == 0) {
            delete this;
            return nullptr;
        }
        return this;
    }

    std::int32_t refCount() const { return refCount_; }

    /* 0 */ virtual ~ReaderWriter();
    /* 1 */ virtual DirEnt* dirEnt();
    /* 2 */ virtual const char* name();
    // A new buffer from std::malloc; the caller frees it with std::free.
    /* 3 */ virtual char* path();
    /* 4 */ virtual const char* fileName();
    /* 5 */ virtual std::int32_t type();
    /* 6 */ virtual std::int32_t setType(std::int32_t type);
    // Mode string in the style of fopen: "r", "w", "a", with "b", "t", "+" ignored by
    // memory files.
    /* 7 */ virtual ErrorValue open(const char* mode) = 0;
    /* 8 */ virtual ErrorValue openRead();
    /* 9 */ virtual ErrorValue openWrite();
    /* 10 */ virtual ErrorValue close() = 0;
    // Bytes placed in buffer / taken from buffer; 0 for a count below 1.
    /* 11 */ virtual std::int32_t read(void* buffer, std::int32_t count) = 0;
    /* 12 */ virtual std::int32_t write(const void* buffer, std::int32_t count) = 0;
    /* 13 */ virtual ErrorValue seekBy(std::int32_t delta) = 0;
    /* 14 */ virtual ErrorValue rewind() = 0;
    /* 15 */ virtual std::int32_t tell() = 0;
    /* 16 */ virtual ErrorValue seek(std::int32_t position) = 0;
    /* 17 */ virtual std::int32_t size() = 0;
    /* 18 */ virtual ErrorValue setSize(std::int32_t length) = 0;

protected:
    // Takes one reference of the entry; the destructor gives it back.
    ReaderWriter(DirEnt* entry, std::int32_t type);

    std::int32_t refCount_ = 1;
    DirEnt* dirEnt_ = nullptr;
    std::int32_t type_ = 0;
};
