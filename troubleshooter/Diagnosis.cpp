// The diagnosis of a packed code into an outcome, and the tests the help topics ask for.
#include <cstdio>
#include <cstring>

#include "errors/ErrorText.h"
#include "tessel/ErrorValue.h"
#include "troubleshooter/BrickCalls.h"
#include "troubleshooter/OutcomeView.h"
#include "troubleshooter/TroubleShooter.h"

namespace {

struct OutcomeEntry {
    std::uint32_t key; // code field, or whole value for the Wisp table
    int outcome;
};

// Brick library (facility 5), module 1: the driver, by code field.
constexpr OutcomeEntry kDriverOutcomes[] = {
    {1, 1001},   {2, 1004},   {3, 1007},   {11, 1003},  {14, 1009},  {15, 1010},  {17, 1011},
    {19, 1104},  {21, 1012},  {33, 1002},  {34, 1006},  {35, 1005},  {36, 1008},  {64, 1401},
    {69, 1402},  {80, 1201},  {81, 1202},  {82, 1203},  {83, 1204},  {113, 1101}, {114, 1101},
    {115, 1103}, {116, 1105}, {117, 1103}, {118, 1103}, {119, 1103},
};

// Module 2: the compiler, by code field. Programs too large or too complex for the brick.
constexpr OutcomeEntry kCompilerOutcomes[] = {
    {2, 1301},  {24, 1302}, {27, 1303}, {31, 1304}, {26, 1305},
    {33, 1306}, {37, 1307}, {42, 1308}, {47, 1309},
};

// Module 3: the library's own layer, by code field. Code 82 ("no more items found") depends
// on the port type and is decided in OutcomeOf.
constexpr OutcomeEntry kLibraryOutcomes[] = {
    {65, 1403}, {66, 1404}, {67, 1405}, {68, 1406}, {69, 1407}, {70, 1408}, {71, 1409}, {72, 1410},
};
constexpr std::uint32_t kLibraryNoMoreItems = 82;

// Facility 256, the communication stack, by whole value.
constexpr OutcomeEntry kWispOutcomes[] = {
    {0xE1000104u, 1002}, // no more items or devices could be found
    {0xE1000204u, 1004}, // retry count exceeded
};

template <std::size_t N> int Lookup(const OutcomeEntry (&table)[N], std::uint32_t key)
{
    for (const OutcomeEntry& entry : table) {
        if (entry.key == key) {
            return entry.outcome;
        }
    }
    return 0;
}

constexpr int kNameSize = 260;
constexpr int kLabelSize = 512;
constexpr tessel::Short kAssumedBrickType = tessel::BrickOnyx2;

} // namespace

int TroubleShooter::OutcomeOf(std::int32_t error, std::int16_t portType, const char** label)
{
    const ErrorValue value(static_cast<std::uint32_t>(error));
    const char* unlisted = "Jump facility";
    int outcome = 0;
    if (value.facility() == 5) {
        switch (value.module()) {
        case 1:
            unlisted = "Jump Brick";
            outcome = Lookup(kDriverOutcomes, value.code());
            break;
        case 2:
            unlisted = "Jump Script";
            outcome = Lookup(kCompilerOutcomes, value.code());
            break;
        case 3:
            unlisted = "Jump Tessel";
            outcome = value.code() == kLibraryNoMoreItems ? (portType == 3 ? 1102 : 1002)
                                                          : Lookup(kLibraryOutcomes, value.code());
            break;
        default:
            unlisted = "Jump Tessel Module";
            break;
        }
    } else if (value.facility() == 256) {
        unlisted = "Jump Wisp";
        outcome = Lookup(kWispOutcomes, static_cast<std::uint32_t>(error));
    }
    if (label != nullptr) {
        *label = unlisted;
    }
    return outcome;
}

bool TroubleShooter::Jump(std::int32_t error)
{
    if (view_ == nullptr) {
        return false;
    }
    const char* label = nullptr;
    const int outcome = OutcomeOf(error, portType_, &label);
    if (outcome == 0) {
        LogStep(label, error);
        return false;
    }
    return view_->ShowOutcome(outcome);
}

std::int32_t TroubleShooter::PortStateError()
{
    if (session_ == nullptr) {
        return static_cast<std::int32_t>(kInvalidHandle);
    }
    return StatusToError(session_->Status(handle(), tessel::StatusPort, nullptr, 0));
}

bool TroubleShooter::Diagnose(std::int32_t error, OutcomeView* view)
{
    WriteSystemReport();
    LogStep("Diagnosing Error", error);
    GetTowerType();
    const std::int32_t state = PortStateError();
    std::int32_t jumpOn = error;
    const bool towerLost = static_cast<std::uint32_t>(state) == kNoTower ||
                           static_cast<std::uint32_t>(state) == kInvalidHandle;
    if (towerLost && portType_ == tessel::PortUsb) {
        if (BeginSection("\nFind USB Tower:\n") >= 0 &&
            LogStep("Find USB tower", LocateUsbTower()) < 0) {
            jumpOn = state;
        }
    }
    view_ = view;
    const bool shown = Jump(jumpOn);
    if (view == nullptr || !shown) {
        return shown;
    }
    // The help's commands arrive as messages and run the tests below on this object; the
    // run ends when the help closes (or was never opened).
    while (view->HelpOpen() && view->PumpMessage()) {
    }
    return true;
}

bool TroubleShooter::RepairUsbTower(std::int16_t portType)
{
    if (portType != tessel::PortUsb) {
        return false;
    }
    const auto state = static_cast<std::uint32_t>(PortStateError());
    if (state != kNoTower && state != kInvalidHandle) {
        return false;
    }
    if (BeginSection("\nFind USB Tower:\n") < 0) {
        return false;
    }
    return LogStep("Find USB tower", LocateUsbTower()) >= 0;
}

tessel::Short TroubleShooter::ReopenPreamble()
{
    tessel::Short brickType = kAssumedBrickType;
    if (session_->Get(handle(), tessel::PropBrickType, &brickType, nullptr, 0) < 0) {
        brickType = kAssumedBrickType;
    }
    session_->Destroy(handle());
    *handleSlot_ = 0;
    return brickType;
}

std::int32_t TroubleShooter::ReopenTail(const char* name, tessel::Short brickType)
{
    const std::int32_t created = CreatePort(name);
    if (created < 0) {
        return created;
    }
    return LogStep("Set brick type", session_->Set(handle(), tessel::PropBrickType, brickType));
}

std::int32_t TroubleShooter::ReopenAndCheck(const char* name, tessel::Short brickType)
{
    const std::int32_t reopened = ReopenTail(name, brickType);
    if (reopened < 0) {
        return reopened;
    }
    return PortStatus();
}

std::int32_t TroubleShooter::InSection(const char* heading, const char* label,
                                       std::int32_t (TroubleShooter::*steps)())
{
    const std::int32_t section = BeginSection(heading);
    if (section < 0) {
        return section;
    }
    return LogStep(label, (this->*steps)());
}

std::int32_t TroubleShooter::GetTowerType()
{
    const std::int32_t section = BeginSection("\nGet Tower Type:\n");
    if (section < 0) {
        return section;
    }
    portType_ = 0;
    char name[kNameSize] = {};
    const std::int32_t result =
        LogStep("Get port name",
                session_->Get(handle(), tessel::PropPort, &portType_, name, kNameSize - 1));
    if (result >= 0) {
        name[kNameSize - 1] = '\0';
        char line[kLabelSize];
        std::snprintf(line, sizeof line, "\tPort %d is %s\n", portType_, name);
        LogText(line);
    }
    return result;
}

std::int32_t TroubleShooter::LocateTower()
{
    return LocatePortNamed(nullptr);
}

std::int32_t TroubleShooter::LocatePortNamed(const char* namePart)
{
    const tessel::Short brickType = ReopenPreamble();
    char name[kNameSize] = {};
    std::int32_t result = LogStep("Find port", session_->FindPort(name, kNameSize));
    if (result < 0) {
        return result;
    }
    name[kNameSize - 1] = '\0';
    if (namePart != nullptr && std::strstr(name, namePart) == nullptr) {
        return static_cast<std::int32_t>(kNoMorePorts);
    }
    result = ReopenAndCheck(name, brickType);
    if (result < 0) {
        return result;
    }
    return GetTowerType();
}

std::int32_t TroubleShooter::FindTower()
{
    return InSection("\nFind Tower:\n", "Find tower", &TroubleShooter::LocateTower);
}

std::int32_t TroubleShooter::LocateUsbTower()
{
    return LocatePortNamed("KIVOTOWER");
}

std::int32_t TroubleShooter::FindUsbTower()
{
    const std::int32_t section = BeginSection("\nFind USB Tower:\n");
    if (section < 0) {
        return section;
    }
    const tessel::Short brickType = ReopenPreamble();
    char name[kNameSize] = {};
    tessel::Short item = 0;
    std::int32_t result = LogStep(
        "Enum USB ports", session_->FindFirst(tessel::EnumUsbPorts, &item, name, kNameSize));
    if (result < 0) {
        return result;
    }
    name[kNameSize - 1] = '\0';
    return ReopenAndCheck(name, brickType);
}

std::int32_t TroubleShooter::FindComPort()
{
    const std::int32_t section = BeginSection("\nFind COM port:\n");
    if (section < 0) {
        return section;
    }
    const tessel::Short brickType = ReopenPreamble();
    char name[kNameSize] = {};
    tessel::Short item = 0;
    // A negative result other than the end still names a port, one that cannot be used:
    // go on to the next.
    std::int32_t result = session_->FindFirst(tessel::EnumComPorts, &item, name, kNameSize);
    for (int listed = 1; result < 0 && static_cast<std::uint32_t>(result) != kNoMoreItems;
         ++listed) {
        if (listed >= kMaxEnumeratedItems) {
            result = static_cast<std::int32_t>(kNoMoreItems);
            break;
        }
        result = session_->FindNext(tessel::EnumComPorts, &item, name, kNameSize);
    }
    result = LogStep("Enum COM ports", result);
    if (result < 0) {
        return result;
    }
    name[kNameSize - 1] = '\0';
    return ReopenTail(name, brickType);
}

std::int32_t TroubleShooter::TestSerialPort(std::int16_t portNumber)
{
    const std::int32_t section = BeginSection("\nTest serial tower:\n");
    if (section < 0) {
        return section;
    }
    const tessel::Short brickType = ReopenPreamble();
    // The label names the last port listed; the end of the list may leave the library's
    // buffer in any state, so each listed name is kept apart.
    char listedName[kNameSize] = {};
    char name[kNameSize] = {};
    tessel::Short item = 0;
    std::int32_t result = session_->FindFirst(tessel::EnumComPorts, &item, name, kNameSize);
    for (int listed = 1; static_cast<std::uint32_t>(result) != kNoMoreItems; ++listed) {
        name[kNameSize - 1] = '\0';
        std::memcpy(listedName, name, sizeof listedName);
        if (item == portNumber) {
            break;
        }
        if (listed >= kMaxEnumeratedItems) {
            result = static_cast<std::int32_t>(kNoMoreItems);
            break;
        }
        std::memset(name, 0, sizeof name);
        result = session_->FindNext(tessel::EnumComPorts, &item, name, kNameSize);
    }
    char label[kLabelSize];
    std::snprintf(label, sizeof label, "Test COM port %s:", listedName);
    result = LogStep(label, result);
    if (result < 0) {
        return result;
    }
    return ReopenAndCheck(listedName, brickType);
}

std::int32_t TroubleShooter::PortStatus()
{
    return LogStep("Port status", PortStateError());
}

std::int32_t TroubleShooter::TestTowerSteps()
{
    const std::int32_t status = PortStatus();
    if (static_cast<std::uint32_t>(status) != kInvalidHandle) {
        return status;
    }
    const std::int32_t found = LogStep("Found tower", LocateTower());
    if (found < 0) {
        return found;
    }
    return PortStatus();
}

std::int32_t TroubleShooter::TestTower()
{
    return InSection("\nTest Tower:\n", "Tower", &TroubleShooter::TestTowerSteps);
}

std::int32_t TroubleShooter::BrickStatus()
{
    const std::int32_t state =
        session_ != nullptr
            ? StatusToError(session_->Status(handle(), tessel::StatusBrick, nullptr, 0))
            : static_cast<std::int32_t>(kInvalidHandle);
    return LogStep("Get brick status", state);
}

std::int32_t TroubleShooter::TestBrickSteps()
{
    const std::int32_t status = BrickStatus();
    if (status < 0) {
        return status;
    }
    return LogStep("Execute", session_->RunImmediate(handle(), "sound 4", nullptr));
}

std::int32_t TroubleShooter::TestBrick()
{
    return InSection("\nTest Onyx:\n", "Onyx", &TroubleShooter::TestBrickSteps);
}

std::int32_t TroubleShooter::SetUsbRange(std::int16_t range)
{
    const std::int32_t section = BeginSection("\nSet USB Range:\n");
    if (section < 0) {
        return section;
    }
    return LogStep("Set range", session_->Set(handle(), tessel::PropRange, range));
}
