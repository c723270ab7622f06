#include <dlfcn.h>
#include <unistd.h>

#include <cstring>
#include <string>

#include "platform/ExecutablePath.h"
#include "platform/LibraryLoader.h"
#include "tessel/TesselApi.h"

namespace platform {

namespace {

bool IsFile(const std::string& path)
{
    return access(path.c_str(), F_OK) == 0;
}

std::string CurrentDirectory()
{
    char buffer[4096];
    if (getcwd(buffer, sizeof buffer) == nullptr) {
        return {};
    }
    std::string directory(buffer);
    if (directory.empty() || directory.back() != '/') {
        directory += '/';
    }
    return directory;
}

std::string TakeDlError()
{
    const char* text = dlerror();
    return text != nullptr ? text : "cannot load library";
}

} // namespace

bool LibraryLoader::Load(const char* path)
{
    lastError_.clear();
    if (path == nullptr || *path == '\0') {
        lastError_ = "empty library path";
        return false;
    }

    std::string target;
    if (std::strchr(path, '/') != nullptr) {
        target = path[0] == '/' ? std::string(path) : CurrentDirectory() + path;
    } else {
        const std::string besideProgram = ExecutableDirectory() + path;
        // Only the system's own search is left for a bare name not found beside us.
        target = !ExecutableDirectory().empty() && IsFile(besideProgram) ? besideProgram
                                                                         : std::string(path);
    }

    dlerror();
    void* handle = dlopen(target.c_str(), RTLD_NOW | RTLD_LOCAL);
    if (handle == nullptr) {
        lastError_ = TakeDlError();
        return false;
    }
    handle_ = handle;
    return true;
}

void* LibraryLoader::Resolve(const char* name) const
{
    if (handle_ == nullptr || name == nullptr) {
        return nullptr;
    }
    dlerror();
    if (void* address = dlsym(handle_, name)) {
        return address;
    }
    dlerror();
    const auto* table =
        static_cast<const tessel::ExportEntry*>(dlsym(handle_, tessel::kExportTableSymbol));
    if (table == nullptr) {
        return nullptr;
    }
    // A table without its end marker would be read past its end; no real module has
    // anywhere near this many rows, so stop there.
    constexpr int kMaxRows = 4096;
    for (int row = 0; row < kMaxRows && table[row].name != nullptr; ++row) {
        if (std::strcmp(table[row].name, name) == 0) {
            return table[row].address;
        }
    }
    return nullptr;
}

} // namespace platform
