// Small text helpers for walking the library's CSV listing record by record and field by
// field. A listing record is a decimal record number followed by fields, all separated by
// ","; records are separated by line ends.
#pragma once

#include <cstddef>

namespace tools {

// Frees *line (std::free) and cuts the next line off *cursor into a new std::malloc'ed copy
// that the caller frees through the next call or with std::free.
//
// A line ends at "\r\n" or at a lone "\n": text read back through a text-mode workspace
// handle has its CR LF pairs turned into LF, and such a listing must still split into
// records. When a line end is found the cursor moves past it and the result is true.
// Otherwise the line receives the whole remaining text and the remaining text is emptied
// in place (its first character set to 0): the result is false.
// When the copy cannot be allocated *line is null; the cursor moves on all the same, so a
// walk "while the remaining text is not empty" always ends.
bool NextLine(char** cursor, char** line);

// Reads a decimal number from the start of text (0 when none can be read; values beyond
// the int range are clamped), then moves the text after the first comma to the front, or
// empties the text when it holds no comma.
int TakeNumber(char* text);

// An empty text gives false. Otherwise out receives the text before the first comma (the
// whole text when there is none), cut to outSize - 1 characters; the text after the comma
// moves to the front (or the text is emptied) and the result is true.
bool TakeField(char* text, char* out, std::size_t outSize);

} // namespace tools
