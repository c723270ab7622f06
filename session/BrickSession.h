// The one object through which Harbor reaches the brick library.
//
// The session binds the library's sixteen entry points when it is constructed, builds and
// owns the script workspace, and offers one thin method per entry point (tslValidate is
// bound but has no method), so that a missing library or entry point turns into an ordinary
// error result instead of a crash. The script runner operations hand scripts to the library
// through the workspace. The brick handle is not part of the session: callers hold it.
//
// Used from the dialog's thread only.
#pragma once

#include <cstdint>

#include "platform/LibraryLoader.h"
#include "tessel/TesselApi.h"

class DirEnt;
class IError;
class ReaderWriter;

class BrickSession {
public:
    // Loads "<PATHS/DLL>Tessel.dll" (the value is a directory ending in a separator, or
    // empty), resolves the entry points, builds the workspace from the same settings file
    // and calls Initialise. Nothing here fails: a missing library shows up per call.
    explicit BrickSession(const char* settingsPath);
    // Releases the workspace tree, then calls Terminate. The library stays loaded.
    ~BrickSession();

    BrickSession(const BrickSession&) = delete;
    BrickSession& operator=(const BrickSession&) = delete;

    // Thin methods: the entry point's parameters in the same order, passed on unchanged,
    // its result returned unchanged. Without the entry point each returns kLinkFailed,
    // except Status (kStatusNoLibrary) and Create (0: any other value would be taken for a
    // valid brick handle).
    tessel::Long Initialise();
    tessel::Long Terminate();
    tessel::Long FindPort(char* name, tessel::Size size);
    tessel::Long Create(const char* port);
    int Destroy(tessel::Long hBrick);
    tessel::Long FindBrick(tessel::Long hBrick, tessel::Short* type, tessel::Long* extra);
    tessel::Long Status(tessel::Long hBrick, tessel::Short what, char* text, tessel::Size size);
    tessel::Long Set(tessel::Long hBrick, tessel::Short property, tessel::Short value);
    tessel::Long Get(tessel::Long hBrick, tessel::Short property, tessel::Short* value, char* text,
                     tessel::Size size);
    tessel::Long Translate(tessel::Short brickType, ReaderWriter* source, ReaderWriter* target,
                           IError* sink, ReaderWriter* extra1, ReaderWriter* extra2);
    tessel::Long Exec(tessel::Long hBrick, ReaderWriter* code, tessel::Long* result,
                      ReaderWriter* resultFile, tessel::Callback callback, void* context);
    tessel::Long Download(tessel::Long hBrick, ReaderWriter* code, tessel::Callback callback,
                          void* context);
    tessel::Long Info(tessel::Short brickType, tessel::Short infoId, tessel::Short* value);
    tessel::Long FindFirst(tessel::Short enumType, tessel::Short* item, char* name,
                           tessel::Size size);
    tessel::Long FindNext(tessel::Short enumType, tessel::Short* item, char* name,
                          tessel::Size size);

    // Workspace set-up. BuildWorkspace runs once from the constructor; a second call
    // changes nothing and returns false. True when the source, object and result working
    // files were all created.
    bool BuildWorkspace(const char* settingsPath);
    // Links the host file diskDirectory+name as workspaceDirectory+name (plain joins, no
    // separator added). The name is lower-cased in the workspace path, so the file is found
    // only under its all-lower-case name; the host path stays as written, since host file
    // systems may be case-sensitive. Null for an empty name or a failed insertion.
    DirEnt* MountDiskFile(const char* name, const char* diskDirectory,
                          const char* workspaceDirectory);
    // Links a new empty text memory file as workspaceDirectory+name; letter case is kept.
    DirEnt* CreateMemoryFile(const char* name, const char* workspaceDirectory);

    // Script runner. A code handle received through an out-parameter belongs to the
    // receiver, which gives it back with ReleaseReaderWriter on every path.
    tessel::Long TranslateText(tessel::Short brickType, std::int32_t type, const char* text,
                               ReaderWriter** code, IError* sink, ReaderWriter* extra1,
                               ReaderWriter* extra2);
    tessel::Long CompileFile(tessel::Short brickType, std::int32_t type, const char* hostPath,
                             ReaderWriter** code, IError* sink, ReaderWriter* extra1,
                             ReaderWriter* extra2);
    tessel::Long TranslateToCsv(tessel::Short brickType, const char* text, ReaderWriter** listing,
                                IError* sink);
    tessel::Long CompileFirmware(const char* hostPath, ReaderWriter** code);
    tessel::Long ExecCode(tessel::Long hBrick, ReaderWriter* code, tessel::Long* result,
                          ReaderWriter** resultFile, tessel::Callback callback, void* context);
    tessel::Long RunImmediate(tessel::Long hBrick, const char* text, tessel::Long* result);

    // These use nothing of the session.
    static void ReleaseReaderWriter(ReaderWriter** handle);
    // Byte length of the file behind handle; 0 for null, unreadable or empty.
    static std::int32_t ContentSize(ReaderWriter* handle);
    // Places where "cmd" begins in a translated code file; 0 for null, unreadable or empty.
    static std::int32_t CountCommands(ReaderWriter* code);

    // Read access for the runner's callers and for tests; the session keeps ownership.
    DirEnt* root() const { return root_; }
    DirEnt* sourceEntry() const { return sourceEntry_; }
    DirEnt* objectEntry() const { return objectEntry_; }
    DirEnt* resultEntry() const { return resultEntry_; }
    DirEnt* firmwareEntry() const { return firmwareEntry_; }
    bool memFiles() const { return memFiles_; }
    // True when the library file was loaded (its entry points may still be missing).
    bool libraryLoaded() const { return library_.isLoaded(); }

    // Errors the runner builds itself (severity 3, facility 5, module 3).
    static constexpr std::uint32_t kNullRoot = 0xE0050C81u;         // 129
    static constexpr std::uint32_t kInsertFailed = 0xE0050C82u;     // 130
    static constexpr std::uint32_t kCreateFailed = 0xE0050C83u;     // 131
    static constexpr std::uint32_t kNullSourcePath = 0xE0050C84u;   // 132
    static constexpr std::uint32_t kNullResultPath = 0xE0050C85u;   // 133
    static constexpr std::uint32_t kNullFirmwarePath = 0xE0050C86u; // 134
    static constexpr std::uint32_t kNullTempPath = 0xE0050C87u;     // 135: no object file

private:
    template <typename Fn> Fn entry(tessel::Slot slot) const
    {
        return reinterpret_cast<Fn>(entryPoints_[slot]);
    }

    // Opens the object working file with objectType and translates source into it.
    tessel::Long translateInto(tessel::Short brickType, ReaderWriter* source,
                               std::int32_t objectType, DirEnt* object, ReaderWriter** code,
                               IError* sink, ReaderWriter* extra1, ReaderWriter* extra2);
    tessel::Long translateSource(tessel::Short brickType, std::int32_t type,
                                 std::int32_t objectType, const char* text, ReaderWriter** code,
                                 IError* sink, ReaderWriter* extra1, ReaderWriter* extra2);
    // Puts the session's own source working file back under its path when CompileFile
    // has linked a host file there.
    void relinkSourceEntry();
    // Replaces whatever is linked at path with a new disk entry for hostPath.
    DirEnt* replaceWithDiskFile(const char* path, const char* hostPath);

    void* entryPoints_[tessel::SlotCount] = {};
    DirEnt* root_ = nullptr;
    // The session holds one reference of its source working file of its own, because
    // CompileFile unlinks it from the tree for a while.
    DirEnt* sourceEntry_ = nullptr;
    DirEnt* objectEntry_ = nullptr;
    DirEnt* resultEntry_ = nullptr;
    DirEnt* firmwareEntry_ = nullptr;
    bool memFiles_ = false;
    platform::LibraryLoader library_;
};
