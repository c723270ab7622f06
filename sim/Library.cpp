#include "Library.h"

#include <chrono>
#include <cstdio>
#include <cstring>

#include "Codes.h"
#include "lang/Capacities.h"
#include "lang/Translator.h"
#include "tessel/ReaderWriter.h"

namespace sim {
namespace {

const char* const kBrickTypeNames[8] = {"no brick", "unknown", "Helmsman", "Onyx (no firmware)",
                                        "Onyx",     "Rover",   "Onyx2",    "MiniRover"};

// Copies text into a caller's buffer, cut to its size with the terminator included.
void CopyOut(char* buffer, Size size, const char* text)
{
    if (buffer != nullptr && size > 0) {
        std::snprintf(buffer, size, "%s", text);
    }
}

const char* StripPrefix(const char* port)
{
    return std::strncmp(port, tessel::kPortPrefix, 4) == 0 ? port + 4 : port;
}

std::int32_t PortFault(const Port& port)
{
    switch (port.spec.state) {
    case PortState::Ok:
        break;
    case PortState::InUse:
        return kComInUse;
    case PortState::Conflict:
        return kComConflict;
    case PortState::Missing:
        return kComMissing;
    case PortState::SerialMouse:
        return kComSerialMouse;
    }
    return port.holder != 0 ? kComHeld : kOk;
}

Short ComNumber(const std::string& name)
{
    return static_cast<Short>(std::atoi(name.c_str() + 3));
}

} // namespace

Library& Library::Instance()
{
    // Built on first use and never destroyed, so that no destructor races a client that calls
    // in while the module is being unloaded; tslTerminate is what releases the threads.
    static Library* library = new Library();
    return *library;
}

void Library::ensureLoaded()
{
    if (loaded_) {
        return;
    }
    scenario_ = Scenario::Load();
    if (!scenario_.problem.empty()) {
        std::fprintf(stderr, "Tessel simulator: scenario %s; using the built-in scenario\n",
                     scenario_.problem.c_str());
    }
    bricks_.clear();
    ports_.clear();
    for (const BrickSpec& spec : scenario_.bricks) {
        bricks_.push_back(
            std::make_unique<Brick>(spec, tessel::lang::CapacitiesOf(spec.type).memory));
    }
    for (const PortSpec& spec : scenario_.ports) {
        auto port = std::make_unique<Port>();
        port->spec = spec;
        for (std::size_t i = 0; i < scenario_.bricks.size(); ++i) {
            if (scenario_.bricks[i].name == spec.brick) {
                port->brick = bricks_[i].get();
            }
        }
        ports_.push_back(std::move(port));
    }
    loaded_ = true;
}

Connection* Library::find(Long handle)
{
    auto it = connections_.find(handle);
    return it == connections_.end() ? nullptr : it->second.get();
}

Long Library::initialise()
{
    std::lock_guard<std::mutex> lock(mutex_);
    ensureLoaded();
    trace_.line("tslInitialise() scenario %s", scenario_.source.c_str());
    return kOk;
}

Long Library::terminate()
{
    std::unique_lock<std::mutex> lock(mutex_);
    trace_.line("tslTerminate()");
    while (!connections_.empty()) {
        Connection& connection = *connections_.begin()->second;
        stopThreads(lock, connection);
        connection.port->holder = 0;
        connections_.erase(connection.id);
    }
    loaded_ = false;
    return kOk;
}

Long Library::findPort(char* name, Size size)
{
    std::lock_guard<std::mutex> lock(mutex_);
    ensureLoaded();
    if (name == nullptr || size == 0) {
        return kNullParameter;
    }
    // The previous name is the cursor; a terminator within size is required to read it.
    if (std::memchr(name, '\0', size) == nullptr) {
        return kNullParameter;
    }
    const std::string previous = StripPrefix(name);
    std::size_t start = 0;
    if (!previous.empty()) {
        start = ports_.size();
        for (std::size_t i = 0; i < ports_.size(); ++i) {
            if (ports_[i]->spec.name == previous) {
                start = i + 1;
            }
        }
    }
    // Only ports with a tower answer the search; a tower behind a port that cannot be opened
    // is skipped, and when nothing else turns up its reason is the answer.
    std::int32_t fault = kNoMoreItems;
    for (std::size_t i = start; i < ports_.size(); ++i) {
        const Port& port = *ports_[i];
        if (port.spec.tower == TowerState::None) {
            continue;
        }
        const std::int32_t portFault = PortFault(port);
        if (portFault != kOk) {
            fault = portFault;
            continue;
        }
        if (port.spec.name.size() + 1 > size) {
            return kWispMemoryOverflow;
        }
        CopyOut(name, size, port.spec.name.c_str());
        trace_.line("tslFindPort() -> %s", name);
        return kOk;
    }
    trace_.line("tslFindPort() -> 0x%x", static_cast<unsigned>(fault));
    return fault;
}

Long Library::create(const char* portName)
{
    std::lock_guard<std::mutex> lock(mutex_);
    ensureLoaded();
    if (portName == nullptr) {
        return 0;
    }
    const char* bare = StripPrefix(portName);
    for (auto& port : ports_) {
        if (port->spec.name != bare) {
            continue;
        }
        if (PortFault(*port) != kOk) {
            trace_.line("tslCreate(%s) -> 0 (port unavailable)", bare);
            return 0;
        }
        auto connection = std::make_unique<Connection>();
        connection->id = nextHandle_++;
        connection->port = port.get();
        connection->random =
            scenario_.seed * 2654435761u + static_cast<std::uint32_t>(connection->id);
        connection->range = port->spec.usb ? tessel::RangeMedium : 0;
        port->holder = connection->id;
        const Long id = connection->id;
        connections_[id] = std::move(connection);
        trace_.line("tslCreate(%s) -> %d", bare, id);
        return id;
    }
    trace_.line("tslCreate(%s) -> 0 (no such port)", bare);
    return 0;
}

int Library::destroy(Long handle)
{
    std::unique_lock<std::mutex> lock(mutex_);
    Connection* connection = find(handle);
    if (connection == nullptr) {
        return kBadHandle;
    }
    // A callback that destroys its own handle would wait for itself.
    if (connection->job.get_id() == std::this_thread::get_id() ||
        connection->receiver.get_id() == std::this_thread::get_id()) {
        return kDriverBusy;
    }
    stopThreads(lock, *connection);
    connection->port->holder = 0;
    trace_.line("tslDestroy(%d)", handle);
    connections_.erase(handle);
    return kOk;
}

void Library::stopThreads(std::unique_lock<std::mutex>& lock, Connection& connection)
{
    connection.stopping = true;
    connection.wake.notify_all();
    std::thread job = std::move(connection.job);
    std::thread receiver = std::move(connection.receiver);
    lock.unlock();
    if (job.joinable()) {
        job.join();
    }
    if (receiver.joinable()) {
        receiver.join();
    }
    lock.lock();
    if (connection.pendingResult != nullptr) {
        connection.pendingResult->release();
        connection.pendingResult = nullptr;
    }
    connection.jobRunning = false;
    connection.receiving = false;
    connection.stopping = false;
}

bool Library::linkDelay(std::unique_lock<std::mutex>& lock, Connection& connection,
                        std::int32_t commands)
{
    const auto delay = std::chrono::milliseconds(scenario_.linkMillisPerCommand) * commands;
    if (delay.count() > 0) {
        connection.wake.wait_for(lock, delay, [&] { return connection.stopping; });
    }
    return !connection.stopping;
}

std::int32_t Library::towerStatus(const Connection& connection) const
{
    switch (connection.port->spec.tower) {
    case TowerState::None:
        return StatusNoTower;
    case TowerState::Dead:
        return StatusTowerNotAlive;
    case TowerState::Present:
        break;
    }
    return connection.unplugged ? StatusNoTower : StatusOk;
}

std::int32_t Library::exchange(Connection& connection, Short retries, bool needsBrick)
{
    const PortSpec& spec = connection.port->spec;
    if (spec.tower == TowerState::None) {
        return kNoTower;
    }
    if (spec.tower == TowerState::Dead) {
        return kTowerNotAlive;
    }
    if (connection.unplugged) {
        return kUsbUnplugged;
    }
    if (spec.unplugAfter >= 0 && connection.packetsSent >= spec.unplugAfter) {
        connection.unplugged = true;
        trace_.line("handle %d: tower %s unplugged", connection.id, spec.name.c_str());
        return kUsbUnplugged;
    }
    ++connection.packetsSent;
    LinkStats& stats = connection.stats;
    const bool count = connection.collecting;
    const Brick* brick = connection.port->brick;
    if (needsBrick && (brick == nullptr || !brick->alive())) {
        // Sent, and every retry too, but nobody answers.
        if (count) {
            stats.packets += 1 + retries;
            stats.retries += retries;
            ++stats.errors;
        }
        return kBrickNotAlive;
    }
    for (Short attempt = 0; attempt <= retries; ++attempt) {
        if (count) {
            ++stats.packets;
        }
        connection.random = connection.random * 1103515245u + 12345u;
        const bool lost = static_cast<std::int32_t>((connection.random >> 16) % 100) < spec.loss;
        if (trace_.packets()) {
            trace_.line("handle %d: packet %d%s", connection.id, connection.packetsSent,
                        lost ? " lost" : "");
        }
        if (!lost) {
            return kOk;
        }
        if (count) {
            if (attempt < retries) {
                ++stats.retries;
            } else {
                ++stats.errors;
            }
        }
    }
    return kWispRetryExceeded;
}

Long Library::findBrick(Long handle, Short* type, Long* extra)
{
    std::lock_guard<std::mutex> lock(mutex_);
    if (type == nullptr) {
        return kNullParameter;
    }
    *type = tessel::BrickNone;
    if (extra != nullptr) {
        *extra = 0;
    }
    Connection* connection = find(handle);
    if (connection == nullptr) {
        return kBadHandle;
    }
    const std::int32_t sent = exchange(*connection, connection->execRetries, true);
    if (sent != kOk) {
        trace_.line("tslFindBrick(%d) -> 0x%x", handle, static_cast<unsigned>(sent));
        return sent;
    }
    const Brick& brick = *connection->port->brick;
    *type = brick.type();
    // An Onyx without firmware answers from its ROM as such.
    if (brick.type() == tessel::BrickOnyx && !brick.firmwarePresent()) {
        *type = tessel::BrickOnyxNoFirmware;
    }
    if (extra != nullptr) {
        *extra = brick.firmwarePresent() ? 1 : 0;
    }
    trace_.line("tslFindBrick(%d) -> type %d", handle, *type);
    return kOk;
}

Long Library::status(Long handle, Short what, char* text, Size size)
{
    std::lock_guard<std::mutex> lock(mutex_);
    Connection* connection = find(handle);
    std::int32_t number = StatusOk;
    const char* description = "ok";
    char buffer[96];
    if (what < tessel::StatusPort || what > tessel::StatusDownloadProgress) {
        number = 2;
        description = "unknown status request";
    } else if (connection == nullptr) {
        number = StatusInvalidHandle;
        description = "invalid hBrick";
    } else if (what == tessel::StatusDownload) {
        number = connection->downloadStatus;
        description = connection->downloadText.c_str();
    } else if (what == tessel::StatusDownloadProgress) {
        number = connection->downloadSent;
        std::snprintf(buffer, sizeof buffer, "%d commands sent", number);
        description = buffer;
    } else {
        number = towerStatus(*connection);
        if (number == StatusNoTower) {
            description = connection->unplugged ? "USB tower unplugged" : "no tower on this port";
        } else if (number == StatusTowerNotAlive) {
            description = "tower does not answer";
        } else if (what == tessel::StatusBrick) {
            const Brick* brick = connection->port->brick;
            number =
                brick == nullptr ? StatusBrickNotAlive : brick->statusNumber(connection->brickType);
            switch (number) {
            case StatusBrickNotAlive:
                description = "brick does not answer";
                break;
            case StatusTypeChanged:
                description = "brick type changed";
                break;
            case StatusLowBattery:
                description = "brick battery low";
                break;
            case StatusNoFirmware:
                description = "brick has no firmware";
                break;
            case StatusUnlockFailed:
                description = "brick firmware not unlocked";
                break;
            default:
                if (connection->jobRunning) {
                    number = StatusBusy;
                    description = "brick busy";
                } else {
                    description = "brick ok (simulated)";
                }
                break;
            }
        } else {
            description = "tower ok (simulated)";
        }
    }
    CopyOut(text, size, description);
    return number;
}

Long Library::set(Long handle, Short property, Short value)
{
    std::lock_guard<std::mutex> lock(mutex_);
    ensureLoaded();
    if (property == tessel::PropTrace) {
        trace_.setOptions(value);
        trace_.line("tslSet(%d, trace, %d)", handle, value);
        return kOk;
    }
    Connection* connection = find(handle);
    const bool known = property == tessel::PropBrickType ||
                       (property >= tessel::PropPort && property <= tessel::PropLongRange);
    if (!known) {
        return kBadProperty;
    }
    if (connection == nullptr) {
        return kBadHandle;
    }
    trace_.line("tslSet(%d, %d, %d)", handle, property, value);
    auto positive = [&](Short& field) {
        if (value < 0) {
            return kBadParameters;
        }
        field = value;
        return kOk;
    };
    switch (property) {
    case tessel::PropBrickType:
        if (value < 0 || value > 7) {
            return kBadParameters;
        }
        connection->brickType = value;
        return kOk;
    case tessel::PropExecRetries:
        return positive(connection->execRetries);
    case tessel::PropDownloadRetries:
        return positive(connection->downloadRetries);
    case tessel::PropReceiveTimeout:
        return positive(connection->receiveTimeout);
    case tessel::PropCharTimeout:
        return positive(connection->charTimeout);
    case tessel::PropExecBlockSize:
        return positive(connection->execBlockSize);
    case tessel::PropDownloadBlockSize:
        return positive(connection->downloadBlockSize);
    case tessel::PropFirmwareBlockSize:
        return positive(connection->firmwareBlockSize);
    case tessel::PropRange: {
        if (!connection->port->spec.usb) {
            return kCannotSet;
        }
        if (value < tessel::RangeShort || value > tessel::RangeLong) {
            return kBadParameters;
        }
        if (value == tessel::RangeLong &&
            (!connection->port->spec.longRange || connection->port->spec.longRangeFails)) {
            return kLongRangeFailed;
        }
        const std::int32_t sent = exchange(*connection, connection->execRetries, false);
        if (sent != kOk) {
            return sent;
        }
        connection->range = value;
        return kOk;
    }
    case tessel::PropCollectStats:
        if (!connection->port->spec.statistics) {
            return kWispStatsDisabled;
        }
        connection->collecting = value != 0;
        if (value != 0) {
            connection->stats = LinkStats{};
        }
        return kOk;
    default:
        return kCannotSet; // port, statistics, long-range capability: read only
    }
}

Long Library::get(Long handle, Short property, Short* value, char* text, Size size)
{
    std::lock_guard<std::mutex> lock(mutex_);
    ensureLoaded();
    if (property == tessel::PropTrace) {
        if (value == nullptr) {
            return kNullParameter;
        }
        *value = trace_.options();
        return kOk;
    }
    const bool known = property == tessel::PropBrickType ||
                       (property >= tessel::PropPort && property <= tessel::PropLongRange);
    if (!known) {
        return kBadProperty;
    }
    Connection* connection = find(handle);
    if (connection == nullptr) {
        return kBadHandle;
    }
    const bool needsValue = property != tessel::PropStatistics;
    if ((needsValue && value == nullptr) || (!needsValue && text == nullptr)) {
        return kNullParameter;
    }
    const PortSpec& spec = connection->port->spec;
    switch (property) {
    case tessel::PropBrickType: {
        *value = connection->brickType;
        char name[64];
        std::snprintf(name, sizeof name, "%s (simulated)", kBrickTypeNames[connection->brickType]);
        CopyOut(text, size, name);
        return kOk;
    }
    case tessel::PropPort:
        *value = spec.usb ? tessel::PortUsb : tessel::PortSerialIr;
        CopyOut(text, size, spec.name.c_str());
        return kOk;
    case tessel::PropExecRetries:
        *value = connection->execRetries;
        return kOk;
    case tessel::PropDownloadRetries:
        *value = connection->downloadRetries;
        return kOk;
    case tessel::PropReceiveTimeout:
        *value = connection->receiveTimeout;
        return kOk;
    case tessel::PropCharTimeout:
        *value = connection->charTimeout;
        return kOk;
    case tessel::PropExecBlockSize:
        *value = connection->execBlockSize;
        return kOk;
    case tessel::PropDownloadBlockSize:
        *value = connection->downloadBlockSize;
        return kOk;
    case tessel::PropFirmwareBlockSize:
        *value = connection->firmwareBlockSize;
        return kOk;
    case tessel::PropCollectStats:
        *value = connection->collecting ? 1 : 0;
        return kOk;
    case tessel::PropRange:
        if (!spec.usb) {
            return kCannotGet;
        }
        *value = connection->range;
        return kOk;
    case tessel::PropLongRange:
        if (!spec.usb) {
            return kCannotGet;
        }
        *value = spec.longRange ? tessel::kLongRangeAvailable : 1;
        return kOk;
    case tessel::PropStatistics: {
        if (!connection->collecting) {
            return kWispStatsDisabled;
        }
        const LinkStats& stats = connection->stats;
        char line[96];
        std::snprintf(line, sizeof line, "sim %d packets, %d retries, %d errors", stats.packets,
                      stats.retries, stats.errors);
        CopyOut(text, size, line);
        if (value != nullptr) {
            *value = static_cast<Short>(stats.packets > 32767 ? 32767 : stats.packets);
        }
        return kOk;
    }
    default:
        return kCannotGet;
    }
}

Long Library::info(Short brickType, Short infoId, Short* value)
{
    if (value == nullptr) {
        return kNullParameter;
    }
    if (brickType < 0 || brickType > 7) {
        return kBadBrickType;
    }
    if (!tessel::lang::InfoFigure(brickType, infoId, *value)) {
        return kBadInfoId;
    }
    return kOk;
}

Long Library::findFirst(Short enumType, Short* item, char* name, Size size)
{
    return enumerate(enumType, item, name, size, true);
}

Long Library::findNext(Short enumType, Short* item, char* name, Size size)
{
    return enumerate(enumType, item, name, size, false);
}

// The item number is the cursor: FindNext continues after the entry whose number the caller
// passes back, so walks on different threads or interleaved walks never disturb each other.
Long Library::enumerate(Short enumType, Short* item, char* name, Size size, bool first)
{
    std::lock_guard<std::mutex> lock(mutex_);
    ensureLoaded();
    if (item == nullptr) {
        return first ? kNullParameter : kNItemNull;
    }
    if (name == nullptr) {
        return kNullParameter;
    }
    struct Entry {
        Short number;
        std::string name;
        std::int32_t code;
    };
    std::vector<Entry> entries;
    switch (enumType) {
    case tessel::EnumBrickTypes:
        for (Short type : {2, 4, 5, 6, 7}) {
            entries.push_back({type, kBrickTypeNames[type], kOk});
        }
        break;
    case tessel::EnumSourceTypes:
    case tessel::EnumTargetTypes:
        for (int index = 0;; ++index) {
            int type = 0;
            const char* typeName = enumType == tessel::EnumSourceTypes
                                       ? tessel::lang::SourceTypeName(index, &type)
                                       : tessel::lang::TargetTypeName(index, &type);
            if (typeName == nullptr) {
                break;
            }
            entries.push_back({static_cast<Short>(type), typeName, kOk});
        }
        break;
    case tessel::EnumComPorts:
        for (const auto& port : ports_) {
            if (!port->spec.usb) {
                entries.push_back({ComNumber(port->spec.name), port->spec.name, PortFault(*port)});
            }
        }
        break;
    case tessel::EnumUsbPorts: {
        Short number = 0;
        for (const auto& port : ports_) {
            if (port->spec.usb) {
                entries.push_back({++number, port->spec.name, kOk});
            }
        }
        break;
    }
    default:
        return kBadEnumType;
    }
    std::size_t next = 0;
    if (!first) {
        next = entries.size();
        for (std::size_t i = 0; i < entries.size(); ++i) {
            if (entries[i].number == *item) {
                next = i + 1;
                break;
            }
        }
    }
    if (next >= entries.size()) {
        return kNoMoreItems;
    }
    *item = entries[next].number;
    CopyOut(name, size, entries[next].name.c_str());
    return entries[next].code;
}

} // namespace sim
