#include "HeadlessSession.h"

#include <unistd.h>

#include <cstdlib>
#include <deque>
#include <fstream>
#include <sstream>
#include <streambuf>

#include "ui/TestClientDialog.h"
#include "ui/headless/HeadlessHost.h"
#include "ui/headless/HeadlessRunner.h"

#ifndef HARBOR_BIN_DIR
#define HARBOR_BIN_DIR ""
#endif

namespace reliability {

namespace {

std::string ReadAll(const std::filesystem::path& path)
{
    std::ifstream in(path, std::ios::binary);
    std::ostringstream text;
    text << in.rdbuf();
    return text.str();
}

// The build's settings, with the library folder replaced and the given lines placed first in
// their sections.
std::string Settings(const SessionSetup& setup)
{
    std::string text = ReadAll(std::filesystem::path(BinDir()) / "harbor.ini");
    std::istringstream in(text);
    std::string out;
    std::string line;
    while (std::getline(in, line)) {
        if (line.rfind("DLL=", 0) == 0) {
            line = "DLL=" + (setup.libraryDir.empty() ? BinDir() : setup.libraryDir) + "/";
        }
        out += line + "\n";
        if (line == "[PORTS]") {
            out += setup.ports;
        } else if (line == "[OPTIONS]") {
            out += setup.options;
        }
    }
    return out;
}

// Collects printed lines; with a limit, keeps the last ones and those around failures.
class LineSink : public std::streambuf {
public:
    explicit LineSink(std::size_t keep) : keep_(keep) {}

    std::vector<std::string> lines() const
    {
        std::vector<std::string> all(failures_.begin(), failures_.end());
        all.insert(all.end(), recent_.begin(), recent_.end());
        if (!current_.empty()) {
            all.push_back(current_);
        }
        return all;
    }

protected:
    int_type overflow(int_type c) override
    {
        if (traits_type::eq_int_type(c, traits_type::eof())) {
            return traits_type::not_eof(c);
        }
        if (traits_type::to_char_type(c) != '\n') {
            current_ += traits_type::to_char_type(c);
            return c;
        }
        if (keep_ > 0 && IsFailure(current_) && failures_.size() < kFailureLines) {
            // The command and what led to it are among the recent lines.
            const std::size_t from = recent_.size() > 4 ? recent_.size() - 4 : 0;
            failures_.insert(failures_.end(), recent_.begin() + static_cast<long>(from),
                             recent_.end());
            failures_.push_back(current_);
        }
        recent_.push_back(current_);
        if (keep_ > 0 && recent_.size() > keep_) {
            recent_.pop_front();
        }
        current_.clear();
        return c;
    }

private:
    static constexpr std::size_t kFailureLines = 100;

    static bool IsFailure(const std::string& line)
    {
        for (const char* prefix : {"question:", "refused:", "wait:", "expect:"}) {
            if (line.rfind(prefix, 0) == 0) {
                return true;
            }
        }
        return false;
    }

    std::size_t keep_;
    std::string current_;
    std::deque<std::string> recent_;
    std::vector<std::string> failures_;
};

} // namespace

std::string BinDir()
{
    return HARBOR_BIN_DIR;
}

std::vector<std::string> Transcript::of(const std::string& command) const
{
    std::vector<std::string> found;
    const std::string marker = "> " + command;
    for (std::size_t i = 0; i < lines.size(); ++i) {
        if (lines[i] != marker) {
            continue;
        }
        found.clear();
        for (std::size_t j = i; j < lines.size(); ++j) {
            if (j > i && lines[j].rfind("> ", 0) == 0) {
                break;
            }
            found.push_back(lines[j]);
        }
    }
    return found;
}

std::vector<std::string> Transcript::from(const std::string& command) const
{
    const std::string marker = "> " + command;
    for (std::size_t i = lines.size(); i-- > 0;) {
        if (lines[i] == marker) {
            return std::vector<std::string>(lines.begin() + static_cast<long>(i), lines.end());
        }
    }
    return {};
}

std::vector<std::string> Transcript::Statuses(const std::vector<std::string>& lines)
{
    std::vector<std::string> texts;
    for (const std::string& line : lines) {
        if (line.rfind("status: ", 0) == 0) {
            texts.push_back(line.substr(8));
        }
    }
    return texts;
}

bool Transcript::Offered(const std::vector<std::string>& lines)
{
    for (const std::string& line : lines) {
        if (line.rfind("question: ", 0) == 0 &&
            line.find("Use Trouble Shooter?") != std::string::npos) {
            return true;
        }
    }
    return false;
}

std::string Transcript::text() const
{
    std::string all;
    for (const std::string& line : lines) {
        all += line + "\n";
    }
    return all;
}

ScratchDir::ScratchDir(const std::string& tag)
{
    static int number = 0;
    path_ = std::filesystem::temp_directory_path() /
            ("harbor-" + tag + "-" + std::to_string(getpid()) + "-" + std::to_string(++number));
    std::filesystem::remove_all(path_);
    std::filesystem::create_directories(path_);
}

ScratchDir::~ScratchDir()
{
    std::error_code ignored;
    std::filesystem::remove_all(path_, ignored);
}

std::string ScratchDir::write(const std::string& name, const std::string& bytes) const
{
    const std::filesystem::path file = path_ / name;
    std::ofstream out(file, std::ios::binary | std::ios::trunc);
    out.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
    return file.string();
}

Transcript RunHeadless(const ScratchDir& dir, const SessionSetup& setup, std::istream& script)
{
    if (setup.scenario.empty()) {
        ::unsetenv("TESSEL_SIM");
    } else {
        ::setenv("TESSEL_SIM", dir.write("scenario.sim", setup.scenario).c_str(), 1);
    }
    dir.write("harbor.ini", Settings(setup));

    ui::HeadlessOptions options;
    options.defaultAnswer = setup.answerYes;
    options.waitTimeoutMs = setup.timeoutMs;
    options.fixedTicks = true;
    options.helpDirectory = BinDir() + "/help/";

    LineSink sink(setup.keepLines);
    std::ostream out(&sink);
    std::ostringstream err;
    Transcript transcript;
    {
        ui::HeadlessHost host;
        const std::string commandLine = "\"" + (dir.path() / "harbor.exe").string() + "\"";
        ui::TestClientDialog dialog(host, commandLine.c_str());
        ui::HeadlessRunner runner(host, dialog, script, out, err, options);
        transcript.exitStatus = runner.Run();
    }
    transcript.lines = sink.lines();
    std::istringstream printed(err.str());
    std::string line;
    while (std::getline(printed, line)) {
        transcript.lines.push_back(line);
    }
    return transcript;
}

Transcript RunHeadless(const ScratchDir& dir, const SessionSetup& setup, const std::string& script)
{
    std::istringstream in(script);
    return RunHeadless(dir, setup, in);
}

} // namespace reliability
