// Reading the help file: topic sections, plain text for the headless viewer, the jump macro
// and command links.
#include "troubleshooter/HelpDocument.h"

#include <cctype>
#include <cerrno>
#include <climits>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <sstream>

namespace {

// Help files are a few dozen kilobytes; anything far larger is not one.
constexpr std::streamoff kMaxFileSize = 4 * 1024 * 1024;

// The value of attribute name in the tag text (between '<' and '>'); "" when absent.
std::string Attribute(const std::string& tag, const char* name)
{
    const std::string key = std::string(name) + "=\"";
    std::size_t at = 0;
    while ((at = tag.find(key, at)) != std::string::npos) {
        // The attribute must stand on its own, not end another one's name ("data-id").
        if (at == 0 || std::isspace(static_cast<unsigned char>(tag[at - 1]))) {
            const std::size_t start = at + key.size();
            const std::size_t end = tag.find('"', start);
            return end == std::string::npos ? std::string() : tag.substr(start, end - start);
        }
        at += key.size();
    }
    return std::string();
}

// The tag name in lower case, with a leading '/' for a closing tag.
std::string TagName(const std::string& tag)
{
    std::string name;
    for (char c : tag) {
        if (std::isspace(static_cast<unsigned char>(c)) || c == '>') {
            break;
        }
        name += static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
    }
    return name;
}

void AppendEntity(const std::string& entity, std::string& out)
{
    static constexpr struct {
        const char* name;
        const char* text;
    } kEntities[] = {{"amp", "&"},  {"lt", "<"},   {"gt", ">"},    {"quot", "\""},
                     {"nbsp", " "}, {"apos", "'"}, {"middot", "-"}};
    for (const auto& known : kEntities) {
        if (entity == known.name) {
            out += known.text;
            return;
        }
    }
    out += "&" + entity + ";";
}

bool ParseNumber(const std::string& text, long long low, long long high, long long* value)
{
    if (text.empty()) {
        return false;
    }
    char* end = nullptr;
    errno = 0;
    const long long number = std::strtoll(text.c_str(), &end, 10);
    if (errno != 0 || end == nullptr || *end != '\0' || number < low || number > high) {
        return false;
    }
    *value = number;
    return true;
}

} // namespace

bool HelpDocument::Load(const std::string& path)
{
    topics_.clear();
    std::ifstream in(path, std::ios::binary);
    if (!in) {
        return false;
    }
    in.seekg(0, std::ios::end);
    const std::streamoff size = in.tellg();
    if (size <= 0 || size > kMaxFileSize) {
        return false;
    }
    in.seekg(0, std::ios::beg);
    std::ostringstream text;
    text << in.rdbuf();
    if (!in && !in.eof()) {
        return false;
    }
    return Parse(text.str());
}

bool HelpDocument::Parse(const std::string& text)
{
    topics_.clear();
    // Comments go first: the file's header comment shows the syntax of a section itself.
    std::string html;
    std::size_t from = 0;
    for (std::size_t open; (open = text.find("<!--", from)) != std::string::npos;) {
        html.append(text, from, open - from);
        const std::size_t close = text.find("-->", open + 4);
        from = close == std::string::npos ? text.size() : close + 3;
    }
    html.append(text, from, std::string::npos);
    std::size_t at = 0;
    while ((at = html.find("<section", at)) != std::string::npos) {
        const std::size_t tagEnd = html.find('>', at);
        if (tagEnd == std::string::npos) {
            break;
        }
        const std::string id = Attribute(html.substr(at + 1, tagEnd - at - 1), "id");
        std::size_t end = html.find("</section>", tagEnd);
        end = end == std::string::npos ? html.size() : end + std::strlen("</section>");
        if (!id.empty() && topics_.count(id) == 0) {
            topics_[id] = html.substr(at, end - at);
        }
        at = end;
    }
    return !topics_.empty();
}

std::vector<std::string> HelpDocument::TopicIds() const
{
    std::vector<std::string> ids;
    for (const auto& topic : topics_) {
        ids.push_back(topic.first);
    }
    return ids;
}

std::string HelpDocument::TopicHtml(const std::string& id) const
{
    const auto found = topics_.find(id);
    return found == topics_.end() ? std::string() : found->second;
}

std::vector<std::string> HelpDocument::TopicText(const std::string& id) const
{
    std::vector<std::string> lines;
    const std::string html = TopicHtml(id);
    std::string line;
    std::string linkSuffix;
    auto endLine = [&]() {
        // Runs of blanks collapse, as a browser shows them.
        std::string clean;
        for (char c : line) {
            const bool blank = std::isspace(static_cast<unsigned char>(c)) != 0;
            if (blank && (clean.empty() || clean.back() == ' ')) {
                continue;
            }
            clean += blank ? ' ' : c;
        }
        while (!clean.empty() && clean.back() == ' ') {
            clean.pop_back();
        }
        if (!clean.empty() && clean != "-") {
            lines.push_back(clean);
        }
        line.clear();
    };
    for (std::size_t i = 0; i < html.size(); ++i) {
        const char c = html[i];
        if (c == '<') {
            const std::size_t close = html.find('>', i);
            if (close == std::string::npos) {
                break;
            }
            const std::string tag = html.substr(i + 1, close - i - 1);
            const std::string name = TagName(tag);
            i = close;
            if (name == "p" || name == "/p" || name == "h1" || name == "/h1" || name == "h2" ||
                name == "/h2" || name == "h3" || name == "/h3" || name == "br" || name == "br/" ||
                name == "/li" || name == "ul" || name == "/ul" || name == "ol" || name == "/ol" ||
                name == "div" || name == "/div") {
                endLine();
            } else if (name == "li") {
                endLine();
                line = "- ";
            } else if (name == "a") {
                const std::string href = Attribute(tag, "href");
                int command = 0;
                std::int32_t argument = 0;
                if (ParseCommandLink(href, &command, &argument)) {
                    linkSuffix = " [help " + std::to_string(command);
                    if (href.find('?') != std::string::npos) {
                        linkSuffix += " " + std::to_string(argument);
                    }
                    linkSuffix += "]";
                } else if (!href.empty() && href[0] == '#') {
                    linkSuffix = " [topic " + href.substr(1) + "]";
                } else {
                    linkSuffix.clear();
                }
            } else if (name == "/a") {
                line += linkSuffix;
                linkSuffix.clear();
            }
            continue;
        }
        if (c == '&') {
            const std::size_t semi = html.find(';', i);
            if (semi != std::string::npos && semi - i <= 8) {
                AppendEntity(html.substr(i + 1, semi - i - 1), line);
                i = semi;
                continue;
            }
        }
        line += c;
    }
    endLine();
    return lines;
}

bool HelpDocument::ParseJumpMacro(const char* macro, std::string* file, std::string* topic)
{
    if (macro == nullptr || std::strncmp(macro, "JI(\"", 4) != 0) {
        return false;
    }
    const char* fileStart = macro + 4;
    const char* fileEnd = std::strchr(fileStart, '"');
    if (fileEnd == nullptr || std::strncmp(fileEnd, "\",\"", 3) != 0) {
        return false;
    }
    const char* topicStart = fileEnd + 3;
    const char* topicEnd = std::strchr(topicStart, '"');
    if (topicEnd == nullptr || std::strcmp(topicEnd, "\")") != 0 || topicEnd == topicStart) {
        return false;
    }
    if (file != nullptr) {
        file->assign(fileStart, fileEnd);
    }
    if (topic != nullptr) {
        topic->assign(topicStart, topicEnd);
    }
    return true;
}

bool HelpDocument::ParseCommandLink(const std::string& href, int* id, std::int32_t* argument)
{
    if (href.rfind("cmd:", 0) != 0) {
        return false;
    }
    const std::size_t question = href.find('?');
    const std::string idText =
        href.substr(4, question == std::string::npos ? std::string::npos : question - 4);
    long long idValue = 0;
    long long argumentValue = 0;
    if (!ParseNumber(idText, 0, 0xFFFF, &idValue)) {
        return false;
    }
    if (question != std::string::npos &&
        !ParseNumber(href.substr(question + 1), INT32_MIN, INT32_MAX, &argumentValue)) {
        return false;
    }
    if (id != nullptr) {
        *id = static_cast<int>(idValue);
    }
    if (argument != nullptr) {
        *argument = static_cast<std::int32_t>(argumentValue);
    }
    return true;
}
