// The dialog frame on the headless host: the control table and menu, the routing, the
// custom messages, the shared helpers, initialisation and teardown.
#include <gtest/gtest.h>

#include <cstring>
#include <fstream>
#include <set>
#include <string>

#include "DialogFixture.h"
#include "session/BrickSession.h"
#include "tessel/DirEnt.h"
#include "testlib/TestSupport.h"
#include "ui/TestClientDialog.h"

using namespace ui;
using commands_test::DialogFixture;
using DialogFrame = DialogFixture;
using Kind = ui::HeadlessEvent::Kind;

namespace {

struct ControlExpectation {
    int id;
    ControlKind kind;
    const char* caption;
    bool visible;
    bool enabled;
};

// Every control with an id, as a user meets it after start-up.
const ControlExpectation kExpectedControls[] = {
    {IdEditor, ControlKind::MultiEdit, "", true, true},
    {IdBrickList, ControlKind::DropList, "", true, true},
    {IdSourceList, ControlKind::DropList, "", true, true},
    {IdAutoClear, ControlKind::CheckBox, "Auto Clear", true, true},
    {IdAutoRun, ControlKind::CheckBox, "Auto Run", true, true},
    {IdDownloadFileName, ControlKind::Edit, "", true, true},
    {IdFirmwareFileName, ControlKind::Edit, "", true, true},
    {IdRangeShort, ControlKind::RadioButton, "Short", true, false},
    {IdRangeMedium, ControlKind::RadioButton, "Medium", true, false},
    {IdRangeLong, ControlKind::RadioButton, "Long", true, false},
    {IdOpenPort, ControlKind::PushButton, "Open", true, true},
    {IdClosePort, ControlKind::PushButton, "Close", true, true},
    {IdTest, ControlKind::PushButton, "Test", true, true},
    {IdValidate, ControlKind::PushButton, "Validate", true, true},
    {IdExecute, ControlKind::PushButton, "Execute", true, true},
    {IdDownload, ControlKind::PushButton, "Download", true, true},
    {IdDownloadFile, ControlKind::PushButton, "Download File", true, true},
    {IdNewFirmware, ControlKind::PushButton, "New Firmware", true, true},
    {IdStatistics, ControlKind::PushButton, "Statistics", true, true},
    {IdInfo, ControlKind::PushButton, "Info", true, true},
    {IdExecuteAsync, ControlKind::PushButton, "Async", false, true},
    {IdStress, ControlKind::PushButton, "Stress", false, true},
    {IdStressCount, ControlKind::Edit, "", false, true},
    {IdUpload, ControlKind::PushButton, "Upload", false, true},
    {IdReceive, ControlKind::CheckBox, "Receive", false, true},
    {IdStatusBox, ControlKind::MultiEdit, "", true, true},
};

} // namespace

TEST(DialogTemplate, DescribesDialog101WithItsControlsAndMenu202)
{
    const DialogTemplate& layout = TestClientDialogTemplate();
    EXPECT_EQ(layout.resourceId, 101);
    EXPECT_STREQ(layout.caption, "Tessel Test Client");
    EXPECT_STREQ(layout.fontName, "MS Sans Serif");
    EXPECT_EQ(layout.fontPoints, 8);
    EXPECT_EQ(layout.width, 372);
    EXPECT_EQ(layout.height, 289);
    EXPECT_EQ(layout.menuId, 202);

    std::set<int> ids;
    std::multiset<std::string> labels;
    for (int i = 0; i < layout.controlCount; ++i) {
        const ControlSpec& spec = layout.controls[i];
        if (spec.kind == ControlKind::Label || spec.kind == ControlKind::GroupBox)
            labels.insert(spec.caption);
        if (spec.id == kNoControlId)
            continue;
        EXPECT_TRUE(ids.insert(spec.id).second) << "control id " << spec.id << " twice";
        EXPECT_GE(spec.x, 0);
        EXPECT_LE(spec.x + spec.width, layout.width) << "control " << spec.id;
        EXPECT_LE(spec.y + spec.height, layout.height) << "control " << spec.id;
    }
    EXPECT_EQ(ids.size(), std::size(kExpectedControls));
    EXPECT_EQ(labels, (std::multiset<std::string>{"Brick:", "Source:", "Range", "Download"}));
    const ControlSpec* status = layout.Find(IdStatusBox);
    ASSERT_NE(status, nullptr);
    EXPECT_TRUE((status->style & StyleReadOnly) && (status->style & StyleVScroll));
    const ControlSpec* editor = layout.Find(IdEditor);
    ASSERT_NE(editor, nullptr);
    EXPECT_TRUE((editor->style & StyleHScroll) && (editor->style & StyleVScroll));

    // Menu, item caption (null: separator), command id; only "Convert to CSV" is greyed.
    const std::tuple<const char*, const char*, int> expected[] = {
        {"&File", "&New", 32768},
        {"&File", "&Open...", 32774},
        {"&File", "&Save", 32769},
        {"&File", "Save &As...", 32770},
        {"&File", nullptr, 0},
        {"&File", "E&xit", 32771},
        {"&Port", "&Open", 205},
        {"&Port", "&Test", 204},
        {"&Port", "&Statistics", 206},
        {"&Port", "&Close", 215},
        {"&Script", "&Validate", 202},
        {"&Script", "&Execute", 203},
        {"&Script", "Execute &Async", 217},
        {"&Script", "&Download", 201},
        {"S&pecial", "&Info", 216},
        {"S&pecial", "&Upload", 221},
        {"S&pecial", "&Stress", 212},
        {"S&pecial", "Download &Firmware", 207},
        {"S&pecial", "&Convert to CSV", 32775},
        {"S&pecial", "&Macro To CSV", 32777},
        {"&Help", "About", 32773},
    };
    std::size_t next = 0;
    for (int m = 0; m < layout.menuCount; ++m) {
        for (int i = 0; i < layout.menus[m].itemCount; ++i, ++next) {
            ASSERT_LT(next, std::size(expected));
            const auto& [menu, caption, id] = expected[next];
            const MenuItemSpec& item = layout.menus[m].items[i];
            SCOPED_TRACE(std::string(layout.menus[m].caption) + " item " + std::to_string(i));
            EXPECT_STREQ(layout.menus[m].caption, menu);
            EXPECT_EQ(item.caption == nullptr ? std::string("-") : std::string(item.caption),
                      caption == nullptr ? "-" : caption);
            EXPECT_EQ(item.id, id);
            EXPECT_EQ(item.greyed, id == 32775);
        }
    }
    EXPECT_EQ(next, std::size(expected));
}

TEST_F(DialogFrame, ControlsStartAsTheTableSays)
{
    Open("[FIRMWARE]\nSOURCE=fw0309.lgo\n[OPTIONS]\nAUTOCLEAR=true\nAUTORUN=FALSE\n");
    for (const ControlExpectation& c : kExpectedControls) {
        SCOPED_TRACE("control " + std::to_string(c.id));
        EXPECT_EQ(host().IsControlVisible(window(), c.id), c.visible);
        EXPECT_EQ(host().IsControlEnabled(window(), c.id), c.enabled);
        if (c.kind == ControlKind::PushButton || c.kind == ControlKind::CheckBox ||
            c.kind == ControlKind::RadioButton) {
            EXPECT_EQ(host().ControlText(window(), c.id), c.caption);
        }
    }
    auto entries = [&](int id) {
        std::vector<std::string> all;
        for (int i = 0; i < host().ListCount(window(), id); ++i)
            all.push_back(host().ListEntry(window(), id, i));
        return all;
    };
    EXPECT_EQ(entries(IdBrickList), (std::vector<std::string>{"Rover", "Onyx2"}));
    EXPECT_EQ(entries(IdSourceList), (std::vector<std::string>{"Script", "Opal", "RAW", "BIN"}));
    EXPECT_TRUE(host().IsChecked(window(), IdAutoClear));
    EXPECT_FALSE(host().IsChecked(window(), IdAutoRun));
    EXPECT_EQ(host().ControlText(window(), IdStressCount), "100");
    EXPECT_EQ(host().ControlText(window(), IdFirmwareFileName), "fw0309.lgo");
    EXPECT_EQ(host().WindowTitle(window()), "Tessel Test Client");
    EXPECT_TRUE(host().WindowVisible(window()));

    // The lists' selections give the types; no selection falls back to Onyx2 and Script.
    EXPECT_EQ(dialog().SelectedBrickType(), 6);
    host().ListSelect(window(), IdBrickList, 0);
    EXPECT_EQ(dialog().SelectedBrickType(), 5);
    host().ListSelect(window(), IdBrickList, -1);
    EXPECT_EQ(dialog().SelectedBrickType(), 6);
    for (int i = 0; i < 4; ++i) {
        host().ListSelect(window(), IdSourceList, i);
        EXPECT_EQ(dialog().SelectedSourceType(), i + 1);
    }
    host().ListSelect(window(), IdSourceList, -1);
    EXPECT_EQ(dialog().SelectedSourceType(), 1);
}

TEST_F(DialogFrame, SettingsReachTheMembers)
{
    Construct("[PATHS]\nFIRMWARE=/fw/\n[FIRMWARE]\nSOURCE=a.lgo\n[PORTS]\nUSB=U1\nSerial=S1\n"
              "[OPTIONS]\nAUTORUN=True\nAUTOCLEAR=yes\nAUTODOWNLOAD=TRUE\n"
              "[DEBUG]\nLOGFILE=/tmp/x.log\n");
    EXPECT_STREQ(dialog().firmwareDir(), "/fw/");
    EXPECT_STREQ(dialog().firmwareFile(), "a.lgo");
    EXPECT_STREQ(dialog().usbPort(), "U1");
    EXPECT_STREQ(dialog().serialPort(), "S1");
    EXPECT_TRUE(dialog().autoRun());
    EXPECT_FALSE(dialog().autoClear()); // only "true", in any case, is true
    EXPECT_TRUE(dialog().autoDownload());
    EXPECT_STREQ(dialog().logFile(), "/tmp/x.log");
    EXPECT_EQ(dialog().handle(), kNoWindow);
}

TEST_F(DialogFrame, StartupOpensTheUsbPortBeforeTheSerialOne)
{
    const struct {
        const char* ports;
        std::int32_t type; // -1: nothing opened
    } cases[] = {{"", -1},
                 {"[PORTS]\nUSB=KIVOTOWER1\nSerial=COM1\n", tessel::PortUsb},
                 {"[PORTS]\nUSB=KIVOTOWER7\nSerial=COM1\n", tessel::PortSerialIr}};
    for (const auto& c : cases) {
        SCOPED_TRACE(c.ports);
        ClearEvents();
        Open(c.ports);
        EXPECT_EQ(dialog().brickHandle() != 0, c.type != -1);
        if (c.type == -1) {
            EXPECT_TRUE(EventsOf(Kind::Status).empty());
            EXPECT_TRUE(EventsOf(Kind::Question).empty());
        } else {
            EXPECT_EQ(dialog().portType(), c.type);
        }
        Stop();
    }
}

TEST_F(DialogFrame, StartupFileIsLoadedWithItsBytesAndTitledAfterTheLastSeparator)
{
    const std::string bytes = "task main\r\n{\r\n  sound 4\r\n}\r\n";
    const std::string file = WriteFile("robot.onyx2", bytes);
    Open("", file);
    EXPECT_STREQ(dialog().currentFile(), file.c_str());
    EXPECT_EQ(host().ControlText(window(), IdEditor), bytes);
    EXPECT_EQ(host().WindowTitle(window()), "Tessel Test Client - robot.onyx2");
    Stop();
    Open("");
    dialog().UpdateTitle();
    EXPECT_EQ(host().WindowTitle(window()), "Tessel Test Client - ");
}

TEST_F(DialogFrame, MissingStartupFileIsForgottenAndNotDownloaded)
{
    const std::string missing = (dir() / "gone.onyx2").string();
    Open("[PORTS]\nUSB=KIVOTOWER1\n[OPTIONS]\nAUTODOWNLOAD=TRUE\n", missing);
    EXPECT_STREQ(dialog().currentFile(), "");
    EXPECT_EQ(host().ControlText(window(), IdEditor), "");
    EXPECT_TRUE(EventsOf(Kind::Title).empty());
    EXPECT_EQ(dialog().operationsInFlight(), 0);
    for (const auto& status : EventsOf(Kind::Status)) {
        EXPECT_EQ(status.text.find("Download"), std::string::npos) << status.text;
    }
}

TEST_F(DialogFrame, ReadEditorTextAndLoadScriptFileKeepWholeTexts)
{
    Open("");
    for (std::size_t length : {0u, 1023u, 1024u, 5000u, 1u << 20}) {
        SCOPED_TRACE(length);
        std::string text(length, 'a');
        if (length > 2)
            text[length / 2] = '\n';
        host().SetControlText(window(), IdEditor, text.c_str());
        std::unique_ptr<char[]> read = dialog().ReadEditorText();
        ASSERT_NE(read, nullptr);
        EXPECT_TRUE(text == read.get());
    }
    host().SetControlText(window(), IdEditor, "kept");
    EXPECT_FALSE(dialog().LoadScriptFile((dir() / "none").string().c_str()));
    EXPECT_FALSE(dialog().LoadScriptFile(dir().string().c_str()));
    EXPECT_FALSE(dialog().LoadScriptFile(""));
    EXPECT_EQ(host().ControlText(window(), IdEditor), "kept");
    EXPECT_TRUE(dialog().LoadScriptFile(WriteFile("empty.onyx2", "").c_str()));
    EXPECT_EQ(host().ControlText(window(), IdEditor), "");
    EXPECT_STREQ(dialog().currentFile(), "");
}

TEST_F(DialogFrame, CustomMessagesWithoutHandlerChangeNothing)
{
    Open("[PORTS]\nUSB=KIVOTOWER1\n");
    host().SetControlText(window(), IdEditor, "text");
    ClearEvents();
    const tessel::Long handle = dialog().brickHandle();
    for (Message m : {kMsgUser + 0, kMsgUser + 5, kMsgUser + 6, kMsgUser + 7, kMsgUser + 8,
                      kMsgUser + 9, kMsgUser + 10}) {
        ASSERT_TRUE(host().PostMessage(window(), m, 0xFFFFFFFFu, -1));
    }
    EXPECT_EQ(host().DispatchPending(), 7);
    EXPECT_TRUE(EventsOf(Kind::Status).empty());
    EXPECT_TRUE(EventsOf(Kind::Title).empty());
    EXPECT_TRUE(EventsOf(Kind::Question).empty());
    EXPECT_EQ(host().ControlText(window(), IdEditor), "text");
    EXPECT_EQ(dialog().brickHandle(), handle);
    EXPECT_EQ(dialog().stressIteration(), 0);
    EXPECT_EQ(dialog().operationsInFlight(), 0);
}

TEST_F(DialogFrame, EveryCommandIdIsRoutedAndTheRestLeftToTheHost)
{
    Open("");
    for (int id : std::initializer_list<int>{
             0, 1, 3, IdEditor, IdStatusBox, IdBrickList, IdSourceList, IdAutoClear, IdAutoRun,
             IdDownloadFileName, IdFirmwareFileName, IdStressCount, 32772, 32776, 32778}) {
        EXPECT_FALSE(dialog().RouteCommand(id)) << id;
    }
    for (int id : {32768, 32774, 32769, 32770, 32773, 205, 215, 204, 206, 218, 219,   220,
                   202,   203,   217,   201,   211,   224, 207, 216, 221, 212, 32775, 32777}) {
        EXPECT_TRUE(dialog().RouteCommand(id)) << id;
        host().DispatchPending();
    }
    EXPECT_TRUE(host().WindowExists(window()));
    EXPECT_FALSE(host().QuitRequested());
    // Routed by id whatever the notification code.
    const std::size_t boxes = EventsOf(Kind::MessageBox).size();
    host().SendMessage(window(), kMsgCommand, MakeCommand(IdAbout, 0x0300), 0);
    EXPECT_EQ(EventsOf(Kind::MessageBox).size(), boxes + 1);
}

TEST_F(DialogFrame, CancelDestroysTheWindowAndPostsQuitZero)
{
    Open("[PORTS]\nUSB=KIVOTOWER1\n");
    const WindowHandle w = window();
    host().SendMessage(w, kMsgCommand, MakeCommand(kIdCancel), 0);
    EXPECT_FALSE(host().WindowExists(w));
    EXPECT_EQ(dialog().handle(), kNoWindow);
    EXPECT_TRUE(host().QuitRequested());
    EXPECT_EQ(host().ExitCode(), 0);
    EXPECT_EQ(dialog().session(), nullptr);
    EXPECT_EQ(dialog().brickHandle(), 0);
    // The nested pump sees the request and leaves it for the outer loop.
    EXPECT_FALSE(host().PumpMessage());
    EXPECT_EQ(host().RunMessageLoop(), 0);
}

TEST_F(DialogFrame, ExitReleasesAResultFileStillQueued)
{
    Open("");
    ASSERT_NE(dialog().session(), nullptr);
    DirEnt* entry = dialog().session()->resultEntry();
    ASSERT_NE(entry, nullptr);
    ReaderWriter* file = entry->open(tessel::FileResult);
    ASSERT_NE(file, nullptr);
    ASSERT_TRUE(host().PostMessage(window(), kMsgExecResult, 0, reinterpret_cast<LParam>(file)));
    host().SendMessage(window(), kMsgCommand, MakeCommand(IdFileExit), 0);
    // TearDown counts the live workspace objects: the file must be gone.
}

namespace {

// The recording library, opened by the absolute path the session uses too.
class RecordingFrame : public DialogFixture {
protected:
    void SetUp() override
    {
        settleOnTearDown_ = false;
        if (commands_test::RecordingLibraryDirectory().empty())
            GTEST_SKIP() << "no testlib";
        library_ = std::make_unique<testsupport::RecordingLibrary>(
            commands_test::RecordingLibraryDirectory() + "/");
        ASSERT_TRUE(library_->loaded());
    }
    void TearDown() override
    {
        DialogFixture::TearDown();
        library_.reset();
    }
    RecordingState& state() { return library_->state(); }
    const RecordedCall& calls(int slot) { return state().calls[slot]; }
    void StartWithHandle(tessel::Long handle, const char* ports = "[PORTS]\nUSB=T1\n")
    {
        state().results[tessel::SlotCreate] = handle;
        Open(ports, "", commands_test::RecordingLibraryDirectory());
        ASSERT_EQ(dialog().brickHandle(), handle);
    }

    std::unique_ptr<testsupport::RecordingLibrary> library_;
};

} // namespace

TEST_F(RecordingFrame, TeardownSwitchesReceptionOffBeforeDestroyingTheHandle)
{
    StartWithHandle(77);
    host().SetCheck(window(), IdReceive, true);
    host().SendMessage(window(), kMsgCommand, MakeCommand(IdReceive), 0);
    ASSERT_TRUE(dialog().receiving());
    ASSERT_EQ(calls(tessel::SlotExec).count, 1);
    EXPECT_NE(calls(tessel::SlotExec).pointers[3], nullptr); // the callback

    host().SendMessage(window(), kMsgCommand, MakeCommand(IdFileExit), 0);
    EXPECT_EQ(calls(tessel::SlotExec).count, 2);
    EXPECT_EQ(calls(tessel::SlotExec).numbers[0], 77);
    for (const void* pointer : calls(tessel::SlotExec).pointers) {
        EXPECT_EQ(pointer, nullptr);
    }
    EXPECT_EQ(calls(tessel::SlotDestroy).count, 1);
    EXPECT_EQ(calls(tessel::SlotDestroy).numbers[0], 77);
    EXPECT_EQ(calls(tessel::SlotTerminate).count, 1);
}

TEST_F(RecordingFrame, AsyncExecutionResultNumberLivesInTheDialog)
{
    StartWithHandle(9);
    ASSERT_EQ(dialog().StartAsyncExec(nullptr), 0);
    const void* first = calls(tessel::SlotExec).pointers[1];
    ASSERT_EQ(dialog().StartAsyncExec(nullptr), 0);
    // The same place both times, so not a handler's stack slot: the dialog's own member.
    EXPECT_NE(first, nullptr);
    EXPECT_EQ(calls(tessel::SlotExec).pointers[1], first);
    EXPECT_EQ(calls(tessel::SlotExec).pointers[4], dialog().CallbackContext());
    EXPECT_EQ(dialog().operationsInFlight(), 2);
    host().PostMessage(window(), kMsgExecResult, 0, 0);
    host().DispatchPending();
    EXPECT_EQ(dialog().operationsInFlight(), 1);
    // A call the library refuses reports nothing back, so it is not waited for.
    state().results[tessel::SlotExec] = static_cast<tessel::Long>(0xE0050C41u);
    EXPECT_LT(dialog().StartAsyncExec(nullptr), 0);
    EXPECT_EQ(dialog().operationsInFlight(), 1);
}

TEST_F(RecordingFrame, DownloadIsInFlightUntilItsLastOrAFailingReport)
{
    StartWithHandle(9);
    EXPECT_FALSE(dialog().DownloadObject(nullptr));
    EXPECT_EQ(host().ControlText(window(), IdStatusBox), "No code");
    EXPECT_TRUE(dialog().failureShown());
    EXPECT_EQ(calls(tessel::SlotDownload).count, 0);
    EXPECT_EQ(dialog().operationsInFlight(), 0);

    for (const WParam report : {WParam(0), static_cast<WParam>(0xE0050C41u)}) {
        SCOPED_TRACE(report);
        ReaderWriter* object = nullptr;
        ASSERT_GE(dialog().session()->TranslateText(6, tessel::FileScript, "a", &object, nullptr,
                                                    nullptr, nullptr),
                  0);
        ASSERT_EQ(BrickSession::CountCommands(object), 1);
        ClearEvents();
        dialog().ResetFailureShown();
        EXPECT_TRUE(dialog().DownloadObject(object));
        BrickSession::ReleaseReaderWriter(&object);
        EXPECT_EQ(calls(tessel::SlotDownload).pointers[2], dialog().CallbackContext());
        EXPECT_EQ(dialog().downloadTotal(), 1);
        EXPECT_EQ(dialog().operationsInFlight(), 1);
        ASSERT_FALSE(EventsOf(Kind::Status).empty());
        EXPECT_EQ(EventsOf(Kind::Status)[0].text, "Downloading");
        EXPECT_GE(host().RepaintCount(), 1);
        ASSERT_TRUE(host().PostMessage(window(), kMsgDownloadProgress, report, report ? 0 : 1));
        host().DispatchPending();
        EXPECT_EQ(dialog().operationsInFlight(), 0);
        EXPECT_EQ(dialog().failureShown(), report != 0);
    }
}

TEST_F(RecordingFrame, TraceOptionReachesTheLibraryAndWritesTheHeader)
{
    Construct("", "", commands_test::RecordingLibraryDirectory());
    EXPECT_EQ(calls(tessel::SlotSet).count, 0);
    Stop();
    const auto old = std::filesystem::current_path();
    std::filesystem::current_path(dir());
    Construct("[DEBUG]\nTRACE=65539\n", "", commands_test::RecordingLibraryDirectory());
    std::filesystem::current_path(old);
    // Only the low 16 bits count.
    EXPECT_EQ(dialog().traceOptions(), 3);
    ASSERT_EQ(calls(tessel::SlotSet).count, 1);
    EXPECT_EQ(calls(tessel::SlotSet).numbers[0], 0);
    EXPECT_EQ(calls(tessel::SlotSet).numbers[1], tessel::PropTrace);
    EXPECT_EQ(calls(tessel::SlotSet).numbers[2], 3);
    EXPECT_EQ(ReadFile(dir() / "tsltrace.txt"), "Trace file \"tsltrace.txt\", options: 3\n\n");
}
