#include "Brick.h"

#include <algorithm>
#include <cstdio>

#include "Codes.h"

namespace sim {

std::size_t SlotCode::bytes() const
{
    std::size_t total = 0;
    for (const auto& sub : subs) {
        total += sub.size();
    }
    for (const auto& task : tasks) {
        total += task.size();
    }
    return total;
}

Brick::Brick(const BrickSpec& spec, std::int32_t programMemory)
    : spec_(spec), programMemory_(std::min<std::int32_t>(
                       spec.memory >= 0 ? spec.memory : programMemory, 0x4000)),
      firmware_(spec.firmware), running_(spec.firmware && !spec.unlockFails),
      firmwareVersion_(spec.firmware ? spec.firmwareVersion : 0), machine_(spec.type, *this)
{
    if (rover()) {
        cells_.assign(0x10000, 0);
    } else {
        bytes_.assign(0x10000, 0);
    }
    setTxPower(1);
    setPowerDownMinutes(15);
    layOut();
}

std::int32_t Brick::statusNumber(std::int16_t expectedType) const
{
    if (!spec_.alive) {
        return StatusBrickNotAlive;
    }
    if (expectedType != spec_.type) {
        return StatusTypeChanged;
    }
    if (spec_.battery < kLowBatteryMillivolts) {
        return StatusLowBattery;
    }
    if (!firmware_) {
        return StatusNoFirmware;
    }
    if (!running_) {
        return StatusUnlockFailed;
    }
    return StatusOk;
}

std::int32_t Brick::romReady() const
{
    if (!spec_.alive) {
        return kBrickNotAlive;
    }
    if (spec_.battery < kLowBatteryMillivolts) {
        return kLowBattery;
    }
    return kOk;
}

std::int32_t Brick::firmwareReady() const
{
    const std::int32_t rom = romReady();
    if (rom != kOk) {
        return rom;
    }
    if (!firmware_) {
        return kNoFirmware;
    }
    if (!running_) {
        return kUnlockFailed;
    }
    return kOk;
}

std::vector<std::uint8_t> Brick::read(std::uint16_t address, std::int32_t count) const
{
    std::vector<std::uint8_t> out;
    if (count <= 0) {
        return out;
    }
    out.reserve(static_cast<std::size_t>(count));
    for (std::int32_t i = 0; i < count; ++i) {
        if (rover()) {
            const std::uint16_t cell = cells_[static_cast<std::uint16_t>(address + i / 2)];
            out.push_back(static_cast<std::uint8_t>(i % 2 == 0 ? cell & 0xFF : cell >> 8));
        } else {
            out.push_back(bytes_[static_cast<std::uint16_t>(address + i)]);
        }
    }
    return out;
}

void Brick::writeByte(std::uint16_t address, std::uint8_t value)
{
    if (rover()) {
        cells_[address] = static_cast<std::uint16_t>((cells_[address] & 0xFF00) | value);
    } else {
        bytes_[address] = value;
    }
}

std::array<std::uint16_t, Brick::kMapWords> Brick::map() const
{
    return map_;
}

std::array<std::uint8_t, 8> Brick::versionDigits() const
{
    std::array<std::uint8_t, 8> digits{};
    const std::int32_t firmware = firmware_ ? firmwareVersion_ : 0;
    for (int i = 0; i < 4; ++i) {
        int power = 1;
        for (int k = 0; k < 3 - i; ++k) {
            power *= 10;
        }
        digits[i] = static_cast<std::uint8_t>(spec_.rom / power % 10);
        digits[4 + i] = static_cast<std::uint8_t>(firmware / power % 10);
    }
    return digits;
}

bool Brick::selectSlot(int slot)
{
    if (slot < 0 || slot >= kSlots || (rover() && slot != 0)) {
        return false;
    }
    if (slot != slot_) {
        machine_.stopAll();
    }
    slot_ = slot;
    writeByte(kSlotAddress, static_cast<std::uint8_t>(slot));
    return true;
}

namespace {

// Each of the eight subroutines of each slot keeps its closing byte even when empty.
constexpr std::int32_t kSubOverhead = Brick::kSlots * 8;

std::int32_t UsedBytes(const std::array<SlotCode, Brick::kSlots>& slots, bool rover)
{
    std::int32_t used = 0;
    for (const SlotCode& slot : slots) {
        used += static_cast<std::int32_t>(slot.bytes());
    }
    return used + (rover ? 3 : kSubOverhead);
}

} // namespace

std::int32_t Brick::freeBytes() const
{
    const std::int32_t free = programMemory_ - UsedBytes(slots_, rover());
    return free > 0 ? free : 0;
}

bool Brick::fits(int slot, const SlotCode& code) const
{
    if (slot < 0 || slot >= kSlots) {
        return false;
    }
    std::array<SlotCode, kSlots> trial = slots_;
    trial[slot] = code;
    return UsedBytes(trial, rover()) <= programMemory_;
}

std::int32_t Brick::store(int slot, const SlotCode& code)
{
    if (!fits(slot, code)) {
        return kOutOfMemory;
    }
    // Running tasks point into the code about to be replaced.
    if (slot == slot_) {
        machine_.stopAll();
    }
    slots_[slot] = code;
    for (int task = 0; task < 10; ++task) {
        setTaskRunning(slot, task, false);
    }
    layOut();
    return kOk;
}

void Brick::clearTasks(int slot)
{
    if (slot == slot_) {
        machine_.stopAll();
    }
    for (auto& task : slots_[slot].tasks) {
        task.clear();
    }
    for (int task = 0; task < 10; ++task) {
        setTaskRunning(slot, task, false);
    }
    layOut();
}

void Brick::clearSubs(int slot)
{
    if (slot == slot_) {
        machine_.stopAll();
    }
    for (auto& sub : slots_[slot].subs) {
        sub.clear();
    }
    layOut();
}

void Brick::setTaskRunning(int slot, int task, bool running)
{
    const auto address = static_cast<std::uint16_t>(kTaskByteBase + 10 * (slot + 1) + task + 1);
    const bool defined = !slots_[slot].tasks[task].empty();
    writeByte(address, static_cast<std::uint8_t>((defined ? 1 : 0) | (running ? 2 : 0)));
}

bool Brick::taskRunning(int slot, int task) const
{
    const auto address = static_cast<std::uint16_t>(kTaskByteBase + 10 * (slot + 1) + task + 1);
    return (read(address, 1)[0] & 2) != 0;
}

void Brick::layOut()
{
    map_.fill(0);
    if (rover()) {
        // One slot: three subroutines and six tasks, code packed two bytes to a cell.
        std::uint16_t cell = kRoverProgramBase;
        auto place = [&](const std::vector<std::uint8_t>& bytes) {
            for (std::size_t i = 0; i < bytes.size(); ++i) {
                std::uint16_t& target = cells_[static_cast<std::uint16_t>(cell + i / 2)];
                target = i % 2 == 0 ? static_cast<std::uint16_t>((target & 0xFF00) | bytes[i])
                                    : static_cast<std::uint16_t>((target & 0x00FF) | bytes[i] << 8);
            }
            cell = static_cast<std::uint16_t>(cell + (bytes.size() + 1) / 2);
        };
        for (int sub = 0; sub < 3; ++sub) {
            cells_[kRoverSubTable + sub] = cell;
            std::vector<std::uint8_t> image = slots_[0].subs[sub];
            image.push_back(kSubEnd);
            place(image);
        }
        cells_[kRoverSubTable + 3] = cell;
        for (int task = 0; task < 6; ++task) {
            cells_[kRoverTaskTable + task] = cell;
            place(slots_[0].tasks[task]);
        }
        cells_[kRoverTaskTable + 6] = cell;
        cells_[kRoverFreeTable] = cell;
        cells_[kRoverFreeTable + 1] = static_cast<std::uint16_t>(cell + freeBytes() - 4);
        return;
    }
    std::uint16_t address = kProgramBase;
    auto place = [&](const std::vector<std::uint8_t>& bytes) {
        for (std::uint8_t byte : bytes) {
            bytes_[address++] = byte;
        }
    };
    for (int slot = 0; slot < kSlots; ++slot) {
        for (int sub = 0; sub < 8; ++sub) {
            map_[8 * slot + sub] = address;
            place(slots_[slot].subs[sub]);
            bytes_[address++] = kSubEnd;
        }
    }
    for (int slot = 0; slot < kSlots; ++slot) {
        for (int task = 0; task < 10; ++task) {
            map_[40 + 10 * slot + task] = address;
            place(slots_[slot].tasks[task]);
        }
    }
    map_[90] = address;
    map_[91] = kProgramBase;
    map_[92] = address;
    map_[93] = static_cast<std::uint16_t>(address + freeBytes());
    for (int slot = 0; slot < kSlots; ++slot) {
        for (int task = 0; task < 10; ++task) {
            setTaskRunning(slot, task, false);
        }
    }
}

std::int32_t Brick::enterBootMode()
{
    const std::int32_t ready = romReady();
    if (ready != kOk) {
        return ready;
    }
    machine_.stopAll();
    boot_ = true;
    running_ = false;
    return kOk;
}

std::int32_t Brick::unlockFirmware()
{
    const std::int32_t ready = romReady();
    if (ready != kOk) {
        return ready;
    }
    if (!firmware_) {
        return kNoFirmware;
    }
    if (spec_.unlockFails) {
        return kUnlockFailed;
    }
    boot_ = false;
    running_ = true;
    return kOk;
}

void Brick::storeFirmware(std::int32_t version)
{
    machine_.stopAll();
    firmware_ = true;
    firmwareVersion_ = version;
    running_ = false;
}

std::uint8_t Brick::txPower() const
{
    return read(kTxPowerAddress, 1)[0];
}

void Brick::setTxPower(std::uint8_t value)
{
    writeByte(kTxPowerAddress, value);
}

std::uint8_t Brick::powerDownMinutes() const
{
    return read(kPowerDownAddress, 1)[0];
}

void Brick::setPowerDownMinutes(std::uint8_t minutes)
{
    writeByte(kPowerDownAddress, minutes);
    writeByte(static_cast<std::uint16_t>(kPowerDownAddress + 1), 0);
}

namespace {

// "0x%02x" values joined by commas: the result-file form of every byte answer.
std::string ByteList(const std::uint8_t* bytes, std::size_t count)
{
    std::string text;
    text.reserve(count * 5);
    char value[8];
    for (std::size_t i = 0; i < count; ++i) {
        std::snprintf(value, sizeof value, i == 0 ? "0x%02x" : ",0x%02x", bytes[i]);
        text += value;
    }
    return text;
}

// The first bytes of an answer as one number, high byte first ("get 0x%x,2" of the power-down
// time gives minutes * 256).
std::int32_t BigEndian(const std::vector<std::uint8_t>& bytes)
{
    std::uint32_t number = 0;
    for (std::size_t i = 0; i < bytes.size() && i < 4; ++i) {
        number = number << 8 | bytes[i];
    }
    return static_cast<std::int32_t>(number);
}

// Requests the ROM answers without running firmware.
bool RomRequest(tessel::lang::Request request)
{
    using tessel::lang::Request;
    switch (request) {
    case Request::Version:
    case Request::GetMemory:
    case Request::GetMap:
    case Request::Alive:
    case Request::BootRom:
    case Request::BootFirmware:
    case Request::Battery:
        return true;
    default:
        return false;
    }
}

} // namespace

constexpr std::int32_t kMaxGetBytes = 1024;
constexpr std::size_t kMaxOutbox = 256;

tessel::lang::ExecOutcome Brick::execute(const tessel::lang::Program& program)
{
    return machine_.execute(program);
}

void Brick::advance(std::uint32_t elapsedMs)
{
    if (running_ && machine_.anyTaskRunning()) {
        machine_.advance(elapsedMs);
    }
}

void Brick::catchUp(std::uint64_t nowMs)
{
    if (lastAdvanceMs_ != 0 && nowMs > lastAdvanceMs_) {
        // A long quiet spell is not replayed in full: ten seconds of brick time at most.
        const std::uint64_t elapsed = nowMs - lastAdvanceMs_;
        advance(static_cast<std::uint32_t>(elapsed > 10000 ? 10000 : elapsed));
    }
    lastAdvanceMs_ = nowMs;
}

std::int16_t Brick::readVariable(int index)
{
    if (rover()) {
        return static_cast<std::int16_t>(cells_[static_cast<std::uint16_t>(kVariableBase + index)]);
    }
    const auto address = static_cast<std::uint16_t>(kVariableBase + 2 * index);
    const std::vector<std::uint8_t> bytes = read(address, 2);
    return static_cast<std::int16_t>(bytes[0] | bytes[1] << 8);
}

void Brick::writeVariable(int index, std::int16_t value)
{
    const auto address = static_cast<std::uint16_t>(kVariableBase + 2 * index);
    const auto word = static_cast<std::uint16_t>(value);
    if (rover()) {
        cells_[static_cast<std::uint16_t>(kVariableBase + index)] = word;
        return;
    }
    writeByte(address, static_cast<std::uint8_t>(word & 0xFF));
    writeByte(static_cast<std::uint16_t>(address + 1), static_cast<std::uint8_t>(word >> 8));
}

std::int16_t Brick::readInput(int port)
{
    return 0;
}

void Brick::playSound(int sound)
{
    lastSound_ = sound;
}

void Brick::playTone(int frequency, int duration)
{
    lastTone_ = frequency;
}

void Brick::setOutputMode(std::uint8_t mask, int mode)
{
    if (mode == 2) {
        outputsOn_ = static_cast<std::uint8_t>(outputsOn_ | mask);
    } else {
        outputsOn_ = static_cast<std::uint8_t>(outputsOn_ & ~mask);
    }
}

void Brick::setOutputDirection(std::uint8_t mask, int direction) {}

void Brick::setOutputPower(std::uint8_t mask, int power) {}

void Brick::sendMessage(int number)
{
    // A host that never listens must not make the brick grow without bound: the oldest go.
    if (outbox_.size() >= kMaxOutbox) {
        outbox_.pop_front();
    }
    outbox_.push_back(number & 0xFF);
}

tessel::lang::CodeView Brick::routineCode(tessel::lang::RoutineKind kind, int number)
{
    tessel::lang::CodeView view;
    const SlotCode& code = slots_[slot_];
    const std::vector<std::uint8_t>* bytes = nullptr;
    if (kind == tessel::lang::RoutineKind::Task && number >= 0 && number < 10) {
        bytes = &code.tasks[number];
    } else if (kind == tessel::lang::RoutineKind::Sub && number >= 0 && number < 8) {
        bytes = &code.subs[number];
    }
    if (bytes != nullptr && !bytes->empty()) {
        view.bytes = bytes->data();
        view.size = bytes->size();
    }
    return view;
}

void Brick::taskStarted(int task)
{
    if (task >= 0 && task < 10) {
        setTaskRunning(slot_, task, true);
    }
}

void Brick::taskStopped(int task)
{
    if (task >= 0 && task < 10) {
        setTaskRunning(slot_, task, false);
    }
}

std::int32_t Brick::request(tessel::lang::Request request, std::int32_t a, std::int32_t b,
                            tessel::lang::Answer& answer)
{
    using tessel::lang::Request;
    const std::int32_t ready = RomRequest(request) ? romReady() : firmwareReady();
    if (ready != kOk) {
        return ready;
    }
    switch (request) {
    case Request::ClearTasks:
        clearTasks(slot_);
        return kOk;
    case Request::ClearSubs:
        clearSubs(slot_);
        return kOk;
    case Request::Version: {
        const std::array<std::uint8_t, 8> digits = versionDigits();
        answer.text = ByteList(digits.data(), digits.size());
        return kOk;
    }
    case Request::GetMemory: {
        if (b < 1 || b > kMaxGetBytes || a < 0 || a > 0xFFFF) {
            return kBadParameters;
        }
        const std::vector<std::uint8_t> bytes = read(static_cast<std::uint16_t>(a), b);
        answer.text = ByteList(bytes.data(), bytes.size());
        answer.number = BigEndian(bytes);
        return kOk;
    }
    case Request::GetMap: {
        std::vector<std::uint8_t> bytes;
        for (std::uint16_t word : map_) {
            bytes.push_back(static_cast<std::uint8_t>(word >> 8));
            bytes.push_back(static_cast<std::uint8_t>(word & 0xFF));
        }
        answer.text = ByteList(bytes.data(), bytes.size());
        return kOk;
    }
    case Request::Alive:
        return kOk;
    case Request::BootRom:
        return enterBootMode();
    case Request::BootFirmware:
        return unlockFirmware();
    case Request::GetSlot:
        answer.number = slot_;
        return kOk;
    case Request::SelectSlot:
        return selectSlot(a) ? kOk : kBadParameters;
    case Request::GetTxPower:
        answer.number = txPower();
        return kOk;
    case Request::SetTxPower:
        setTxPower(static_cast<std::uint8_t>(a != 0 ? 1 : 0));
        return kOk;
    case Request::GetPowerDown:
        answer.number = powerDownMinutes();
        return kOk;
    case Request::SetPowerDown:
        if (a < 0 || a > 255) {
            return kBadParameters;
        }
        setPowerDownMinutes(static_cast<std::uint8_t>(a));
        return kOk;
    case Request::Battery:
        answer.number = spec_.battery;
        return kOk;
    }
    return kBadParameters;
}

} // namespace sim
