// RegServer and UnregServer on a freedesktop.org desktop: a desktop entry and a MIME type,
// installed for the user.
#include "app/Registration.h"

#include <fcntl.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <system_error>
#include <vector>

#include "platform/ExecutablePath.h"

#if __has_include("app/DesktopFiles.h")
#include "app/DesktopFiles.h"
#define HARBOR_HAVE_DESKTOP_FILES 1
#else
#define HARBOR_HAVE_DESKTOP_FILES 0
#endif

extern char** environ;

namespace app {

namespace {

namespace fs = std::filesystem;

constexpr const char* kApplicationsFolder = "applications";
constexpr const char* kMimeFolder = "mime";
constexpr const char* kPackagesFolder = "mime/packages";

#if HARBOR_HAVE_DESKTOP_FILES
constexpr const char* kEntryName = desktop::kDesktopEntryName;
constexpr const char* kPackageName = desktop::kMimePackageName;
#else
constexpr const char* kEntryName = "harbor.desktop";
constexpr const char* kPackageName = "harbor-onyx2.xml";
#endif

// A value of the string type of a desktop entry: a backslash is written as two.
std::string EscapeString(const std::string& text)
{
    std::string escaped;
    for (char c : text) {
        if (c == '\\')
            escaped += '\\';
        escaped += c;
    }
    return escaped;
}

// The program as the first argument of an Exec line: quoted when it holds a character the
// line reserves, with the quoting's own escapes, and a percent sign doubled.
std::string ExecArgument(const std::string& path)
{
    const char* reserved = " \t\"'\\><~|&;$*?#()`";
    bool quote = false;
    std::string argument;
    for (char c : path) {
        if (std::strchr(reserved, c) != nullptr)
            quote = true;
        if (c == '"' || c == '`' || c == '$' || c == '\\')
            argument += '\\';
        if (c == '%')
            argument += '%';
        argument += c;
    }
    if (quote)
        argument = '"' + argument + '"';
    return EscapeString(argument);
}

void ReplaceAll(std::string& text, const std::string& from, const std::string& to)
{
    for (std::size_t at = text.find(from); at != std::string::npos;
         at = text.find(from, at + to.size()))
        text.replace(at, from.size(), to);
}

// Written next to its place and renamed into it, so that a desktop watching the folder
// never reads half a file.
bool WriteFileAtomically(const fs::path& path, const std::string& content, std::string& error)
{
    const fs::path temporary = path.string() + ".tmp" + std::to_string(getpid());
    {
        std::ofstream out(temporary, std::ios::binary | std::ios::trunc);
        if (!out) {
            error = "cannot write " + temporary.string() + ": " + std::strerror(errno);
            return false;
        }
        out.write(content.data(), static_cast<std::streamsize>(content.size()));
        out.close();
        if (!out) {
            error = "cannot write " + temporary.string();
            std::error_code ignored;
            fs::remove(temporary, ignored);
            return false;
        }
    }
    std::error_code code;
    fs::rename(temporary, path, code);
    if (code) {
        error = "cannot write " + path.string() + ": " + code.message();
        fs::remove(temporary, code);
        return false;
    }
    return true;
}

// The tool's path on PATH, "" when it is not there.
std::string FindOnPath(const char* tool)
{
    const char* path = std::getenv("PATH");
    if (path == nullptr)
        return {};
    std::string folders = path;
    std::size_t start = 0;
    while (start <= folders.size()) {
        std::size_t end = folders.find(':', start);
        if (end == std::string::npos)
            end = folders.size();
        const std::string folder = end > start ? folders.substr(start, end - start) : ".";
        const std::string candidate = folder + "/" + tool;
        if (::access(candidate.c_str(), X_OK) == 0)
            return candidate;
        start = end + 1;
    }
    return {};
}

std::string Joined(const std::vector<std::string>& items)
{
    std::string text;
    for (const std::string& item : items)
        text += (text.empty() ? "" : ", ") + item;
    return text;
}

} // namespace

DesktopRegistration::DesktopRegistration(std::string dataHome, std::string executable)
    : dataHome_(std::move(dataHome)), executable_(std::move(executable))
{
}

std::string DesktopRegistration::desktopEntryPath() const
{
    return (fs::path(dataHome_) / kApplicationsFolder / kEntryName).string();
}

std::string DesktopRegistration::mimePackagePath() const
{
    return (fs::path(dataHome_) / kPackagesFolder / kPackageName).string();
}

std::string DesktopRegistration::UserDataHome()
{
    // A relative XDG_DATA_HOME is invalid and ignored, as the XDG base directories have it.
    const char* dataHome = std::getenv("XDG_DATA_HOME");
    if (dataHome != nullptr && dataHome[0] == '/')
        return dataHome;
    const char* home = std::getenv("HOME");
    if (home != nullptr && home[0] == '/')
        return std::string(home) + "/.local/share";
    return {};
}

std::string DesktopRegistration::DesktopEntry(const std::string& executable)
{
#if HARBOR_HAVE_DESKTOP_FILES
    if (executable.empty() || executable[0] != '/' ||
        executable.find_first_of("\n\r") != std::string::npos)
        return {};
    std::string entry = desktop::kDesktopEntryTemplate;
    ReplaceAll(entry, "@HARBOR_EXEC@", ExecArgument(executable));
    ReplaceAll(entry, "@HARBOR_TRYEXEC@", EscapeString(executable));
    return entry;
#else
    return {};
#endif
}

int DesktopRegistration::RunUpdater(const char* tool, const std::string& folder)
{
    const std::string program = FindOnPath(tool);
    if (program.empty())
        return 0;
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    // Its chatter is not ours to show: the one line says what happened.
    posix_spawn_file_actions_addopen(&actions, STDOUT_FILENO, "/dev/null", O_WRONLY, 0);
    posix_spawn_file_actions_addopen(&actions, STDERR_FILENO, "/dev/null", O_WRONLY, 0);
    std::vector<char> name(program.begin(), program.end());
    name.push_back('\0');
    std::vector<char> argument(folder.begin(), folder.end());
    argument.push_back('\0');
    char* argv[] = {name.data(), argument.data(), nullptr};
    pid_t child = 0;
    const int spawned = posix_spawn(&child, program.c_str(), &actions, nullptr, argv, environ);
    posix_spawn_file_actions_destroy(&actions);
    if (spawned != 0)
        return -1;
    int status = 0;
    while (waitpid(child, &status, 0) < 0) {
        if (errno != EINTR)
            return -1;
    }
    return WIFEXITED(status) && WEXITSTATUS(status) == 0 ? 1 : -1;
}

int DesktopRegistration::Register(std::string& report) const
{
#if HARBOR_HAVE_DESKTOP_FILES
    if (dataHome_.empty()) {
        report = "RegServer failed: no data folder (neither XDG_DATA_HOME nor HOME is set)";
        return 1;
    }
    const std::string entry = DesktopEntry(executable_);
    if (entry.empty()) {
        report = "RegServer failed: the program's path \"" + executable_ +
                 "\" cannot be written into a desktop entry";
        return 1;
    }
    std::error_code code;
    for (const char* folder : {kApplicationsFolder, kPackagesFolder}) {
        fs::create_directories(fs::path(dataHome_) / folder, code);
        if (code) {
            report = "RegServer failed: cannot make " + (fs::path(dataHome_) / folder).string() +
                     ": " + code.message();
            return 1;
        }
    }
    std::string error;
    if (!WriteFileAtomically(mimePackagePath(), desktop::kMimePackage, error) ||
        !WriteFileAtomically(desktopEntryPath(), entry, error)) {
        report = "RegServer failed: " + error;
        return 1;
    }

    std::vector<std::string> ran;
    std::vector<std::string> failed;
    const struct {
        const char* tool;
        std::string folder;
    } updaters[] = {
        {"update-mime-database", (fs::path(dataHome_) / kMimeFolder).string()},
        {"update-desktop-database", (fs::path(dataHome_) / kApplicationsFolder).string()},
    };
    for (const auto& updater : updaters) {
        const int result = RunUpdater(updater.tool, updater.folder);
        if (result > 0)
            ran.push_back(updater.tool);
        else if (result < 0)
            failed.push_back(updater.tool);
    }
    report = "registered " + executable_ + " for " + desktop::kMimeType +
             " (*.onyx2): " + desktopEntryPath() + ", " + mimePackagePath();
    if (!ran.empty())
        report += "; ran " + Joined(ran);
    if (!failed.empty()) {
        report += "; " + Joined(failed) + " failed";
        return 1;
    }
    return 0;
#else
    report = "RegServer is not supported by this build";
    return 1;
#endif
}

int DesktopRegistration::Unregister(std::string& report) const
{
    if (dataHome_.empty()) {
        report = "UnregServer failed: no data folder (neither XDG_DATA_HOME nor HOME is set)";
        return 1;
    }
    std::vector<std::string> removed;
    for (const std::string& path : {desktopEntryPath(), mimePackagePath()}) {
        std::error_code code;
        if (fs::remove(path, code)) {
            removed.push_back(path);
        } else if (code) {
            report = "UnregServer failed: cannot remove " + path + ": " + code.message();
            return 1;
        }
    }
    if (removed.empty()) {
        report = "unregistered: nothing to remove in " + dataHome_;
        return 0;
    }
    std::vector<std::string> failed;
    std::error_code code;
    if (fs::is_directory(fs::path(dataHome_) / kPackagesFolder, code) &&
        RunUpdater("update-mime-database", (fs::path(dataHome_) / kMimeFolder).string()) < 0)
        failed.push_back("update-mime-database");
    if (fs::is_directory(fs::path(dataHome_) / kApplicationsFolder, code) &&
        RunUpdater("update-desktop-database",
                   (fs::path(dataHome_) / kApplicationsFolder).string()) < 0)
        failed.push_back("update-desktop-database");
    report = "unregistered: removed " + Joined(removed);
    if (!failed.empty()) {
        report += "; " + Joined(failed) + " failed";
        return 1;
    }
    return 0;
}

namespace {

int Report(int result, const std::string& report)
{
    std::fprintf(result == 0 ? stdout : stderr, "harbor: %s\n", report.c_str());
    return result;
}

} // namespace

int RegisterProgram()
{
    std::string report;
    const DesktopRegistration registration(DesktopRegistration::UserDataHome(),
                                           platform::ExecutablePath());
    const int result = registration.Register(report);
    return Report(result, report);
}

int UnregisterProgram()
{
    std::string report;
    const DesktopRegistration registration(DesktopRegistration::UserDataHome(),
                                           platform::ExecutablePath());
    const int result = registration.Unregister(report);
    return Report(result, report);
}

} // namespace app
