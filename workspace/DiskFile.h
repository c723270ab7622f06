// Disk files of the script workspace: an entry naming a host file and a handle holding an open
// standard-library stream on it.
//
// The host file is always opened in binary mode, so bytes pass unchanged both ways. Nothing of
// it is cached: every operation goes to the stream.
#pragma once

#include <cstdint>
#include <cstdio>

#include "tessel/DirEnt.h"
#include "tessel/ReaderWriter.h"

class DiskEntry : public DirEnt {
public:
    // Count 0, no parent; keeps its own copy of the host path (null counts as "").
    explicit DiskEntry(const char* hostPath);
    ~DiskEntry() override;

    // A new DiskEntry naming the same host file; null when memory is exhausted.
    DirEnt* clone() override;
    // A new DiskReaderWriter (count 1, not yet open) on this entry; null when memory is
    // exhausted.
    ReaderWriter* open(std::int32_t type) override;
    // The host path.
    const char* fileName() override;

private:
    char* fileName_ = nullptr;
};

class DiskReaderWriter : public ReaderWriter {
public:
    // Count 1, not open; takes one reference of the entry.
    DiskReaderWriter(DirEnt* entry, std::int32_t type);
    // Closes the stream when it is open, then (in the base) releases the entry.
    ~DiskReaderWriter() override;

    // Each goes through openFile(); a stream that is already open is closed first.
    ErrorValue open(const char* mode) override;
    ErrorValue openRead() override;
    ErrorValue openWrite() override;
    // RwNotOpen when not open.
    ErrorValue close() override;
    // 0 when not open.
    std::int32_t read(void* buffer, std::int32_t count) override;
    // -1 when not open.
    std::int32_t write(const void* buffer, std::int32_t count) override;
    // RwSeekFailed when the runtime refuses, RwNotOpen when not open.
    ErrorValue seekBy(std::int32_t delta) override;
    ErrorValue rewind() override;
    // -1 when not open.
    std::int32_t tell() override;
    ErrorValue seek(std::int32_t position) override;
    // The host file's length, the position kept; -1 when not open.
    std::int32_t size() override;
    // The host file keeps its length: RwOk (RwOutOfRange for a negative length).
    ErrorValue setSize(std::int32_t length) override;

    // Opens the host file with the mode plus "b". RwNotOpen when the file cannot be opened,
    // is a directory, or the mode is missing or longer than 14 characters.
    /* 19 */ virtual ErrorValue openFile(const char* mode);

    bool isOpen() const { return file_ != nullptr; }

private:
    // A stream open for update must be repositioned between a write and a read (and back);
    // the handle does it so that callers can alternate freely.
    enum class LastTransfer : std::uint8_t { None, Read, Write };
    void switchTo(LastTransfer next);
    ErrorValue seekTo(long offset, int origin);

    std::FILE* file_ = nullptr;
    LastTransfer last_ = LastTransfer::None;
};
