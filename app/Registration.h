// Registering the program with the desktop (RegServer) and removing it again (UnregServer).
//
// There is no COM here: registering installs, for the user who runs it, a desktop entry for
// Harbor and a MIME type for "*.onyx2" scripts, so that a script opens in Harbor, which
// loads it as the command line's file. Both go below the user's data folder
// ($XDG_DATA_HOME, else ~/.local/share): applications/harbor.desktop and
// mime/packages/harbor-onyx2.xml. The desktop's caches are brought up to date by
// update-mime-database and update-desktop-database where they are installed.
#pragma once

#include <string>

namespace app {

class DesktopRegistration {
public:
    // dataHome: the data folder to write below; executable: the absolute path of the program
    // the entry starts.
    DesktopRegistration(std::string dataHome, std::string executable);

    // Each returns 0 when it worked and fills report with one line of what it did (or why
    // it did not), without line end.
    int Register(std::string& report) const;
    int Unregister(std::string& report) const;

    std::string desktopEntryPath() const;
    std::string mimePackagePath() const;

    // The user's data folder: $XDG_DATA_HOME when it is an absolute path, otherwise
    // $HOME/.local/share; "" when neither is known.
    static std::string UserDataHome();
    // The desktop entry for executable; "" when the path cannot be written in one (a line
    // break in it, or a relative path).
    static std::string DesktopEntry(const std::string& executable);

private:
    // Runs an updater on folder when the tool is on PATH: 0 not found, 1 ran fine, -1 failed.
    static int RunUpdater(const char* tool, const std::string& folder);

    std::string dataHome_;
    std::string executable_;
};

// The switches' entry points: they print the report (to standard output when the step
// worked, to standard error when it did not) and return the process exit code.
int RegisterProgram();
int UnregisterProgram();

} // namespace app
