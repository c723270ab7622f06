// Text and binary handles on one memory block, driven by random reads, writes, seeks, size
// changes and reopenings, each checked against a plain model of the stored bytes: LF is
// stored as CR LF, CR LF reads back as LF, a lone CR stays, a Ctrl-Z ends the text with the
// position left on it. A block never shrinks its buffer: bytes beyond a shortened length keep
// what they held and come back when the file grows again; room never used before is zeros.
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <new>
#include <string>
#include <vector>

#include "FuzzInput.h"
#include "workspace/LiveObjects.h"
#include "workspace/MemoryBlock.h"
#include "workspace/MemoryFile.h"

namespace {

constexpr unsigned char kCr = 13;
constexpr unsigned char kLf = 10;
constexpr unsigned char kCtrlZ = 26;

void Check(bool condition)
{
    if (!condition) {
        std::abort();
    }
}

struct Model {
    std::vector<unsigned char> buffer; // every byte ever held; the file is its first length
    std::size_t length = 0;

    std::size_t size() const { return length; }

    void resize(std::size_t newLength)
    {
        if (newLength > buffer.size()) {
            buffer.resize(newLength, 0);
        }
        length = newLength;
    }

    // Stores at position, growing as needed; returns the new position.
    std::int32_t store(std::int32_t position, const std::vector<unsigned char>& data)
    {
        const auto at = static_cast<std::size_t>(position);
        if (at + data.size() > length) {
            resize(at + data.size());
        }
        std::memcpy(buffer.data() + at, data.data(), data.size());
        return static_cast<std::int32_t>(at + data.size());
    }

    std::string readText(std::int32_t& position, std::int32_t count) const
    {
        std::string out;
        if (count < 1 || position < 0) {
            return out;
        }
        auto at = static_cast<std::size_t>(position);
        while (static_cast<std::int32_t>(out.size()) < count && at < length) {
            const unsigned char c = buffer[at];
            if (c == kCtrlZ) {
                break;
            }
            ++at;
            if (c == kCr && at < length && buffer[at] == kLf) {
                ++at;
                out += static_cast<char>(kLf);
            } else {
                out += static_cast<char>(c);
            }
        }
        position = static_cast<std::int32_t>(at);
        return out;
    }
};

struct Handle {
    ReaderWriter* rw = nullptr;
    std::int32_t position = 0;
    bool text = false;
};

std::vector<unsigned char> Payload(fuzz::Input& input)
{
    const std::string raw = input.text(40);
    std::vector<unsigned char> out(raw.begin(), raw.end());
    return out;
}

void Step(fuzz::Input& input, Model& model, Handle& h)
{
    ReaderWriter* rw = h.rw;
    const auto size = static_cast<std::int32_t>(model.size());
    switch (input.byte() % 9) {
    case 0: { // write
        const std::vector<unsigned char> data = Payload(input);
        std::vector<unsigned char> stored;
        for (unsigned char c : data) {
            if (h.text && c == kLf) {
                stored.push_back(kCr);
            }
            stored.push_back(c);
        }
        const std::int32_t n = rw->write(data.data(), static_cast<std::int32_t>(data.size()));
        Check(n == static_cast<std::int32_t>(data.size()));
        if (!data.empty()) {
            h.position = model.store(h.position, stored);
        }
        break;
    }
    case 1: { // read
        const std::int32_t count = input.byte() % 48;
        std::vector<char> buffer(static_cast<std::size_t>(count) + 1, '\x7f');
        const std::int32_t n = rw->read(buffer.data(), count);
        Check(n >= 0 && n <= count);
        Check(buffer[static_cast<std::size_t>(count)] == '\x7f');
        if (h.text) {
            const std::string expected = model.readText(h.position, count);
            Check(std::string(buffer.data(), static_cast<std::size_t>(n)) == expected);
        } else {
            const std::int32_t available = h.position < size ? size - h.position : 0;
            const std::int32_t expected = count < available ? count : available;
            Check(n == expected);
            Check(n == 0 || std::memcmp(buffer.data(), model.buffer.data() + h.position,
                                        static_cast<std::size_t>(n)) == 0);
            h.position += n;
        }
        break;
    }
    case 2: { // seek
        const std::int32_t target = static_cast<std::int8_t>(input.byte());
        const bool ok = rw->seek(target).succeeded();
        Check(ok == (target >= 0 && target <= size));
        if (ok) {
            h.position = target;
        }
        break;
    }
    case 3: { // seekBy
        const std::int32_t delta = static_cast<std::int8_t>(input.byte());
        const std::int64_t target = static_cast<std::int64_t>(h.position) + delta;
        const bool ok = rw->seekBy(delta).succeeded();
        Check(ok == (target >= 0 && (delta <= 0 || target <= size)));
        if (ok) {
            h.position = static_cast<std::int32_t>(target);
        }
        break;
    }
    case 4: { // setSize
        const std::int32_t length = static_cast<std::int8_t>(input.byte());
        const bool ok = rw->setSize(length).succeeded();
        Check(ok == (length >= 0));
        if (ok) {
            model.resize(static_cast<std::size_t>(length));
        }
        break;
    }
    case 5: { // open
        static const char* const kModes[] = {"r", "w", "a", "rb", "wt", "a+", "wa", "", "r+"};
        const char* mode = kModes[input.byte() % 9];
        Check(rw->open(mode).succeeded());
        const bool write = std::strchr(mode, 'w') != nullptr;
        const bool append = std::strchr(mode, 'a') != nullptr;
        if (write && !append) {
            model.resize(0);
        }
        h.position = append ? static_cast<std::int32_t>(model.size()) : 0;
        break;
    }
    case 6:
        rw->close();
        h.position = 0;
        break;
    case 7:
        rw->rewind();
        h.position = 0;
        break;
    default:
        break;
    }
    Check(rw->tell() == h.position);
    Check(rw->size() == static_cast<std::int32_t>(model.size()));
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    const std::int64_t before = workspace::LiveObjectCount();
    {
        fuzz::Input input(data, size);
        MemoryBlock* block = new (std::nothrow) MemoryBlock();
        if (block == nullptr) {
            return 0;
        }
        DirEnt* textEntry = (new TextMemoryEntry(block))->addRef();
        DirEnt* binaryEntry = (new MemoryEntry(block))->addRef();
        Handle handles[2];
        handles[0].rw = textEntry->open(1);
        handles[0].text = true;
        handles[1].rw = binaryEntry->open(1);
        Check(handles[0].rw != nullptr && handles[1].rw != nullptr);
        Model model;
        for (int steps = 0; steps < 300 && !input.empty(); ++steps) {
            Handle& h = handles[input.byte() & 1];
            Step(input, model, h);
        }
        handles[0].rw->release();
        handles[1].rw->release();
        textEntry->release();
        binaryEntry->release();
    }
    Check(workspace::LiveObjectCount() == before);
    return 0;
}
