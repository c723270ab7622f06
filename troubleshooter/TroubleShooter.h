// One run of the Trouble Shooter: the diagnostic log, the system report, the diagnosis of a
// failed operation's packed code into an outcome, and the tests that the help topics ask for.
//
// The object borrows the brick calls and the dialog's brick handle: tests that re-open a port
// destroy the handle held there and store the new one, so the dialog goes on with whatever
// port the diagnosis left open. It lives on the stack of the dialog operation that starts the
// run and is used on the dialog's thread only.
//
// The log is plain text, opened and closed around every write so that no handle is held
// between steps; an empty log name skips every write.
#pragma once

#include <cstdint>

#include "platform/SystemInfo.h"
#include "tessel/TesselApi.h"

class BrickCalls;
class OutcomeView;

class TroubleShooter {
public:
    static constexpr int kLogNameSize = 260;

    // Packed codes the diagnosis compares by whole value.
    static constexpr std::uint32_t kInvalidHandle = 0xE0050401u; // driver 1, "invalid hBrick"
    static constexpr std::uint32_t kNoTower = 0xE0050421u;       // driver 33, no tower
    static constexpr std::uint32_t kNoMorePorts = 0xE0050444u;   // driver 68
    static constexpr std::uint32_t kNoMoreItems = tessel::kNoMoreItems; // library 82

    // An enumeration that never reports its end is cut off after this many items, as if
    // it had ended: a misbehaving library must not hold the dialog in a loop.
    static constexpr int kMaxEnumeratedItems = 256;

    // logPath null or empty: no log. Otherwise the file is emptied and gets the banner; a
    // file that cannot be opened is skipped silently, then and on every later write.
    // system null: the running machine.
    TroubleShooter(BrickCalls* session, tessel::Long* handleSlot, const char* logPath,
                   platform::SystemInfo* system = nullptr);

    TroubleShooter(const TroubleShooter&) = delete;
    TroubleShooter& operator=(const TroubleShooter&) = delete;

    // --- the log ------------------------------------------------------------------------
    void CloseLog();
    void LogText(const char* text);
    // "\t%s ok\n" or the failure lines with the catalogue text; returns value unchanged.
    std::int32_t LogStep(const char* label, std::int32_t value);
    // Logs the heading; kInvalidHandle (logged) when the session or handle slot is missing.
    std::int32_t BeginSection(const char* heading);
    // Creates a handle on the named port into the handle slot; the slot keeps its old value
    // when the library gives none.
    std::int32_t CreatePort(const char* name);
    void WriteSystemReport();
    void WriteOsVersion();

    // --- the diagnosis ------------------------------------------------------------------
    // Logs the system and the port, may look for a lost USB tower once, then shows the
    // outcome of the error through view and, when a topic was shown, pumps messages until
    // the help is closed. True when a topic was shown.
    bool Diagnose(std::int32_t error, OutcomeView* view);
    // The quiet repair: true when a USB tower that stopped answering was found again.
    bool RepairUsbTower(std::int16_t portType);
    // Shows the outcome of an error; unlisted errors are logged under a "Jump" label.
    bool Jump(std::int32_t error);
    // The outcome number of an error for the given port type, 0 when the tables list none.
    // label receives the "Jump" label logged for an unlisted error.
    static int OutcomeOf(std::int32_t error, std::int16_t portType, const char** label);

    // --- tests and steps, each logging itself and returning its packed value -------------
    std::int32_t GetTowerType();
    std::int32_t LocateTower();
    std::int32_t FindTower();
    std::int32_t LocateUsbTower();
    std::int32_t FindUsbTower();
    std::int32_t FindComPort();
    std::int32_t TestSerialPort(std::int16_t portNumber);
    std::int32_t PortStatus();
    std::int32_t TestTower();
    std::int32_t BrickStatus();
    std::int32_t TestBrick();
    std::int32_t SetUsbRange(std::int16_t range);

    // The run's port type: 3 is a USB tower. Set by GetTowerType and by the help command
    // that names it.
    std::int16_t portType() const { return portType_; }
    void setPortType(std::int16_t portType) { portType_ = portType; }
    const char* logName() const { return logName_; }
    OutcomeView* view() const { return view_; }

private:
    // Appends formatted text to the log; the composed text is cut at the buffer's bound.
    void LogFormat(const char* format, ...) __attribute__((format(printf, 2, 3)));
    std::int32_t TestTowerSteps();
    std::int32_t TestBrickSteps();
    // Remembers the brick type and closes the current port.
    tessel::Short ReopenPreamble();
    // Creates the port and gives it the remembered brick type.
    std::int32_t ReopenTail(const char* name, tessel::Short brickType);
    // ReopenTail, then the port's status.
    std::int32_t ReopenAndCheck(const char* name, tessel::Short brickType);
    // Finds the port, reopens it and asks the tower type; a name lacking namePart (when
    // given) is no port of the wanted kind.
    std::int32_t LocatePortNamed(const char* namePart);
    // Opens the section and logs the steps' outcome under the label.
    std::int32_t InSection(const char* heading, const char* label,
                           std::int32_t (TroubleShooter::*steps)());
    std::int32_t PortStateError();
    tessel::Long handle() const { return handleSlot_ != nullptr ? *handleSlot_ : 0; }

    BrickCalls* session_;
    tessel::Long* handleSlot_;
    OutcomeView* view_ = nullptr;
    std::int16_t portType_ = 0;
    char logName_[kLogNameSize] = {};
    platform::HostSystemInfo hostSystem_;
    platform::SystemInfo* system_;
};
