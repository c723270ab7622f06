#include "session/BrickSession.h"

#include <string>

#include "platform/Profile.h"
#include "tessel/DirEnt.h"
#include "tessel/ErrorValue.h"

using tessel::Long;
using tessel::Short;
using tessel::Size;

namespace {

// Built and taken apart on the spot: a missing entry point is reported per call and never
// stored.
Long LinkFailed()
{
    return ErrorValue(3, 5, 3, 65).asLong();
}

} // namespace

BrickSession::BrickSession(const char* settingsPath)
{
    char directory[tessel::kPathSize] = {};
    platform::ReadProfileString("PATHS", "DLL", "", directory, sizeof directory, settingsPath);

    // No separator is added: the value names a directory that ends in one, or is empty
    // and the system's search finds the library.
    const std::string libraryPath = std::string(directory) + "Tessel.dll";
    if (library_.Load(libraryPath.c_str())) {
        for (int slot = 0; slot < tessel::SlotCount; ++slot) {
            entryPoints_[slot] = library_.Resolve(tessel::kExportNames[slot]);
        }
    }

    BuildWorkspace(settingsPath);
    Initialise();
}

BrickSession::~BrickSession()
{
    if (root_ != nullptr) {
        root_ = root_->release();
    }
    // The tree no longer links it; this drops the last reference.
    if (sourceEntry_ != nullptr) {
        sourceEntry_ = sourceEntry_->release();
    }
    sourceEntry_ = nullptr;
    objectEntry_ = nullptr;
    resultEntry_ = nullptr;
    firmwareEntry_ = nullptr;
    Terminate();
}

Long BrickSession::Initialise()
{
    auto fn = entry<tessel::InitialiseFn>(tessel::SlotInitialise);
    return fn != nullptr ? fn() : LinkFailed();
}

Long BrickSession::Terminate()
{
    auto fn = entry<tessel::TerminateFn>(tessel::SlotTerminate);
    return fn != nullptr ? fn() : LinkFailed();
}

Long BrickSession::FindPort(char* name, Size size)
{
    auto fn = entry<tessel::FindPortFn>(tessel::SlotFindPort);
    return fn != nullptr ? fn(name, size) : LinkFailed();
}

Long BrickSession::Create(const char* port)
{
    auto fn = entry<tessel::CreateFn>(tessel::SlotCreate);
    // Callers take any non-zero result for a brick handle, so the link failure code would
    // open a phantom port; 0 is the library's own "no handle".
    return fn != nullptr ? fn(port) : 0;
}

int BrickSession::Destroy(Long hBrick)
{
    auto fn = entry<tessel::DestroyFn>(tessel::SlotDestroy);
    return fn != nullptr ? fn(hBrick) : LinkFailed();
}

Long BrickSession::FindBrick(Long hBrick, Short* type, Long* extra)
{
    auto fn = entry<tessel::FindBrickFn>(tessel::SlotFindBrick);
    return fn != nullptr ? fn(hBrick, type, extra) : LinkFailed();
}

Long BrickSession::Status(Long hBrick, Short what, char* text, Size size)
{
    auto fn = entry<tessel::StatusFn>(tessel::SlotStatus);
    return fn != nullptr ? fn(hBrick, what, text, size) : tessel::kStatusNoLibrary;
}

Long BrickSession::Set(Long hBrick, Short property, Short value)
{
    auto fn = entry<tessel::SetFn>(tessel::SlotSet);
    return fn != nullptr ? fn(hBrick, property, value) : LinkFailed();
}

Long BrickSession::Get(Long hBrick, Short property, Short* value, char* text, Size size)
{
    auto fn = entry<tessel::GetFn>(tessel::SlotGet);
    return fn != nullptr ? fn(hBrick, property, value, text, size) : LinkFailed();
}

Long BrickSession::Translate(Short brickType, ReaderWriter* source, ReaderWriter* target,
                             IError* sink, ReaderWriter* extra1, ReaderWriter* extra2)
{
    auto fn = entry<tessel::TranslateFn>(tessel::SlotTranslate);
    return fn != nullptr ? fn(brickType, source, target, sink, extra1, extra2) : LinkFailed();
}

Long BrickSession::Exec(Long hBrick, ReaderWriter* code, Long* result, ReaderWriter* resultFile,
                        tessel::Callback callback, void* context)
{
    auto fn = entry<tessel::ExecFn>(tessel::SlotExec);
    return fn != nullptr ? fn(hBrick, code, result, resultFile, callback, context) : LinkFailed();
}

Long BrickSession::Download(Long hBrick, ReaderWriter* code, tessel::Callback callback,
                            void* context)
{
    auto fn = entry<tessel::DownloadFn>(tessel::SlotDownload);
    return fn != nullptr ? fn(hBrick, code, callback, context) : LinkFailed();
}

Long BrickSession::Info(Short brickType, Short infoId, Short* value)
{
    auto fn = entry<tessel::InfoFn>(tessel::SlotInfo);
    return fn != nullptr ? fn(brickType, infoId, value) : LinkFailed();
}

Long BrickSession::FindFirst(Short enumType, Short* item, char* name, Size size)
{
    auto fn = entry<tessel::FindFirstFn>(tessel::SlotFindFirst);
    return fn != nullptr ? fn(enumType, item, name, size) : LinkFailed();
}

Long BrickSession::FindNext(Short enumType, Short* item, char* name, Size size)
{
    auto fn = entry<tessel::FindNextFn>(tessel::SlotFindNext);
    return fn != nullptr ? fn(enumType, item, name, size) : LinkFailed();
}
