#include <vector>

#include "SessionFixture.h"

using tessel::Long;
using tessel::Short;

namespace {

constexpr Long kLinkFailed = static_cast<Long>(tessel::kLinkFailed);

int TSL_STDCALL SomeCallback(Long, void*, Long, ReaderWriter*)
{
    return 1;
}

class Binding : public SessionTest {
protected:
    // Calls the method of slot with arguments at the edges of their ranges, each distinct,
    // so that a dropped, swapped or narrowed argument shows in the recorded call.
    Long call(BrickSession& s, int slot)
    {
        switch (slot) {
        case tessel::SlotInitialise:
            return s.Initialise();
        case tessel::SlotTerminate:
            return s.Terminate();
        case tessel::SlotFindPort:
            return s.FindPort(text, 260);
        case tessel::SlotCreate:
            return s.Create(kPort);
        case tessel::SlotDestroy:
            return s.Destroy(-2147483647 - 1);
        case tessel::SlotFindBrick:
            return s.FindBrick(0x1234, &value, &extra);
        case tessel::SlotStatus:
            return s.Status(5, 3, text, 80);
        case tessel::SlotSet:
            return s.Set(0x7FFFFFFF, 15, -32768);
        case tessel::SlotGet:
            return s.Get(9, 1, &value, text, 40);
        case tessel::SlotTranslate:
            return s.Translate(2, handles[0], handles[1], nullptr, handles[2], handles[3]);
        case tessel::SlotExec:
            return s.Exec(12, nullptr, &result, nullptr, SomeCallback, &context);
        case tessel::SlotDownload:
            return s.Download(11, kSomeHandle, SomeCallback, &context);
        case tessel::SlotInfo:
            return s.Info(6, 18, &value);
        case tessel::SlotFindFirst:
            return s.FindFirst(3, &value, text, 260);
        case tessel::SlotFindNext:
            return s.FindNext(4, &value, text, 260);
        default:
            return 0;
        }
    }

    static constexpr const char* kPort = "\\\\.\\USB0";
    ReaderWriter* const kSomeHandle = reinterpret_cast<ReaderWriter*>(0x1010);
    char text[300] = {};
    Short value = 0;
    Long extra = 0;
    Long result = 0;
    int context = 0;
    ReaderWriter* handles[4] = {};

    // Without its function Status says there is no library and Create gives no handle.
    static Long missingResult(int slot)
    {
        return slot == tessel::SlotStatus ? tessel::kStatusNoLibrary
                                          : (slot == tessel::SlotCreate ? 0 : kLinkFailed);
    }
};

TEST_F(Binding, WithoutUsableLibraryEveryMethodReportsLinkFailure)
{
    std::filesystem::create_directories(dir.path() + "junk");
    dir.write("junk/Tessel.dll", std::string(3000, '\x7f'));
    std::string unjoined = testsupport::RecordingLibraryDirectory();
    unjoined.pop_back(); // ".../testlib" + "Tessel.dll" names no file
    const struct {
        const char* what;
        std::string directory;
        bool loads;
    } cases[] = {
        {"no file", dir.path() + "nothing-here/", false},
        {"not a shared object", dir.path() + "junk/", false},
        {"directory without trailing separator", unjoined, false},
        {"no export table", testsupport::BareLibraryDirectory(), true},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.what);
        BrickSession& s = open("", "[DEBUG]\nMEMFILES=TRUE\n", c.directory);
        EXPECT_EQ(s.libraryLoaded(), c.loads);
        for (int slot = 0; slot < tessel::SlotCount; ++slot) {
            if (slot != tessel::SlotValidate) {
                EXPECT_EQ(call(s, slot), missingResult(slot)) << tessel::kExportNames[slot];
            }
        }
        // The workspace is still built, and the runner reports the link failure it meets.
        ASSERT_NE(s.root(), nullptr);
        ReaderWriter* code = reinterpret_cast<ReaderWriter*>(1);
        EXPECT_EQ(s.TranslateText(6, 1, "sound 1", &code, nullptr, nullptr, nullptr), kLinkFailed);
        EXPECT_EQ(code, nullptr);
        EXPECT_EQ(s.RunImmediate(1, "sound 4", nullptr), kLinkFailed);
    }
}

TEST_F(Binding, ConstructionInitialisesOnceAndDestructionTerminatesOnce)
{
    open();
    EXPECT_EQ(lib().calls[tessel::SlotInitialise].count, 1);
    EXPECT_EQ(lib().calls[tessel::SlotTerminate].count, 0);
    session.reset();
    EXPECT_EQ(lib().calls[tessel::SlotTerminate].count, 1);
    // Validate is bound but never called.
    EXPECT_EQ(lib().calls[tessel::SlotValidate].count, 0);
}

TEST_F(Binding, OnlyTheMissingSlotFails)
{
    for (int omitted = 0; omitted < tessel::SlotCount; ++omitted) {
        SCOPED_TRACE(tessel::kExportNames[omitted]);
        library.omit(omitted);
        for (int slot = 0; slot < tessel::SlotCount; ++slot) {
            lib().results[slot] = 1000 + slot;
        }
        BrickSession& s = open();
        for (int slot = 0; slot < tessel::SlotCount; ++slot) {
            if (slot == tessel::SlotValidate) {
                continue;
            }
            const int before = lib().calls[slot].count;
            const Long got = call(s, slot);
            EXPECT_EQ(got, slot == omitted ? missingResult(slot) : 1000 + slot) << slot;
            EXPECT_EQ(lib().calls[slot].count, before + (slot == omitted ? 0 : 1)) << slot;
        }
        session.reset();
        EXPECT_EQ(workspace::LiveObjectCount(), 0);
        library.omit(-1);
        for (RecordedCall& recorded : lib().calls) {
            recorded = RecordedCall{};
        }
    }
}

// Results of every slot come back unchanged in OnlyTheMissingSlotFails; here the arguments
// and out-parameters.
TEST_F(Binding, ArgumentsAndOutParametersPassUnchanged)
{
    BrickSession& s = open();
    RecordingState& state = lib();
    state.shortOut = -7;
    state.longOut = -123456789;
    state.resultNumber = 31;
    handles[0] = s.sourceEntry()->open(1);
    handles[1] = s.objectEntry()->open(4);
    handles[2] = s.resultEntry()->open(0);
    handles[3] = s.firmwareEntry()->open(0);
    for (int slot = tessel::SlotFindPort; slot < tessel::SlotCount; ++slot) {
        call(s, slot);
    }
    const void* callback = reinterpret_cast<const void*>(&SomeCallback);
    const struct {
        int slot;
        std::vector<std::int64_t> numbers;
        std::vector<const void*> pointers;
    } expected[] = {
        {tessel::SlotFindPort, {260}, {text}},
        {tessel::SlotCreate, {}, {kPort}},
        {tessel::SlotDestroy, {-2147483647LL - 1}, {}},
        {tessel::SlotFindBrick, {0x1234}, {&value, &extra}},
        {tessel::SlotStatus, {5, 3, 80}, {text}},
        {tessel::SlotSet, {0x7FFFFFFF, 15, -32768}, {}},
        {tessel::SlotGet, {9, 1, 40}, {&value, text}},
        {tessel::SlotTranslate, {2}, {handles[0], handles[1], nullptr, handles[2], handles[3]}},
        {tessel::SlotExec, {12}, {nullptr, &result, nullptr, callback, &context}},
        {tessel::SlotDownload, {11}, {kSomeHandle, callback, &context}},
        {tessel::SlotInfo, {6, 18}, {&value}},
        {tessel::SlotFindFirst, {3, 260}, {&value, text}},
        {tessel::SlotFindNext, {4, 260}, {&value, text}},
    };
    for (const auto& e : expected) {
        SCOPED_TRACE(tessel::kExportNames[e.slot]);
        const RecordedCall& recorded = state.calls[e.slot];
        EXPECT_EQ(recorded.count, 1);
        for (std::size_t i = 0; i < e.numbers.size(); ++i) {
            EXPECT_EQ(recorded.numbers[i], e.numbers[i]) << "number " << i;
        }
        for (std::size_t i = 0; i < e.pointers.size(); ++i) {
            EXPECT_EQ(recorded.pointers[i], e.pointers[i]) << "pointer " << i;
        }
    }
    EXPECT_STREQ(text, kPort); // the library echoes the port it was given
    EXPECT_EQ(value, -7);
    EXPECT_EQ(extra, -123456789);
    EXPECT_EQ(result, 31);
    for (ReaderWriter* handle : handles) {
        BrickSession::ReleaseReaderWriter(&handle);
    }
}

} // namespace
