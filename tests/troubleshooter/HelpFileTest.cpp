// The help file the client ships, the document reader, and the headless viewer built on it.
#include <gtest/gtest.h>

#include <regex>
#include <set>
#include <string>
#include <vector>

#include "Fakes.h"
#include "troubleshooter/HeadlessHelpViewer.h"
#include "troubleshooter/HelpDocument.h"
#include "troubleshooter/HelpLink.h"
#include "ui/headless/HeadlessHost.h"

namespace {

TEST(ShooterHelpFile, HasExactlyTheTopicsTheClientOpensAndEveryLinkLeadsSomewhere)
{
    HelpDocument document;
    ASSERT_TRUE(document.Load(HARBOR_HELP_FILE));
    std::set<std::string> required = {"Found_working_IR_Transmitter", "IR_Transmitter_ok",
                                      "Onyx_ok", "IR_Transmitter_range_set_ok",
                                      "Found_working_COM_port"};
    for (int outcome = 1000; outcome < 1500; ++outcome) {
        if (const char* topic = HelpLink::TopicOf(outcome)) {
            required.insert(topic);
        }
    }
    EXPECT_EQ(required.size(), 26u);
    const Strings ids = document.TopicIds();
    EXPECT_EQ(std::set<std::string>(ids.begin(), ids.end()), required);

    const std::set<int> commands = {2000, 2001, 2002, 2003, 2004, 2006, 2007, 2008, 3001};
    const std::regex link("href=\"([^\"]*)\"");
    for (const std::string& id : ids) {
        SCOPED_TRACE(id);
        const std::string html = document.TopicHtml(id);
        bool closes = false;
        for (std::sregex_iterator it(html.begin(), html.end(), link), end; it != end; ++it) {
            const std::string href = (*it)[1];
            SCOPED_TRACE(href);
            if (href[0] == '#') {
                EXPECT_TRUE(document.HasTopic(href.substr(1)));
                continue;
            }
            int command = 0;
            std::int32_t argument = 0;
            ASSERT_TRUE(HelpDocument::ParseCommandLink(href, &command, &argument));
            EXPECT_EQ(commands.count(command), 1u);
            const bool takesArgument = command == 2004 || command == 2006 || command == 3001;
            EXPECT_EQ(href.find('?') != std::string::npos, takesArgument);
            EXPECT_TRUE(command != 2006 || (argument >= 1 && argument <= 3));
            EXPECT_TRUE(command != 3001 || argument == 1 || argument == 3);
            closes = closes || command == 2000;
        }
        EXPECT_TRUE(closes) << "no way to close";
        const Strings text = document.TopicText(id);
        EXPECT_GE(text.size(), 2u);
        for (const std::string& line : text) {
            EXPECT_EQ(line.find_first_of("<&"), std::string::npos) << line;
        }
    }
}

TEST(HelpDocumentText, TopicsAreReadAsLinesWithWhatToType)
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
                       "Go to COM3 [help 2004 3], or test [help 2002] or read B [topic B].",
                       "- one", "- two"}));
    EXPECT_TRUE(document.TopicText("C").empty());
    // Files without topics are no help files.
    EXPECT_FALSE(document.Parse("<html><body>nothing</body></html>"));
    EXPECT_FALSE(document.Parse(""));
    EXPECT_FALSE(document.Load("/nonexistent/shooter.hlp"));
    TempLog empty;
    std::fclose(std::fopen(empty.path(), "w"));
    EXPECT_FALSE(document.Load(empty.path()));
}

TEST(HelpDocumentText, JumpMacrosAndCommandLinks)
{
    std::string file;
    std::string topic;
    EXPECT_TRUE(HelpDocument::ParseJumpMacro("JI(\"shooter.hlp\",\"Onyx_ok\")", &file, &topic));
    EXPECT_EQ(file + "|" + topic, "shooter.hlp|Onyx_ok");
    for (const char* bad : {"JI(\"shooter.hlp\",\"\")", "JI(\"shooter.hlp\",\"x\"", "JI(\"a\")",
                            "JumpId(\"a\",\"b\")", "", "JI(\"shooter.hlp\",\"x\") ",
                            static_cast<const char*>(nullptr)}) {
        EXPECT_FALSE(HelpDocument::ParseJumpMacro(bad, &file, &topic)) << (bad ? bad : "<null>");
    }
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
    struct Sink : ui::WindowObject {
        std::vector<std::pair<int, ui::LParam>> commands;
        bool OnMessage(ui::Message message, ui::WParam wParam, ui::LParam lParam,
                       ui::LResult&) override
        {
            if (message == ui::kMsgCommand) {
                commands.emplace_back(ui::CommandId(wParam), lParam);
            }
            return true;
        }
    };

    ui::HeadlessHost host;
    Strings printed;
    HeadlessHelpViewer viewer{host, [this](const std::string& line) { printed.push_back(line); },
                              HelpDirectory()};
    Sink sink;
    const ui::WindowHandle owner = host.CreatePlainWindow("trbl_wnd", &sink);
    const char* const onyxOk = "JI(\"shooter.hlp\",\"Onyx_ok\")";
};

TEST_F(HeadlessViewer, PrintsTheTopicAndSendsCommandsToItsOwner)
{
    EXPECT_EQ(viewer.OpenFile(owner, "shooter.hlp"), 1);
    EXPECT_EQ(viewer.RunMacro(owner, "shooter.hlp", "JI(\"shooter.hlp\",\"IR_Transmitter_ok\")"),
              1);
    EXPECT_EQ(viewer.currentTopic(), "IR_Transmitter_ok");
    ASSERT_GE(printed.size(), 4u);
    EXPECT_EQ(printed[0], "[help] opened shooter.hlp");
    EXPECT_EQ(printed[1], "[help] topic IR_Transmitter_ok");
    EXPECT_EQ(printed[2], "[help]   The tower is working");
    EXPECT_EQ(printed.back(), "[help]   Test the brick [help 2003] - Close [help 2000]");
    EXPECT_EQ(viewer.RunMacro(owner, "shooter.hlp", "JI(\"shooter.hlp\",\"Nowhere\")"), 0);
    EXPECT_EQ(printed.back(), "[help] no topic Nowhere");
    EXPECT_TRUE(viewer.ShowTopic("Onyx_ok"));

    EXPECT_TRUE(viewer.Command(2004, 3));
    // The end of the input closes the help, once.
    viewer.InputEnded();
    viewer.InputEnded();
    host.DispatchPending();
    EXPECT_EQ(sink.commands, (std::vector<std::pair<int, ui::LParam>>{{2004, 3}, {2000, 0}}));
    EXPECT_EQ(viewer.Quit(owner, "shooter.hlp"), 1);
    EXPECT_FALSE(viewer.IsOpen());
    EXPECT_EQ(printed.back(), "[help] closed");
    EXPECT_FALSE(viewer.Command(2002, 0));
}

TEST_F(HeadlessViewer, ANewOwnerTakesTheViewerOver)
{
    Sink second;
    const ui::WindowHandle later = host.CreatePlainWindow("trbl_wnd", &second);
    EXPECT_EQ(viewer.OpenFile(owner, "shooter.hlp"), 1);
    EXPECT_EQ(viewer.OpenFile(later, "shooter.hlp"), 1);
    host.DispatchPending();
    EXPECT_EQ(sink.commands, (std::vector<std::pair<int, ui::LParam>>{{2000, 0}}));
    // The first owner's own close and topics no longer touch the viewer.
    EXPECT_EQ(viewer.RunMacro(owner, "shooter.hlp", onyxOk), 0);
    EXPECT_EQ(viewer.Quit(owner, "shooter.hlp"), 1);
    EXPECT_TRUE(viewer.IsOpen());
    EXPECT_EQ(viewer.RunMacro(later, "shooter.hlp", onyxOk), 1);
    EXPECT_TRUE(viewer.Command(2002, 0));
    host.DispatchPending();
    EXPECT_EQ(second.commands.size(), 1u);
    EXPECT_EQ(viewer.Quit(later, "shooter.hlp"), 1);
    EXPECT_FALSE(viewer.IsOpen());
}

} // namespace
