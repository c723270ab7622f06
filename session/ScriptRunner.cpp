// The script runner: every script reaches the brick library through these operations,
// which write it into the workspace, have it translated and run, and hand files back.
#include <cstring>
#include <new>

#include "errors/ErrorSink.h"
#include "session/BrickSession.h"
#include "session/WorkspaceLinks.h"
#include "tessel/DirEnt.h"
#include "tessel/ReaderWriter.h"
#include "workspace/DiskFile.h"

using tessel::Long;
using tessel::Short;

namespace {

constexpr const char* kSourcePath = "/Script/Temp/source.txt";
constexpr const char* kFirmwareImagePath = "/Script/Firmware/Onyx2firm.kvo";
constexpr Short kImmediateBrickType = tessel::BrickOnyx2;

Long Code(std::uint32_t packed)
{
    return static_cast<Long>(packed);
}

// ReaderWriter::write takes a 32-bit count; longer texts go in pieces.
void WriteAll(ReaderWriter* handle, const char* text)
{
    std::size_t remaining = std::strlen(text);
    constexpr std::size_t kPiece = std::size_t{1} << 30;
    while (remaining > 0) {
        const std::size_t piece = remaining < kPiece ? remaining : kPiece;
        const std::int32_t written = handle->write(text, static_cast<std::int32_t>(piece));
        if (written <= 0) {
            return;
        }
        text += written;
        remaining -= static_cast<std::size_t>(written);
    }
}

} // namespace

void BrickSession::relinkSourceEntry()
{
    if (root_ == nullptr || sourceEntry_ == nullptr || root_->find(kSourcePath) == sourceEntry_) {
        return;
    }
    root_->remove(kSourcePath);
    // The session's own reference keeps the entry alive whether or not this succeeds.
    root_->insert(kSourcePath, sourceEntry_);
}

DirEnt* BrickSession::replaceWithDiskFile(const char* path, const char* hostPath)
{
    root_->remove(path);
    auto* entry = new (std::nothrow) DiskEntry(hostPath != nullptr ? hostPath : "");
    if (entry == nullptr) {
        return nullptr;
    }
    return session::InsertNew(root_, path, entry);
}

Long BrickSession::translateInto(Short brickType, ReaderWriter* source, std::int32_t objectType,
                                 DirEnt* object, ReaderWriter** code, IError* sink,
                                 ReaderWriter* extra1, ReaderWriter* extra2)
{
    ReaderWriter* target = object->open(objectType);
    if (target == nullptr) {
        ReleaseReaderWriter(&source);
        return Code(kCreateFailed);
    }
    const Long result = Translate(brickType, source, target, sink, extra1, extra2);
    ReleaseReaderWriter(&source);
    if (result < 0) {
        ReleaseReaderWriter(&target);
    }
    if (code != nullptr) {
        *code = target;
    } else {
        ReleaseReaderWriter(&target);
    }
    return result;
}

Long BrickSession::translateSource(Short brickType, std::int32_t type, std::int32_t objectType,
                                   const char* text, ReaderWriter** code, IError* sink,
                                   ReaderWriter* extra1, ReaderWriter* extra2)
{
    if (code != nullptr) {
        *code = nullptr;
    }
    if (sourceEntry_ == nullptr) {
        return Code(kNullSourcePath);
    }
    if (type != tessel::FileCode && objectEntry_ == nullptr) {
        return Code(kNullTempPath);
    }
    // CompileFile may have linked a host file in its place.
    relinkSourceEntry();

    ReaderWriter* source = sourceEntry_->open(type);
    if (source == nullptr) {
        return Code(kCreateFailed);
    }
    // A source that cannot be written is not reported: translation then sees the file's
    // earlier content.
    if (source->openWrite() == RwOk) {
        WriteAll(source, text != nullptr ? text : "");
        source->close();
    }

    if (type == tessel::FileCode) {
        // The text is the code. A caller that keeps nothing gets nothing to leak.
        if (code != nullptr) {
            *code = source;
        } else {
            ReleaseReaderWriter(&source);
        }
        return 0;
    }
    return translateInto(brickType, source, objectType, objectEntry_, code, sink, extra1, extra2);
}

Long BrickSession::TranslateText(Short brickType, std::int32_t type, const char* text,
                                 ReaderWriter** code, IError* sink, ReaderWriter* extra1,
                                 ReaderWriter* extra2)
{
    return translateSource(brickType, type, tessel::FileCode, text, code, sink, extra1, extra2);
}

Long BrickSession::TranslateToCsv(Short brickType, const char* text, ReaderWriter** listing,
                                  IError* sink)
{
    return translateSource(brickType, tessel::FileScript, tessel::FileCsvListing, text, listing,
                           sink, nullptr, nullptr);
}

Long BrickSession::CompileFile(Short brickType, std::int32_t type, const char* hostPath,
                               ReaderWriter** code, IError* sink, ReaderWriter* extra1,
                               ReaderWriter* extra2)
{
    if (code != nullptr) {
        *code = nullptr;
    }
    if (root_ == nullptr) {
        return Code(kNullRoot);
    }
    if (type != tessel::FileCode && objectEntry_ == nullptr) {
        return Code(kNullTempPath);
    }
    // The session's own source working file is unlinked here, not freed: it holds a
    // reference of its own, and TranslateText links it back.
    DirEnt* entry = replaceWithDiskFile(kSourcePath, hostPath);
    if (entry == nullptr) {
        return Code(kInsertFailed);
    }
    ReaderWriter* source = entry->open(type);
    if (source == nullptr) {
        return Code(kCreateFailed);
    }
    if (type == tessel::FileCode) {
        if (code != nullptr) {
            *code = source;
        } else {
            ReleaseReaderWriter(&source);
        }
        return 0;
    }
    return translateInto(brickType, source, tessel::FileCode, objectEntry_, code, sink, extra1,
                         extra2);
}

Long BrickSession::CompileFirmware(const char* hostPath, ReaderWriter** code)
{
    if (code != nullptr) {
        *code = nullptr;
    }
    if (firmwareEntry_ == nullptr) {
        return Code(kNullFirmwarePath);
    }
    if (root_ == nullptr) {
        return Code(kNullRoot);
    }
    DirEnt* entry = replaceWithDiskFile(kFirmwareImagePath, hostPath);
    if (entry == nullptr) {
        return Code(kInsertFailed);
    }
    ReaderWriter* image = entry->open(tessel::FileFirmware);
    if (image == nullptr) {
        return Code(kCreateFailed);
    }
    // The library may report into a sink; nobody reads this one.
    ErrorSink sink;
    return translateInto(kImmediateBrickType, image, tessel::FileCode, firmwareEntry_, code, &sink,
                         nullptr, nullptr);
}

Long BrickSession::ExecCode(Long hBrick, ReaderWriter* code, Long* result,
                            ReaderWriter** resultFile, tessel::Callback callback, void* context)
{
    if (resultFile != nullptr) {
        *resultFile = nullptr;
    }
    if (resultEntry_ == nullptr) {
        return Code(kNullResultPath);
    }
    ReaderWriter* resultHandle = nullptr;
    if (resultFile != nullptr) {
        resultHandle = resultEntry_->open(tessel::FileResult);
        if (resultHandle == nullptr) {
            return Code(kCreateFailed);
        }
        // The library appends to what it finds, so it must start from an empty file.
        resultHandle->openWrite();
        resultHandle->setSize(0);
        resultHandle->close();
    }
    const Long status = Exec(hBrick, code, result, resultHandle, callback, context);
    if (resultFile != nullptr) {
        *resultFile = resultHandle;
    }
    return status;
}

Long BrickSession::RunImmediate(Long hBrick, const char* text, Long* result)
{
    ReaderWriter* code = nullptr;
    const Long translated = TranslateText(kImmediateBrickType, tessel::FileScript, text, &code,
                                          nullptr, nullptr, nullptr);
    if (translated < 0) {
        return translated;
    }
    const Long status = ExecCode(hBrick, code, result, nullptr, nullptr, nullptr);
    ReleaseReaderWriter(&code);
    return status;
}

void BrickSession::ReleaseReaderWriter(ReaderWriter** handle)
{
    if (handle != nullptr && *handle != nullptr) {
        *handle = (*handle)->release();
    }
}

std::int32_t BrickSession::ContentSize(ReaderWriter* handle)
{
    if (handle == nullptr || !(handle->openRead() == RwOk)) {
        return 0;
    }
    const std::int32_t size = handle->size();
    handle->close();
    return size > 0 ? size : 0;
}

std::int32_t BrickSession::CountCommands(ReaderWriter* code)
{
    if (code == nullptr || !(code->openRead() == RwOk)) {
        return 0;
    }
    const std::int32_t size = code->size();
    if (size <= 0) {
        code->close();
        return 0;
    }
    char* text = new (std::nothrow) char[static_cast<std::size_t>(size) + 1];
    if (text == nullptr) {
        code->close();
        return 0;
    }
    // A short read leaves the rest out of the count rather than counting stale bytes.
    std::int32_t length = 0;
    while (length < size) {
        const std::int32_t got = code->read(text + length, size - length);
        if (got <= 0) {
            break;
        }
        length += got;
    }
    code->close();
    text[length] = '\0';

    std::int32_t count = 0;
    for (const char* at = std::strstr(text, "cmd"); at != nullptr;
         at = std::strstr(at + 3, "cmd")) {
        ++count;
    }
    delete[] text;
    return count;
}
