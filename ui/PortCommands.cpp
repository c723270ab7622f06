// Port commands: Open, Close, Test, Statistics and the infrared range, and the brick type
// table that names the models the library reports.
#include "ui/TestClientDialog.h"

#include <cstdio>
#include <cstring>

#include "errors/ErrorText.h"
#include "session/BrickSession.h"

namespace ui {

namespace {

// The search offers no more ports than this; a question per port is already a lot.
constexpr int kMaxPorts = 10;

// A successful quiet repair runs Test again; a tower that keeps failing after being
// repaired this often is not going to be fixed quietly, so the user is asked instead.
constexpr int kMaxQuietRepairs = 3;

// Names of the brick types 0 to 7 as tslFindBrick reports them.
constexpr const char* kBrickTypeNames[] = {
    "no brick",   "unknown brick", "Helmsman brick", "Onyx brick, no firmware",
    "Onyx brick", "Rover brick",   "Onyx2 brick",    "MiniRover brick",
};
constexpr int kBrickTypeCount = static_cast<int>(sizeof kBrickTypeNames / sizeof *kBrickTypeNames);

const tessel::Long kNoLibrary = static_cast<tessel::Long>(tessel::kLinkFailed);

} // namespace

void TestClientDialog::OnOpenPort()
{
    // At most one handle: the old one goes first, also when the search finds nothing.
    if (brickHandle_ != 0) {
        if (session_ != nullptr)
            session_->Destroy(brickHandle_);
        brickHandle_ = 0;
    }

    char ports[kMaxPorts][kPathSize] = {};
    int found = 0;
    // The search continues from the name the last call returned; the first call starts empty.
    char query[kPathSize] = {};
    tessel::Long result = kNoLibrary;
    while (session_ != nullptr && found < kMaxPorts) {
        result = session_->FindPort(query, sizeof query);
        if (result < 0)
            break;
        // A library that fills the whole buffer leaves no terminator; cut to the buffer.
        query[kPathSize - 1] = '\0';
        std::snprintf(ports[found], kPathSize, "%s", query);
        ++found;
    }
    if (found == 0) {
        ShowError(result, nullptr);
        OfferTroubleShooter(result);
        return;
    }

    int chosen = 0;
    if (found > 1) {
        chosen = -1;
        for (int i = 0; i < found && chosen < 0; ++i) {
            if (host_.AskYesNo(kNoWindow, ports[i], "Select Port"))
                chosen = i;
        }
        if (chosen < 0) {
            ShowFailure("No port selected");
            return;
        }
    }

    // The trouble shooter run above may have pumped a destroy of the window.
    const tessel::Long handle = session_ != nullptr ? session_->Create(ports[chosen]) : 0;
    if (handle == 0) {
        ShowFailure("Create failed");
        return;
    }
    brickHandle_ = handle;
    OnPortOpened(ports[chosen]);
}

bool TestClientDialog::OnPortOpened(const char* portName)
{
    if (session_ == nullptr || brickHandle_ == 0)
        return false;
    const WindowHandle window = handle();

    tessel::Short kind = 0;
    if (session_->Get(brickHandle_, tessel::PropPort, &kind, nullptr, 0) >= 0) {
        portType_ = kind;
        // Only a USB tower has a transmitter whose range can be set.
        const bool usb = portType_ == tessel::PortUsb;
        host_.EnableControl(window, IdRangeShort, usb);
        host_.EnableControl(window, IdRangeMedium, usb);
        tessel::Short longRange = 0;
        if (session_->Get(brickHandle_, tessel::PropLongRange, &longRange, nullptr, 0) >= 0 &&
            longRange == tessel::kLongRangeAvailable) {
            host_.EnableControl(window, IdRangeLong, usb);
        }
        tessel::Short range = 0;
        if (session_->Get(brickHandle_, tessel::PropRange, &range, nullptr, 0) >= 0) {
            switch (range) {
            case tessel::RangeShort:
                host_.SetCheck(window, IdRangeShort, true);
                break;
            case tessel::RangeMedium:
                host_.SetCheck(window, IdRangeMedium, true);
                break;
            case tessel::RangeLong:
                host_.SetCheck(window, IdRangeLong, true);
                break;
            default:
                break;
            }
        }
    }

    if (session_->Set(brickHandle_, tessel::PropCollectStats, 1) < 0) {
        ShowFailure("Collect statistics failed");
        return false;
    }

    char name[kBrickNameSize];
    if (DetectBrick(name) != tessel::BrickNone) {
        ShowStatusF("Opened %s, %s", portName, name);
        return true;
    }
    // Nobody answered: translations follow the Brick list until a brick is found.
    session_->Set(brickHandle_, tessel::PropBrickType, SelectedBrickType());
    ShowFailureF("Opened %s, no brick detected", portName);
    return false;
}

tessel::Short TestClientDialog::DetectBrick(char* name)
{
    name[0] = '\0';
    if (session_ == nullptr)
        return tessel::BrickNone;
    tessel::Short type = tessel::BrickNone;
    tessel::Long extra = 0;
    if (session_->FindBrick(brickHandle_, &type, &extra) < 0)
        return tessel::BrickNone;

    if (type >= 0 && type < kBrickTypeCount)
        std::snprintf(name, kBrickNameSize, "%s", kBrickTypeNames[type]);
    else
        std::snprintf(name, kBrickNameSize, "unknown brick type %d", type);

    // Only the two translation targets follow the brick that answered.
    if (type == tessel::BrickRover || type == tessel::BrickOnyx2) {
        host_.ListSelect(handle(), IdBrickList,
                         type == tessel::BrickRover ? BrickListRover : BrickListOnyx2);
        session_->Set(brickHandle_, tessel::PropBrickType, type);
    }
    return type;
}

void TestClientDialog::OnClosePort()
{
    if (brickHandle_ == 0) {
        ShowStatus("Not open");
        return;
    }
    if (session_ != nullptr)
        session_->Destroy(brickHandle_);
    brickHandle_ = 0;
    ShowStatus("Closed");
}

void TestClientDialog::OnTest()
{
    // Works on the handle as it is, 0 included: the library's answer decides.
    for (int repairs = 0;; ++repairs) {
        char text[kStatusSize] = {};
        const tessel::Long status =
            session_ != nullptr
                ? session_->Status(brickHandle_, tessel::StatusBrick, text, sizeof text)
                : tessel::kStatusNoLibrary;
        text[kStatusSize - 1] = '\0';

        if (status == tessel::kBrickAnswers) {
            // Rover is assumed when the type cannot be read.
            tessel::Short type = tessel::BrickRover;
            char typeName[tessel::kBrickNameSize] = {};
            session_->Get(brickHandle_, tessel::PropBrickType, &type, typeName, sizeof typeName);
            const tessel::Long code = type == tessel::BrickRover
                                          ? RunCommand("sound 25", tessel::BrickRover)
                                          : RunCommand("sound 4", type);
            if (code >= 0) {
                ShowStatus("Tested OK");
            } else {
                ShowError(code, nullptr);
                OfferTroubleShooter(code);
            }
            return;
        }

        if (status == tessel::kBrickTypeChanged) {
            char name[kBrickNameSize];
            if (DetectBrick(name) != tessel::BrickNone)
                ShowStatusF("Brick type changed to %s", name);
            else
                ShowFailure("No brick");
            return;
        }

        if (repairs < kMaxQuietRepairs && QuietRepair(status))
            continue;

        // A library that gives no text (or none at all) still leaves the user a reason.
        if (text[0] == '\0') {
            std::snprintf(text, sizeof text, "%s", GetErrorText(StatusToError(status), nullptr));
        }
        ShowFailure(text);
        OfferTroubleShooterForStatus(status, text);
        return;
    }
}

void TestClientDialog::OnStatistics()
{
    if (!PortReady())
        return;
    char text[kStatusSize] = {};
    tessel::Short value = 0;
    if (session_->Get(brickHandle_, tessel::PropStatistics, &value, text, sizeof text) < 0) {
        ShowFailure("No statistics");
        return;
    }
    text[kStatusSize - 1] = '\0';
    ShowStatusF("Statistics: %s", text);
}

void TestClientDialog::OnRange(tessel::Short range)
{
    if (brickHandle_ == 0 || session_ == nullptr)
        return;
    const tessel::Long code = session_->Set(brickHandle_, tessel::PropRange, range);
    if (code < 0) {
        ShowError(code, nullptr);
        OfferTroubleShooter(code);
        return;
    }
    switch (range) {
    case tessel::RangeShort:
        ShowStatus("Short range");
        break;
    case tessel::RangeMedium:
        ShowStatus("Medium range");
        break;
    default:
        ShowStatus("Long range");
        break;
    }
}

} // namespace ui
