#include "agent/file/DescriptionChange.h"
#include "agent/file/TreeFile.h"
#include "fuzz/Wanted.h"

#include <algorithm>
#include <exception>

/** Any ASCII text as the description of a host: read or refused, and read again as wanted when it is edited. */
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    using namespace Orv::Agent;
    using Orv::Fuzz::require;
    const auto [wanted, text] = Orv::Fuzz::wantedAndText(data, size);
    // The parser's Unicode tables (toml++ 3.3) have undefined behaviour for characters where none may stand.
    if (std::any_of(text.begin(), text.end(),
                    [](char byte) { return (static_cast<unsigned char>(byte) & 0x80U) != 0; })) {
        return 0;
    }
    std::shared_ptr<const Tree> tree;
    try {
        tree = parseTree(text, "fuzz");
    } catch (const std::exception&) {
        return 0;
    }
    const auto& adapters = tree->nodesOfType(Orv::NodeLexicon::NODE_NETWORK_ADAPTER);
    if (adapters.empty()) {
        return 0;
    }
    const std::size_t last = adapters.size() - 1;
    const std::string after = editAdapter(text, "fuzz", last, keyEdits(adapters[last]->properties, wanted));
    const auto changed = parseTree(after, "fuzz");
    const auto& changedAdapters = changed->nodesOfType(Orv::NodeLexicon::NODE_NETWORK_ADAPTER);
    require(changedAdapters.size() == adapters.size(), "no adapter comes or goes");
    for (std::size_t number = 0; number < last; ++number) {
        require(*changedAdapters[number] == *adapters[number], "other adapters stay");
    }
    require(keyEdits(changedAdapters[last]->properties, wanted).empty(), "it says what was wanted");
    return 0;
}
