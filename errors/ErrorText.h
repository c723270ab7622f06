// The message catalogue: one line of English text for a packed error code, and the
// conversion of a brick status number into a packed code.
#pragma once

#include <cstdint>

class IError;

// "Ok" for a code that is not negative; otherwise the composed message in one shared
// 256-byte buffer, valid until the next call. The buffer is shared, so the function is not
// re-entrant: callers use or copy the text at once, on the dialog's thread.
// sink: the translation's error sink, whose text is the detail; may be null.
const char* GetErrorText(std::int32_t code, IError* sink);

// A brick status result (what tslStatus returns) as a packed code; 0 for success (status 1).
std::int32_t StatusToError(std::int32_t status);

// The size of the shared message buffer, terminator included.
inline constexpr int kErrorTextSize = 256;
