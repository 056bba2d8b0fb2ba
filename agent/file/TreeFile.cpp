#include "agent/file/TreeFile.h"

#include "agent/config/TextFile.h"
#include "agent/file/DerivedHardware.h"
#include "agent/file/DescriptionReader.h"

#include <utility>

namespace Orv::Agent {

std::shared_ptr<const Tree> parseTree(std::string_view text, const std::string& file) {
    return DescriptionReader::read(text, file).tree;
}

TreeDescription parseTreeDescription(std::string_view text, const std::string& file) {
    DescribedHost host = DescriptionReader::read(text, file);
    return {host.tree, host.saysHardware ? std::move(host.hardware) : deriveHardware(*host.tree)};
}

TreeDescription readTreeFile(const std::string& path) {
    return parseTreeDescription(readTextFile(path).text, path);
}

} // namespace Orv::Agent
