// A stand-in brick library for the session's tests: every entry point records its
// arguments and returns what the test asked for. Exported by the decorated names through
// "export_table", so it is found exactly as the real library is.
#include "testlib/RecordingLibrary.h"

#include <cstdio>
#include <cstring>

#include "tessel/IError.h"
#include "tessel/ReaderWriter.h"

using tessel::Long;
using tessel::Short;
using tessel::Size;

namespace {

RecordingState state;

RecordedCall& Record(tessel::Slot slot, std::int64_t n0 = 0, std::int64_t n1 = 0,
                     std::int64_t n2 = 0, std::int64_t n3 = 0)
{
    RecordedCall& call = state.calls[slot];
    ++call.count;
    call.numbers[0] = n0;
    call.numbers[1] = n1;
    call.numbers[2] = n2;
    call.numbers[3] = n3;
    for (const void*& pointer : call.pointers) {
        pointer = nullptr;
    }
    return call;
}

void ReadAll(ReaderWriter* handle, char* buffer, std::size_t size)
{
    buffer[0] = '\0';
    if (handle == nullptr || !(handle->openRead() == RwOk)) {
        return;
    }
    std::size_t length = 0;
    while (length + 1 < size) {
        const std::int32_t got =
            handle->read(buffer + length, static_cast<std::int32_t>(size - 1 - length));
        if (got <= 0) {
            break;
        }
        length += static_cast<std::size_t>(got);
    }
    buffer[length] = '\0';
    handle->close();
}

void WriteText(ReaderWriter* handle, const char* mode, const char* text)
{
    if (handle != nullptr && handle->open(mode) == RwOk) {
        handle->write(text, static_cast<std::int32_t>(std::strlen(text)));
        handle->close();
    }
}

void CopyText(char* target, std::size_t size, const char* text)
{
    std::snprintf(target, size, "%s", text);
}

Long Initialise()
{
    Record(tessel::SlotInitialise);
    return state.results[tessel::SlotInitialise];
}

Long Terminate()
{
    Record(tessel::SlotTerminate);
    return state.results[tessel::SlotTerminate];
}

Long FindPort(char* name, Size size)
{
    Record(tessel::SlotFindPort, size).pointers[0] = name;
    if (name != nullptr && size > 0) {
        CopyText(name, size, state.textOut);
    }
    return state.results[tessel::SlotFindPort];
}

Long Create(const char* port)
{
    Record(tessel::SlotCreate).pointers[0] = port;
    if (port != nullptr) {
        CopyText(state.textOut, sizeof state.textOut, port);
    }
    return state.results[tessel::SlotCreate];
}

int Destroy(Long hBrick)
{
    Record(tessel::SlotDestroy, hBrick);
    return static_cast<int>(state.results[tessel::SlotDestroy]);
}

Long FindBrick(Long hBrick, Short* type, Long* extra)
{
    RecordedCall& call = Record(tessel::SlotFindBrick, hBrick);
    call.pointers[0] = type;
    call.pointers[1] = extra;
    if (type != nullptr) {
        *type = state.shortOut;
    }
    if (extra != nullptr) {
        *extra = state.longOut;
    }
    return state.results[tessel::SlotFindBrick];
}

Long Status(Long hBrick, Short what, char* text, Size size)
{
    Record(tessel::SlotStatus, hBrick, what, size).pointers[0] = text;
    if (text != nullptr && size > 0) {
        CopyText(text, size, state.textOut);
    }
    return state.results[tessel::SlotStatus];
}

Long Set(Long hBrick, Short property, Short value)
{
    Record(tessel::SlotSet, hBrick, property, value);
    return state.results[tessel::SlotSet];
}

Long Get(Long hBrick, Short property, Short* value, char* text, Size size)
{
    RecordedCall& call = Record(tessel::SlotGet, hBrick, property, size);
    call.pointers[0] = value;
    call.pointers[1] = text;
    if (value != nullptr) {
        *value = state.shortOut;
    }
    if (text != nullptr && size > 0) {
        CopyText(text, size, state.textOut);
    }
    return state.results[tessel::SlotGet];
}

Long Validate(Short brickType, ReaderWriter* source, IError* sink, ReaderWriter* extra1,
              ReaderWriter* extra2)
{
    RecordedCall& call = Record(tessel::SlotValidate, brickType);
    call.pointers[0] = source;
    call.pointers[1] = sink;
    call.pointers[2] = extra1;
    call.pointers[3] = extra2;
    return state.results[tessel::SlotValidate];
}

Long Translate(Short brickType, ReaderWriter* source, ReaderWriter* target, IError* sink,
               ReaderWriter* extra1, ReaderWriter* extra2)
{
    RecordedCall& call = Record(tessel::SlotTranslate, brickType);
    call.pointers[0] = source;
    call.pointers[1] = target;
    call.pointers[2] = sink;
    call.pointers[3] = extra1;
    call.pointers[4] = extra2;
    state.sourceType = source != nullptr ? source->type() : -1;
    state.targetType = target != nullptr ? target->type() : -1;
    ReadAll(source, state.sourceText, sizeof state.sourceText);

    const Long result = state.results[tessel::SlotTranslate];
    if (result < 0) {
        if (sink != nullptr) {
            sink->SetError(result, state.errorPosition, "testlib: cannot translate");
        }
        return result;
    }
    char text[sizeof state.sourceText + 4];
    std::snprintf(text, sizeof text, "cmd %s", state.sourceText);
    WriteText(target, "w", text);
    return result;
}

Long Exec(Long hBrick, ReaderWriter* code, Long* result, ReaderWriter* resultFile,
          tessel::Callback callback, void* context)
{
    RecordedCall& call = Record(tessel::SlotExec, hBrick);
    call.pointers[0] = code;
    call.pointers[1] = result;
    call.pointers[2] = resultFile;
    call.pointers[3] = reinterpret_cast<const void*>(callback);
    call.pointers[4] = context;
    ReadAll(code, state.codeText, sizeof state.codeText);
    state.resultSizeOnEntry = -1;
    if (resultFile != nullptr && resultFile->openRead() == RwOk) {
        state.resultSizeOnEntry = resultFile->size();
        resultFile->close();
        WriteText(resultFile, "a", state.resultText);
    }
    if (result != nullptr) {
        *result = state.resultNumber;
    }
    return state.results[tessel::SlotExec];
}

Long Download(Long hBrick, ReaderWriter* code, tessel::Callback callback, void* context)
{
    RecordedCall& call = Record(tessel::SlotDownload, hBrick);
    call.pointers[0] = code;
    call.pointers[1] = reinterpret_cast<const void*>(callback);
    call.pointers[2] = context;
    return state.results[tessel::SlotDownload];
}

Long Info(Short brickType, Short infoId, Short* value)
{
    Record(tessel::SlotInfo, brickType, infoId).pointers[0] = value;
    if (value != nullptr) {
        *value = state.shortOut;
    }
    return state.results[tessel::SlotInfo];
}

Long FindItem(tessel::Slot slot, Short enumType, Short* item, char* name, Size size)
{
    RecordedCall& call = Record(slot, enumType, size);
    call.pointers[0] = item;
    call.pointers[1] = name;
    if (item != nullptr) {
        *item = state.shortOut;
    }
    if (name != nullptr && size > 0) {
        CopyText(name, size, state.textOut);
    }
    return state.results[slot];
}

Long FindFirst(Short enumType, Short* item, char* name, Size size)
{
    return FindItem(tessel::SlotFindFirst, enumType, item, name, size);
}

Long FindNext(Short enumType, Short* item, char* name, Size size)
{
    return FindItem(tessel::SlotFindNext, enumType, item, name, size);
}

void* const kAddresses[tessel::SlotCount] = {
    reinterpret_cast<void*>(&Initialise), reinterpret_cast<void*>(&Terminate),
    reinterpret_cast<void*>(&FindPort),   reinterpret_cast<void*>(&Create),
    reinterpret_cast<void*>(&Destroy),    reinterpret_cast<void*>(&FindBrick),
    reinterpret_cast<void*>(&Status),     reinterpret_cast<void*>(&Set),
    reinterpret_cast<void*>(&Get),        reinterpret_cast<void*>(&Validate),
    reinterpret_cast<void*>(&Translate),  reinterpret_cast<void*>(&Exec),
    reinterpret_cast<void*>(&Download),   reinterpret_cast<void*>(&Info),
    reinterpret_cast<void*>(&FindFirst),  reinterpret_cast<void*>(&FindNext),
};

constexpr const char* kOmittedName = "?omitted@@";

} // namespace

extern "C" {

#if !defined(HARBOR_TESTLIB_NO_TABLE)
// Mutable so that a test can leave one name out before it builds a session.
__attribute__((visibility("default"))) tessel::ExportEntry export_table[tessel::SlotCount + 1] = {
    {tessel::kExportNames[0], kAddresses[0]},
    {tessel::kExportNames[1], kAddresses[1]},
    {tessel::kExportNames[2], kAddresses[2]},
    {tessel::kExportNames[3], kAddresses[3]},
    {tessel::kExportNames[4], kAddresses[4]},
    {tessel::kExportNames[5], kAddresses[5]},
    {tessel::kExportNames[6], kAddresses[6]},
    {tessel::kExportNames[7], kAddresses[7]},
    {tessel::kExportNames[8], kAddresses[8]},
    {tessel::kExportNames[9], kAddresses[9]},
    {tessel::kExportNames[10], kAddresses[10]},
    {tessel::kExportNames[11], kAddresses[11]},
    {tessel::kExportNames[12], kAddresses[12]},
    {tessel::kExportNames[13], kAddresses[13]},
    {tessel::kExportNames[14], kAddresses[14]},
    {tessel::kExportNames[15], kAddresses[15]},
    {nullptr, nullptr},
};
#endif

__attribute__((visibility("default"))) RecordingState* testlib_state()
{
    return &state;
}

__attribute__((visibility("default"))) void testlib_reset()
{
    state = RecordingState{};
#if !defined(HARBOR_TESTLIB_NO_TABLE)
    for (int slot = 0; slot < tessel::SlotCount; ++slot) {
        export_table[slot].name = tessel::kExportNames[slot];
    }
#endif
}

// Leaves the decorated name of slot out of the export table (-1 restores every name).
__attribute__((visibility("default"))) void testlib_omit(int slot)
{
    state.omittedSlot = slot;
#if !defined(HARBOR_TESTLIB_NO_TABLE)
    for (int i = 0; i < tessel::SlotCount; ++i) {
        export_table[i].name = i == slot ? kOmittedName : tessel::kExportNames[i];
    }
#endif
}

// A plain C symbol, found by the loader without the table.
__attribute__((visibility("default"))) int testlib_plain_symbol()
{
    return 42;
}

} // extern "C"
