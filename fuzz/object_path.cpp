#include "fuzz/Require.h"
#include "host/model/Instance.h"

#include <stdexcept>

/** Any text as an object path: it is refused with its place, or it is printed as a text that gives the same path. */
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    using namespace marlo;
    ObjectPath path;
    try {
        path = ObjectPath::parse(fuzz::textOf(data, size));
    } catch (const std::invalid_argument& error) {
        fuzz::require(std::string_view(error.what()).starts_with("position "), "a refusal has its place");
        return 0;
    }
    fuzz::require(ObjectPath::parse(path.toString()) == path, "what is printed is read back");
    return 0;
}
