// The state shared between the recording test library (a module loaded as Tessel.dll) and
// the tests that drive it. The tests reach it through the C function testlib_state(),
// looked up in the same loaded module the session uses.
#pragma once

#include <cstdint>

#include "tessel/TesselApi.h"

struct RecordedCall {
    int count = 0; // calls of this slot since the last reset
    // Integer arguments in parameter order (hBrick, short values widened, sizes).
    std::int64_t numbers[4] = {};
    // Pointer arguments in parameter order.
    const void* pointers[6] = {};
};

struct RecordingState {
    RecordedCall calls[tessel::SlotCount];
    // What each entry point returns.
    tessel::Long results[tessel::SlotCount] = {};

    // tslFindBrick, tslGet, tslInfo, tslFindFirst/Next write these into their out-parameters.
    tessel::Short shortOut = 0;
    tessel::Long longOut = 0;
    char textOut[64] = {};

    // tslTranslate: what it read from the source and the types of both handles; on success
    // it writes "cmd " followed by the source into the target.
    char sourceText[4096] = {};
    std::int32_t sourceType = -1;
    std::int32_t targetType = -1;
    // On failure it reports into the sink at this position.
    std::int32_t errorPosition = 0;

    // tslExec: the size of the result file when called (-1: none given) and the text of
    // the code it ran; it then appends resultText to the result file and stores
    // resultNumber in *result.
    std::int32_t resultSizeOnEntry = -1;
    char codeText[4096] = {};
    char resultText[256] = {};
    tessel::Long resultNumber = 0;

    // Slot whose decorated name is left out of the export table, or -1.
    int omittedSlot = -1;
};

extern "C" {
using TestLibStateFn = RecordingState* (*)();
using TestLibResetFn = void (*)();
using TestLibOmitFn = void (*)(int slot);
}
