// The interpreter of the brick's code bytes: immediate commands run at once, tasks run in
// slices as simulated time advances.
//
// The brick model (the library's simulator) implements MachineHost: it owns the memory, the
// global variables, the program slots with their code, sound and outputs, and it answers the
// brick requests (version, memory, map, boot mode ...). The machine owns what only running
// code needs: task states, call stacks, locals, timers, counters, events and semaphores.
//
// Not thread-safe: the owner serialises every call (the host is called back from inside them).
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "Code.h"
#include "Program.h"

namespace tessel::lang {

// Requests that the brick answers; each row of Opcodes.def in the request group maps to one.
enum class Request : std::uint8_t {
    ClearTasks,   // stop and erase the tasks of the current slot
    ClearSubs,    // erase the subroutines of the current slot
    Version,      // text: ROM then firmware version, eight decimal digits as a byte list
    GetMemory,    // a = address, b = byte count; number and text as the host defines
    GetMap,       // text: the 94 words of the memory map
    Alive,        // success when the brick answers
    BootRom,      // enter boot mode
    BootFirmware, // leave boot mode and start the firmware
    GetSlot,      // number: the current slot, 0-based
    SelectSlot,   // a = slot, 0-based
    GetTxPower,   // number
    SetTxPower,   // a = power
    GetPowerDown, // number
    SetPowerDown, // a = minutes
    Battery,      // number: millivolts
};

// What an immediate command answers: a result number and a result-file text.
struct Answer {
    std::int32_t number = 0;
    std::string text;
};

struct CodeView {
    const std::uint8_t* bytes = nullptr;
    std::size_t size = 0; // 0: no such routine
};

class MachineHost {
public:
    virtual ~MachineHost() = default;

    virtual std::int16_t readVariable(int index) = 0;
    virtual void writeVariable(int index, std::int16_t value) = 0;
    virtual std::int16_t readInput(int port) = 0;

    virtual void playSound(int sound) = 0;
    virtual void playTone(int frequency, int duration) = 0; // duration in 1/100 s
    virtual void setVolume(int volume) { (void)volume; }
    virtual void setOutputMode(std::uint8_t mask, int mode) = 0;           // 0 float, 1 off, 2 on
    virtual void setOutputDirection(std::uint8_t mask, int direction) = 0; // 0 rev, 1 fwd, 2 toggle
    virtual void setOutputPower(std::uint8_t mask, int power) = 0;         // 0..7

    // A running program sends a message (0..255) to the host computer.
    virtual void sendMessage(int number) = 0;

    // The code of a routine of the current slot. The bytes must stay valid and unchanged until
    // the next call into the machine returns; size 0 when there is no such routine.
    virtual CodeView routineCode(RoutineKind kind, int number) = 0;

    virtual void taskStarted(int task) { (void)task; }
    virtual void taskStopped(int task) { (void)task; }

    // Carries out a brick request; returns 0 or a packed failure. answer starts empty.
    virtual std::int32_t request(Request request, std::int32_t a, std::int32_t b,
                                 Answer& answer) = 0;
};

// The outcome of running immediate commands.
struct ExecOutcome {
    std::int32_t status = 0; // 0, or packed failure of the first command that failed
    Answer answer;           // of the last command that answered
};

class Machine {
public:
    static constexpr int kMaxTasks = 16;
    static constexpr int kMaxLocals = 16;
    static constexpr int kCallDepth = 8;

    Machine(int brickType, MachineHost& host);

    void setBrickType(int brickType);

    // Runs immediate commands in order, stopping at the first failure. A command that only a
    // program may use fails with BLT code 10; an undecodable one with BLT code 6.
    ExecOutcome execute(const Program& immediateProgram);
    ExecOutcome execute(const std::uint8_t* code, std::size_t size);

    // Starts (or restarts from its beginning) a task of the current slot; fails with driver
    // code 9 when the slot has no such task.
    std::int32_t startTask(int task);
    void stopTask(int task);
    void stopAll();
    bool taskRunning(int task) const;
    bool anyTaskRunning() const;

    // Moves the clock on by elapsedMs and runs the tasks that are due, at most budget
    // instructions in all, so that a task looping forever cannot hold the caller.
    void advance(std::uint32_t elapsedMs, long budget = 100000);
    std::uint64_t clock() const { return clock_; }

    // The packed fault that stopped a task last (0 when none): a bad instruction, a missing
    // subroutine, calls nested too deep.
    std::int32_t lastFault() const { return lastFault_; }

    std::int16_t counter(int index) const;
    bool eventRaised(int index) const;

private:
    enum class Wait : std::uint8_t { None, Time, Event, Semaphore };
    struct Frame {
        int sub = -1; // -1: the task itself
        std::size_t pc = 0;
    };
    struct Task {
        bool running = false;
        Wait wait = Wait::None;
        int waitOn = 0;
        std::uint64_t wakeAt = 0;
        Frame frames[kCallDepth + 1];
        int depth = 0; // frames in use minus one
        std::int16_t locals[kMaxLocals] = {};
    };

    // Runs one instruction of task t; false when the task yields (sleeps or ends).
    bool step(int t);
    std::int32_t run(const Instruction& in, int task, Answer& answer, bool immediate,
                     std::size_t& nextPc, bool& yield);
    std::int16_t read(const Operand& operand, int task);
    void write(const Operand& operand, int task, std::int16_t value);
    void stopTaskInternal(int task);
    CodeView codeOf(int task, const Frame& frame);

    int brickType_;
    MachineHost& host_;
    Task tasks_[kMaxTasks];
    std::uint64_t clock_ = 0;
    std::uint64_t timerBase_[8] = {};
    std::int16_t counters_[8] = {};
    bool events_[32] = {};
    int semaphoreOwner_[8] = {-1, -1, -1, -1, -1, -1, -1, -1};
    std::uint32_t random_ = 0x2545F491u;
    std::int32_t lastFault_ = 0;
    int nextTask_ = 0; // round-robin start
};

} // namespace tessel::lang
