// Helpers shared by the platform, app and session suites: a scratch directory and the
// recording test library.
#pragma once

#include <dlfcn.h>
#include <stdlib.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <string>

#include "platform/ExecutablePath.h"
#include "testlib/RecordingLibrary.h"

namespace testsupport {

// A fresh directory below the system's temporary directory, removed with everything in it.
class TempDirectory {
public:
    TempDirectory()
    {
        std::string pattern = (std::filesystem::temp_directory_path() / "harbor-XXXXXX").string();
        if (mkdtemp(pattern.data()) != nullptr) {
            path_ = pattern + "/";
        }
    }
    ~TempDirectory()
    {
        if (!path_.empty()) {
            std::error_code ignored;
            std::filesystem::remove_all(path_, ignored);
        }
    }
    TempDirectory(const TempDirectory&) = delete;
    TempDirectory& operator=(const TempDirectory&) = delete;

    // With a trailing "/"; "" when the directory could not be made.
    const std::string& path() const { return path_; }

    std::string write(const std::string& name, const std::string& content) const
    {
        const std::string file = path_ + name;
        std::ofstream(file, std::ios::binary) << content;
        return file;
    }

    std::string read(const std::string& name) const
    {
        std::ifstream in(path_ + name, std::ios::binary);
        return std::string(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
    }

private:
    std::string path_;
};

// Folders of the recording library beside the test binaries, with a trailing "/".
inline std::string RecordingLibraryDirectory()
{
    return platform::ExecutableDirectory() + "testlib/";
}
inline std::string BareLibraryDirectory()
{
    return platform::ExecutableDirectory() + "testlib-bare/";
}

// The recording library, opened by the same absolute path the session uses, so both see
// one loaded module and one state.
class RecordingLibrary {
public:
    explicit RecordingLibrary(const std::string& directory = RecordingLibraryDirectory())
    {
        handle_ = dlopen((directory + "Tessel.dll").c_str(), RTLD_NOW | RTLD_LOCAL);
        if (handle_ != nullptr) {
            state_ = reinterpret_cast<TestLibStateFn>(dlsym(handle_, "testlib_state"))();
            reset_ = reinterpret_cast<TestLibResetFn>(dlsym(handle_, "testlib_reset"));
            omit_ = reinterpret_cast<TestLibOmitFn>(dlsym(handle_, "testlib_omit"));
            reset_();
        }
    }
    ~RecordingLibrary()
    {
        if (handle_ != nullptr) {
            reset_();
            dlclose(handle_);
        }
    }
    RecordingLibrary(const RecordingLibrary&) = delete;
    RecordingLibrary& operator=(const RecordingLibrary&) = delete;

    bool loaded() const { return handle_ != nullptr; }
    RecordingState& state() const { return *state_; }
    void omit(int slot) const { omit_(slot); }

private:
    void* handle_ = nullptr;
    RecordingState* state_ = nullptr;
    TestLibResetFn reset_ = nullptr;
    TestLibOmitFn omit_ = nullptr;
};

} // namespace testsupport
