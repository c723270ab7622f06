// A session over the recording test library, built from a settings file in a scratch
// directory that is also the current one, with a check that no workspace object outlives it.
#pragma once

#include <gtest/gtest.h>

#include <filesystem>
#include <memory>
#include <string>

#include "session/BrickSession.h"
#include "tessel/DirEnt.h"
#include "tessel/ReaderWriter.h"
#include "testlib/TestSupport.h"
#include "workspace/LiveObjects.h"

class SessionTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        ASSERT_TRUE(library.loaded()) << "recording library missing beside the tests";
        ASSERT_FALSE(dir.path().empty());
        ASSERT_EQ(workspace::LiveObjectCount(), 0);
        // A disk-mode workspace without PATHS names its files relative to the current
        // directory; run in the scratch directory so no test writes into the source tree.
        previousDirectory = std::filesystem::current_path();
        std::filesystem::current_path(dir.path());
    }

    void TearDown() override
    {
        if (!previousDirectory.empty()) {
            std::filesystem::current_path(previousDirectory);
        }
        session.reset();
        EXPECT_EQ(workspace::LiveObjectCount(), 0) << "workspace objects outlived the session";
    }

    // paths: further lines of [PATHS]; rest: further sections.
    std::string writeSettings(const std::string& paths, const std::string& rest,
                              const std::string& dll = testsupport::RecordingLibraryDirectory())
    {
        return dir.write("harbor.ini", "[PATHS]\nDLL=" + dll + "\n" + paths + rest);
    }

    BrickSession& open(const std::string& paths = "",
                       const std::string& rest = "[DEBUG]\nMEMFILES=TRUE\n",
                       const std::string& dll = testsupport::RecordingLibraryDirectory())
    {
        settingsPath = writeSettings(paths, rest, dll);
        session = std::make_unique<BrickSession>(settingsPath.c_str());
        return *session;
    }

    // [PATHS] lines putting the disk-mode working files in tmp/ and fw/ of the scratch directory.
    std::string diskPaths()
    {
        std::filesystem::create_directories(dir.path() + "tmp");
        std::filesystem::create_directories(dir.path() + "fw");
        return "TEMP=" + dir.path() + "tmp/\nFIRMWARE=" + dir.path() + "fw/\n";
    }
    BrickSession& openDisk(const std::string& rest = "") { return open(diskPaths(), rest); }

    static std::string contentOf(ReaderWriter* handle)
    {
        std::string text;
        if (handle == nullptr || !(handle->openRead() == RwOk)) {
            return "<unreadable>";
        }
        char buffer[512];
        for (std::int32_t got; (got = handle->read(buffer, sizeof buffer)) > 0;) {
            text.append(buffer, static_cast<std::size_t>(got));
        }
        handle->close();
        return text;
    }

    RecordingState& lib() { return library.state(); }
    DirEnt* find(const char* path) { return session->root()->find(path); }

    testsupport::RecordingLibrary library;
    testsupport::TempDirectory dir;
    std::string settingsPath;
    std::unique_ptr<BrickSession> session;
    std::filesystem::path previousDirectory;
};
