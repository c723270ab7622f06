#include "troubleshooter/HeadlessHelpViewer.h"

#include <cstring>
#include <utility>

HeadlessHelpViewer::HeadlessHelpViewer(ui::WindowHost& host, Printer print,
                                       std::string helpDirectory)
    : host_(host), print_(std::move(print)), helpDirectory_(std::move(helpDirectory))
{
}

void HeadlessHelpViewer::Print(const std::string& line) const
{
    if (print_) {
        print_("[help] " + line);
    }
}

int HeadlessHelpViewer::OpenFile(ui::WindowHandle owner, const char* file)
{
    if (file == nullptr || file[0] == '\0') {
        return 0;
    }
    if (open_ && owner != owner_) {
        // Another run takes the viewer over; the earlier one ends when the viewer closes.
        Command(kCloseCommand, 0);
        open_ = false;
    }
    const std::string path =
        std::strchr(file, '/') != nullptr ? std::string(file) : helpDirectory_ + file;
    if (!document_.Load(path)) {
        Print("cannot open " + path);
        return 0;
    }
    owner_ = owner;
    open_ = true;
    closeSent_ = false;
    currentTopic_.clear();
    Print("opened " + std::string(file));
    return 1;
}

int HeadlessHelpViewer::RunMacro(ui::WindowHandle owner, const char* file, const char* macro)
{
    std::string topic;
    if (!open_ || owner != owner_ || !HelpDocument::ParseJumpMacro(macro, nullptr, &topic)) {
        return 0;
    }
    return ShowTopic(topic) ? 1 : 0;
}

bool HeadlessHelpViewer::ShowTopic(const std::string& id)
{
    if (!open_) {
        return false;
    }
    if (!document_.HasTopic(id)) {
        Print("no topic " + id);
        return false;
    }
    currentTopic_ = id;
    Print("topic " + id);
    for (const std::string& line : document_.TopicText(id)) {
        Print("  " + line);
    }
    return true;
}

int HeadlessHelpViewer::Quit(ui::WindowHandle owner, const char* file)
{
    if (open_ && owner == owner_) {
        open_ = false;
        currentTopic_.clear();
        Print("closed");
    }
    return 1;
}

bool HeadlessHelpViewer::Command(int id, std::int32_t argument)
{
    if (!open_) {
        return false;
    }
    if (id == kCloseCommand) {
        closeSent_ = true;
    }
    return host_.PostMessage(owner_, ui::kMsgCommand, ui::MakeCommand(id),
                             static_cast<ui::LParam>(argument));
}

void HeadlessHelpViewer::InputEnded()
{
    if (open_ && !closeSent_) {
        Command(kCloseCommand, 0);
    }
}
