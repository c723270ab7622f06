#include "Files.h"

#include "tessel/DirEnt.h"
#include "tessel/ReaderWriter.h"

namespace sim {

ReadResult Read(ReaderWriter* file, std::string& text)
{
    text.clear();
    if (file == nullptr || !(file->openRead() == RwOk)) {
        return ReadResult::NotReadable;
    }
    const std::int32_t size = file->size();
    if (size < 0) {
        file->close();
        return ReadResult::NotReadable;
    }
    if (static_cast<std::size_t>(size) > kMaxFileBytes) {
        file->close();
        return ReadResult::TooLarge;
    }
    // A text file may read back shorter than its stored size (line ends are folded), so read
    // until the handle gives no more, bounded by the size it reported.
    text.resize(static_cast<std::size_t>(size));
    std::size_t filled = 0;
    while (filled < text.size()) {
        const std::int32_t got =
            file->read(text.data() + filled, static_cast<std::int32_t>(text.size() - filled));
        if (got <= 0) {
            break;
        }
        filled += static_cast<std::size_t>(got);
    }
    text.resize(filled);
    file->close();
    return ReadResult::Ok;
}

bool WriteAll(ReaderWriter* file, const std::string& text)
{
    if (file == nullptr || !(file->openWrite() == RwOk)) {
        return false;
    }
    const std::int32_t length = static_cast<std::int32_t>(text.size());
    const std::int32_t written = length > 0 ? file->write(text.data(), length) : 0;
    file->close();
    return written == length;
}

DirEnt* FindFrom(ReaderWriter* file, const char* path)
{
    if (file == nullptr) {
        return nullptr;
    }
    DirEnt* entry = file->dirEnt();
    return entry == nullptr ? nullptr : entry->find(path);
}

bool WriteBeside(ReaderWriter* file, const char* name, const std::string& text)
{
    DirEnt* entry = FindFrom(file, name);
    if (entry == nullptr || entry->isDirectory()) {
        return false;
    }
    ReaderWriter* handle = entry->open(0);
    if (handle == nullptr) {
        return false;
    }
    const bool ok = WriteAll(handle, text);
    handle->release();
    return ok;
}

} // namespace sim
