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

namespace commands_test {

namespace {

// Long enough for any report of the simulator with no link time, even under the sanitizers;
// reaching it means a report never came.
constexpr int kHangMs = 20000;

int NextDirectoryNumber()
{
    static int number = 0;
    return ++number;
}

} // namespace

std::string SoundProgram(int count, int brickType)
{
    std::string text = "tobj 1 " + std::to_string(brickType) + " program\ntask 0\n";
    for (int i = 0; i < count; ++i)
        text += "cmd 20 04\n";
    text += "end\n";
    return text;
}

void DialogFixture::SetUp()
{
    dir_ = std::filesystem::temp_directory_path() / ("harbor-commands-" + std::to_string(getpid()) +
                                                     "-" + std::to_string(NextDirectoryNumber()));
    std::filesystem::remove_all(dir_);
    std::filesystem::create_directories(dir_);
    ASSERT_NE(std::string(HARBOR_SIM_DIR), "") << "the simulated library is not built";
}

void DialogFixture::TearDown()
{
    Stop();
    // Every file the commands opened, result files posted by the library included, was given
    // back by the time the session is gone.
    EXPECT_EQ(workspace::LiveObjectCount(), 0);
    std::error_code ignored;
    std::filesystem::remove_all(dir_, ignored);
}

void DialogFixture::Start(const std::string& scenario, const std::string& ports,
                          const std::string& options, const std::string& fileArgument)
{
    const std::string scenarioPath = WriteFile("scenario.txt", scenario);
    ::setenv("TESSEL_SIM", scenarioPath.c_str(), 1);

    std::string settings = "[PATHS]\nDLL=" + std::string(HARBOR_SIM_DIR) + "/\n";
    settings += "[DEBUG]\nMEMFILES=TRUE\n";
    settings += "[PORTS]\n" + ports + "\n";
    settings += "[OPTIONS]\n" + options + "\n";
    WriteFile("harbor.ini", settings);

    host_ = std::make_unique<ui::HeadlessHost>();
    host_->FixTickCount(1000);
    host_->SetListener([this](const ui::HeadlessEvent& event) {
        events_.push_back(event);
        if (extra_)
            extra_(event);
    });

    std::string commandLine = "\"" + (dir_ / "harbor.exe").string() + "\"";
    if (!fileArgument.empty())
        commandLine += " " + fileArgument;
    dialog_ = std::make_unique<ui::TestClientDialog>(*host_, commandLine.c_str());
    ASSERT_NE(dialog_->session(), nullptr);
    ASSERT_TRUE(dialog_->session()->libraryLoaded()) << "Tessel.dll not found in " HARBOR_SIM_DIR;
    ASSERT_TRUE(dialog_->Create());
}

void DialogFixture::Stop(bool settle)
{
    if (dialog_) {
        if (settle && dialog_->handle() != ui::kNoWindow)
            Settle();
        dialog_.reset();
    }
    extra_ = nullptr;
    host_.reset();
}

void DialogFixture::Settle()
{
    Pump([this] { return dialog_->operationsInFlight() == 0 && host_->QueuedMessages() == 0; },
         "a download or execution never reported back");
}

void DialogFixture::WaitForStatuses(std::size_t count, bool (*accept)(const std::string&))
{
    Pump(
        [this, count, accept] {
            std::size_t seen = 0;
            for (const std::string& status : Statuses())
                seen += accept(status) ? 1 : 0;
            return seen >= count;
        },
        "not all expected texts arrived");
}

void DialogFixture::Pump(const std::function<bool()>& done, const char* hang)
{
    for (;;) {
        host_->DispatchPending();
        if (done())
            return;
        if (!host_->WaitForMessage(kHangMs)) {
            ADD_FAILURE() << hang;
            return;
        }
    }
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

std::vector<ui::HeadlessEvent> DialogFixture::EventsOf(ui::HeadlessEvent::Kind kind) const
{
    std::vector<ui::HeadlessEvent> found;
    for (const ui::HeadlessEvent& event : events_) {
        if (event.kind == kind)
            found.push_back(event);
    }
    return found;
}

std::vector<std::string> DialogFixture::Offers() const
{
    std::vector<std::string> texts;
    for (const ui::HeadlessEvent& event : EventsOf(ui::HeadlessEvent::Kind::Question)) {
        if (event.caption == "Diagnostics")
            texts.push_back(event.text);
    }
    return texts;
}

std::string DialogFixture::WriteFile(const std::string& name, const std::string& bytes)
{
    const std::filesystem::path path = dir_ / name;
    std::ofstream out(path, std::ios::binary | std::ios::trunc);
    out.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
    return path.string();
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
