// A scratch folder with a scenario for the simulated library and a harbor.ini that loads it
// from the build's bin folder, as the program's own settings would.
#pragma once

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string>

#include <unistd.h>

namespace bench {

class BenchFolder {
public:
    // ports: the [PORTS] lines.
    BenchFolder(const std::string& scenario, const std::string& ports)
        : dir_(std::filesystem::temp_directory_path() /
               ("harbor-bench-" + std::to_string(getpid()) + "-" + std::to_string(++serial_)))
    {
        std::filesystem::create_directories(dir_);
        const std::string scenarioPath = write("scenario.sim", scenario);
        ::setenv("TESSEL_SIM", scenarioPath.c_str(), 1);
        write("harbor.ini",
              "[PATHS]\nDLL=" HARBOR_BIN_DIR "/\n[DEBUG]\nMEMFILES=TRUE\n[PORTS]\n" + ports + "\n");
    }
    ~BenchFolder()
    {
        std::error_code ignored;
        std::filesystem::remove_all(dir_, ignored);
    }
    BenchFolder(const BenchFolder&) = delete;
    BenchFolder& operator=(const BenchFolder&) = delete;

    std::string settingsPath() const { return (dir_ / "harbor.ini").string(); }
    // The dialog's command line: a program in this folder, so the settings are found.
    std::string commandLine() const { return "\"" + (dir_ / "harbor").string() + "\""; }

    std::string write(const std::string& name, const std::string& bytes) const
    {
        const std::filesystem::path path = dir_ / name;
        std::ofstream(path, std::ios::binary | std::ios::trunc) << bytes;
        return path.string();
    }

private:
    static inline int serial_ = 0;
    std::filesystem::path dir_;
};

// No transmission time, one Onyx2 brick behind a serial tower on COM1.
inline constexpr const char* kFastScenario = "link-time = 0\n[brick b1]\n[port COM1]\n";
inline constexpr const char* kSerialPorts = "Serial=COM1";

// A script of about lines lines, statements of every common kind in ten tasks.
std::string LongScript(int lines);

} // namespace bench
