// The sixteen entry points and the export table through which the client finds them under
// their decorated names. Nothing else of the module is visible.
#include "Library.h"

namespace {

using sim::Library;
using tessel::Callback;
using tessel::Long;
using tessel::Short;
using tessel::Size;

Long TSL_CDECL tslInitialise()
{
    return Library::Instance().initialise();
}
Long TSL_CDECL tslTerminate()
{
    return Library::Instance().terminate();
}
Long TSL_CDECL tslFindPort(char* name, Size size)
{
    return Library::Instance().findPort(name, size);
}
Long TSL_CDECL tslCreate(const char* port)
{
    return Library::Instance().create(port);
}
int TSL_CDECL tslDestroy(Long hBrick)
{
    return Library::Instance().destroy(hBrick);
}
Long TSL_CDECL tslFindBrick(Long hBrick, Short* type, Long* extra)
{
    return Library::Instance().findBrick(hBrick, type, extra);
}
Long TSL_CDECL tslStatus(Long hBrick, Short what, char* text, Size size)
{
    return Library::Instance().status(hBrick, what, text, size);
}
Long TSL_CDECL tslSet(Long hBrick, Short property, Short value)
{
    return Library::Instance().set(hBrick, property, value);
}
Long TSL_CDECL tslGet(Long hBrick, Short property, Short* value, char* text, Size size)
{
    return Library::Instance().get(hBrick, property, value, text, size);
}
Long TSL_CDECL tslValidate(Short brickType, ReaderWriter* source, IError* sink,
                           ReaderWriter* extra1, ReaderWriter* extra2)
{
    return Library::Instance().validate(brickType, source, sink, extra1, extra2);
}
Long TSL_CDECL tslTranslate(Short brickType, ReaderWriter* source, ReaderWriter* target,
                            IError* sink, ReaderWriter* extra1, ReaderWriter* extra2)
{
    return Library::Instance().translate(brickType, source, target, sink, extra1, extra2);
}
Long TSL_CDECL tslExec(Long hBrick, ReaderWriter* code, Long* result, ReaderWriter* resultFile,
                       Callback callback, void* context)
{
    return Library::Instance().exec(hBrick, code, result, resultFile, callback, context);
}
Long TSL_CDECL tslDownload(Long hBrick, ReaderWriter* code, Callback callback, void* context)
{
    return Library::Instance().download(hBrick, code, callback, context);
}
Long TSL_CDECL tslInfo(Short brickType, Short infoId, Short* value)
{
    return Library::Instance().info(brickType, infoId, value);
}
Long TSL_CDECL tslFindFirst(Short enumType, Short* item, char* name, Size size)
{
    return Library::Instance().findFirst(enumType, item, name, size);
}
Long TSL_CDECL tslFindNext(Short enumType, Short* item, char* name, Size size)
{
    return Library::Instance().findNext(enumType, item, name, size);
}

// Checked against the boundary's signatures, so a drifting parameter list fails to compile.
constexpr tessel::InitialiseFn kInitialise = &tslInitialise;
constexpr tessel::TerminateFn kTerminate = &tslTerminate;
constexpr tessel::FindPortFn kFindPort = &tslFindPort;
constexpr tessel::CreateFn kCreate = &tslCreate;
constexpr tessel::DestroyFn kDestroy = &tslDestroy;
constexpr tessel::FindBrickFn kFindBrick = &tslFindBrick;
constexpr tessel::StatusFn kStatus = &tslStatus;
constexpr tessel::SetFn kSet = &tslSet;
constexpr tessel::GetFn kGet = &tslGet;
constexpr tessel::ValidateFn kValidate = &tslValidate;
constexpr tessel::TranslateFn kTranslate = &tslTranslate;
constexpr tessel::ExecFn kExec = &tslExec;
constexpr tessel::DownloadFn kDownload = &tslDownload;
constexpr tessel::InfoFn kInfo = &tslInfo;
constexpr tessel::FindFirstFn kFindFirst = &tslFindFirst;
constexpr tessel::FindNextFn kFindNext = &tslFindNext;

} // namespace

// Declared before it is defined: a const object is otherwise local to this file.
extern "C" __attribute__((visibility("default"))) const tessel::ExportEntry export_table[];

// Slot order; ended by the null pair the loader looks for.
const tessel::ExportEntry export_table[] = {
    {tessel::kExportNames[tessel::SlotInitialise], reinterpret_cast<void*>(kInitialise)},
    {tessel::kExportNames[tessel::SlotTerminate], reinterpret_cast<void*>(kTerminate)},
    {tessel::kExportNames[tessel::SlotFindPort], reinterpret_cast<void*>(kFindPort)},
    {tessel::kExportNames[tessel::SlotCreate], reinterpret_cast<void*>(kCreate)},
    {tessel::kExportNames[tessel::SlotDestroy], reinterpret_cast<void*>(kDestroy)},
    {tessel::kExportNames[tessel::SlotFindBrick], reinterpret_cast<void*>(kFindBrick)},
    {tessel::kExportNames[tessel::SlotStatus], reinterpret_cast<void*>(kStatus)},
    {tessel::kExportNames[tessel::SlotSet], reinterpret_cast<void*>(kSet)},
    {tessel::kExportNames[tessel::SlotGet], reinterpret_cast<void*>(kGet)},
    {tessel::kExportNames[tessel::SlotValidate], reinterpret_cast<void*>(kValidate)},
    {tessel::kExportNames[tessel::SlotTranslate], reinterpret_cast<void*>(kTranslate)},
    {tessel::kExportNames[tessel::SlotExec], reinterpret_cast<void*>(kExec)},
    {tessel::kExportNames[tessel::SlotDownload], reinterpret_cast<void*>(kDownload)},
    {tessel::kExportNames[tessel::SlotInfo], reinterpret_cast<void*>(kInfo)},
    {tessel::kExportNames[tessel::SlotFindFirst], reinterpret_cast<void*>(kFindFirst)},
    {tessel::kExportNames[tessel::SlotFindNext], reinterpret_cast<void*>(kFindNext)},
    {nullptr, nullptr},
};
