#include "tools/MacroToCsv.h"

#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "session/BrickSession.h"
#include "tessel/DirEnt.h"
#include "tessel/ReaderWriter.h"
#include "tools/BrickQueries.h"
#include "tools/MacroListing.h"

namespace tools {

namespace {

// Writes the wrapper program into the source file; an unopenable file keeps what it held,
// as with every translation of the runner.
void WriteProgram(ReaderWriter* source, const char* macroCall, const char* headerName)
{
    std::size_t size = std::strlen(headerName) + std::strlen(macroCall) + 64;
    char* program = static_cast<char*>(std::malloc(size));
    if (program == nullptr) {
        return;
    }
    int length = std::snprintf(program, size, kMacroProgram, headerName, macroCall);
    if (length > 0 && source->openWrite() == RwOk) {
        source->write(program, length);
        source->close();
    }
    std::free(program);
}

// The whole listing as a terminated text, or null when it cannot be read or is empty.
char* ReadListing(ReaderWriter* object)
{
    if (!(object->openRead() == RwOk)) {
        return nullptr;
    }
    std::int32_t size = object->size();
    if (size <= 0) {
        object->close();
        return nullptr;
    }
    char* listing = static_cast<char*>(std::malloc(static_cast<std::size_t>(size) + 1));
    if (listing == nullptr) {
        object->close();
        return nullptr;
    }
    std::int32_t length = object->read(listing, size);
    listing[length > 0 ? length : 0] = 0;
    object->close();
    return listing;
}

} // namespace

std::int32_t MacroToCsv(BrickSession& session, tessel::Short brickType, const char* macroCall,
                        const char* headerName, ReaderWriter** result, IError* sink)
{
    if (session.sourceEntry() == nullptr) {
        return static_cast<std::int32_t>(BrickSession::kNullSourcePath);
    }
    ReaderWriter* source = session.sourceEntry()->open(tessel::FileScript);
    if (source == nullptr) {
        return static_cast<std::int32_t>(BrickSession::kCreateFailed);
    }
    WriteProgram(source, macroCall, headerName);

    DirEnt* objectEntry = session.objectEntry();
    ReaderWriter* object =
        objectEntry != nullptr ? objectEntry->open(tessel::FileCsvListing) : nullptr;
    if (object == nullptr) {
        ReleaseHandle(&source);
        return static_cast<std::int32_t>(BrickSession::kCreateFailed);
    }
    std::int32_t status = session.Translate(brickType, source, object, sink, nullptr, nullptr);
    ReleaseHandle(&source);
    if (status < 0) {
        ReleaseHandle(&object);
        return status;
    }

    // The object handle is given back on every path from here on.
    char* listing = ReadListing(object);
    ReleaseHandle(&object);
    if (listing == nullptr) {
        return kListingUnreadable;
    }
    DirEnt* resultEntry = session.resultEntry();
    ReaderWriter* output =
        resultEntry != nullptr ? resultEntry->open(tessel::FileCsvListing) : nullptr;
    if (result != nullptr) {
        *result = output;
    }
    if (output == nullptr) {
        std::free(listing);
        return static_cast<std::int32_t>(BrickSession::kCreateFailed);
    }
    if (!(output->openWrite() == RwOk)) {
        std::free(listing);
        if (result == nullptr) {
            ReleaseHandle(&output);
        }
        return kListingUnreadable;
    }
    bool filtered = FilterMacroListing(
        listing, std::strlen(macroCall) + 1,
        [output](const char* line, std::int32_t length) { output->write(line, length); });
    output->close();
    std::free(listing);
    if (result == nullptr) {
        ReleaseHandle(&output);
    }
    return filtered ? 0 : kListingUnreadable;
}

} // namespace tools
