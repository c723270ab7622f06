// One simulated brick: its 16-bit memory, five program slots laid out in program memory as the
// brick's memory map describes them, firmware and boot mode, battery and settings, and the
// interpreter that runs its code. Guarded by the library's lock; it knows nothing of ports or
// threads.
#pragma once

#include <array>
#include <cstdint>
#include <deque>
#include <string>
#include <vector>

#include "Scenario.h"
#include "lang/Machine.h"

namespace sim {

// The code of one program slot as downloaded: bytes per task and per subroutine.
struct SlotCode {
    std::array<std::vector<std::uint8_t>, 8> subs;
    std::array<std::vector<std::uint8_t>, 10> tasks;
    std::size_t bytes() const;
};

class Brick : public tessel::lang::MachineHost {
public:
    static constexpr int kSlots = 5;
    static constexpr int kMapWords = 94;
    // Fixed cells the client reads with "get 0x%x,n".
    static constexpr std::uint16_t kTxPowerAddress = 0xC8B0;
    static constexpr std::uint16_t kPowerDownAddress = 0xC8BE;
    static constexpr std::uint16_t kTaskByteBase = 0xC8E3; // + 10 * slot + task, both 1-based
    static constexpr std::uint16_t kSlotAddress = 0xC924;
    static constexpr std::uint16_t kProgramBase = 0x8000;
    static constexpr std::uint16_t kVariableBase = 0xC800; // globals, 16-bit little-endian
    // Rover tables (16-bit cells): subroutine starts, task starts, free memory bounds.
    static constexpr std::uint16_t kRoverSubTable = 0x233;
    static constexpr std::uint16_t kRoverTaskTable = 0x239;
    static constexpr std::uint16_t kRoverFreeTable = 0x245;
    static constexpr std::uint16_t kRoverProgramBase = 0x400;
    // A subroutine is stored with one closing byte, so an empty one still takes a byte.
    static constexpr std::uint8_t kSubEnd = 0xF6;

    Brick(const BrickSpec& spec, std::int32_t programMemory);

    const std::string& name() const { return spec_.name; }
    std::int16_t type() const { return spec_.type; }
    bool rover() const { return spec_.type == 5 || spec_.type == 7; }
    bool alive() const { return spec_.alive; }

    // The brick status number of tslStatus 3 for a brick that was reached.
    std::int32_t statusNumber(std::int16_t expectedType) const;
    // kOk when the brick can run ordinary (firmware) commands, else the reason.
    std::int32_t firmwareReady() const;
    // kOk when the brick can answer at all (ROM commands), else the reason.
    std::int32_t romReady() const;

    // Memory as the "get" command sees it: bytes from `address` on. On a Rover addresses name
    // 16-bit cells and each cell gives its low byte, then its high byte.
    std::vector<std::uint8_t> read(std::uint16_t address, std::int32_t count) const;
    void writeByte(std::uint16_t address, std::uint8_t value);
    std::array<std::uint16_t, kMapWords> map() const;
    std::array<std::uint8_t, 8> versionDigits() const;

    // Programs.
    int currentSlot() const { return slot_; } // 0-based
    bool selectSlot(int slot);                // false outside 0..4
    std::int32_t freeBytes() const;
    std::int32_t store(int slot, const SlotCode& code); // kOk or kOutOfMemory
    // Replaces the whole slot only when it fits; used to check a download before it starts.
    bool fits(int slot, const SlotCode& code) const;
    void clearTasks(int slot);
    void clearSubs(int slot);
    const SlotCode& slotCode(int slot) const { return slots_[slot]; }
    void setTaskRunning(int slot, int task, bool running);
    bool taskRunning(int slot, int task) const;

    // Firmware and boot mode.
    bool firmwarePresent() const { return firmware_; }
    bool firmwareRunning() const { return running_; }
    bool bootMode() const { return boot_; }
    std::int32_t enterBootMode();  // "boot rom": stops the firmware
    std::int32_t unlockFirmware(); // "boot firmware"
    void storeFirmware(std::int32_t version);

    // Settings.
    std::uint8_t txPower() const;
    void setTxPower(std::uint8_t value);
    std::uint8_t powerDownMinutes() const;
    void setPowerDownMinutes(std::uint8_t minutes);
    std::int32_t batteryMillivolts() const { return spec_.battery; }

    // Messages the brick sent towards the host, oldest first.
    std::deque<std::int32_t>& outbox() { return outbox_; }
    const std::vector<std::int32_t>& scenarioMessages() const { return spec_.messages; }

    // The last sound and tone played and the outputs, for tests and the trace.
    std::int32_t lastSound() const { return lastSound_; }
    std::int32_t lastToneFrequency() const { return lastTone_; }
    std::uint8_t outputsOn() const { return outputsOn_; }

    // Runs the brick's immediate commands.
    tessel::lang::ExecOutcome execute(const tessel::lang::Program& program);
    // Lets the running tasks catch up with the time that passed.
    void advance(std::uint32_t elapsedMs);
    // The same, from a clock reading in milliseconds; the first reading only starts the clock.
    void catchUp(std::uint64_t nowMs);
    bool anyTaskRunning() const { return machine_.anyTaskRunning(); }

    // MachineHost.
    std::int16_t readVariable(int index) override;
    void writeVariable(int index, std::int16_t value) override;
    std::int16_t readInput(int port) override;
    void playSound(int sound) override;
    void playTone(int frequency, int duration) override;
    void setOutputMode(std::uint8_t mask, int mode) override;
    void setOutputDirection(std::uint8_t mask, int direction) override;
    void setOutputPower(std::uint8_t mask, int power) override;
    void sendMessage(int number) override;
    tessel::lang::CodeView routineCode(tessel::lang::RoutineKind kind, int number) override;
    void taskStarted(int task) override;
    void taskStopped(int task) override;
    std::int32_t request(tessel::lang::Request request, std::int32_t a, std::int32_t b,
                         tessel::lang::Answer& answer) override;

private:
    void layOut(); // rewrites program memory and the tables from slots_

    BrickSpec spec_;
    std::int32_t programMemory_;
    std::vector<std::uint8_t> bytes_;  // 64 KiB, byte-addressed bricks
    std::vector<std::uint16_t> cells_; // 64 Ki cells, Rover bricks
    std::array<SlotCode, kSlots> slots_;
    std::array<std::uint16_t, kMapWords> map_{};
    int slot_ = 0;
    bool firmware_;
    bool running_;
    bool boot_ = false;
    std::int32_t firmwareVersion_;
    std::int32_t lastSound_ = -1;
    std::int32_t lastTone_ = 0;
    std::uint8_t outputsOn_ = 0;
    std::deque<std::int32_t> outbox_;
    std::uint64_t lastAdvanceMs_ = 0;
    tessel::lang::Machine machine_;
};

} // namespace sim
