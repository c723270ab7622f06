// Building the script workspace that the session and the brick library share.
#include <cctype>
#include <cstring>
#include <new>
#include <string>

#include "platform/Profile.h"
#include "session/BrickSession.h"
#include "session/WorkspaceLinks.h"
#include "workspace/Directory.h"
#include "workspace/DiskFile.h"
#include "workspace/MemoryBlock.h"
#include "workspace/MemoryFile.h"

namespace {

// The working files, in the order they are created; the first three and the last are
// the ones the runner uses.
constexpr const char* kWorkingFiles[] = {
    "source.txt", "object.txt",  "result.txt", "opal.txt",
    "temp.tmp",   "context.txt", "symtab.txt", "firmware.txt",
};
constexpr int kWorkingFileCount = sizeof kWorkingFiles / sizeof kWorkingFiles[0];
constexpr int kSourceFile = 0;
constexpr int kObjectFile = 1;
constexpr int kResultFile = 2;
constexpr int kFirmwareFile = 7;

// The key names of HEADERS are read in one call of this size; names beyond it are cut,
// as the profile reading cuts any list.
constexpr std::uint32_t kKeyListSize = 1024;
constexpr std::uint32_t kBooleanSize = 12;

bool EqualsNoCase(const char* text, const char* expected)
{
    for (; *text != '\0' && *expected != '\0'; ++text, ++expected) {
        if (std::tolower(static_cast<unsigned char>(*text)) !=
            std::tolower(static_cast<unsigned char>(*expected))) {
            return false;
        }
    }
    return *text == *expected;
}

void ToLowerInPlace(std::string& text)
{
    for (char& c : text) {
        c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
    }
}

} // namespace

bool BrickSession::BuildWorkspace(const char* settingsPath)
{
    if (root_ != nullptr) {
        return false;
    }
    auto* top = new (std::nothrow) Directory();
    if (top == nullptr) {
        return false;
    }
    root_ = top;
    root_->addRef();

    if (auto* script = new (std::nothrow) Directory()) {
        session::InsertNew(root_, "/Script", script);
    }

    char includeDirectory[tessel::kPathSize] = {};
    platform::ReadProfileString("PATHS", "HEADERS", "", includeDirectory, sizeof includeDirectory,
                                settingsPath);
    char keys[kKeyListSize] = {};
    platform::ReadProfileString("HEADERS", nullptr, "", keys, sizeof keys, settingsPath);
    for (const char* key = keys; *key != '\0'; key += std::strlen(key) + 1) {
        char value[tessel::kPathSize] = {};
        platform::ReadProfileString("HEADERS", key, "", value, sizeof value, settingsPath);
        MountDiskFile(value, includeDirectory, "/Script/Include/");
    }

    char memFiles[kBooleanSize] = {};
    platform::ReadProfileString("DEBUG", "MEMFILES", "", memFiles, sizeof memFiles, settingsPath);
    memFiles_ = EqualsNoCase(memFiles, "TRUE");

    DirEnt* created[kWorkingFileCount] = {};
    if (memFiles_) {
        for (int i = 0; i < kWorkingFileCount; ++i) {
            created[i] = CreateMemoryFile(kWorkingFiles[i], "/Script/Temp/");
        }
    } else {
        char tempDirectory[tessel::kPathSize] = {};
        platform::ReadProfileString("PATHS", "TEMP", "", tempDirectory, sizeof tempDirectory,
                                    settingsPath);
        for (int i = 0; i < kFirmwareFile; ++i) {
            created[i] = MountDiskFile(kWorkingFiles[i], tempDirectory, "/Script/Temp/");
        }
        char firmwareDirectory[tessel::kPathSize] = {};
        platform::ReadProfileString("PATHS", "FIRMWARE", "", firmwareDirectory,
                                    sizeof firmwareDirectory, settingsPath);
        created[kFirmwareFile] =
            MountDiskFile(kWorkingFiles[kFirmwareFile], firmwareDirectory, "/Script/Firmware/");
    }

    sourceEntry_ = created[kSourceFile];
    if (sourceEntry_ != nullptr) {
        sourceEntry_->addRef();
    }
    objectEntry_ = created[kObjectFile];
    resultEntry_ = created[kResultFile];
    firmwareEntry_ = created[kFirmwareFile];
    return sourceEntry_ != nullptr && objectEntry_ != nullptr && resultEntry_ != nullptr;
}

DirEnt* BrickSession::MountDiskFile(const char* name, const char* diskDirectory,
                                    const char* workspaceDirectory)
{
    if (name == nullptr || *name == '\0' || root_ == nullptr) {
        return nullptr;
    }
    const std::string hostPath = std::string(diskDirectory != nullptr ? diskDirectory : "") + name;
    // Lookup in the tree is case-sensitive, so every disk-backed file is linked under its
    // all-lower-case name, where the library looks for it ("/Script/Include/onyx2mlt.h");
    // the workspace directories are our own names and keep their letters. The host path
    // keeps its letters too: on a case-sensitive file system lower-casing it would name
    // another file.
    std::string lowerName(name);
    ToLowerInPlace(lowerName);
    const std::string workspacePath =
        std::string(workspaceDirectory != nullptr ? workspaceDirectory : "") + lowerName;

    auto* entry = new (std::nothrow) DiskEntry(hostPath.c_str());
    if (entry == nullptr) {
        return nullptr;
    }
    return session::InsertNew(root_, workspacePath.c_str(), entry);
}

DirEnt* BrickSession::CreateMemoryFile(const char* name, const char* workspaceDirectory)
{
    if (name == nullptr || *name == '\0' || root_ == nullptr) {
        return nullptr;
    }
    const std::string workspacePath =
        std::string(workspaceDirectory != nullptr ? workspaceDirectory : "") + name;
    auto* block = new (std::nothrow) MemoryBlock();
    if (block == nullptr) {
        return nullptr;
    }
    auto* entry = new (std::nothrow) TextMemoryEntry(block);
    if (entry == nullptr) {
        session::DisposeBlock(block);
        return nullptr;
    }
    return session::InsertNew(root_, workspacePath.c_str(), entry);
}
