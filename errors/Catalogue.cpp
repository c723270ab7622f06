// The catalogue's texts, copied exactly; the library's status names stay as they are.
#include "errors/Catalogue.h"

#include <iterator>

namespace catalogue {
namespace {

template <typename Table> const Entry* FindIn(const Table& table, std::uint32_t number)
{
    for (const Entry& entry : table) {
        if (entry.number == number) {
            return &entry;
        }
    }
    return nullptr;
}

template <typename Table> const char* TextIn(const Table& table, std::uint32_t number)
{
    const Entry* entry = FindIn(table, number);
    return entry != nullptr ? entry->text : kUnknown;
}

// Facility 3, the assembler, by code field.
const Entry kOpal[] = {
    {1, "outside range"},
    {2, "not one range"},
    {3, "no source"},
    {4, "no range"},
    {5, "no number"},
    {6, "argc zero"},
    {7, "unknown opcode"},
    {8, "wrong opcode"},
    {9, "wrong number of fields"},
    {10, "value below range"},
    {11, "value above range"},
    {12, "wrong mode"},
    {13, "too many bytes on line"},
    {14, "too few bytes on line"},
    {15, "file not found"},
    {16, "undefined label"},
    {17, "unknown command"},
    {18, "soundset not implemented"},
    {19, "task ID not defined"},
    {20, "sub ID not defined"},
    {21, "soundset ID not defined"},
    {22, "label ID not defined"},
    {23, "syntax"},
    {24, "label redefined"},
    {25, "labels not allowed"},
    {26, "illegal character"},
    {27, "parameter expression"},
    {28, "too many nested includes"},
    {29, "too many macro expansions"},
    {30, "too many nested conditionals"},
    {31, "unmatched conditional"},
    {32, "unfinished conditional"},
    {33, "label conditional"},
    {34, "label undefined"},
    {35, "expression label undefined"},
    {36, "expression div zero"},
    {37, "warning - symbol redefined"},
    {38, "warning - symbol undefined"},
};

// Facility 6, the byte lookup table of the target brick, by code field.
const Entry kBlt[] = {
    {1, "Zero or more than one range was found"},
    {2, "No range information could be found for the source"},
    {3, "No range information could be found"},
    {4, "No following number for the source"},
    {5, "No arguments to encode"},
    {6, "Unknown opcode"},
    {7, "Wrong number of arguments"},
    {8, "Value is below valid range"},
    {9, "Value is above valid range"},
    {10, "The opcode is not allowed in this mode"},
};

// Facility 5 module 1, the driver, by code field. Code 118 has no text.
const Entry kDriver[] = {
    {1, "invalid hBrick"},
    {2, "PBrick not alive"},
    {3, "PBrick type mismatch"},
    {4, "PBrick ID mismatch"},
    {7, "internal error: byte code underflow"},
    {8, "internal error: NULL pCmd"},
    {9, "bad result returned by PBrick"},
    {10, "cannot execute request (driver busy)"},
    {11, "tower not alive"},
    {12, "illegal NULL property string"},
    {13, "driver not initialised"},
    {14, "not enough memory for task/sub"},
    {15, "download mode not active in PBrick"},
    {16, "given parameters not correct, #of jobs"},
    {17, "transmission error (blockcounter invalid)"},
    {18, "unknown download error"},
    {19, "failed to set USB port to long range"},
    {20, "failed to set USB type (IR/VLL)"},
    {21, "bad firmware RAM download checksum"},
    {32, "IDSTATUS_RESULT_UNKNOWN | IDSTATUS_RESULT_NODRIVER"},
    {33, "IDSTATUS_RESULT_NOTOWER"},
    {34, "IDSTATUS_RESULT_BADPBRICK (no firmware)"},
    {35, "IDSTATUS_RESULT_UNLOCKFAILED"},
    {36, "IDSTATUS_RESULT_BADPBRICKBATTERY"},
    {37, "IDSTATUS_RESULT_DOWNLOADING"},
    {64, "failed to load Commstk32.dll LOM function"},
    {65, "GetObject(Kivo.Pbk.CommStack.Port.RS232,IPbkPort) returned NULL"},
    {66, "failed to create session from RS232 port"},
    {67, "failed to create session from USB port"},
    {68, "no more ports found"},
    {80, "COM port opened by another application"},
    {81, "failed to open COM port: hardware conflict?"},
    {82, "COM port does not exist"},
    {83, "serial mouse using COM port"},
    {84, "COM port already associated with an hBrick"},
    {96, "Failed to load BeaconAPI.dll"},
    {97, "BeaconAPI failed to CreateFile"},
    {100, "illegal NULL parameter"},
    {113, "USB system not enabled"},
    {114, "no USB host controllers"},
    {115, "missing Turret.sys or other USB driver(s)"},
    {116, "Kivo USB Tower has been unplugged from this port"},
    {117, "Kivo USB Tower installation failed"},
    {119, "missing Turret.sys"},
};

// Facility 5 module 2, the compiler, by code field; detail codes take the sink's text.
const CompilerEntry kCompiler[] = {
    {1, true, "syntax error"},
    {2, false, "parser stack overflow (program too complicated)"},
    {3, false, "translation stack overflow (program too complicated)"},
    {16, true, "variable not declared"},
    {17, true, "variable, semaphore, counter or parameter name expected"},
    {18, true, "value expected"},
    {19, false, "internal compiler error (bad symbol table)"},
    {20, false, "internal compiler error (invalid token): "},
    {21, false, "internal compiler error (bad encoder)"},
    {22, true, "name expected"},
    {23, true, "name already declared"},
    {24, true, "too many variables for target PBrick"},
    {25, true, "name not declared"},
    {26, false, "no more tasks available in target PBrick"},
    {27, false, "no more subroutines available in target PBrick"},
    {28, false, "task undefined"},
    {29, false, "macro called but not undefined"},
    {30, false, "sensor not declared"},
    {31, false, "no temp variable available for repeat loop"},
    {32, false, "constant not declared"},
    {33, false, "no more timers available in target PBrick"},
    {34, true, "subroutines cannot call other subroutines"},
    {35, true, "subroutines cannot call themselves"},
    {36, true, "undefined watcher"},
    {37, true, "too many events for target PBrick"},
    {38, true, "event not declared"},
    {39, true, "too many parameters for macro"},
    {40, true, "not enough parameters for macro"},
    {41, true, "property not recognised"},
    {42, true, "too many counters for target PBrick"},
    {43, true, "event expected"},
    {44, true, "event not valid for target PBrick"},
    {45, true, "cannot nest try blocks"},
    {46, true, "locals must be declared inside main, watcher or task"},
    {47, true, "too many semaphores for target PBrick"},
    {48, true, "undeclared semaphore"},
    {49, false, "monitor not allowed inside a restarting watcher"},
    {50, false, "subroutine index out of range"},
    {51, false, "only literal watch times allowed"},
    {52, false, "only literal port lists allowed"},
    {53, false, "cannot specify a range as a value"},
    {54, false, "internal compiler error (eval parse error)"},
    {55, false, "run out of local variables while evaluating an expression"},
    {56, false, "cannot declare this as a global"},
    {57, false, "cannot declare this as a local"},
    {58, false, "event cannot be used here"},
    {100, false, "illegal NULL parameter"},
    {129, true, "parameter out of range"},
    {130, true, "constant expected"},
    {131, false, "primitive only available in immediate mode"},
    {132, false, "primitive only available in download mode"},
    {133, true, "type mismatch"},
    {134, true, "not implemented"},
    {135, false, "internal compiler error (wrong number of parameters)"},
    {136, false, "internal compiler error (not sub)"},
    {137, false, "task or watcher expected for start/stop"},
    {138, false, "internal compiler error (invalid relop)"},
    {139, false, "bad parameter to 'get' primitive"},
    {145, false, "failed to initialise compiler for selected PBrick & target code"},
    {146, false, "failed to read include file"},
    {147, false, "failed to find or create ReaderWriter preprocessor file"},
    {148, false, "failed to open ReaderWriter object file"},
    {149, false, "failed to open ReaderWriter temporary file"},
    {150, false, "script assertion failed"},
    {151, false, "failed to read source file"},
    {152, false, "error while reading source file"},
    {255, false, "internal compiler error"},
};

// Facility 5 module 3, the library's own layer, by code field.
const Entry kLibrary[] = {
    {65, "failed to link to Tessel.dll"},
    {66, "failed to link to Mason.dll"},
    {67, "failed to link to Convey.dll"},
    {68, "failed to link to Scribe.dll"},
    {69, "failed to link to Opal.dll"},
    {70, "failed to link to target PBrick BLT (Onyx2.dll or Rover.dll)"},
    {71, "failed to find target PBrick BLT (Onyx2.dll or Rover.dll)"},
    {72, "BLT DLL failed to return a byte lookup table"},
    {81, "nItem parameter to tslFindNext should not be NULL"},
    {82, "no more items found"},
    {83, "unrecognised nEnumType in tslFindFirst/tslFindNext"},
    {84, "unknown info request"},
    {97, "unrecognised property set/get"},
    {98, "cannot get this property"},
    {99, "cannot set this property"},
    {100, "illegal NULL parameter"},
    {129, "illegal NULL root in tessel"},
    {130, "Insert DirEnt failed in tessel"},
    {131, "ReaderWriter Create failed in tessel"},
    {132, "illegal NULL source path"},
    {133, "illegal NULL result path"},
    {134, "illegal NULL firmware path"},
    {135, "illegal NULL temp path"},
    {145, "illegal NULL source"},
    {146, "illegal NULL target"},
    {147, "bad source (OpenRead failed)"},
    {148, "bad source type"},
    {149, "bad target (OpenWrite failed)"},
    {150, "bad target type"},
    {151, "Opal returned NULL raw bytecodelist"},
    {152, "bad (unsupported) PBrick type"},
};

// Facility 256, the communication stack, by whole value (severity 3 only).
const Entry kWisp[] = {
    {0xE1000000u, "Generic error"},
    {0xE1000001u, "Bad parameters"},
    {0xE1000002u, "Method not implemented"},
    {0xE1000003u, "Insufficient memory to perform the requested operation"},
    {0xE1000004u, "Memory overflow - buffer size insufficient to hold requested data"},
    {0xE1000101u, "Port (or protocol, or session) already open"},
    {0xE1000102u, "Port (or protocol, or session) already closed"},
    {0xE1000103u, "Requested service is incompatible with the current state"},
    {0xE1000104u, "No more items or devices could be found"},
    {0xE1000105u, "Communication timeout occurred. Couldn't complete the requested operation"},
    {0xE1000106u, "The object is in an invalid state"},
    {0xE1000107u, "Item not found"},
    {0xE1000108u, "Abort requested for the specified command"},
    {0xE1000110u, "Error opening port (or protocol, or session)"},
    {0xE1000111u, "Transmission error"},
    {0xE1000112u, "Receive error"},
    {0xE1000113u, "Error in <om IPbkPort::devicecontrol>"},
    {0xE1000114u, "Error in <om IPbkPort::getthroughput>"},
    {0xE1000115u, "Error in <om IPbkPort::settimeout>"},
    {0xE1000116u, "Error in <om IPbkPort::gettimeout>"},
    {0xE1000117u, "Error while creating a thread"},
    {0xE1000118u, "No port object was bound to protocol object"},
    {0xE1000119u, "No protocol object was bound to session object"},
    {0xE100011Au, "Error in <om IPbkPort::flush>"},
    {0xE100011Bu, "Error in <om IPbkPort::abort>"},
    {0xE100011Cu, "Error in <om IPbkProtocol::sendcommand>"},
    {0xE1000201u, "Bad or missing protocol packet header"},
    {0xE1000202u, "Bad or protocol packet checksum"},
    {0xE1000203u, "Bad packet length"},
    {0xE1000204u, "Retry count exceeded"},
    {0xE1000205u, "Negative acknowledge received"},
    {0xE1000206u, "Statistics are currently disabled"},
    {0xE1000301u, "Request queue empty"},
    {0xE1000302u, "Abort already requested for the specified PBK_HREQUEST"},
    {0xE1000340u, "No tower seems to be connected to the currently open protocol/port"},
};

// Facility 512, the USB port of the communication stack, by whole value.
const Entry kWispUsb[] = {
    {0xE2000001u, "Unsupported request"},
    {0xE200000Au, "Invalid request"},
    {0xE2000064u, "Unspecified USB problem"},
    {0xE2000065u, "Call to wrong USB function"},
    {0xE2000066u, "No or invalid data received"},
    {0xE2000067u, "Invalid endpoint"},
    {0xE2000068u, "Invalid packetsize"},
    {0xE2000069u, "Error on sending on endpoint 0"},
    {0xE200006Au, "Tried to send more than MAXPACKETSIZE on endpoint 0"},
    {0xE200006Bu, "Tried to send more than MAXPACKETSIZE on endpoint 1"},
    {0xE200006Cu, "Answer buffer full"},
    {0xE20000C8u, "SW UART problems"},
    {0xE20000C9u, "Invalid UART mode"},
    {0xE20000D2u, "Invalid TX state"},
    {0xE20000F0u, "Tower out of order"},
    {0xE20000FFu, "undefined error"},
};

} // namespace

const char* OpalText(std::uint32_t code)
{
    return TextIn(kOpal, code);
}
const char* BltText(std::uint32_t code)
{
    return TextIn(kBlt, code);
}
const char* DriverText(std::uint32_t code)
{
    return TextIn(kDriver, code);
}
const char* LibraryText(std::uint32_t code)
{
    return TextIn(kLibrary, code);
}
const char* WispText(std::uint32_t value)
{
    return TextIn(kWisp, value);
}
const char* WispUsbText(std::uint32_t value)
{
    return TextIn(kWispUsb, value);
}

const char* CompilerText(std::uint32_t code, bool* detail)
{
    for (const CompilerEntry& entry : kCompiler) {
        if (entry.number == code) {
            *detail = entry.detail;
            return entry.text;
        }
    }
    *detail = false;
    return kUnknown;
}

} // namespace catalogue
