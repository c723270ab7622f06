#include "DialogFixture.h"

#include <unistd.h>

#include <cstdlib>
#include <fstream>
#include <sstream>

#include "session/BrickSession.h"
#include "workspace/LiveObjects.h"

#ifndef HARBOR_SIM_DIR
#define HARBOR_SIM_DIR ""
#endif
#ifndef HARBOR_TESTLIB_DIR
#define HARBOR_TESTLIB_DIR ""
#endif

namespace commands_test {

std::string SimulatorDirectory()
{
    return HARBOR_SIM_DIR;
}

std::string RecordingLibraryDirectory()
{
    return HARBOR_TESTLIB_DIR;
}

std::string SoundProgram(int count)
{
    std::string text = "tobj 1 6 program\ntask 0\n";
    for (int i = 0; i < count; ++i)
        text += "cmd 20 04\n";
    return text + "end\n";
}

namespace {

// Long enough for any report of the simulator with no link time, even under the sanitizers;
// reaching it means a report never came.
constexpr int kHangMs = 20000;

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

DialogFixture::DialogFixture()
{
    static int number = 0;
    dir_ = std::filesystem::temp_directory_path() /
           ("harbor-frame-" + std::to_string(getpid()) + "-" + std::to_string(++number));
    std::filesystem::remove_all(dir_);
    std::filesystem::create_directories(dir_);
}

DialogFixture::~DialogFixture()
{
    std::error_code ignored;
    std::filesystem::remove_all(dir_, ignored);
}

void DialogFixture::Construct(const std::string& settings, const std::string& fileArgument,
                              const std::string& library)
{
    ASSERT_FALSE(library.empty()) << "the library module is not built";
    ::setenv("TESSEL_SIM", WriteFile("scenario.sim", scenario_).c_str(), 1);
    WriteFile("harbor.ini", MergeSettings(settings, library));
    host_ = std::make_unique<ui::HeadlessHost>();
    host_->FixTickCount(500);
    host_->SetListener([this](const ui::HeadlessEvent& event) {
        events_.push_back(event);
        if (extra_)
            extra_(event);
    });
    std::string commandLine = "\"" + (dir_ / "harbor").string() + "\"";
    if (!fileArgument.empty())
        commandLine += " " + fileArgument;
    dialog_ = std::make_unique<ui::TestClientDialog>(*host_, commandLine.c_str());
}

void DialogFixture::Open(const std::string& settings, const std::string& fileArgument,
                         const std::string& library)
{
    ASSERT_NO_FATAL_FAILURE(Construct(settings, fileArgument, library));
    ASSERT_TRUE(dialog_->session()->libraryLoaded()) << "no library in " << library;
    ASSERT_TRUE(dialog_->Create());
}

void DialogFixture::StartOnCom1(const std::string& brickLines, const std::string& portLines,
                                const std::string& options)
{
    ASSERT_NO_FATAL_FAILURE(
        Start(std::string(kFastLink) + "[brick b1]\n" + brickLines + "[port COM1]\n" + portLines,
              "Serial=COM1", options));
    ASSERT_NE(dialog_->brickHandle(), 0);
    ClearEvents();
}

void DialogFixture::Stop(bool settle)
{
    if (dialog_ && dialog_->handle() != ui::kNoWindow) {
        if (settle)
            Settle();
        host_->SendMessage(dialog_->handle(), ui::kMsgCommand, ui::MakeCommand(ui::IdFileExit), 0);
    }
    extra_ = nullptr;
    dialog_.reset();
    host_.reset();
}

void DialogFixture::TearDown()
{
    Stop(settleOnTearDown_);
    // Every file the commands opened, result files posted by the library included, was given
    // back by the time the session is gone.
    EXPECT_EQ(workspace::LiveObjectCount(), 0);
}

void DialogFixture::Settle()
{
    PumpUntil(
        [this] { return dialog_->operationsInFlight() == 0 && host_->QueuedMessages() == 0; });
}

void DialogFixture::PumpUntil(const std::function<bool()>& done)
{
    for (;;) {
        host_->DispatchPending();
        if (done())
            return;
        if (!host_->WaitForMessage(kHangMs)) {
            ADD_FAILURE() << "a report expected from the library never came";
            return;
        }
    }
}

std::vector<ui::HeadlessEvent> DialogFixture::EventsOf(ui::HeadlessEvent::Kind kind) const
{
    std::vector<ui::HeadlessEvent> result;
    for (const auto& event : events_) {
        if (event.kind == kind)
            result.push_back(event);
    }
    return result;
}

std::vector<std::string> DialogFixture::Statuses() const
{
    std::vector<std::string> texts;
    for (const ui::HeadlessEvent& event : EventsOf(ui::HeadlessEvent::Kind::Status))
        texts.push_back(event.text);
    return texts;
}

std::string DialogFixture::LastStatus() const
{
    const std::vector<std::string> texts = Statuses();
    return texts.empty() ? std::string("<no status shown>") : texts.back();
}

std::vector<std::string> DialogFixture::Questions(const std::string& caption) const
{
    std::vector<std::string> texts;
    for (const ui::HeadlessEvent& event : EventsOf(ui::HeadlessEvent::Kind::Question)) {
        if (event.caption == caption)
            texts.push_back(event.text);
    }
    return texts;
}

std::string DialogFixture::WriteFile(const std::string& name, const std::string& bytes) const
{
    const std::filesystem::path file = dir_ / name;
    std::ofstream(file, std::ios::binary | std::ios::trunc) << bytes;
    return file.string();
}

std::string DialogFixture::ReadFile(const std::filesystem::path& path)
{
    std::ifstream in(path, std::ios::binary);
    std::ostringstream bytes;
    bytes << in.rdbuf();
    return bytes.str();
}

std::int16_t DialogFixture::Property(std::int16_t property)
{
    std::int16_t value = -1;
    char text[tessel::kPathSize] = {};
    dialog_->session()->Get(dialog_->brickHandle(), property, &value, text, sizeof text);
    return value;
}

} // namespace commands_test
