// The state of the loaded library: the scenario's ports and bricks, the open brick handles and
// their background threads, and the entry points' behaviour. A loaded module has exactly one
// of these (Library::Instance); everything in it is guarded by one lock, which is never held
// while a client callback runs.
#pragma once

#include <condition_variable>
#include <cstdint>
#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "Brick.h"
#include "Scenario.h"
#include "Trace.h"
#include "lang/Program.h"
#include "tessel/TesselApi.h"

namespace sim {

using tessel::Callback;
using tessel::Long;
using tessel::Short;
using tessel::Size;

struct LinkStats {
    std::int32_t packets = 0;
    std::int32_t retries = 0;
    std::int32_t errors = 0;
};

// A port of the scenario, with the brick in front of its tower (null: none).
struct Port {
    PortSpec spec;
    Brick* brick = nullptr;
    Long holder = 0; // the handle that has it open, 0 when free
};

// One open brick handle: its link over the tower and its background work.
struct Connection {
    Long id = 0;
    Port* port = nullptr;
    // Properties.
    Short brickType = 6;
    Short execRetries = 3;
    Short downloadRetries = 3;
    Short receiveTimeout = 300;
    Short charTimeout = 50;
    Short range = 2;
    Short execBlockSize = 64;
    Short downloadBlockSize = 32;
    Short firmwareBlockSize = 128;
    bool collecting = false;
    LinkStats stats;
    // Link.
    bool unplugged = false;
    std::int32_t packetsSent = 0;
    std::uint32_t random = 1;
    // A download or asynchronous execution, one at a time.
    std::thread job;
    bool jobRunning = false;
    bool polledDownload = false;
    std::int32_t downloadSent = 0;
    std::int32_t downloadStatus = 1; // tslStatus 4 number
    std::string downloadText = "no download started";
    // The result file of an asynchronous execution until the callback takes it; released by
    // whoever stops the thread when the callback never runs.
    ReaderWriter* pendingResult = nullptr;
    // Brick message reception.
    std::thread receiver;
    bool receiving = false;
    Callback receiveCallback = nullptr;
    void* receiveContext = nullptr;
    // Set by tslDestroy/tslTerminate; threads wake and leave without calling back.
    bool stopping = false;
    std::condition_variable wake;
};

class Library {
public:
    static Library& Instance();

    Long initialise();
    Long terminate();
    Long findPort(char* name, Size size);
    Long create(const char* port);
    int destroy(Long handle);
    Long findBrick(Long handle, Short* type, Long* extra);
    Long status(Long handle, Short what, char* text, Size size);
    Long set(Long handle, Short property, Short value);
    Long get(Long handle, Short property, Short* value, char* text, Size size);
    Long validate(Short brickType, ReaderWriter* source, IError* sink, ReaderWriter* extra1,
                  ReaderWriter* extra2);
    Long translate(Short brickType, ReaderWriter* source, ReaderWriter* target, IError* sink,
                   ReaderWriter* extra1, ReaderWriter* extra2);
    Long exec(Long handle, ReaderWriter* code, Long* result, ReaderWriter* resultFile,
              Callback callback, void* context);
    Long download(Long handle, ReaderWriter* code, Callback callback, void* context);
    Long info(Short brickType, Short infoId, Short* value);
    Long findFirst(Short enumType, Short* item, char* name, Size size);
    Long findNext(Short enumType, Short* item, char* name, Size size);

private:
    Library() = default;

    void ensureLoaded();           // lock held
    Connection* find(Long handle); // lock held; null for an unknown handle
    Long enumerate(Short enumType, Short* item, char* name, Size size, bool first);
    // One packet out and its answer back; kOk or why not. Lock held.
    std::int32_t exchange(Connection& connection, Short retries, bool needsBrick);
    // The tslStatus 2 number of a connection. Lock held.
    std::int32_t towerStatus(const Connection& connection) const;
    // Stops and joins a connection's threads; takes and gives back the lock.
    void stopThreads(std::unique_lock<std::mutex>& lock, Connection& connection);
    // Waits the simulated transmission time of some commands; false when told to stop.
    bool linkDelay(std::unique_lock<std::mutex>& lock, Connection& connection,
                   std::int32_t commands);
    Long startReception(Long handle, Callback callback, void* context);
    Long stopReception(Long handle);
    void receive(Connection* connection);
    // Sends and runs immediate commands on the brick; lock held.
    std::int32_t runImmediate(Connection& connection, const tessel::lang::Program& program,
                              tessel::lang::ExecOutcome& outcome);
    // Makes room for a new background job: joins a finished one; lock held, may be released.
    bool reapJob(std::unique_lock<std::mutex>& lock, Long handle);
    struct Block {
        std::int32_t commands;   // in this block
        std::int32_t cumulative; // sent once this block is through
    };
    void downloadJob(Connection* connection, std::vector<Block> blocks,
                     tessel::lang::Program program, int slot, Callback callback, void* context);

    friend class ExecContext;

    std::mutex mutex_;
    bool loaded_ = false;
    Scenario scenario_;
    std::vector<std::unique_ptr<Brick>> bricks_;
    std::vector<std::unique_ptr<Port>> ports_;
    std::map<Long, std::unique_ptr<Connection>> connections_;
    Long nextHandle_ = 1;
    Trace trace_;
};

} // namespace sim
