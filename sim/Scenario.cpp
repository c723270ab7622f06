#include "Scenario.h"

#include <cctype>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <sstream>

namespace sim {
namespace {

std::string Trim(const std::string& text)
{
    std::size_t begin = 0;
    std::size_t end = text.size();
    while (begin < end && std::isspace(static_cast<unsigned char>(text[begin]))) {
        ++begin;
    }
    while (end > begin && std::isspace(static_cast<unsigned char>(text[end - 1]))) {
        --end;
    }
    return text.substr(begin, end - begin);
}

std::string Lower(std::string text)
{
    for (char& c : text) {
        c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
    }
    return text;
}

bool ParseInt(const std::string& text, std::int32_t& value)
{
    if (text.empty()) {
        return false;
    }
    char* end = nullptr;
    long parsed = std::strtol(text.c_str(), &end, 0);
    if (*end != '\0' || parsed < -2147483647L || parsed > 2147483647L) {
        return false;
    }
    value = static_cast<std::int32_t>(parsed);
    return true;
}

bool ParseBool(const std::string& text, bool& value)
{
    const std::string word = Lower(text);
    if (word == "yes" || word == "true" || word == "1" || word == "on") {
        value = true;
        return true;
    }
    if (word == "no" || word == "false" || word == "0" || word == "off") {
        value = false;
        return true;
    }
    return false;
}

bool ParseBrickType(const std::string& text, std::int16_t& type)
{
    static const char* const kNames[] = {"none", "unknown", "helmsman", "onyx-no-firmware",
                                         "onyx", "rover",   "onyx2",    "minirover"};
    const std::string word = Lower(text);
    for (int i = 0; i < 8; ++i) {
        if (word == kNames[i]) {
            type = static_cast<std::int16_t>(i);
            return true;
        }
    }
    std::int32_t number = 0;
    if (ParseInt(text, number) && number >= 0 && number <= 7) {
        type = static_cast<std::int16_t>(number);
        return true;
    }
    return false;
}

// "0301.0309" or "0301"
bool ParseVersionPart(const std::string& text, std::int32_t& value)
{
    if (text.size() != 4) {
        return false;
    }
    for (char c : text) {
        if (!std::isdigit(static_cast<unsigned char>(c))) {
            return false;
        }
    }
    value = std::atoi(text.c_str());
    return true;
}

bool ParseBrickKey(BrickSpec& brick, const std::string& key, const std::string& value)
{
    if (key == "type") {
        return ParseBrickType(value, brick.type);
    }
    if (key == "alive") {
        return ParseBool(value, brick.alive);
    }
    if (key == "firmware") {
        return ParseBool(value, brick.firmware);
    }
    if (key == "unlock") {
        const std::string word = Lower(value);
        if (word != "ok" && word != "fails") {
            return false;
        }
        brick.unlockFails = word == "fails";
        return true;
    }
    if (key == "battery") {
        return ParseInt(value, brick.battery) && brick.battery >= 0;
    }
    if (key == "memory") {
        return ParseInt(value, brick.memory) && brick.memory >= 0 && brick.memory <= 0x4000;
    }
    if (key == "version") {
        const std::size_t dot = value.find('.');
        return dot != std::string::npos && ParseVersionPart(value.substr(0, dot), brick.rom) &&
               ParseVersionPart(value.substr(dot + 1), brick.firmwareVersion);
    }
    if (key == "messages") {
        brick.messages.clear();
        std::stringstream list(value);
        std::string item;
        while (std::getline(list, item, ',')) {
            std::int32_t number = 0;
            if (!ParseInt(Trim(item), number)) {
                return false;
            }
            brick.messages.push_back(number);
        }
        return true;
    }
    return false;
}

bool ParsePortKey(PortSpec& port, const std::string& key, const std::string& value)
{
    if (key == "kind") {
        const std::string word = Lower(value);
        if (word != "usb" && word != "serial") {
            return false;
        }
        port.usb = word == "usb";
        return true;
    }
    if (key == "state") {
        const std::string word = Lower(value);
        if (word == "ok") {
            port.state = PortState::Ok;
        } else if (word == "in-use") {
            port.state = PortState::InUse;
        } else if (word == "conflict") {
            port.state = PortState::Conflict;
        } else if (word == "missing") {
            port.state = PortState::Missing;
        } else if (word == "serial-mouse") {
            port.state = PortState::SerialMouse;
        } else {
            return false;
        }
        return true;
    }
    if (key == "tower") {
        const std::string word = Lower(value);
        if (word == "yes") {
            port.tower = TowerState::Present;
        } else if (word == "no") {
            port.tower = TowerState::None;
        } else if (word == "dead") {
            port.tower = TowerState::Dead;
        } else {
            return false;
        }
        return true;
    }
    if (key == "long-range") {
        port.longRangeFails = Lower(value) == "fails";
        if (port.longRangeFails) {
            port.longRange = true;
            return true;
        }
        return ParseBool(value, port.longRange);
    }
    if (key == "unplug-after") {
        return ParseInt(value, port.unplugAfter) && port.unplugAfter >= -1;
    }
    if (key == "loss") {
        return ParseInt(value, port.loss) && port.loss >= 0 && port.loss <= 100;
    }
    if (key == "statistics") {
        const std::string word = Lower(value);
        if (word != "ok" && word != "refused") {
            return false;
        }
        port.statistics = word == "ok";
        return true;
    }
    if (key == "brick") {
        port.brick = Lower(value) == "none" ? std::string() : value;
        return true;
    }
    return false;
}

} // namespace

Scenario Scenario::BuiltIn()
{
    Scenario scenario;
    BrickSpec brick;
    brick.name = "onyx2";
    scenario.bricks.push_back(brick);

    PortSpec usb;
    usb.name = "KIVOTOWER1";
    usb.usb = true;
    usb.longRange = true;
    usb.brick = brick.name;
    scenario.ports.push_back(usb);

    PortSpec serial;
    serial.name = "COM1";
    serial.brick = brick.name;
    scenario.ports.push_back(serial);
    scenario.source = "built-in";
    return scenario;
}

const BrickSpec* Scenario::findBrick(const std::string& name) const
{
    for (const BrickSpec& brick : bricks) {
        if (brick.name == name) {
            return &brick;
        }
    }
    return nullptr;
}

bool Scenario::Parse(const std::string& text, Scenario& out, std::string& error)
{
    Scenario scenario;
    enum class Section { Global, Port, Brick } section = Section::Global;
    std::vector<bool> portHasBrickKey;
    std::stringstream lines(text);
    std::string line;
    int number = 0;
    auto fail = [&](const char* what) {
        char message[160];
        std::snprintf(message, sizeof message, "line %d: %s", number, what);
        error = message;
        return false;
    };
    while (std::getline(lines, line)) {
        ++number;
        const std::size_t hash = line.find('#');
        if (hash != std::string::npos) {
            line.erase(hash);
        }
        line = Trim(line);
        if (line.empty()) {
            continue;
        }
        if (line.front() == '[') {
            if (line.back() != ']') {
                return fail("section header without ']'");
            }
            std::string header = Trim(line.substr(1, line.size() - 2));
            const std::size_t blank = header.find(' ');
            const std::string kind = Lower(header.substr(0, blank));
            const std::string name =
                blank == std::string::npos ? std::string() : Trim(header.substr(blank + 1));
            if (name.empty()) {
                return fail("section needs a name, as in [port COM1] or [brick b1]");
            }
            if (kind == "port") {
                for (const PortSpec& port : scenario.ports) {
                    if (port.name == name) {
                        return fail("port named twice");
                    }
                }
                PortSpec port;
                port.name = name;
                port.usb = name.find("KIVOTOWER") != std::string::npos;
                if (!port.usb && name.rfind("COM", 0) != 0) {
                    return fail("a port name is COMn or contains KIVOTOWER");
                }
                scenario.ports.push_back(port);
                portHasBrickKey.push_back(false);
                section = Section::Port;
            } else if (kind == "brick") {
                if (scenario.findBrick(name) != nullptr) {
                    return fail("brick named twice");
                }
                BrickSpec brick;
                brick.name = name;
                scenario.bricks.push_back(brick);
                section = Section::Brick;
            } else {
                return fail("unknown section kind (port or brick)");
            }
            continue;
        }
        const std::size_t equals = line.find('=');
        if (equals == std::string::npos) {
            return fail("expected key = value");
        }
        const std::string key = Lower(Trim(line.substr(0, equals)));
        const std::string value = Trim(line.substr(equals + 1));
        bool ok = false;
        switch (section) {
        case Section::Global:
            if (key == "link-time") {
                ok = ParseInt(value, scenario.linkMillisPerCommand) &&
                     scenario.linkMillisPerCommand >= 0 && scenario.linkMillisPerCommand <= 1000;
            } else if (key == "seed") {
                std::int32_t seed = 0;
                ok = ParseInt(value, seed);
                scenario.seed = static_cast<std::uint32_t>(seed);
            }
            break;
        case Section::Port:
            ok = ParsePortKey(scenario.ports.back(), key, value);
            if (key == "brick") {
                portHasBrickKey.back() = true;
            }
            break;
        case Section::Brick:
            ok = ParseBrickKey(scenario.bricks.back(), key, value);
            break;
        }
        if (!ok) {
            return fail("unknown key or bad value");
        }
    }
    for (std::size_t i = 0; i < scenario.ports.size(); ++i) {
        PortSpec& port = scenario.ports[i];
        if (!portHasBrickKey[i] && !scenario.bricks.empty()) {
            port.brick = scenario.bricks.front().name;
        }
        if (!port.brick.empty() && scenario.findBrick(port.brick) == nullptr) {
            number = 0;
            error = "port " + port.name + " names an unknown brick " + port.brick;
            return false;
        }
    }
    out = scenario;
    return true;
}

Scenario Scenario::Load()
{
    const char* path = std::getenv("TESSEL_SIM");
    if (path == nullptr || *path == '\0') {
        return BuiltIn();
    }
    std::ifstream file(path, std::ios::binary);
    std::string text;
    if (file) {
        std::stringstream content;
        content << file.rdbuf();
        text = content.str();
    }
    Scenario scenario;
    std::string error;
    if (!file) {
        error = "cannot read the file";
    } else if (Scenario::Parse(text, scenario, error)) {
        scenario.source = path;
        return scenario;
    }
    scenario = BuiltIn();
    scenario.problem = std::string(path) + ": " + error;
    return scenario;
}

} // namespace sim
