// The help link of a Trouble Shooter run: its window, the outcome topics and the help
// command protocol.
#include "troubleshooter/HelpLink.h"

#include <cstdio>

#include "troubleshooter/HelpViewer.h"
#include "troubleshooter/TroubleShooter.h"

namespace {

struct TopicRange {
    int first;
    int last;
    const char* topic;
};

// Outcome numbers of the diagnosis and the help topics that explain them.
constexpr TopicRange kOutcomeTopics[] = {
    {1001, 1001, "IR_Transmitter_not_found"},
    {1002, 1002, "IR_Transmitter_or_cable_not_connected"},
    {1003, 1003, "IR_Transmitter_not_working"},
    {1004, 1004, "Onyx_not_alive"},
    {1005, 1005, "UnlockPBrick_failed"},
    {1006, 1006, "No_Onyx_firmware"},
    {1007, 1007, "Not_an_Onyx"},
    {1008, 1008, "Onyx_battery_voltage_too_low"},
    {1009, 1009, "Onyx_memory_full"},
    {1010, 1012, "Download_interrupted"},
    {1101, 1101, "USB_not_installed"},
    {1102, 1102, "USB_Transmitter_not_installed"},
    {1103, 1103, "USB_Transmitter_not_installed_properly"},
    {1104, 1104, "Failed_to_set_IR_Transmitter_to_long_range"},
    {1105, 1105, "USB_Transmitter_unplugged"},
    {1201, 1201, "COM_port_not_free"},
    {1202, 1202, "COM_port_not_working"},
    {1203, 1203, "COM_port_invalid"},
    {1204, 1204, "COM_port_used_by_serial_mouse"},
    {1301, 1309, "Error_in_program"},
    {1401, 1410, "Missing_system_component"},
};

std::int16_t Low16(ui::LParam argument)
{
    return static_cast<std::int16_t>(static_cast<std::uint16_t>(argument & 0xFFFF));
}

} // namespace

// The hidden window's object: hands every command message to the link.
class HelpLink::HelpWindow final : public ui::WindowObject {
public:
    explicit HelpWindow(HelpLink& link) : link_(link) {}

    bool OnMessage(ui::Message message, ui::WParam wParam, ui::LParam lParam,
                   ui::LResult& result) override
    {
        if (message != ui::kMsgCommand) {
            return false;
        }
        result = link_.HandleHelpCommand(ui::CommandId(wParam), lParam);
        return true;
    }

private:
    HelpLink& link_;
};

HelpLink::HelpLink(TroubleShooter* shooter, ui::WindowHost& host, HelpViewer* viewer)
    : shooter_(shooter), window_(std::make_unique<HelpWindow>(*this)), host_(host), viewer_(viewer)
{
    host_.CreatePlainWindow(kWindowClass, window_.get());
}

HelpLink::~HelpLink()
{
    if (helpOpen_) {
        CloseHelp();
    }
    if (window_->handle() != ui::kNoWindow) {
        host_.DestroyWindow(window_->handle());
    }
}

ui::WindowHandle HelpLink::window() const
{
    return window_->handle();
}

const char* HelpLink::TopicOf(int outcome)
{
    for (const TopicRange& range : kOutcomeTopics) {
        if (outcome >= range.first && outcome <= range.last) {
            return range.topic;
        }
    }
    return nullptr;
}

int HelpLink::WinHelp(unsigned command, const char* data)
{
    if (viewer_ == nullptr) {
        return 0;
    }
    const ui::WindowHandle owner = window();
    switch (command) {
    case kHelpForceFile:
        return viewer_->OpenFile(owner, kHelpFile);
    case kHelpCommand:
        return viewer_->RunMacro(owner, kHelpFile, data);
    case kHelpQuit:
        return viewer_->Quit(owner, kHelpFile);
    default:
        return 0;
    }
}

int HelpLink::ShowTopic(const char* topic)
{
    // Topic ids are short; a longer one would be cut at the macro's bound.
    char macro[kMacroSize];
    std::snprintf(macro, sizeof macro, kJumpMacro, topic);
    return WinHelp(kHelpCommand, macro);
}

void HelpLink::CloseHelp()
{
    WinHelp(kHelpQuit, nullptr);
    helpOpen_ = false;
}

bool HelpLink::ShowOutcome(int outcome)
{
    // Without its window the help's commands, its close command included, could reach
    // nothing, and the run would wait for ever: such a help is never opened.
    if (!helpOpen_ && window() != ui::kNoWindow && WinHelp(kHelpForceFile, nullptr) == 1) {
        helpOpen_ = true;
    }
    const char* topic = TopicOf(outcome);
    if (topic == nullptr) {
        return false;
    }
    ShowTopic(topic);
    return true;
}

bool HelpLink::PumpMessage()
{
    if (!host_.PumpMessage()) {
        // The program is ending: the nested loop must not hold it, and the help's commands
        // could no longer reach a dialog.
        if (helpOpen_) {
            CloseHelp();
        }
    }
    return helpOpen_;
}

ui::LResult HelpLink::HandleHelpCommand(int id, ui::LParam argument)
{
    if (id == CmdClose) {
        CloseHelp();
        return 0;
    }
    if (shooter_ == nullptr) {
        return 0;
    }
    std::int32_t result = 0;
    const char* successTopic = nullptr;
    switch (id) {
    case CmdFindTower:
    case CmdFindUsbTower:
        successTopic = kFoundTower;
        if (shooter_->RepairUsbTower(shooter_->portType())) {
            // The tower answers again; the help file's own argument stands as the result.
            result = static_cast<std::int32_t>(argument);
        } else {
            result = id == CmdFindTower ? shooter_->FindTower() : shooter_->FindUsbTower();
        }
        break;
    case CmdTestTower:
        successTopic = kTowerOk;
        result = shooter_->TestTower();
        break;
    case CmdTestBrick:
        successTopic = kBrickOk;
        result = shooter_->TestBrick();
        break;
    case CmdTestComPort:
        successTopic = kFoundTower;
        result = shooter_->TestSerialPort(Low16(argument));
        break;
    case CmdSetRange:
        successTopic = kRangeSet;
        result = shooter_->SetUsbRange(Low16(argument));
        break;
    case CmdFindComPort:
        successTopic = kFoundComPort;
        result = shooter_->FindComPort();
        break;
    case CmdSetPortType:
        shooter_->setPortType(Low16(argument));
        return 0;
    default:
        return 0;
    }
    if (result >= 0) {
        ShowTopic(successTopic);
    } else {
        shooter_->Jump(result);
    }
    return 0;
}
