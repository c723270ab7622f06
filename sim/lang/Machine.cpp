#include "Machine.h"

#include "Status.h"

namespace tessel::lang {
namespace {

// Instructions a task runs before the next task gets its turn.
constexpr int kSlice = 32;

bool Holds(Relation relation, int a, int b)
{
    switch (relation) {
    case Relation::Less:
        return a < b;
    case Relation::Greater:
        return a > b;
    case Relation::LessEqual:
        return a <= b;
    case Relation::GreaterEqual:
        return a >= b;
    case Relation::Equal:
        return a == b;
    case Relation::NotEqual:
        return a != b;
    }
    return false;
}

std::int16_t Wrap(long value)
{
    return static_cast<std::int16_t>(static_cast<std::uint16_t>(value));
}

bool RequestOf(Op op, Request& request)
{
    switch (op) {
    case Op::ClearTasks:
        request = Request::ClearTasks;
        return true;
    case Op::ClearSubs:
        request = Request::ClearSubs;
        return true;
    case Op::Version:
        request = Request::Version;
        return true;
    case Op::GetMemory:
        request = Request::GetMemory;
        return true;
    case Op::GetMap:
        request = Request::GetMap;
        return true;
    case Op::Alive:
        request = Request::Alive;
        return true;
    case Op::BootRom:
        request = Request::BootRom;
        return true;
    case Op::BootFirmware:
        request = Request::BootFirmware;
        return true;
    case Op::GetSlot:
        request = Request::GetSlot;
        return true;
    case Op::SelectSlot:
        request = Request::SelectSlot;
        return true;
    case Op::GetTxPower:
        request = Request::GetTxPower;
        return true;
    case Op::SetTxPower:
        request = Request::SetTxPower;
        return true;
    case Op::GetPowerDown:
        request = Request::GetPowerDown;
        return true;
    case Op::SetPowerDown:
        request = Request::SetPowerDown;
        return true;
    case Op::Battery:
        request = Request::Battery;
        return true;
    default:
        return false;
    }
}

} // namespace

Machine::Machine(int brickType, MachineHost& host) : brickType_(brickType), host_(host) {}

void Machine::setBrickType(int brickType)
{
    brickType_ = brickType;
}

ExecOutcome Machine::execute(const Program& immediateProgram)
{
    ExecOutcome outcome;
    if (immediateProgram.kind != ObjectKind::Immediate) {
        outcome.status = BltError(10);
        return outcome;
    }
    for (const auto& command : immediateProgram.immediate) {
        ExecOutcome one = execute(command.data(), command.size());
        if (one.status < 0) {
            outcome.status = one.status;
            return outcome;
        }
        if (one.answer.number != 0 || !one.answer.text.empty()) {
            outcome.answer = std::move(one.answer);
        }
    }
    return outcome;
}

ExecOutcome Machine::execute(const std::uint8_t* code, std::size_t size)
{
    ExecOutcome outcome;
    std::size_t pc = 0;
    Instruction in;
    while (pc < size) {
        if (!Decode(code, size, pc, in)) {
            outcome.status = BltError(6);
            return outcome;
        }
        if (in.info->mode == OpMode::P) {
            outcome.status = BltError(10);
            return outcome;
        }
        Answer answer;
        std::size_t next = pc + in.size;
        bool yield = false;
        const std::int32_t status = run(in, -1, answer, true, next, yield);
        if (status < 0) {
            outcome.status = status;
            return outcome;
        }
        if (answer.number != 0 || !answer.text.empty()) {
            outcome.answer = std::move(answer);
        }
        pc = next;
    }
    return outcome;
}

std::int32_t Machine::startTask(int task)
{
    if (task < 0 || task >= kMaxTasks || host_.routineCode(RoutineKind::Task, task).size == 0) {
        return DriverError(kBadBrickResult);
    }
    if (tasks_[task].running) {
        stopTaskInternal(task);
    }
    Task& t = tasks_[task];
    t = Task{};
    t.running = true;
    host_.taskStarted(task);
    return 0;
}

void Machine::stopTask(int task)
{
    if (task >= 0 && task < kMaxTasks && tasks_[task].running) {
        stopTaskInternal(task);
    }
}

void Machine::stopAll()
{
    for (int t = 0; t < kMaxTasks; ++t) {
        stopTask(t);
    }
}

void Machine::stopTaskInternal(int task)
{
    tasks_[task].running = false;
    tasks_[task].wait = Wait::None;
    for (int& owner : semaphoreOwner_) {
        if (owner == task) {
            owner = -1;
        }
    }
    host_.taskStopped(task);
}

bool Machine::taskRunning(int task) const
{
    return task >= 0 && task < kMaxTasks && tasks_[task].running;
}

bool Machine::anyTaskRunning() const
{
    for (const Task& t : tasks_) {
        if (t.running) {
            return true;
        }
    }
    return false;
}

std::int16_t Machine::counter(int index) const
{
    return index >= 0 && index < 8 ? counters_[index] : 0;
}

bool Machine::eventRaised(int index) const
{
    return index >= 0 && index < 32 && events_[index];
}

void Machine::advance(std::uint32_t elapsedMs, long budget)
{
    clock_ += elapsedMs;
    bool progress = true;
    while (progress && budget > 0) {
        progress = false;
        for (int n = 0; n < kMaxTasks && budget > 0; ++n) {
            const int t = (nextTask_ + n) % kMaxTasks;
            Task& task = tasks_[t];
            if (!task.running) {
                continue;
            }
            if (task.wait == Wait::Time) {
                if (clock_ < task.wakeAt) {
                    continue;
                }
                task.wait = Wait::None;
            } else if (task.wait == Wait::Event) {
                if (!events_[task.waitOn]) {
                    continue;
                }
                events_[task.waitOn] = false;
                task.wait = Wait::None;
            } else if (task.wait == Wait::Semaphore) {
                if (semaphoreOwner_[task.waitOn] != -1) {
                    continue;
                }
                semaphoreOwner_[task.waitOn] = t;
                task.wait = Wait::None;
            }
            for (int i = 0; i < kSlice && budget > 0; ++i) {
                --budget;
                progress = true;
                if (!step(t)) {
                    break;
                }
            }
        }
        nextTask_ = (nextTask_ + 1) % kMaxTasks;
    }
}

CodeView Machine::codeOf(int task, const Frame& frame)
{
    return frame.sub < 0 ? host_.routineCode(RoutineKind::Task, task)
                         : host_.routineCode(RoutineKind::Sub, frame.sub);
}

bool Machine::step(int t)
{
    Task& task = tasks_[t];
    Frame& frame = task.frames[task.depth];
    const CodeView code = codeOf(t, frame);
    if (frame.pc >= code.size) {
        if (task.depth > 0) { // falling off a subroutine returns from it
            --task.depth;
            return true;
        }
        stopTaskInternal(t);
        return false;
    }
    Instruction in;
    if (!Decode(code.bytes, code.size, frame.pc, in) || in.info->mode == OpMode::I) {
        lastFault_ = BltError(6);
        stopTaskInternal(t);
        return false;
    }
    std::size_t next = frame.pc + in.size;
    bool yield = false;
    Answer unused;
    const std::int32_t status = run(in, t, unused, false, next, yield);
    if (status < 0) {
        lastFault_ = status;
        stopTaskInternal(t);
        return false;
    }
    if (!task.running) { // stopped itself
        return false;
    }
    // A call or return has moved to another frame and set next for it; a call has saved
    // where its caller resumes.
    task.frames[task.depth].pc = next;
    return !yield;
}

std::int16_t Machine::read(const Operand& operand, int task)
{
    const int index = operand.value;
    switch (operand.source) {
    case Source::Constant:
        return operand.value;
    case Source::Variable:
        return host_.readVariable(index);
    case Source::Local:
        return task >= 0 && index >= 0 && index < kMaxLocals ? tasks_[task].locals[index] : 0;
    case Source::Timer:
        return index >= 0 && index < 8 ? Wrap(static_cast<long>((clock_ - timerBase_[index]) / 100))
                                       : 0;
    case Source::Counter:
        return counter(index);
    case Source::Input:
        return host_.readInput(index);
    case Source::Random: {
        random_ = random_ * 1103515245u + 12345u;
        const std::uint32_t span = index < 0 ? 1u : static_cast<std::uint32_t>(index) + 1u;
        return static_cast<std::int16_t>((random_ >> 16) % span);
    }
    }
    return 0;
}

void Machine::write(const Operand& operand, int task, std::int16_t value)
{
    const int index = operand.value;
    switch (operand.source) {
    case Source::Variable:
        host_.writeVariable(index, value);
        break;
    case Source::Local:
        if (task >= 0 && index >= 0 && index < kMaxLocals) {
            tasks_[task].locals[index] = value;
        }
        break;
    case Source::Timer:
        if (index >= 0 && index < 8) {
            const std::uint64_t back = value > 0 ? static_cast<std::uint64_t>(value) * 100u : 0u;
            timerBase_[index] = clock_ >= back ? clock_ - back : 0;
        }
        break;
    case Source::Counter:
        if (index >= 0 && index < 8) {
            counters_[index] = value;
        }
        break;
    default:
        break;
    }
}

std::int32_t Machine::run(const Instruction& in, int task, Answer& answer, bool immediate,
                          std::size_t& nextPc, bool& yield)
{
    const Operand* v = in.values;
    const std::int32_t* p = in.plain;
    const Op op = in.info->op;
    switch (op) {
    case Op::SetVar:
        write(v[0], task, read(v[1], task));
        return 0;
    case Op::AddVar:
        write(v[0], task, Wrap(read(v[0], task) + read(v[1], task)));
        return 0;
    case Op::SubVar:
        write(v[0], task, Wrap(read(v[0], task) - read(v[1], task)));
        return 0;
    case Op::MulVar:
        write(v[0], task, Wrap(static_cast<long>(read(v[0], task)) * read(v[1], task)));
        return 0;
    case Op::DivVar:
    case Op::ModVar: {
        const long a = read(v[0], task);
        const long b = read(v[1], task);
        if (b != 0) {
            write(v[0], task, Wrap(op == Op::DivVar ? a / b : a % b));
        }
        return 0;
    }
    case Op::AndVar:
        write(v[0], task, Wrap(read(v[0], task) & read(v[1], task)));
        return 0;
    case Op::OrVar:
        write(v[0], task, Wrap(read(v[0], task) | read(v[1], task)));
        return 0;
    case Op::NegVar:
        write(v[0], task, Wrap(-static_cast<long>(read(v[1], task))));
        return 0;
    case Op::Jump:
        nextPc = static_cast<std::size_t>(static_cast<long>(nextPc) + p[0]);
        return 0;
    case Op::JumpUnless: {
        const int a = read(v[0], task);
        const int b = read(v[1], task);
        if (!Holds(static_cast<Relation>(p[0]), a, b)) {
            nextPc = static_cast<std::size_t>(static_cast<long>(nextPc) + p[1]);
        }
        return 0;
    }
    case Op::Call: {
        Task& t = tasks_[task];
        if (t.depth >= kCallDepth || host_.routineCode(RoutineKind::Sub, p[0]).size == 0) {
            return DriverError(kBadBrickResult);
        }
        t.frames[t.depth].pc = nextPc;
        ++t.depth;
        t.frames[t.depth] = Frame{p[0], 0};
        nextPc = 0;
        return 0;
    }
    case Op::Return: {
        Task& t = tasks_[task];
        if (t.depth == 0) {
            stopTaskInternal(task);
            return 0;
        }
        --t.depth;
        nextPc = t.frames[t.depth].pc;
        return 0;
    }
    case Op::StartTask: {
        const std::int32_t status = startTask(p[0]);
        if (p[0] == task) { // restarted itself: begin again at the top
            nextPc = 0;
        }
        return immediate ? status : 0;
    }
    case Op::StopTask:
        stopTask(p[0]);
        return 0;
    case Op::StopAll:
        stopAll();
        return 0;
    case Op::EndTask:
        stopTaskInternal(task);
        return 0;
    case Op::PlaySound:
        host_.playSound(p[0]);
        return 0;
    case Op::PlayTone:
        host_.playTone(read(v[0], task), read(v[1], task));
        return 0;
    case Op::SetVolume:
        host_.setVolume(read(v[0], task));
        return 0;
    case Op::OutputMode:
        host_.setOutputMode(static_cast<std::uint8_t>(p[0]), p[1]);
        return 0;
    case Op::OutputDir:
        host_.setOutputDirection(static_cast<std::uint8_t>(p[0]), p[1]);
        return 0;
    case Op::OutputPower:
        host_.setOutputPower(static_cast<std::uint8_t>(p[0]), read(v[0], task));
        return 0;
    case Op::Wait: {
        const int ticks = read(v[0], task);
        if (ticks > 0) {
            Task& t = tasks_[task];
            t.wait = Wait::Time;
            t.wakeAt = clock_ + static_cast<std::uint64_t>(ticks) * 10u;
            yield = true;
        }
        return 0;
    }
    case Op::SendMessage:
        host_.sendMessage(read(v[0], task) & 0xFF);
        return 0;
    case Op::Signal:
        if (p[0] < 32) {
            events_[p[0]] = true;
        }
        return 0;
    case Op::Await: {
        if (p[0] >= 32) {
            return 0;
        }
        if (events_[p[0]]) {
            events_[p[0]] = false;
        } else {
            tasks_[task].wait = Wait::Event;
            tasks_[task].waitOn = p[0];
            yield = true;
        }
        return 0;
    }
    case Op::Acquire: {
        if (p[0] >= 8) {
            return 0;
        }
        int& owner = semaphoreOwner_[p[0]];
        if (owner == -1 || owner == task) {
            owner = task;
        } else {
            tasks_[task].wait = Wait::Semaphore;
            tasks_[task].waitOn = p[0];
            yield = true;
        }
        return 0;
    }
    case Op::Release:
        if (p[0] < 8 && semaphoreOwner_[p[0]] == task) {
            semaphoreOwner_[p[0]] = -1;
        }
        return 0;
    case Op::Poll:
        answer.number = read(v[0], task);
        return 0;
    default:
        break;
    }
    Request request;
    if (RequestOf(op, request)) {
        if (op == Op::ClearTasks) {
            stopAll();
        }
        return host_.request(request, in.plainCount > 0 ? p[0] : 0, in.plainCount > 1 ? p[1] : 0,
                             answer);
    }
    return BltError(6);
}

} // namespace tessel::lang
