#include "SessionFixture.h"

using tessel::Long;
using tessel::Short;

namespace {

constexpr Long kLinkFailed = static_cast<Long>(tessel::kLinkFailed);

int TSL_STDCALL SomeCallback(Long, void*, Long, ReaderWriter*)
{
    return 1;
}

// What each method returns when its entry point is missing, or the call's result.
struct SlotOutcome {
    Long result;
    bool reached; // the library recorded a call
};

class Binding : public SessionTest {
protected:
    // Calls the method of slot with harmless arguments.
    Long call(BrickSession& s, int slot)
    {
        char text[80] = {};
        Short value = 0;
        Long extra = 0;
        switch (slot) {
        case tessel::SlotInitialise:
            return s.Initialise();
        case tessel::SlotTerminate:
            return s.Terminate();
        case tessel::SlotFindPort:
            return s.FindPort(text, sizeof text);
        case tessel::SlotCreate:
            return s.Create("\\\\.\\COM1");
        case tessel::SlotDestroy:
            return s.Destroy(7);
        case tessel::SlotFindBrick:
            return s.FindBrick(7, &value, &extra);
        case tessel::SlotStatus:
            return s.Status(7, 3, text, sizeof text);
        case tessel::SlotSet:
            return s.Set(7, 8, 2);
        case tessel::SlotGet:
            return s.Get(7, 1, &value, text, sizeof text);
        case tessel::SlotTranslate:
            return s.Translate(6, nullptr, nullptr, nullptr, nullptr, nullptr);
        case tessel::SlotExec:
            return s.Exec(7, nullptr, nullptr, nullptr, nullptr, nullptr);
        case tessel::SlotDownload:
            return s.Download(7, nullptr, nullptr, nullptr);
        case tessel::SlotInfo:
            return s.Info(6, 1, &value);
        case tessel::SlotFindFirst:
            return s.FindFirst(0, &value, text, sizeof text);
        case tessel::SlotFindNext:
            return s.FindNext(0, &value, text, sizeof text);
        default:
            return 0;
        }
    }

    static Long missingResult(int slot)
    {
        if (slot == tessel::SlotStatus) {
            return tessel::kStatusNoLibrary;
        }
        if (slot == tessel::SlotCreate) {
            return 0;
        }
        return kLinkFailed;
    }

    void expectEveryMethodMissing(BrickSession& s)
    {
        for (int slot = 0; slot < tessel::SlotCount; ++slot) {
            if (slot != tessel::SlotValidate) {
                EXPECT_EQ(call(s, slot), missingResult(slot)) << tessel::kExportNames[slot];
            }
        }
    }
};

TEST_F(Binding, WithoutLibraryEveryMethodReportsLinkFailure)
{
    BrickSession& s = open("", "[DEBUG]\nMEMFILES=TRUE\n", dir.path() + "nothing-here/");
    EXPECT_FALSE(s.libraryLoaded());
    expectEveryMethodMissing(s);
    // The workspace is still built, and the runner reports the link failure it meets.
    ASSERT_NE(s.root(), nullptr);
    ReaderWriter* code = reinterpret_cast<ReaderWriter*>(1);
    EXPECT_EQ(s.TranslateText(6, 1, "sound 1", &code, nullptr, nullptr, nullptr), kLinkFailed);
    EXPECT_EQ(code, nullptr);
    EXPECT_EQ(s.RunImmediate(1, "sound 4", nullptr), kLinkFailed);
}

TEST_F(Binding, FileThatIsNotASharedObjectIsLikeNoLibrary)
{
    dir.write("Tessel.dll", std::string(3000, '\x7f'));
    BrickSession& s = open("", "[DEBUG]\nMEMFILES=TRUE\n", dir.path());
    EXPECT_FALSE(s.libraryLoaded());
    expectEveryMethodMissing(s);
}

TEST_F(Binding, LibraryWithoutExportTableLacksEveryName)
{
    BrickSession& s = open("", "[DEBUG]\nMEMFILES=TRUE\n", testsupport::BareLibraryDirectory());
    EXPECT_TRUE(s.libraryLoaded());
    expectEveryMethodMissing(s);
}

TEST_F(Binding, DirectoryWithoutTrailingSeparatorIsJoinedAsWritten)
{
    std::string directory = testsupport::RecordingLibraryDirectory();
    directory.pop_back(); // ".../testlib" + "Tessel.dll" names no file
    BrickSession& s = open("", "[DEBUG]\nMEMFILES=TRUE\n", directory);
    EXPECT_FALSE(s.libraryLoaded());
    EXPECT_EQ(s.Status(1, 2, nullptr, 0), tessel::kStatusNoLibrary);
}

TEST_F(Binding, ConstructionInitialisesOnceAndDestructionTerminatesOnce)
{
    open();
    EXPECT_EQ(lib().calls[tessel::SlotInitialise].count, 1);
    EXPECT_EQ(lib().calls[tessel::SlotTerminate].count, 0);
    session.reset();
    EXPECT_EQ(lib().calls[tessel::SlotTerminate].count, 1);
    EXPECT_EQ(lib().calls[tessel::SlotInitialise].count, 1);
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
            const Long result = call(s, slot);
            if (slot == omitted) {
                EXPECT_EQ(result, missingResult(slot)) << "slot " << slot;
                EXPECT_EQ(lib().calls[slot].count, before) << "slot " << slot;
            } else {
                EXPECT_EQ(result, 1000 + slot) << "slot " << slot;
                EXPECT_EQ(lib().calls[slot].count, before + 1) << "slot " << slot;
            }
        }
        session.reset();
        EXPECT_EQ(workspace::LiveObjectCount(), 0);
        library.omit(-1);
        for (RecordedCall& recorded : lib().calls) {
            recorded = RecordedCall{};
        }
    }
}

TEST_F(Binding, ArgumentsPassAndResultsComeBackUnchanged)
{
    BrickSession& s = open();
    RecordingState& state = lib();
    state.textOut[0] = 'Z';
    state.shortOut = -7;
    state.longOut = -123456789;

    char name[300] = {};
    state.results[tessel::SlotFindPort] = static_cast<Long>(0xE0050C52u);
    EXPECT_EQ(s.FindPort(name, 260), static_cast<Long>(0xE0050C52u));
    EXPECT_EQ(state.calls[tessel::SlotFindPort].pointers[0], name);
    EXPECT_EQ(state.calls[tessel::SlotFindPort].numbers[0], 260);
    EXPECT_STREQ(name, "Z");

    const char* port = "\\\\.\\USB0";
    state.results[tessel::SlotCreate] = 0x7FFFFFFF;
    EXPECT_EQ(s.Create(port), 0x7FFFFFFF);
    EXPECT_EQ(state.calls[tessel::SlotCreate].pointers[0], port);

    state.results[tessel::SlotDestroy] = -1;
    EXPECT_EQ(s.Destroy(-2147483647 - 1), -1);
    EXPECT_EQ(state.calls[tessel::SlotDestroy].numbers[0], -2147483647LL - 1);

    Short type = 0;
    Long extra = 0;
    state.results[tessel::SlotFindBrick] = 0x20050000;
    EXPECT_EQ(s.FindBrick(0x1234, &type, &extra), 0x20050000);
    EXPECT_EQ(state.calls[tessel::SlotFindBrick].numbers[0], 0x1234);
    EXPECT_EQ(type, -7);
    EXPECT_EQ(extra, -123456789);

    char text[80] = {};
    state.results[tessel::SlotStatus] = 9;
    EXPECT_EQ(s.Status(5, 3, text, sizeof text), 9);
    EXPECT_EQ(state.calls[tessel::SlotStatus].numbers[1], 3);
    EXPECT_EQ(state.calls[tessel::SlotStatus].numbers[2], 80);
    EXPECT_EQ(state.calls[tessel::SlotStatus].pointers[0], text);

    state.results[tessel::SlotSet] = static_cast<Long>(0xE0050C41u);
    EXPECT_EQ(s.Set(0, 15, -32768), static_cast<Long>(0xE0050C41u));
    EXPECT_EQ(state.calls[tessel::SlotSet].numbers[1], 15);
    EXPECT_EQ(state.calls[tessel::SlotSet].numbers[2], -32768);

    Short value = 0;
    state.results[tessel::SlotGet] = 3;
    EXPECT_EQ(s.Get(9, 1, &value, text, 40), 3);
    EXPECT_EQ(state.calls[tessel::SlotGet].numbers[2], 40);
    EXPECT_EQ(state.calls[tessel::SlotGet].pointers[0], &value);
    EXPECT_EQ(value, -7);

    auto* source = reinterpret_cast<ReaderWriter*>(0x1010);
    state.results[tessel::SlotDownload] = 77;
    int context = 0;
    EXPECT_EQ(s.Download(11, source, SomeCallback, &context), 77);
    EXPECT_EQ(state.calls[tessel::SlotDownload].pointers[0], source);
    EXPECT_EQ(state.calls[tessel::SlotDownload].pointers[1],
              reinterpret_cast<const void*>(&SomeCallback));
    EXPECT_EQ(state.calls[tessel::SlotDownload].pointers[2], &context);

    Long result = 0;
    state.results[tessel::SlotExec] = -5;
    state.resultNumber = 31;
    EXPECT_EQ(s.Exec(12, nullptr, &result, nullptr, SomeCallback, &context), -5);
    EXPECT_EQ(state.calls[tessel::SlotExec].numbers[0], 12);
    EXPECT_EQ(state.calls[tessel::SlotExec].pointers[1], &result);
    EXPECT_EQ(state.calls[tessel::SlotExec].pointers[4], &context);
    EXPECT_EQ(result, 31);

    state.results[tessel::SlotInfo] = 0;
    EXPECT_EQ(s.Info(6, 18, &value), 0);
    EXPECT_EQ(state.calls[tessel::SlotInfo].numbers[0], 6);
    EXPECT_EQ(state.calls[tessel::SlotInfo].numbers[1], 18);

    state.results[tessel::SlotFindFirst] = 1;
    state.results[tessel::SlotFindNext] = static_cast<Long>(0xE0050C52u);
    EXPECT_EQ(s.FindFirst(3, &value, name, 260), 1);
    EXPECT_EQ(s.FindNext(4, &value, name, 260), static_cast<Long>(0xE0050C52u));
    EXPECT_EQ(state.calls[tessel::SlotFindNext].numbers[0], 4);
    EXPECT_EQ(state.calls[tessel::SlotFindNext].pointers[1], name);
}

TEST_F(Binding, TranslatePassesHandlesAndSinkUnchanged)
{
    BrickSession& s = open();
    ReaderWriter* source = s.sourceEntry()->open(1);
    ReaderWriter* target = s.objectEntry()->open(4);
    ReaderWriter* extra1 = s.resultEntry()->open(0);
    ReaderWriter* extra2 = s.firmwareEntry()->open(0);
    lib().results[tessel::SlotTranslate] = 0x4242;
    IError* sink = nullptr;
    EXPECT_EQ(s.Translate(2, source, target, sink, extra1, extra2), 0x4242);
    const RecordedCall& call = lib().calls[tessel::SlotTranslate];
    EXPECT_EQ(call.numbers[0], 2);
    EXPECT_EQ(call.pointers[0], source);
    EXPECT_EQ(call.pointers[1], target);
    EXPECT_EQ(call.pointers[2], sink);
    EXPECT_EQ(call.pointers[3], extra1);
    EXPECT_EQ(call.pointers[4], extra2);
    for (ReaderWriter* handle : {source, target, extra1, extra2}) {
        BrickSession::ReleaseReaderWriter(&handle);
    }
}

} // namespace
