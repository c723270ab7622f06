// One headless Harbor session in this process: the dialog on the headless host, driven by the
// headless runner from a script of commands, against a brick library in a folder named by a
// settings file of its own. Shared by the fault matrix, the hostile library tests and the soak.
#pragma once

#include <cstddef>
#include <filesystem>
#include <functional>
#include <istream>
#include <string>
#include <vector>

namespace reliability {

struct SessionSetup {
    // The folder holding Tessel.dll; by default the simulated library's.
    std::string libraryDir;
    // Scenario text for the simulated library (TESSEL_SIM); empty: the built-in one.
    std::string scenario;
    // Lines put first into [PORTS] and [OPTIONS] (the first occurrence of a key wins).
    std::string ports;
    std::string options;
    bool answerYes = false;
    int timeoutMs = 20000;
    // 0: keep every printed line. Otherwise only the last keepLines lines, and the lines around
    // failures (questions, refusals, timeouts, failed expectations; the first hundred), so a
    // long run holds no growing transcript.
    std::size_t keepLines = 0;
};

struct Transcript {
    int exitStatus = -1;
    std::vector<std::string> lines;

    // The lines printed for the last run of command (from its "> command" line up to the next
    // command's); empty when it did not run.
    std::vector<std::string> of(const std::string& command) const;
    // The lines from the last run of command to the end.
    std::vector<std::string> from(const std::string& command) const;
    // The status texts among lines, unescaped only as far as the transcript leaves them.
    static std::vector<std::string> Statuses(const std::vector<std::string>& lines);
    // Whether one of lines asks "Use Trouble Shooter?".
    static bool Offered(const std::vector<std::string>& lines);
    std::string text() const;
};

// A fresh folder under the temporary directory, removed again with the object.
class ScratchDir {
public:
    explicit ScratchDir(const std::string& tag);
    ~ScratchDir();
    ScratchDir(const ScratchDir&) = delete;
    ScratchDir& operator=(const ScratchDir&) = delete;
    const std::filesystem::path& path() const { return path_; }
    std::string write(const std::string& name, const std::string& bytes) const;

private:
    std::filesystem::path path_;
};

// Writes the settings and the scenario into dir, runs script to its end (the window is closed
// as by Exit) and returns what was printed.
Transcript RunHeadless(const ScratchDir& dir, const SessionSetup& setup, std::istream& script);
Transcript RunHeadless(const ScratchDir& dir, const SessionSetup& setup, const std::string& script);

// The folder of the build's program files (include/, firmware/, help/, Tessel.dll).
std::string BinDir();

} // namespace reliability
