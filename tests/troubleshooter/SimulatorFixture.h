// The brick session against the simulated library. Each test writes its scenario and a
// settings file into a directory of its own; the session then loads Tessel.dll by absolute
// path from the folder it was built into. No workspace object may outlive a test.
#pragma once

#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <memory>
#include <string>

#include "session/BrickSession.h"
#include "workspace/LiveObjects.h"

#ifndef HARBOR_SIM_DIR
#define HARBOR_SIM_DIR ""
#endif

class SimulatorFixture : public testing::Test {
protected:
    void SetUp() override
    {
        static int number = 0;
        dir_ = std::filesystem::temp_directory_path() /
               ("harbor-shooter-" + std::to_string(getpid()) + "-" + std::to_string(++number));
        std::filesystem::remove_all(dir_);
        std::filesystem::create_directories(dir_);
        ASSERT_NE(std::string(HARBOR_SIM_DIR), "") << "the simulated library is not built";
    }
    void TearDown() override
    {
        session_.reset();
        EXPECT_EQ(workspace::LiveObjectCount(), 0);
        std::error_code ignored;
        std::filesystem::remove_all(dir_, ignored);
    }

    // Writes the scenario (link time 0 is added) and the settings, with lines of the test's own.
    void WriteScenario(const std::string& scenario, const std::string& settings = "")
    {
        ::setenv("TESSEL_SIM", WriteFile("scenario.txt", "link-time = 0\n" + scenario).c_str(), 1);
        WriteFile("harbor.ini", "[PATHS]\nDLL=" + std::string(HARBOR_SIM_DIR) +
                                    "/\n[DEBUG]\nMEMFILES=TRUE\n" + settings);
    }
    void Start(const std::string& scenario)
    {
        WriteScenario(scenario);
        session_ = std::make_unique<BrickSession>((dir_ / "harbor.ini").string().c_str());
        ASSERT_TRUE(session_->libraryLoaded()) << "Tessel.dll not found in " HARBOR_SIM_DIR;
    }
    std::string LogPath() const { return (dir_ / "shooter.log").string(); }
    std::string Log() const
    {
        std::ifstream in(LogPath(), std::ios::binary);
        return std::string(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
    }
    std::string WriteFile(const std::string& name, const std::string& bytes)
    {
        const std::string path = (dir_ / name).string();
        std::ofstream(path, std::ios::binary) << bytes;
        return path;
    }

    BrickSession& session() { return *session_; }
    BrickSession* sessionSlot_ = nullptr; // the dialog's pointer, as the adapter reads it
    std::filesystem::path dir_;
    std::unique_ptr<BrickSession> session_;
};
