// Run-time loading of a shared library and lookup of its exported names.
//
// ELF symbol names cannot carry decorated export names ("@@" means symbol versioning to
// the linker), so a module may also export a C data symbol "export_table": an array of
// tessel::ExportEntry ended by {nullptr, nullptr}. Resolve tries the symbol first, then
// the table.
//
// The library is never unloaded: its threads may still call back into the process, and
// nothing would be gained by closing it before the process ends.
#pragma once

#include <string>

namespace platform {

class LibraryLoader {
public:
    LibraryLoader() = default;
    LibraryLoader(const LibraryLoader&) = delete;
    LibraryLoader& operator=(const LibraryLoader&) = delete;

    // A path without a directory is looked for beside the running executable first, the
    // way Windows searches the program's directory, then by the system's search. A file
    // that is found is always opened by its absolute path (under the sanitizers a bare-name
    // open ignores RUNPATH). False when nothing could be loaded; a second Load replaces the
    // handle this loader uses.
    bool Load(const char* path);

    bool isLoaded() const { return handle_ != nullptr; }

    // The address of name, or null when the library is not loaded or does not export it.
    void* Resolve(const char* name) const;

    // The text of the last load failure ("" after a success), for diagnostics.
    const std::string& lastError() const { return lastError_; }

private:
    void* handle_ = nullptr;
    std::string lastError_;
};

} // namespace platform
