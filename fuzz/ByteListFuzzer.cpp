// The readers of the brick's byte-list answers on any file: ParseByteList stores no more than
// it may and closes the file, ReadByteValue and ReadWord walk a file of any content to its end.
#include <cstdint>
#include <cstdlib>
#include <new>
#include <string>
#include <vector>

#include "FuzzInput.h"
#include "tools/ByteList.h"
#include "workspace/LiveObjects.h"
#include "workspace/MemoryBlock.h"
#include "workspace/MemoryFile.h"

namespace {

void Check(bool condition)
{
    if (!condition) {
        std::abort();
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    const std::int64_t before = workspace::LiveObjectCount();
    {
        fuzz::Input input(data, size);
        const int max = input.byte() % 100 - 4; // a few negative limits too
        const bool text = (input.byte() & 1) != 0;
        const std::string content = input.rest();

        MemoryBlock* block = new MemoryBlock();
        DirEnt* entry =
            (text ? static_cast<DirEnt*>(new TextMemoryEntry(block)) : new MemoryEntry(block))
                ->addRef();
        ReaderWriter* file = entry->open(0);
        Check(file != nullptr);
        file->open("wb");
        file->write(content.data(), static_cast<std::int32_t>(content.size()));
        file->close();

        // Guard bytes behind the limit catch a store past it.
        constexpr int kGuard = 16;
        const int room = max > 0 ? max : 0;
        std::vector<unsigned char> out(static_cast<std::size_t>(room + kGuard), 0xa5);
        const int stored = tools::ParseByteList(file, out.data(), max);
        Check(stored >= 0 && stored <= room);
        for (int i = room; i < room + kGuard; ++i) {
            Check(out[static_cast<std::size_t>(i)] == 0xa5);
        }
        Check(tools::ParseByteList(nullptr, out.data(), max) == 0);

        // Field by field to the end: a call that takes no byte means the readable text is used
        // up (a text file ends at a Ctrl-Z, before its size).
        file->open("r");
        for (std::size_t calls = 0;; ++calls) {
            Check(calls <= content.size() + 2);
            const std::int32_t position = file->tell();
            if ((calls & 1) != 0) {
                tools::ReadWord(file);
            } else {
                tools::ReadByteValue(file);
            }
            if (file->tell() == position) {
                break;
            }
        }
        tools::ReadWord(file);
        file->release();
        entry->release();
    }
    Check(workspace::LiveObjectCount() == before);
    return 0;
}
