#include "agent/persistence/NetworkdFile.h"
#include "fuzz/Wanted.h"

/** Any text as a .network file: its settings are read back from what is written for it, and the rest once more. */
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    using namespace Orv::Agent::Persistence;
    using Orv::Fuzz::require;
    const auto [wanted, text] = Orv::Fuzz::wantedAndText(data, size);
    const NetworkdSettings inForce = readNetworkdSettings(text);
    const NetworkdSettings own = changed(inForce, inForce, wanted);
    const std::string rest = restOf(text);
    const std::string unit = unitText("eth0", own, rest);
    require(readOwnSettings(dropInText(own)) == own, "a drop-in is read back");
    require(readOwnSettings(unit) == own, "a unit is read back");
    require(restOfOwn(unit) == rest, "the rest is read back");
    require(changed(own, own, wanted) == own, "a second change changes nothing");
    return 0;
}
