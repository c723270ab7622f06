#include "Machine.h"

#include "Status.h"

namespace tessel::lang {

Machine::Machine(int brickType, MachineHost& host) : brickType_(brickType), host_(host) {}

void Machine::setBrickType(int brickType)
{
    brickType_ = brickType;
}

ExecOutcome Machine::execute(const Program& immediateProgram)
{
    (void)immediateProgram;
    return {};
}

ExecOutcome Machine::execute(const std::uint8_t* code, std::size_t size)
{
    (void)code;
    (void)size;
    return {};
}

std::int32_t Machine::startTask(int task)
{
    (void)task;
    return DriverError(kBadBrickResult);
}

void Machine::stopTask(int task)
{
    (void)task;
}
void Machine::stopAll() {}
bool Machine::taskRunning(int task) const
{
    (void)task;
    return false;
}
bool Machine::anyTaskRunning() const
{
    return false;
}
void Machine::advance(std::uint32_t elapsedMs, long budget)
{
    clock_ += elapsedMs;
    (void)budget;
}
std::int16_t Machine::counter(int index) const
{
    (void)index;
    return 0;
}
bool Machine::eventRaised(int index) const
{
    (void)index;
    return false;
}

} // namespace tessel::lang
