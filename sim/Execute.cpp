// tslExec and tslDownload: immediate commands, downloads in blocks, and the reception of brick
// messages, with their background threads. Workspace files are only touched on the caller's
// thread (the client's tree is not thread-safe); the threads only wait, talk to the simulated
// link and call back.
#include <chrono>
#include <thread>

#include "Codes.h"
#include "Files.h"
#include "Library.h"
#include "lang/Code.h"
#include "tessel/DirEnt.h"
#include "tessel/ReaderWriter.h"

namespace sim {
namespace {

using tessel::lang::ExecOutcome;
using tessel::lang::ObjectKind;
using tessel::lang::Op;
using tessel::lang::Program;

std::uint64_t NowMs()
{
    return static_cast<std::uint64_t>(std::chrono::duration_cast<std::chrono::milliseconds>(
                                          std::chrono::steady_clock::now().time_since_epoch())
                                          .count()) +
           1;
}

std::int32_t ReadProgram(ReaderWriter* code, Program& program)
{
    std::string text;
    if (!ReadAll(code, text)) {
        return kBadSource;
    }
    return tessel::lang::ParseObject(text, program).code;
}

// Commands the ROM answers by itself; anything else needs the firmware running.
bool NeedsFirmware(const Program& program)
{
    for (const auto& command : program.immediate) {
        if (command.empty()) {
            continue;
        }
        switch (static_cast<Op>(command[0])) {
        case Op::Version:
        case Op::GetMemory:
        case Op::GetMap:
        case Op::Alive:
        case Op::BootRom:
        case Op::BootFirmware:
        case Op::Battery:
            break;
        default:
            return true;
        }
    }
    return false;
}

// Sizes in bytes of the commands in the order they are sent.
std::vector<std::int32_t> CommandSizes(const Program& program)
{
    std::vector<std::int32_t> sizes;
    if (program.kind == ObjectKind::Firmware) {
        for (const auto& record : program.firmware) {
            sizes.push_back(static_cast<std::int32_t>(record.data.size()) + 2);
        }
        return sizes;
    }
    for (const auto& routine : program.routines) {
        std::size_t offset = 0;
        tessel::lang::Instruction instruction;
        while (
            offset < routine.code.size() &&
            tessel::lang::Decode(routine.code.data(), routine.code.size(), offset, instruction)) {
            sizes.push_back(instruction.size);
            offset += static_cast<std::size_t>(instruction.size);
        }
    }
    return sizes;
}

std::int32_t StatusOfFailure(std::int32_t code, const char*& text)
{
    switch (code) {
    case kBrokenLink:
    case kWispRetryExceeded:
        text = "download failed: transmission error";
        return 11;
    case kBrickNotAlive:
        text = "download failed: brick does not answer";
        return 6;
    case kNoTower:
    case kUsbUnplugged:
        text = "download failed: no tower";
        return 4;
    case kTowerNotAlive:
        text = "download failed: tower does not answer";
        return 5;
    case kLowBattery:
        text = "download failed: brick battery low";
        return 8;
    case kOutOfMemory:
        text = "download failed: not enough memory";
        return 2;
    default:
        text = "download failed";
        return 2;
    }
}

} // namespace

std::int32_t Library::runImmediate(Connection& connection, const Program& program,
                                   ExecOutcome& outcome)
{
    for (std::size_t i = 0; i < program.immediate.size(); ++i) {
        const std::int32_t sent = exchange(connection, connection.execRetries, true);
        if (sent != kOk) {
            return sent;
        }
    }
    Brick& brick = *connection.port->brick;
    if (NeedsFirmware(program)) {
        const std::int32_t ready = brick.firmwareReady();
        if (ready != kOk) {
            return ready;
        }
    }
    brick.catchUp(NowMs());
    outcome = brick.execute(program);
    return outcome.status;
}

bool Library::reapJob(std::unique_lock<std::mutex>& lock, Long handle)
{
    Connection* connection = find(handle);
    if (connection == nullptr || connection->jobRunning) {
        return false;
    }
    if (connection->job.joinable()) {
        if (connection->job.get_id() == std::this_thread::get_id()) {
            // Called from the finished job's own last callback: it touches nothing after it.
            connection->job.detach();
        } else {
            std::thread finished = std::move(connection->job);
            lock.unlock();
            finished.join();
            lock.lock();
        }
    }
    return find(handle) != nullptr;
}

Long Library::exec(Long handle, ReaderWriter* code, Long* result, ReaderWriter* resultFile,
                   Callback callback, void* context)
{
    if (code == nullptr) {
        if (callback != nullptr) {
            return startReception(handle, callback, context);
        }
        if (result == nullptr && resultFile == nullptr && context == nullptr) {
            return stopReception(handle);
        }
        return kNullParameter;
    }
    if (result != nullptr) {
        *result = 0;
    }
    Program program;
    const std::int32_t parsed = ReadProgram(code, program);
    if (parsed < 0) {
        return parsed;
    }
    // A program runs on the brick once it is downloaded; firmware is only ever downloaded.
    if (program.kind != ObjectKind::Immediate) {
        return kBadSourceType;
    }
    const auto commands = static_cast<std::int32_t>(program.immediate.size());
    if (callback == nullptr) {
        // The caller waits for the answer; nothing is locked meanwhile.
        std::int32_t millis = 0;
        {
            std::lock_guard<std::mutex> lock(mutex_);
            if (find(handle) == nullptr) {
                return kBadHandle;
            }
            millis = scenario_.linkMillisPerCommand * commands;
        }
        std::this_thread::sleep_for(std::chrono::milliseconds(millis));
    }
    std::unique_lock<std::mutex> lock(mutex_);
    if (find(handle) == nullptr) {
        return kBadHandle;
    }
    if (callback != nullptr && !reapJob(lock, handle)) {
        return find(handle) == nullptr ? kBadHandle : kDriverBusy;
    }
    Connection& connection = *find(handle);
    ExecOutcome outcome;
    const std::int32_t status = runImmediate(connection, program, outcome);
    trace_.line("tslExec(%d, %d commands) -> 0x%x, %d", handle, commands,
                static_cast<unsigned>(status), outcome.answer.number);
    // The result number is written before returning and never later, so the caller's variable
    // may go out of scope as soon as the call returns.
    if (result != nullptr) {
        *result = status < 0 ? 0 : outcome.answer.number;
    }
    if (callback == nullptr) {
        if (status >= 0 && resultFile != nullptr && !WriteAll(resultFile, outcome.answer.text)) {
            return kBadTarget;
        }
        return status;
    }
    // The answer travels with the callback in a result file, written here on the caller's
    // thread: the given one, or the result working file beside the code.
    ReaderWriter* answer = nullptr;
    if (status >= 0 && !outcome.answer.text.empty()) {
        if (resultFile != nullptr) {
            answer = resultFile->addRef();
        } else if (DirEnt* entry = FindFrom(code, "result.txt");
                   entry != nullptr && !entry->isDirectory()) {
            answer = entry->open(tessel::FileResult);
        }
        if (answer != nullptr && !WriteAll(answer, outcome.answer.text)) {
            answer->release();
            answer = nullptr;
        }
    }
    connection.jobRunning = true;
    connection.pendingResult = answer;
    const std::int32_t number = outcome.answer.number;
    Connection* target = &connection;
    connection.job = std::thread([this, target, commands, status, number, callback, context] {
        std::unique_lock<std::mutex> jobLock(mutex_);
        if (!linkDelay(jobLock, *target, commands)) {
            return;
        }
        ReaderWriter* file = target->pendingResult;
        target->pendingResult = nullptr;
        target->jobRunning = false;
        jobLock.unlock();
        callback(status, context, number, file);
    });
    return kOk;
}

Long Library::download(Long handle, ReaderWriter* code, Callback callback, void* context)
{
    if (code == nullptr) {
        return kNullParameter;
    }
    Program program;
    const std::int32_t parsed = ReadProgram(code, program);
    if (parsed < 0) {
        return parsed;
    }
    if (program.kind == ObjectKind::Immediate) {
        return kBadSourceType; // immediate commands are executed, not downloaded
    }
    std::unique_lock<std::mutex> lock(mutex_);
    if (find(handle) == nullptr) {
        return kBadHandle;
    }
    if (!reapJob(lock, handle)) {
        return find(handle) == nullptr ? kBadHandle : kDriverBusy;
    }
    Connection& connection = *find(handle);
    switch (towerStatus(connection)) {
    case StatusNoTower:
        return connection.unplugged ? kUsbUnplugged : kNoTower;
    case StatusTowerNotAlive:
        return kTowerNotAlive;
    default:
        break;
    }
    Brick* brick = connection.port->brick;
    if (brick == nullptr || !brick->alive()) {
        return kBrickNotAlive;
    }
    const int slot = brick->currentSlot();
    Short blockSize = connection.downloadBlockSize;
    if (program.kind == ObjectKind::Firmware) {
        if (!brick->bootMode()) {
            return kDownloadModeInactive;
        }
        const std::int32_t ready = brick->romReady();
        if (ready != kOk) {
            return ready;
        }
        blockSize = connection.firmwareBlockSize;
    } else {
        if (program.brickType != brick->type()) {
            return kBrickTypeMismatch;
        }
        const std::int32_t ready = brick->firmwareReady();
        if (ready != kOk) {
            return ready;
        }
        SlotCode slotCode;
        for (const auto& routine : program.routines) {
            std::vector<std::uint8_t>* place =
                routine.kind == tessel::lang::RoutineKind::Task
                    ? (routine.number < 10 ? &slotCode.tasks[routine.number] : nullptr)
                    : (routine.number < 8 ? &slotCode.subs[routine.number] : nullptr);
            if (place == nullptr || routine.number < 0) {
                return kBadParameters;
            }
            *place = routine.code;
        }
        if (!brick->fits(slot, slotCode)) {
            return kOutOfMemory;
        }
    }
    // Commands go out in blocks of up to blockSize bytes (at least one command each).
    std::vector<Block> blocks;
    std::int32_t bytes = 0;
    std::int32_t total = 0;
    for (std::int32_t size : CommandSizes(program)) {
        if (blocks.empty() || bytes + size > blockSize) {
            blocks.push_back({0, total});
            bytes = 0;
        }
        bytes += size;
        ++total;
        ++blocks.back().commands;
        blocks.back().cumulative = total;
    }
    trace_.line("tslDownload(%d, %d commands in %zu blocks)", handle, total, blocks.size());
    connection.jobRunning = true;
    connection.polledDownload = callback == nullptr;
    connection.downloadSent = 0;
    connection.downloadStatus = StatusDownloading;
    connection.downloadText = "downloading";
    connection.job = std::thread(&Library::downloadJob, this, &connection, std::move(blocks),
                                 std::move(program), slot, callback, context);
    return kOk;
}

void Library::downloadJob(Connection* connection, std::vector<Block> blocks, Program program,
                          int slot, Callback callback, void* context)
{
    std::unique_lock<std::mutex> lock(mutex_);
    Connection& c = *connection;
    std::int32_t sent = 0;
    std::int32_t failure = kOk;
    for (std::size_t i = 0; i < blocks.size(); ++i) {
        if (!linkDelay(lock, c, blocks[i].commands)) {
            return;
        }
        std::int32_t status = exchange(c, c.downloadRetries, true);
        // A block lost after others arrived leaves the brick's block counter out of step.
        if (status == kWispRetryExceeded && i > 0) {
            status = kBrokenLink;
        }
        const bool last = i + 1 == blocks.size();
        if (status == kOk && last) {
            Brick& brick = *c.port->brick;
            if (program.kind == ObjectKind::Firmware) {
                brick.storeFirmware(program.firmwareVersion);
            } else {
                SlotCode code;
                for (const auto& routine : program.routines) {
                    auto& place = routine.kind == tessel::lang::RoutineKind::Task
                                      ? code.tasks[routine.number]
                                      : code.subs[routine.number];
                    place = routine.code;
                }
                status = brick.store(slot, code);
            }
        }
        if (status != kOk) {
            failure = status;
            break;
        }
        sent = blocks[i].cumulative;
        c.downloadSent = sent;
        if (!last && callback != nullptr) {
            lock.unlock();
            callback(0, context, sent, nullptr);
            lock.lock();
            if (c.stopping) {
                return;
            }
        }
    }
    const char* text = "download finished";
    c.downloadStatus = failure == kOk ? StatusOk : StatusOfFailure(failure, text);
    c.downloadText = text;
    c.jobRunning = false;
    trace_.line("download on %d: %d commands sent, 0x%x", c.id, sent,
                static_cast<unsigned>(failure));
    lock.unlock();
    // Nothing of the connection is touched after this: tslDestroy may be waiting to free it.
    if (callback != nullptr) {
        callback(failure, context, sent, nullptr);
    }
}

Long Library::startReception(Long handle, Callback callback, void* context)
{
    std::unique_lock<std::mutex> lock(mutex_);
    if (find(handle) == nullptr) {
        return kBadHandle;
    }
    if (find(handle)->receiving) {
        lock.unlock();
        const Long stopped = stopReception(handle);
        if (stopped != kOk) {
            return stopped;
        }
        lock.lock();
        if (find(handle) == nullptr) {
            return kBadHandle;
        }
    }
    Connection& connection = *find(handle);
    connection.receiving = true;
    connection.receiveCallback = callback;
    connection.receiveContext = context;
    if (Brick* brick = connection.port->brick; brick != nullptr) {
        for (std::int32_t number : brick->scenarioMessages()) {
            brick->sendMessage(number);
        }
    }
    trace_.line("reception on %d started", handle);
    connection.receiver = std::thread(&Library::receive, this, &connection);
    return kOk;
}

Long Library::stopReception(Long handle)
{
    std::unique_lock<std::mutex> lock(mutex_);
    Connection* connection = find(handle);
    if (connection == nullptr) {
        return kBadHandle;
    }
    if (connection->receiver.get_id() == std::this_thread::get_id()) {
        return kDriverBusy; // from inside a message callback: it would wait for itself
    }
    connection->receiving = false;
    connection->wake.notify_all();
    std::thread receiver = std::move(connection->receiver);
    lock.unlock();
    if (receiver.joinable()) {
        receiver.join();
    }
    trace_.line("reception on %d stopped", handle);
    return kOk;
}

void Library::receive(Connection* connection)
{
    std::unique_lock<std::mutex> lock(mutex_);
    Connection& c = *connection;
    while (!c.stopping && c.receiving) {
        Brick* brick = c.port->brick;
        if (brick != nullptr && brick->alive() && towerStatus(c) == StatusOk) {
            brick->catchUp(NowMs());
            if (!brick->outbox().empty()) {
                const std::int32_t number = brick->outbox().front();
                brick->outbox().pop_front();
                if (c.collecting) {
                    ++c.stats.packets;
                }
                const Callback callback = c.receiveCallback;
                void* const context = c.receiveContext;
                lock.unlock();
                callback(0, context, number, nullptr);
                lock.lock();
                continue;
            }
        }
        c.wake.wait_for(lock, std::chrono::milliseconds(20),
                        [&] { return c.stopping || !c.receiving; });
    }
}

} // namespace sim
