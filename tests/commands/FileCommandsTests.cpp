// New, Open, Save and Save As, and the title that follows the current file.
#include <string>

#include "DialogFixture.h"

namespace commands_test {
namespace {

using ui::HeadlessEvent;

constexpr const char* kCaptionDash = "Tessel Test Client - ";

class FileCommands : public DialogFixture {
protected:
    void SetUp() override
    {
        DialogFixture::SetUp();
        ASSERT_NO_FATAL_FAILURE(Start(std::string(kFastLink) + "[brick b1]\n[port COM1]\n"));
    }
    std::string Title() { return host().WindowTitle(window()); }
    void Menu(int id) { Click(id); }
};

TEST_F(FileCommands, OpenLoadsTheFileAndNamesItInTheTitle)
{
    const std::string path = WriteFile("robot.onyx2", "task main\n{\n}\n");
    host().QueueFileName(path);
    Menu(ui::IdFileOpen);

    const std::vector<HeadlessEvent> dialogs = EventsOf(HeadlessEvent::Kind::OpenFile);
    ASSERT_EQ(dialogs.size(), 1u);
    EXPECT_EQ(Text(ui::IdEditor), "task main\n{\n}\n");
    EXPECT_STREQ(dialog().currentFile(), path.c_str());
    EXPECT_EQ(Title(), std::string(kCaptionDash) + "robot.onyx2");
}

TEST_F(FileCommands, NewAfterOpenEmptiesTheEditorAndTheTitle)
{
    host().QueueFileName(WriteFile("robot.onyx2", "sound 4"));
    Menu(ui::IdFileOpen);
    Menu(ui::IdFileNew);
    EXPECT_EQ(Text(ui::IdEditor), "");
    EXPECT_STREQ(dialog().currentFile(), "");
    EXPECT_EQ(Title(), kCaptionDash);
}

TEST_F(FileCommands, CancelledOpenChangesNothing)
{
    SetText(ui::IdEditor, "kept");
    const std::string before = Title();
    Menu(ui::IdFileOpen); // no file name queued: the dialog is cancelled
    EXPECT_EQ(Text(ui::IdEditor), "kept");
    EXPECT_STREQ(dialog().currentFile(), "");
    EXPECT_EQ(Title(), before);
}

TEST_F(FileCommands, OpenOfAnUnreadableFileKeepsEditorAndFileButUpdatesTheTitle)
{
    host().QueueFileName(WriteFile("first.onyx2", "first"));
    Menu(ui::IdFileOpen);
    host().QueueFileName((dir() / "missing.onyx2").string());
    Menu(ui::IdFileOpen);

    EXPECT_EQ(Text(ui::IdEditor), "first");
    EXPECT_EQ(std::string(dialog().currentFile()), (dir() / "first.onyx2").string());
    const std::vector<HeadlessEvent> titles = EventsOf(HeadlessEvent::Kind::Title);
    ASSERT_EQ(titles.size(), 2u);
    EXPECT_EQ(titles[1].text, std::string(kCaptionDash) + "first.onyx2");
}

TEST_F(FileCommands, SaveWithoutACurrentFileAsksForANameAsSaveAsDoes)
{
    SetText(ui::IdEditor, "sound 4");
    const std::string path = (dir() / "new.onyx2").string();
    host().QueueFileName(path);
    Menu(ui::IdFileSave);

    ASSERT_EQ(EventsOf(HeadlessEvent::Kind::SaveFile).size(), 1u);
    EXPECT_EQ(ReadFile(path), "sound 4");
    EXPECT_STREQ(dialog().currentFile(), path.c_str());
    EXPECT_EQ(Title(), std::string(kCaptionDash) + "new.onyx2");
}

TEST_F(FileCommands, SaveWithACurrentFileWritesItWithoutAsking)
{
    const std::string path = WriteFile("robot.onyx2", "old");
    host().QueueFileName(path);
    Menu(ui::IdFileOpen);
    SetText(ui::IdEditor, "new text");
    Menu(ui::IdFileSave);

    EXPECT_TRUE(EventsOf(HeadlessEvent::Kind::SaveFile).empty());
    EXPECT_EQ(ReadFile(path), "new text");
    EXPECT_STREQ(dialog().currentFile(), path.c_str());
}

TEST_F(FileCommands, SaveAsWritesExactlyTheNameTyped)
{
    SetText(ui::IdEditor, "text");
    const std::string path = (dir() / "noextension").string();
    host().QueueFileName(path);
    Menu(ui::IdFileSaveAs);

    EXPECT_EQ(ReadFile(path), "text");
    EXPECT_FALSE(std::filesystem::exists(path + ".onyx2"));
    EXPECT_EQ(Title(), std::string(kCaptionDash) + "noextension");
}

TEST_F(FileCommands, AFileWithCrLfLineEndsIsWrittenBackByteForByte)
{
    const std::string bytes = "task main\r\n{\r\n  sound 4\r\n}\r\n\r\n\t// end\r\n";
    const std::string path = WriteFile("crlf.onyx2", bytes);
    host().QueueFileName(path);
    Menu(ui::IdFileOpen);
    Menu(ui::IdFileSave);
    EXPECT_EQ(ReadFile(path), bytes);

    const std::string copy = (dir() / "copy.txt").string();
    host().QueueFileName(copy);
    Menu(ui::IdFileSaveAs);
    EXPECT_EQ(ReadFile(copy), bytes);
}

TEST_F(FileCommands, ALargeFileIsWrittenBackWhole)
{
    std::string bytes;
    for (int i = 0; i < 5000; ++i)
        bytes += "line " + std::to_string(i) + "\r\n";
    const std::string path = WriteFile("large.onyx2", bytes);
    host().QueueFileName(path);
    Menu(ui::IdFileOpen);
    Menu(ui::IdFileSave);
    EXPECT_EQ(ReadFile(path), bytes);
}

TEST_F(FileCommands, SavingWhereNothingCanBeWrittenTakesTheNameAndSaysSo)
{
    SetText(ui::IdEditor, "text");
    const std::string path = (dir() / "no-such-directory" / "robot.onyx2").string();
    host().QueueFileName(path);
    Menu(ui::IdFileSaveAs);

    EXPECT_STREQ(dialog().currentFile(), path.c_str());
    EXPECT_EQ(Title(), std::string(kCaptionDash) + "robot.onyx2");
    EXPECT_FALSE(std::filesystem::exists(path));
    EXPECT_EQ(LastStatus(), "Could not write " + path);
}

TEST_F(FileCommands, ANameLongerThanACurrentFileCanHoldIsRefused)
{
    SetText(ui::IdEditor, "text");
    // Every component is short; the whole path is not.
    const std::filesystem::path deep = dir() / std::string(200, 'd');
    std::filesystem::create_directories(deep);
    const std::string longName = (deep / (std::string(100, 'f') + ".onyx2")).string();
    ASSERT_GT(longName.size(), 260u);
    host().QueueFileName(longName);
    Menu(ui::IdFileSaveAs);

    EXPECT_STREQ(dialog().currentFile(), "");
    EXPECT_EQ(LastStatus(), "File name too long: " + longName);
    // Nothing was written, under the full name or under one cut to 259 characters.
    EXPECT_TRUE(std::filesystem::is_empty(deep));
}

TEST_F(FileCommands, TheTitleShowsOnlyTheLastComponentOfEitherSeparator)
{
    SetText(ui::IdEditor, "text");
    // A Windows-style name is a plain file name here; the title still cuts at the backslash.
    const std::string windowsStyle = (dir() / "C:\\work\\robot.onyx2").string();
    host().QueueFileName(windowsStyle);
    Menu(ui::IdFileSaveAs);
    EXPECT_EQ(Title(), std::string(kCaptionDash) + "robot.onyx2");

    // A bare name is written to the current directory, which is the test's own meanwhile.
    const std::filesystem::path previous = std::filesystem::current_path();
    std::filesystem::current_path(dir());
    host().QueueFileName("bare.onyx2");
    Menu(ui::IdFileSaveAs);
    std::filesystem::current_path(previous);
    EXPECT_EQ(Title(), std::string(kCaptionDash) + "bare.onyx2");
    EXPECT_EQ(ReadFile(dir() / "bare.onyx2"), "text");
}

TEST_F(FileCommands, AStartUpFileIsLoadedAndNamedInTheTitle)
{
    const std::string path = WriteFile("start.onyx2", "start text");
    Stop();
    ASSERT_NO_FATAL_FAILURE(
        Start(std::string(kFastLink) + "[brick b1]\n[port COM1]\n", "", "", path));
    EXPECT_EQ(Text(ui::IdEditor), "start text");
    EXPECT_EQ(Title(), std::string(kCaptionDash) + "start.onyx2");
}

} // namespace
} // namespace commands_test
