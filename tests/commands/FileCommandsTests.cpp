// New, Open, Save and Save As, and the title that follows the current file.
#include <string>

#include "DialogFixture.h"

namespace commands_test {
namespace {

using ui::HeadlessEvent;

const std::string kCaptionDash = "Tessel Test Client - ";

class FileCommands : public DialogFixture {
protected:
    void SetUp() override
    {
        ASSERT_NO_FATAL_FAILURE(Start(std::string(kFastLink) + "[brick b1]\n[port COM1]\n"));
    }
    std::string Title() { return host().WindowTitle(window()); }
    void Menu(int id, const std::string& fileName = "")
    {
        if (!fileName.empty())
            host().QueueFileName(fileName);
        Click(id);
    }
};

TEST_F(FileCommands, OpenSaveAndNewFollowTheCurrentFile)
{
    SetText(ui::IdEditor, "kept");
    Menu(ui::IdFileOpen); // no file name queued: the dialog is cancelled
    EXPECT_EQ(Text(ui::IdEditor), "kept");
    EXPECT_STREQ(dialog().currentFile(), "");

    const std::string path = WriteFile("robot.onyx2", "task main\n{\n}\n");
    Menu(ui::IdFileOpen, path);
    EXPECT_EQ(EventsOf(HeadlessEvent::Kind::OpenFile).size(), 2u);
    EXPECT_EQ(Text(ui::IdEditor), "task main\n{\n}\n");
    EXPECT_STREQ(dialog().currentFile(), path.c_str());
    EXPECT_EQ(Title(), kCaptionDash + "robot.onyx2");

    // An unreadable file keeps editor and file, but the title is set again.
    Menu(ui::IdFileOpen, (dir() / "missing.onyx2").string());
    EXPECT_EQ(Text(ui::IdEditor), "task main\n{\n}\n");
    EXPECT_STREQ(dialog().currentFile(), path.c_str());
    EXPECT_EQ(EventsOf(HeadlessEvent::Kind::Title).back().text, kCaptionDash + "robot.onyx2");

    SetText(ui::IdEditor, "new text"); // Save with a current file does not ask
    Menu(ui::IdFileSave);
    EXPECT_TRUE(EventsOf(HeadlessEvent::Kind::SaveFile).empty());
    EXPECT_EQ(ReadFile(path), "new text");

    Menu(ui::IdFileNew);
    EXPECT_EQ(Text(ui::IdEditor), "");
    EXPECT_STREQ(dialog().currentFile(), "");
    EXPECT_EQ(Title(), kCaptionDash);

    SetText(ui::IdEditor, "sound 4"); // without one it asks as Save As does
    const std::string fresh = (dir() / "new.onyx2").string();
    Menu(ui::IdFileSave, fresh);
    EXPECT_EQ(EventsOf(HeadlessEvent::Kind::SaveFile).size(), 1u);
    EXPECT_EQ(ReadFile(fresh), "sound 4");
    EXPECT_STREQ(dialog().currentFile(), fresh.c_str());
    EXPECT_EQ(Title(), kCaptionDash + "new.onyx2");
}

TEST_F(FileCommands, FilesAreWrittenBackByteForByte)
{
    std::string large;
    for (int i = 0; i < 5000; ++i)
        large += "line " + std::to_string(i) + "\r\n";
    for (const std::string& bytes :
         {std::string("task main\r\n{\r\n  sound 4\r\n}\r\n\r\n\t// end\r\n"), large}) {
        const std::string path = WriteFile("file.onyx2", bytes);
        Menu(ui::IdFileOpen, path);
        Menu(ui::IdFileSave);
        EXPECT_EQ(ReadFile(path), bytes);
        const std::string copy = (dir() / "copy.txt").string();
        Menu(ui::IdFileSaveAs, copy);
        EXPECT_EQ(ReadFile(copy), bytes);
    }
}

TEST_F(FileCommands, TheTitleShowsTheLastComponentOfEitherSeparatorOfExactlyTheNameTyped)
{
    SetText(ui::IdEditor, "text");
    // A Windows-style name is a plain file name here; the title still cuts at the backslash.
    // A bare name is written to the current directory, which is the test's own meanwhile.
    const std::pair<std::string, std::string> names[] = {
        {(dir() / "noextension").string(), "noextension"},
        {(dir() / "C:\\work\\robot.onyx2").string(), "robot.onyx2"},
        {"bare.onyx2", "bare.onyx2"},
    };
    const std::filesystem::path previous = std::filesystem::current_path();
    std::filesystem::current_path(dir());
    for (const auto& [path, shown] : names) {
        Menu(ui::IdFileSaveAs, path);
        EXPECT_EQ(ReadFile(dir() / path), "text");
        EXPECT_EQ(Title(), kCaptionDash + shown);
    }
    std::filesystem::current_path(previous);
    EXPECT_FALSE(std::filesystem::exists(names[0].first + ".onyx2"));
}

TEST_F(FileCommands, ANameThatCannotBeWrittenIsTakenButOneTooLongIsRefused)
{
    SetText(ui::IdEditor, "text");
    const std::string path = (dir() / "no-such-directory" / "robot.onyx2").string();
    Menu(ui::IdFileSaveAs, path);
    EXPECT_STREQ(dialog().currentFile(), path.c_str());
    EXPECT_EQ(Title(), kCaptionDash + "robot.onyx2");
    EXPECT_FALSE(std::filesystem::exists(path));
    EXPECT_EQ(LastStatus(), "Could not write " + path);

    Menu(ui::IdFileNew);
    SetText(ui::IdEditor, "text");
    // Every component is short; the whole path is not.
    const std::filesystem::path deep = dir() / std::string(200, 'd');
    std::filesystem::create_directories(deep);
    const std::string longName = (deep / (std::string(100, 'f') + ".onyx2")).string();
    Menu(ui::IdFileSaveAs, longName);
    EXPECT_STREQ(dialog().currentFile(), "");
    EXPECT_EQ(LastStatus(), "File name too long: " + longName);
    // Nothing was written, under the full name or under one cut to 259 characters.
    EXPECT_TRUE(std::filesystem::is_empty(deep));
}

} // namespace
} // namespace commands_test
