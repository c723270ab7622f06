#include "workspace/DiskFile.h"

#include <climits>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <new>
#include <system_error>

namespace {

// The mode buffer holds the caller's letters, the "b" that forces binary mode, and the zero.
constexpr std::size_t kModeBufferSize = 16;

char* CopyText(const char* text)
{
    const std::size_t length = std::strlen(text);
    auto* copy = static_cast<char*>(std::malloc(length + 1));
    if (copy != nullptr) {
        std::memcpy(copy, text, length + 1);
    }
    return copy;
}

} // namespace

// ---- entry ----

DiskEntry::DiskEntry(const char* hostPath)
    : fileName_(CopyText(hostPath != nullptr ? hostPath : ""))
{
}

DiskEntry::~DiskEntry()
{
    std::free(fileName_);
}

DirEnt* DiskEntry::clone()
{
    auto* copy = new (std::nothrow) DiskEntry(fileName_ != nullptr ? fileName_ : "");
    if (copy != nullptr && copy->fileName_ == nullptr) {
        // The path could not be copied: a clone naming no file is worth nothing.
        copy->addRef();
        copy->release();
        return nullptr;
    }
    return copy;
}

ReaderWriter* DiskEntry::open(std::int32_t type)
{
    return new (std::nothrow) DiskReaderWriter(this, type);
}

const char* DiskEntry::fileName()
{
    return fileName_ != nullptr ? fileName_ : "";
}

// ---- handle ----

DiskReaderWriter::DiskReaderWriter(DirEnt* entry, std::int32_t type) : ReaderWriter(entry, type) {}

DiskReaderWriter::~DiskReaderWriter()
{
    if (file_ != nullptr) {
        std::fclose(file_);
    }
}

ErrorValue DiskReaderWriter::open(const char* mode)
{
    return openFile(mode);
}

ErrorValue DiskReaderWriter::openRead()
{
    return openFile("r");
}

ErrorValue DiskReaderWriter::openWrite()
{
    return openFile("w");
}

ErrorValue DiskReaderWriter::openFile(const char* mode)
{
    // A second open would otherwise leave the earlier stream behind, open for good.
    if (file_ != nullptr) {
        std::fclose(file_);
        file_ = nullptr;
    }
    last_ = LastTransfer::None;
    if (mode == nullptr) {
        return RwNotOpen;
    }
    const std::size_t modeLength = std::strlen(mode);
    // The runtime reads text after a "," as a character-set request, which would turn the
    // stream into a wide one: refused, like a mode too long for the buffer.
    if (modeLength > kModeBufferSize - 2 || std::strchr(mode, ',') != nullptr) {
        return RwNotOpen;
    }
    char binaryMode[kModeBufferSize];
    std::snprintf(binaryMode, sizeof binaryMode, "%sb", mode);

    const char* hostPath = fileName();
    if (hostPath == nullptr || *hostPath == '\0') {
        return RwNotOpen;
    }
    // A directory opens for reading on some systems, and every read then fails: refuse it.
    std::error_code error;
    if (std::filesystem::is_directory(hostPath, error)) {
        return RwNotOpen;
    }
    file_ = std::fopen(hostPath, binaryMode);
    return file_ != nullptr ? RwOk : RwNotOpen;
}

ErrorValue DiskReaderWriter::close()
{
    if (file_ == nullptr) {
        return RwNotOpen;
    }
    std::fclose(file_);
    file_ = nullptr;
    last_ = LastTransfer::None;
    return RwOk;
}

void DiskReaderWriter::switchTo(LastTransfer next)
{
    if (last_ != LastTransfer::None && last_ != next) {
        std::fseek(file_, 0, SEEK_CUR);
    }
    last_ = next;
}

std::int32_t DiskReaderWriter::read(void* buffer, std::int32_t count)
{
    if (file_ == nullptr || count < 1 || buffer == nullptr) {
        return 0;
    }
    switchTo(LastTransfer::Read);
    return static_cast<std::int32_t>(std::fread(buffer, 1, static_cast<std::size_t>(count), file_));
}

std::int32_t DiskReaderWriter::write(const void* buffer, std::int32_t count)
{
    if (file_ == nullptr) {
        return -1;
    }
    if (count < 1 || buffer == nullptr) {
        return 0;
    }
    switchTo(LastTransfer::Write);
    return static_cast<std::int32_t>(
        std::fwrite(buffer, 1, static_cast<std::size_t>(count), file_));
}

ErrorValue DiskReaderWriter::seekTo(long offset, int origin)
{
    if (file_ == nullptr) {
        return RwNotOpen;
    }
    // A seek is also the repositioning that a change of direction needs.
    last_ = LastTransfer::None;
    return std::fseek(file_, offset, origin) == 0 ? RwOk : RwSeekFailed;
}

ErrorValue DiskReaderWriter::seekBy(std::int32_t delta)
{
    return seekTo(delta, SEEK_CUR);
}

ErrorValue DiskReaderWriter::rewind()
{
    return seekTo(0, SEEK_SET);
}

std::int32_t DiskReaderWriter::tell()
{
    if (file_ == nullptr) {
        return -1;
    }
    const long position = std::ftell(file_);
    // A position past the 32-bit range cannot be told: reported like a failure.
    return position >= 0 && position <= INT32_MAX ? static_cast<std::int32_t>(position) : -1;
}

ErrorValue DiskReaderWriter::seek(std::int32_t position)
{
    return seekTo(position, SEEK_SET);
}

std::int32_t DiskReaderWriter::size()
{
    if (file_ == nullptr) {
        return -1;
    }
    const std::int32_t position = tell();
    seekTo(0, SEEK_END);
    const std::int32_t length = tell();
    seek(position);
    return length;
}

ErrorValue DiskReaderWriter::setSize(std::int32_t length)
{
    return length < 0 ? RwOutOfRange : RwOk;
}
