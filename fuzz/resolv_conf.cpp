#include "agent/linux/Resolver.h"
#include "agent/linux/Words.h"
#include "agent/persistence/ResolvConf.h"
#include "fuzz/Wanted.h"

#include <algorithm>

/** Any text as a resolv.conf: edited, read back as wanted, with all other lines kept. */
namespace {

using namespace Orv::Agent;
using Orv::Fuzz::require;

/** The lines that no edit may touch. */
std::vector<std::string> otherLines(std::string_view text) {
    std::vector<std::string> lines;
    for (const std::string_view line : Linux::linesOf(text)) {
        const auto words = Linux::wordsOf(line);
        const bool isSetting = words.size() >= 2 && words[0].data() == line.data() &&
                               (words[0] == "nameserver" || words[0] == "domain" || words[0] == "search");
        if (!isSetting) {
            lines.emplace_back(line);
        }
    }
    return lines;
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    const auto [wanted, text] = Orv::Fuzz::wantedAndText(data, size);
    const std::string after = Persistence::editResolvConf(text, wanted.names);
    require(Persistence::editResolvConf(after, wanted.names) == after, "a second edit changes nothing");
    require(otherLines(after) == otherLines(text), "other lines stay");
    const Linux::ResolverSettings read = Linux::parseResolvConf(after);
    if (wanted.names.servers) {
        require(read.servers == *wanted.names.servers, "servers");
    }
    if (wanted.names.domain) {
        require(read.domain == *wanted.names.domain, "domain");
    }
    if (wanted.names.suffixes && !wanted.names.suffixes->empty()) {
        require(read.suffixes == *wanted.names.suffixes, "suffixes");
    }
    return 0;
}
