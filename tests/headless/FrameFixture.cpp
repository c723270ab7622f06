#include "FrameFixture.h"

#include <unistd.h>

#include <cstdlib>
#include <fstream>

#include "workspace/LiveObjects.h"

#ifndef HARBOR_SIM_DIR
#define HARBOR_SIM_DIR ""
#endif
#ifndef HARBOR_TESTLIB_DIR
#define HARBOR_TESTLIB_DIR ""
#endif

namespace headless_test {

std::string SimulatorDirectory()
{
    return HARBOR_SIM_DIR;
}

std::string RecordingLibraryDirectory()
{
    return HARBOR_TESTLIB_DIR;
}

ScratchDirectory::ScratchDirectory()
{
    static int number = 0;
    path_ = std::filesystem::temp_directory_path() /
            ("harbor-headless-" + std::to_string(getpid()) + "-" + std::to_string(++number));
    std::filesystem::remove_all(path_);
    std::filesystem::create_directories(path_);
}

ScratchDirectory::~ScratchDirectory()
{
    std::error_code ignored;
    std::filesystem::remove_all(path_, ignored);
}

std::string ScratchDirectory::Write(const std::string& name, const std::string& bytes) const
{
    const std::filesystem::path file = path_ / name;
    std::ofstream(file, std::ios::binary) << bytes;
    return file.string();
}

namespace {

// The profile reader takes the first section of a name only, so the library directory and
// the memory files go into the test's own PATHS and DEBUG sections when it has them.
std::string MergeSettings(const std::string& extra, const std::string& libraryDirectory)
{
    std::string settings = "\n" + extra + "\n";
    auto addKey = [&settings](const std::string& section, const std::string& line) {
        const std::string header = "\n[" + section + "]\n";
        const std::size_t at = settings.find(header);
        if (at == std::string::npos) {
            settings += header + line + "\n";
        } else {
            settings.insert(at + header.size(), line + "\n");
        }
    };
    addKey("PATHS", "DLL=" + libraryDirectory + "/");
    addKey("DEBUG", "MEMFILES=TRUE");
    return settings;
}

} // namespace

void FrameFixture::Construct(const std::string& extraSettings, const std::string& fileArgument,
                             const std::string& libraryDirectory)
{
    ASSERT_FALSE(libraryDirectory.empty()) << "the library module is not built";
    ::setenv("TESSEL_SIM",
             scratch_.Write("scenario.sim", scenario_.empty() ? kFastScenario : scenario_).c_str(),
             1);
    scratch_.Write("harbor.ini", MergeSettings(extraSettings, libraryDirectory));
    host_ = std::make_unique<ui::HeadlessHost>();
    host_->FixTickCount(500);
    host_->SetListener([this](const ui::HeadlessEvent& event) { events_.push_back(event); });
    std::string commandLine = "\"" + (scratch_.path() / "harbor").string() + "\"";
    if (!fileArgument.empty())
        commandLine += " " + fileArgument;
    dialog_ = std::make_unique<ui::TestClientDialog>(*host_, commandLine.c_str());
}

void FrameFixture::Start(const std::string& extraSettings, const std::string& fileArgument,
                         const std::string& libraryDirectory)
{
    Construct(extraSettings, fileArgument, libraryDirectory);
    if (dialog_)
        ASSERT_TRUE(dialog_->Create());
}

void FrameFixture::Stop()
{
    if (dialog_ && dialog_->handle() != ui::kNoWindow) {
        host_->SendMessage(dialog_->handle(), ui::kMsgCommand, ui::MakeCommand(ui::IdFileExit), 0);
    }
    dialog_.reset();
    host_.reset();
}

void FrameFixture::TearDown()
{
    Stop();
    EXPECT_EQ(workspace::LiveObjectCount(), 0);
}

std::vector<ui::HeadlessEvent> FrameFixture::EventsOf(ui::HeadlessEvent::Kind kind) const
{
    std::vector<ui::HeadlessEvent> result;
    for (const auto& event : events_) {
        if (event.kind == kind)
            result.push_back(event);
    }
    return result;
}

} // namespace headless_test
