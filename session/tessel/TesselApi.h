// The brick library's sixteen entry points, their decorated export names, the callback
// and the value codes passed across the boundary.
//
// The contract was written for a 32-bit Windows library: its long is std::int32_t here
// (a packed code must stay negative when it is negative), short is std::int16_t and
// unsigned sizes are std::uint32_t. Never let a packed code pass through a 64-bit long.
#pragma once

#include <cstdint>

class IError;
class ReaderWriter;

#if defined(_WIN32)
#define TSL_CDECL __cdecl
#define TSL_STDCALL __stdcall
#else
#define TSL_CDECL
#define TSL_STDCALL
#endif

namespace tessel {

using Long = std::int32_t;
using Short = std::int16_t;
using Size = std::uint32_t;

// status < 0 is a failure; count is the commands downloaded so far or a received message's
// number; result is an execution's result file, which the receiver releases.
using Callback = int(TSL_STDCALL*)(Long status, void* context, Long count, ReaderWriter* result);

using InitialiseFn = Long(TSL_CDECL*)();
using TerminateFn = Long(TSL_CDECL*)();
using FindPortFn = Long(TSL_CDECL*)(char* name, Size size);
using CreateFn = Long(TSL_CDECL*)(const char* port);
using DestroyFn = int(TSL_CDECL*)(Long hBrick);
using FindBrickFn = Long(TSL_CDECL*)(Long hBrick, Short* type, Long* extra);
using StatusFn = Long(TSL_CDECL*)(Long hBrick, Short what, char* text, Size size);
using SetFn = Long(TSL_CDECL*)(Long hBrick, Short property, Short value);
using GetFn = Long(TSL_CDECL*)(Long hBrick, Short property, Short* value, char* text, Size size);
using ValidateFn = Long(TSL_CDECL*)(Short brickType, ReaderWriter* source, IError* sink,
                                    ReaderWriter* extra1, ReaderWriter* extra2);
using TranslateFn = Long(TSL_CDECL*)(Short brickType, ReaderWriter* source, ReaderWriter* target,
                                     IError* sink, ReaderWriter* extra1, ReaderWriter* extra2);
using ExecFn = Long(TSL_CDECL*)(Long hBrick, ReaderWriter* code, Long* result,
                                ReaderWriter* resultFile, Callback callback, void* context);
using DownloadFn = Long(TSL_CDECL*)(Long hBrick, ReaderWriter* code, Callback callback,
                                    void* context);
using InfoFn = Long(TSL_CDECL*)(Short brickType, Short infoId, Short* value);
using FindFirstFn = Long(TSL_CDECL*)(Short enumType, Short* item, char* name, Size size);
using FindNextFn = Long(TSL_CDECL*)(Short enumType, Short* item, char* name, Size size);

enum Slot : int {
    SlotInitialise = 0,
    SlotTerminate,
    SlotFindPort,
    SlotCreate,
    SlotDestroy,
    SlotFindBrick,
    SlotStatus,
    SlotSet,
    SlotGet,
    SlotValidate,
    SlotTranslate,
    SlotExec,
    SlotDownload,
    SlotInfo,
    SlotFindFirst,
    SlotFindNext,
    SlotCount
};

// The decorated export names, in slot order; the decoration is part of the name.
inline constexpr const char* kExportNames[SlotCount] = {
    "?tslInitialise@@YAJXZ",
    "?tslTerminate@@YAJXZ",
    "?tslFindPort@@YAJPADI@Z",
    "?tslCreate@@YAJPBD@Z",
    "?tslDestroy@@YAHJ@Z",
    "?tslFindBrick@@YAJJPAFPAJ@Z",
    "?tslStatus@@YAJJFPADI@Z",
    "?tslSet@@YAJJFF@Z",
    "?tslGet@@YAJJFPAFPADI@Z",
    "?tslValidate@@YAJFPAVReaderWriter@@PAVIError@@00@Z",
    "?tslTranslate@@YAJFPAVReaderWriter@@0PAVIError@@00@Z",
    "?tslExec@@YAJJPAVReaderWriter@@PAJ0P6GHJPAXJ0@Z2@Z",
    "?tslDownload@@YAJJPAVReaderWriter@@P6GHJPAXJ0@Z1@Z",
    "?tslInfo@@YAJFFPAF@Z",
    "?tslFindFirst@@YAJFPAFPADI@Z",
    "?tslFindNext@@YAJFPAFPADI@Z",
};

// ELF symbols cannot carry the decorated names, so a module also exports a C data symbol
// "export_table": an array of these ended by {nullptr, nullptr}. The loader tries dlsym()
// first, then the table.
struct ExportEntry {
    const char* name;
    void* address;
};
inline constexpr const char* kExportTableSymbol = "export_table";

// Properties of tslSet / tslGet.
enum Property : Short {
    PropBrickType = 1,         // value: brick type; Get text: its name (buffer of 40)
    PropPort = 3,              // value: port kind; text: port name
    PropExecRetries = 4,
    PropDownloadRetries = 5,
    PropReceiveTimeout = 6,    // milliseconds
    PropCharTimeout = 7,       // inter-character timeout, milliseconds
    PropRange = 8,             // USB tower transmitter: 1 short, 2 medium, 3 long
    PropCollectStats = 9,      // Set 1 right after a port is opened
    PropStatistics = 10,       // Get text (buffer of 80)
    PropExecBlockSize = 11,
    PropDownloadBlockSize = 12,
    PropFirmwareBlockSize = 13,
    PropLongRange = 14,        // 2: the long range is available on this tower
    PropTrace = 15,            // Set with hBrick 0: trace options
};

// Port kinds read through PropPort.
enum PortKind : Short {
    PortSerialIr = 1,  // "RS232 IR"
    PortUsb = 3,
};

// Range values of PropRange.
enum Range : Short {
    RangeShort = 1,
    RangeMedium = 2,
    RangeLong = 3,
};

inline constexpr Short kLongRangeAvailable = 2;

// tslStatus requests.
enum StatusRequest : Short {
    StatusPort = 2,              // any number, converted by StatusToError
    StatusBrick = 3,             // with a text (buffer of 80)
    StatusDownload = 4,          // with a text (buffer of 80)
    StatusDownloadProgress = 5,  // commands sent so far
};

// Status numbers acted on.
inline constexpr Long kBrickAnswers = 1;       // StatusBrick: as expected
inline constexpr Long kBrickTypeChanged = 9;   // StatusBrick: detect again
inline constexpr Long kDownloadRunning = 0;    // StatusDownload
inline constexpr Long kDownloadFinished = 1;   // StatusDownload
inline constexpr Long kStatusNoLibrary = 13;   // what Status returns without the entry point

// Enumerations of tslFindFirst / tslFindNext (name buffers of 260).
enum EnumType : Short {
    EnumBrickTypes = 0,
    EnumSourceTypes = 1,
    EnumTargetTypes = 2,
    EnumComPorts = 3,
    EnumUsbPorts = 4,
};

// tslInfo ids: one figure of a brick type.
enum InfoId : Short {
    InfoTasks = 1,
    InfoSubroutines = 2,
    InfoProgramSlots = 3,
    InfoGlobalVariables = 4,
    InfoLocalVariables = 5,
    InfoOutputs = 6,
    InfoInputs = 7,
    InfoSubroutineNesting = 8,
    InfoTimers = 11,
    InfoCounters = 13,
    InfoEvents = 14,
    InfoSemaphores = 15,
    InfoProgramMemory = 18,
};

// Brick types reported by tslFindBrick and taken by PropBrickType.
enum BrickType : Short {
    BrickNone = 0,
    BrickUnknown = 1,
    BrickHelmsman = 2,
    BrickOnyxNoFirmware = 3,
    BrickOnyx = 4,
    BrickRover = 5,
    BrickOnyx2 = 6,
    BrickMiniRover = 7,
};

// Workspace file types: the type a handle is opened with tells the library what it holds.
enum FileType : std::int32_t {
    FileResult = 0,
    FileScript = 1,
    FileOpal = 2,
    FileRaw = 3,
    FileCode = 4,      // compiled code; a source of this type is used without translation
    FileFirmware = 5,
    FileCsvListing = 7,
};

// Packed codes both sides rely on.
inline constexpr std::uint32_t kNoMoreItems = 0xE0050C52u;      // enumeration ended
inline constexpr std::uint32_t kLinkFailed = 0xE0050C41u;       // entry point missing
inline constexpr std::uint32_t kIllegalNullParam = 0xE0050C64u; // null pointer argument

// Port names are given to tslCreate as "\\.\%s".
inline constexpr const char* kPortPrefix = "\\\\.\\";

// Fixed buffer sizes of the contract (terminator included).
inline constexpr Size kPathSize = 260;
inline constexpr Size kStatusTextSize = 80;
inline constexpr Size kBrickNameSize = 40;

}  // namespace tessel
