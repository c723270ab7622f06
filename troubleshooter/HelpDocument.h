// The help file "shooter.hlp": one HTML document with one <section id="..."> per topic id.
// Its header comment documents the link syntax; in short, a command link is
//   <a href="cmd:2004?3">...</a>   command id 2004 with argument 3 (the argument may be left
//                                  out: "cmd:2002"; it is then 0)
// and a plain link to another topic is <a href="#Topic_id">...</a>.
//
// Shared by the help viewers of both hosts: the document finds the topics, turns a topic
// into plain text for the headless viewer and reads the jump macro and command links.
#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <vector>

class HelpDocument {
public:
    // Reads and indexes the file; false (and no topics) when it cannot be read or holds no
    // topic section.
    bool Load(const std::string& path);
    // Indexes HTML text already in memory; false when it holds no topic section.
    bool Parse(const std::string& text);

    bool HasTopic(const std::string& id) const { return topics_.count(id) != 0; }
    std::size_t TopicCount() const { return topics_.size(); }
    std::vector<std::string> TopicIds() const;
    // The topic's section as written, from <section ...> to </section>; "" when unknown.
    std::string TopicHtml(const std::string& id) const;
    // The topic as lines of plain text: headings and paragraphs on lines of their own, list
    // items with "- ", and each link followed by what to type to follow it:
    // "Test the tower [help 2002]", "Port 3 [help 2004 3]", "Next [topic Other_topic]".
    std::vector<std::string> TopicText(const std::string& id) const;

    // The topic id of JI("<file>","<topic>"); false for any other macro.
    static bool ParseJumpMacro(const char* macro, std::string* file, std::string* topic);
    // "cmd:<id>" or "cmd:<id>?<argument>" (decimal, argument may be negative); false for
    // any other link.
    static bool ParseCommandLink(const std::string& href, int* id, std::int32_t* argument);

private:
    std::map<std::string, std::string> topics_;
};
