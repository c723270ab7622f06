// The help file the client ships, its reader and headless viewer, and the help protocol of a
// run: the hidden window, the outcome topics, and the commands whose tests open the next topic.
#include <gtest/gtest.h>

#include <deque>
#include <regex>
#include <set>
#include <string>
#include <vector>

#include "Fakes.h"
#include "troubleshooter/HeadlessHelpViewer.h"
#include "troubleshooter/HelpDocument.h"
#include "troubleshooter/HelpLink.h"
#include "troubleshooter/TroubleShooter.h"
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

std::string Jump(const char* topic)
{
    return std::string("JI(\"shooter.hlp\",\"") + topic + "\")";
}

class HelpProtocol : public ShooterFixture {
protected:
    HelpProtocol()
    {
        host.SetListener([](const ui::HeadlessEvent& event) {
            ADD_FAILURE() << "the help link shows nothing itself: " << event.text;
        });
        // A dry queue runs the help's next scripted command, as a link of the shown topic
        // would send it; with none left the quit request ends a faulty run.
        host.SetIdleHandler([this] {
            ++idleCalls;
            if (script.empty()) {
                host.PostQuit(0);
            } else {
                host.PostMessage(viewer.lastOwner, ui::kMsgCommand,
                                 ui::MakeCommand(script.front().first), script.front().second);
                script.pop_front();
            }
            return true;
        });
    }

    ui::HeadlessHost host;
    RecordingViewer viewer;
    TroubleShooter shooter{&calls, &handle, log.path(), &system};
    std::deque<std::pair<int, ui::LParam>> script;
    int idleCalls = 0;
};

TEST_F(HelpProtocol, HiddenWindowOpensTheFileOnceShowsTopicsAndClosesTheHelpWhenItGoes)
{
    ui::WindowHandle window = ui::kNoWindow;
    {
        HelpLink link(&shooter, host, &viewer);
        window = link.window();
        EXPECT_EQ(host.FindWindowOfClass("trbl_wnd"), window);
        EXPECT_FALSE(host.WindowVisible(window));
        EXPECT_FALSE(link.HelpOpen());
        EXPECT_FALSE(link.ShowOutcome(1310)) << "no topic, but the help opens";
        EXPECT_TRUE(link.HelpOpen());
        EXPECT_TRUE(link.ShowOutcome(1011));
        EXPECT_TRUE(link.ShowOutcome(1203));
        EXPECT_EQ(viewer.lastOwner, window);
    }
    EXPECT_FALSE(host.WindowExists(window));
    EXPECT_EQ(viewer.calls, (Strings{"open shooter.hlp", "macro " + Jump("Download_interrupted"),
                                     "macro " + Jump("COM_port_invalid"), "quit shooter.hlp"}));
}

TEST_F(HelpProtocol, OnlyAnAnswerOfExactlyOneOpensTheHelp)
{
    for (int answer : {0, 2, -1}) {
        RecordingViewer refusing;
        refusing.openAnswer = answer;
        HelpLink link(&shooter, host, &refusing);
        EXPECT_TRUE(link.ShowOutcome(1001));
        EXPECT_FALSE(link.HelpOpen()) << answer;
        link.ShowOutcome(1001);
        EXPECT_EQ(refusing.calls.size(), 4u) << "the next outcome tries to open it again";
    }
    HelpLink without(&shooter, host, nullptr);
    EXPECT_TRUE(without.ShowOutcome(1001));
    EXPECT_FALSE(without.HelpOpen());
}

// A window system that makes no windows: the help's commands, its close included, would have
// nowhere to go, so the help must not be opened and nothing may wait for it.
class WindowlessHost final : public ui::HeadlessHost {
public:
    ui::WindowHandle CreatePlainWindow(const char*, ui::WindowObject*) override
    {
        return ui::kNoWindow;
    }
};

TEST_F(HelpProtocol, WithoutItsWindowTheHelpIsNeverOpened)
{
    WindowlessHost windowless;
    HelpLink link(&shooter, windowless, &viewer);
    EXPECT_EQ(link.window(), ui::kNoWindow);
    EXPECT_TRUE(link.ShowOutcome(1001)) << "the topic is still known";
    EXPECT_FALSE(link.HelpOpen()) << "a run would not wait for it";
    EXPECT_EQ(viewer.calls, Strings{"macro " + Jump("IR_Transmitter_not_found")})
        << "the file is never opened";
}

TEST_F(HelpProtocol, TopicTableCoversEveryOutcomeGroup)
{
    const std::pair<int, const char*> expected[] = {
        {1001, "IR_Transmitter_not_found"},
        {1002, "IR_Transmitter_or_cable_not_connected"},
        {1003, "IR_Transmitter_not_working"},
        {1004, "Onyx_not_alive"},
        {1005, "UnlockPBrick_failed"},
        {1006, "No_Onyx_firmware"},
        {1007, "Not_an_Onyx"},
        {1008, "Onyx_battery_voltage_too_low"},
        {1009, "Onyx_memory_full"},
        {1010, "Download_interrupted"},
        {1012, "Download_interrupted"},
        {1101, "USB_not_installed"},
        {1102, "USB_Transmitter_not_installed"},
        {1103, "USB_Transmitter_not_installed_properly"},
        {1104, "Failed_to_set_IR_Transmitter_to_long_range"},
        {1105, "USB_Transmitter_unplugged"},
        {1201, "COM_port_not_free"},
        {1202, "COM_port_not_working"},
        {1203, "COM_port_invalid"},
        {1204, "COM_port_used_by_serial_mouse"},
        {1301, "Error_in_program"},
        {1309, "Error_in_program"},
        {1401, "Missing_system_component"},
        {1410, "Missing_system_component"}};
    for (const auto& [outcome, topic] : expected) {
        ASSERT_NE(HelpLink::TopicOf(outcome), nullptr) << outcome;
        EXPECT_STREQ(HelpLink::TopicOf(outcome), topic);
    }
    for (int none : {0, 1000, 1013, 1100, 1106, 1200, 1205, 1300, 1310, 1400, 1411}) {
        EXPECT_EQ(HelpLink::TopicOf(none), nullptr) << none;
    }
}

TEST_F(HelpProtocol, EachTestOpensItsSuccessTopic)
{
    HelpLink link(&shooter, host, &viewer);
    calls.findPortAnswers = {{0, "COM1"}};
    calls.enumAnswers[3] = {{0, 1, "COM1"}, {0, 3, "COM3"}};
    calls.enumAnswers[4] = {{0, 1, "KIVOTOWER1"}};
    const std::pair<int, ui::LParam> commands[] = {{2001, 0}, {2002, 0}, {2003, 0},      {2006, 2},
                                                   {2007, 0}, {2008, 0}, {2004, 0x70003}};
    for (const auto& [id, argument] : commands) {
        EXPECT_EQ(link.HandleHelpCommand(id, argument), 0) << id;
    }
    EXPECT_EQ(
        viewer.macros,
        (Strings{Jump("Found_working_IR_Transmitter"), Jump("IR_Transmitter_ok"), Jump("Onyx_ok"),
                 Jump("IR_Transmitter_range_set_ok"), Jump("Found_working_COM_port"),
                 Jump("Found_working_IR_Transmitter"), Jump("Found_working_IR_Transmitter")}));
    const std::string body = log.body();
    EXPECT_NE(body.find("\nFind Tower:\n"), std::string::npos);
    EXPECT_NE(body.find("\nFind USB Tower:\n\tEnum USB ports ok\n"), std::string::npos);
    EXPECT_NE(body.find("\nSet USB Range:\n\tSet range ok\n"), std::string::npos);
    // The port number is the low sixteen bits of the argument.
    EXPECT_NE(body.find("\nTest serial tower:\n\tTest COM port COM3: ok\n\tCreate port COM3 ok\n"),
              std::string::npos);
}

TEST_F(HelpProtocol, FailedTestJumpsToItsOwnOutcomeAndCloseEndsThePump)
{
    HelpLink link(&shooter, host, &viewer);
    calls.lastStatus[3] = 4; // the brick's status: no tower
    script = {{2003, 0}, {2000, 0}};
    EXPECT_TRUE(shooter.Diagnose(Packed(0xE0050402u), &link));
    EXPECT_EQ(viewer.calls, (Strings{"open shooter.hlp", "macro " + Jump("Onyx_not_alive"),
                                     "macro " + Jump("IR_Transmitter_or_cable_not_connected"),
                                     "quit shooter.hlp"}));
    EXPECT_EQ(idleCalls, 2);
    EXPECT_FALSE(host.QuitRequested());
}

TEST_F(HelpProtocol, RepairedUsbTowerLetsTheArgumentStand)
{
    HelpLink link(&shooter, host, &viewer);
    calls.portKind = 3;
    // Answering at the diagnosis, lost before each of the two commands, found again by each.
    calls.statusAnswers[2] = {1, 4, 1, 4, 1};
    calls.findPortAnswers = {{0, "KIVOTOWER"}, {0, "KIVOTOWER"}};
    script = {{2001, 0}, {2008, Packed(0xE0050413u)}, {2000, 0}};
    shooter.Diagnose(Packed(0xE0050401u), &link);
    EXPECT_EQ(viewer.macros,
              (Strings{Jump("IR_Transmitter_not_found"), Jump("Found_working_IR_Transmitter"),
                       Jump("Failed_to_set_IR_Transmitter_to_long_range")}));
    EXPECT_EQ(log.body().find("Find Tower:"), std::string::npos);
    EXPECT_EQ(log.body().find("Enum USB ports"), std::string::npos);
}

TEST_F(HelpProtocol, UnknownCommandsAndCommandsWithoutTroubleShooterDoNothing)
{
    calls.forbidCalls = true;
    HelpLink link(&shooter, host, &viewer);
    for (int id : {1999, 2005, 2009, 3000, 3002, 0}) {
        EXPECT_EQ(link.HandleHelpCommand(id, 1), 0);
    }
    HelpLink orphan(nullptr, host, &viewer);
    for (int id : {2001, 2002, 2003, 2004, 2006, 2007, 2008, 3001}) {
        orphan.HandleHelpCommand(id, 3);
    }
    EXPECT_TRUE(viewer.calls.empty());
    EXPECT_EQ(log.body(), "");
    orphan.ShowOutcome(1001);
    orphan.HandleHelpCommand(2000, 0);
    EXPECT_FALSE(orphan.HelpOpen()) << "only close acts";
}

TEST_F(HelpProtocol, QuitRequestEndsTheRunAndStaysPending)
{
    HelpLink link(&shooter, host, &viewer);
    EXPECT_TRUE(shooter.Diagnose(Packed(0xE0050401u), &link));
    EXPECT_FALSE(link.HelpOpen());
    EXPECT_TRUE(host.QuitRequested());
    EXPECT_EQ(viewer.calls.back(), "quit shooter.hlp");
}

} // namespace
