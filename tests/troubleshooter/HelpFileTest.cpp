#include <gtest/gtest.h>

#include <regex>
#include <set>
#include <string>
#include <vector>

#include "FakeWindowHost.h"
#include "LogHelpers.h"
#include "troubleshooter/HeadlessHelpViewer.h"
#include "troubleshooter/HelpDocument.h"
#include "troubleshooter/HelpLink.h"

namespace {

using Strings = std::vector<std::string>;

const char* const kSuccessTopics[] = {"Found_working_IR_Transmitter", "IR_Transmitter_ok",
                                      "Onyx_ok", "IR_Transmitter_range_set_ok",
                                      "Found_working_COM_port"};

std::set<std::string> RequiredTopics()
{
    std::set<std::string> topics(std::begin(kSuccessTopics), std::end(kSuccessTopics));
    for (int outcome = 1000; outcome < 1500; ++outcome) {
        if (const char* topic = HelpLink::TopicOf(outcome)) {
            topics.insert(topic);
        }
    }
    return topics;
}

class ShooterHelpFile : public testing::Test {
protected:
    void SetUp() override { ASSERT_TRUE(document.Load(HARBOR_HELP_FILE)); }
    HelpDocument document;
};

TEST_F(ShooterHelpFile, HasExactlyTheTopicsTheClientOpens)
{
    const std::set<std::string> required = RequiredTopics();
    EXPECT_EQ(required.size(), 26u);
    const Strings ids = document.TopicIds();
    EXPECT_EQ(std::set<std::string>(ids.begin(), ids.end()), required);
}

TEST_F(ShooterHelpFile, EveryLinkLeadsSomewhere)
{
    const std::set<int> commands = {2000, 2001, 2002, 2003, 2004, 2006, 2007, 2008, 3001};
    const std::regex link("href=\"([^\"]*)\"");
    for (const std::string& id : document.TopicIds()) {
        const std::string html = document.TopicHtml(id);
        bool closes = false;
        for (std::sregex_iterator it(html.begin(), html.end(), link), end; it != end; ++it) {
            const std::string href = (*it)[1];
            if (href[0] == '#') {
                EXPECT_TRUE(document.HasTopic(href.substr(1))) << id << ": " << href;
                continue;
            }
            int command = 0;
            std::int32_t argument = 0;
            ASSERT_TRUE(HelpDocument::ParseCommandLink(href, &command, &argument))
                << id << ": " << href;
            EXPECT_EQ(commands.count(command), 1u) << id << ": " << href;
            const bool takesArgument = command == 2004 || command == 2006 || command == 3001;
            EXPECT_EQ(href.find('?') != std::string::npos, takesArgument) << id << ": " << href;
            if (command == 2006) {
                EXPECT_TRUE(argument >= 1 && argument <= 3) << id;
            }
            if (command == 3001) {
                EXPECT_TRUE(argument == 1 || argument == 3) << id;
            }
            closes = closes || command == 2000;
        }
        EXPECT_TRUE(closes) << id << " offers no way to close";
    }
}

TEST_F(ShooterHelpFile, TopicsReadAsGuidance)
{
    for (const std::string& id : document.TopicIds()) {
        const Strings text = document.TopicText(id);
        ASSERT_GE(text.size(), 2u) << id;
        for (const std::string& line : text) {
            EXPECT_EQ(line.find('<'), std::string::npos) << id << ": " << line;
            EXPECT_EQ(line.find("&"), std::string::npos) << id << ": " << line;
        }
    }
}

TEST(HelpDocumentText, LinksShowWhatToType)
{
    HelpDocument document;
    ASSERT_TRUE(document.Parse(
        "<!-- <section id=\"Commented\"> --><section id=\"A\"><h2>Title &amp; more</h2>\n"
        "<p>Go <a href=\"cmd:2004?3\">to COM3</a>,\n   or <a href=\"cmd:2002\">test</a>"
        " or <a href=\"#B\">read B</a>.</p><ul><li>one</li><li>two</li></ul></section>"
        "<section id=\"B\"><p>b</p></section><section id=\"A\">duplicate</section>"));
    EXPECT_EQ(document.TopicIds(), (Strings{"A", "B"}));
    EXPECT_EQ(document.TopicText("A"),
              (Strings{"Title & more",
                       "Go to COM3 [help 2004 3], or test [help 2002] or read B "
                       "[topic B].",
                       "- one", "- two"}));
    EXPECT_TRUE(document.TopicText("C").empty());
}

TEST(HelpDocumentText, FilesWithoutTopicsAreNotHelpFiles)
{
    HelpDocument document;
    EXPECT_FALSE(document.Parse("<html><body>nothing</body></html>"));
    EXPECT_FALSE(document.Parse(""));
    EXPECT_FALSE(document.Load("/nonexistent/shooter.hlp"));
    TempLog empty;
    std::fclose(std::fopen(empty.path(), "w"));
    EXPECT_FALSE(document.Load(empty.path()));
}

TEST(HelpDocumentText, JumpMacro)
{
    std::string file;
    std::string topic;
    EXPECT_TRUE(HelpDocument::ParseJumpMacro("JI(\"shooter.hlp\",\"Onyx_ok\")", &file, &topic));
    EXPECT_EQ(file, "shooter.hlp");
    EXPECT_EQ(topic, "Onyx_ok");
    for (const char* bad : {"JI(\"shooter.hlp\",\"\")", "JI(\"shooter.hlp\",\"x\"", "JI(\"a\")",
                            "JumpId(\"a\",\"b\")", "", "JI(\"shooter.hlp\",\"x\") "}) {
        EXPECT_FALSE(HelpDocument::ParseJumpMacro(bad, &file, &topic)) << bad;
    }
    EXPECT_FALSE(HelpDocument::ParseJumpMacro(nullptr, &file, &topic));
}

TEST(HelpDocumentText, CommandLinks)
{
    int id = 0;
    std::int32_t argument = 99;
    EXPECT_TRUE(HelpDocument::ParseCommandLink("cmd:2002", &id, &argument));
    EXPECT_EQ(id, 2002);
    EXPECT_EQ(argument, 0);
    EXPECT_TRUE(HelpDocument::ParseCommandLink("cmd:2004?-3", &id, &argument));
    EXPECT_EQ(argument, -3);
    for (const char* bad : {"cmd:", "cmd:x", "cmd:70000", "cmd:2004?", "cmd:2004?3x",
                            "cmd:2004?99999999999", "#Topic", "http://x"}) {
        EXPECT_FALSE(HelpDocument::ParseCommandLink(bad, &id, &argument)) << bad;
    }
}

class HeadlessViewer : public testing::Test {
protected:
    HeadlessViewer()
        : viewer(
              host, [this](const std::string& line) { printed.push_back(line); }, HelpDirectory())
    {
    }
    static std::string HelpDirectory()
    {
        const std::string file = HARBOR_HELP_FILE;
        return file.substr(0, file.rfind('/') + 1);
    }
    ui::WindowHandle Owner()
    {
        owner = host.CreatePlainWindow("trbl_wnd", &sink);
        return owner;
    }

    struct Sink : ui::WindowObject {
        std::vector<std::pair<int, ui::LParam>> commands;
        bool OnMessage(ui::Message message, ui::WParam wParam, ui::LParam lParam,
                       ui::LResult& result) override
        {
            if (message == ui::kMsgCommand) {
                commands.emplace_back(ui::CommandId(wParam), lParam);
            }
            return true;
        }
    } sink;
    FakeWindowHost host;
    Strings printed;
    HeadlessHelpViewer viewer;
    ui::WindowHandle owner = ui::kNoWindow;
};

TEST_F(HeadlessViewer, PrintsTheTopicAndSendsCommandsToItsOwner)
{
    const ui::WindowHandle window = Owner();
    EXPECT_EQ(viewer.OpenFile(window, "shooter.hlp"), 1);
    EXPECT_EQ(viewer.RunMacro(window, "shooter.hlp", "JI(\"shooter.hlp\",\"IR_Transmitter_ok\")"),
              1);
    EXPECT_EQ(viewer.currentTopic(), "IR_Transmitter_ok");
    ASSERT_GE(printed.size(), 4u);
    EXPECT_EQ(printed[0], "[help] opened shooter.hlp");
    EXPECT_EQ(printed[1], "[help] topic IR_Transmitter_ok");
    EXPECT_EQ(printed[2], "[help]   The tower is working");
    EXPECT_EQ(printed.back(), "[help]   Test the brick [help 2003] - Close [help 2000]");

    EXPECT_TRUE(viewer.Command(2004, 3));
    host.PumpMessage();
    ASSERT_EQ(sink.commands.size(), 1u);
    EXPECT_EQ(sink.commands[0], std::make_pair(2004, static_cast<ui::LParam>(3)));
}

TEST_F(HeadlessViewer, EndOfInputClosesTheHelpOnce)
{
    const ui::WindowHandle window = Owner();
    viewer.OpenFile(window, "shooter.hlp");
    viewer.InputEnded();
    viewer.InputEnded();
    host.PumpMessage();
    EXPECT_EQ(sink.commands.size(), 1u);
    EXPECT_EQ(sink.commands[0].first, 2000);
    EXPECT_EQ(viewer.Quit(window, "shooter.hlp"), 1);
    EXPECT_FALSE(viewer.IsOpen());
    EXPECT_EQ(printed.back(), "[help] closed");
    EXPECT_FALSE(viewer.Command(2002, 0));
}

TEST_F(HeadlessViewer, ANewOwnerTakesTheViewerOver)
{
    const ui::WindowHandle first = Owner();
    Sink second;
    const ui::WindowHandle later = host.CreatePlainWindow("trbl_wnd", &second);
    EXPECT_EQ(viewer.OpenFile(first, "shooter.hlp"), 1);
    EXPECT_EQ(viewer.OpenFile(later, "shooter.hlp"), 1);
    host.PumpMessage();
    ASSERT_EQ(sink.commands.size(), 1u);
    EXPECT_EQ(sink.commands[0].first, 2000);
    // The first owner's own close and topics no longer touch the viewer.
    EXPECT_EQ(viewer.RunMacro(first, "shooter.hlp", "JI(\"shooter.hlp\",\"Onyx_ok\")"), 0);
    EXPECT_EQ(viewer.Quit(first, "shooter.hlp"), 1);
    EXPECT_TRUE(viewer.IsOpen());
    EXPECT_EQ(viewer.RunMacro(later, "shooter.hlp", "JI(\"shooter.hlp\",\"Onyx_ok\")"), 1);
    EXPECT_TRUE(viewer.Command(2002, 0));
    host.PumpMessage();
    EXPECT_EQ(second.commands.size(), 1u);
    EXPECT_EQ(viewer.Quit(later, "shooter.hlp"), 1);
    EXPECT_FALSE(viewer.IsOpen());
}

TEST_F(HeadlessViewer, MissingFileFailsToOpen)
{
    HeadlessHelpViewer elsewhere(host, nullptr, "/nonexistent/");
    EXPECT_EQ(elsewhere.OpenFile(Owner(), "shooter.hlp"), 0);
    EXPECT_FALSE(elsewhere.IsOpen());
    EXPECT_EQ(elsewhere.RunMacro(owner, "shooter.hlp", "JI(\"shooter.hlp\",\"Onyx_ok\")"), 0);
    EXPECT_FALSE(elsewhere.Command(2000, 0));
}

TEST_F(HeadlessViewer, UnknownTopicIsReported)
{
    viewer.OpenFile(Owner(), "shooter.hlp");
    EXPECT_EQ(viewer.RunMacro(owner, "shooter.hlp", "JI(\"shooter.hlp\",\"Nowhere\")"), 0);
    EXPECT_EQ(printed.back(), "[help] no topic Nowhere");
    EXPECT_TRUE(viewer.ShowTopic("Onyx_ok"));
}

} // namespace
