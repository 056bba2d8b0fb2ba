#include "tests/linux/IpMonitor.h"

#include <chrono>
#include <fstream>
#include <optional>
#include <regex>
#include <sstream>
#include <stdexcept>
#include <thread>

#include <unistd.h>

namespace Orv::Test {

namespace {

constexpr const char* markerPrefix = "marker";

/** A line such as "7: left@right: <BROADCAST,UP,LOWER_UP> mtu 1500 ... state UP mode DEFAULT ...". */
struct Line {
    int index;
    std::string name;
    bool isGone;
    unsigned status;
};

unsigned statusOf(const std::string& flags, const std::string& state) {
    const auto has = [&](const char* flag) {
        return (',' + flags + ',').find(',' + std::string(flag) + ',') != std::string::npos;
    };
    if (!has("UP")) {
        return 5;
    }
    const bool carrier = has("LOWER_UP") || !has("NO-CARRIER");
    return state == "UP" || (state == "UNKNOWN" && carrier) ? 1 : 12;
}

std::optional<Line> parse(const std::string& text) {
    static const std::regex form(R"(^(Deleted )?(\d+): ([^:@]+)(@[^:]*)?: <([^>]*)> .*?state (\S+) .*)");
    std::smatch parts;
    if (!std::regex_match(text, parts, form)) {
        return std::nullopt;
    }
    return Line{std::stoi(parts[2]), parts[3], parts[1].matched, statusOf(parts[5], parts[6])};
}

} // namespace

IpMonitor::IpMonitor(const Namespace& space) : _space(space) {
    std::string name = (std::filesystem::temp_directory_path() / "ip-monitor-XXXXXX").string();
    close(mkstemp(name.data()));
    _file = name;
    // The usual queue of a megabyte does not hold what hundreds of interfaces do at once.
    _process = space.shell("ip -rcvbuf 33554432 -o monitor link >" + name + " 2>&1 & echo $!");
    awaitMarker();
    _begin = output().size();
    std::istringstream lines(space.ip("-o link show"));
    for (std::string text; std::getline(lines, text);) {
        if (const auto line = parse(text)) {
            _statuses[line->index] = line->status;
        }
    }
}

IpMonitor::~IpMonitor() {
    _space.shell("kill " + _process);
    std::filesystem::remove(_file);
}

std::string IpMonitor::output() const {
    std::ostringstream text;
    text << std::ifstream(_file).rdbuf();
    return text.str();
}

/** Until the program shows an interface that was made just now: it has seen everything before that, too. */
void IpMonitor::awaitMarker() {
    for (int attempt = 0; attempt < 100; ++attempt) {
        const std::string marker = markerPrefix + std::to_string(_markers++);
        _space.ip("link add " + marker + " type bridge");
        for (int look = 0; look < 20; ++look) {
            if (output().find(' ' + marker + ':') != std::string::npos) {
                return;
            }
            std::this_thread::sleep_for(std::chrono::milliseconds(10));
        }
    }
    throw std::runtime_error("ip monitor shows nothing: " + output());
}

std::vector<Transition> IpMonitor::transitions() {
    awaitMarker();
    std::vector<Transition> transitions;
    std::map<int, unsigned> statuses = _statuses;
    std::istringstream lines(output().substr(_begin));
    for (std::string text; std::getline(lines, text);) {
        const auto line = parse(text);
        if (!line || line->name.starts_with(markerPrefix)) {
            continue;
        }
        const auto known = statuses.find(line->index);
        if (line->isGone) {
            if (known != statuses.end() && known->second == 1) {
                transitions.push_back({line->name, 5});
            }
            statuses.erase(line->index);
            continue;
        }
        const bool isNew = known == statuses.end();
        if (isNew ? line->status == 1 : line->status != known->second) {
            transitions.push_back({line->name, line->status});
        }
        statuses[line->index] = line->status;
    }
    return transitions;
}

} // namespace Orv::Test
